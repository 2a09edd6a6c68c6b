// Listing of the glare pixels of the downscaled shots and the repair of one shot from the
// other: the other shot's local detail is put onto the glaring shot's local average.

#include <cstdint>
#include <initializer_list>

#include "holograms/HologramsRemove.h"
#include "holograms/PixelHelpersInternal.h"

using holo::Refuse;
using holo::Row;

namespace holo {
namespace {

// Where both shots are marked: true when the shot with local excesses `own` keeps its pixel
// against the other shot's excesses `other`.
bool KeepsPixel(const int own[3], const int other[3]) {
    const int ownSum = own[0] + own[1] + own[2];
    const int otherSum = other[0] + other[1] + other[2];
    if (ownSum > 2 * otherSum) return false;
    bool clearlyBrighter = 3 * ownSum > 4 * otherSum || ownSum - otherSum > 64;
    bool everyChannelClose = true;
    for (int c = 0; c < 3; ++c) {
        clearlyBrighter = clearlyBrighter || own[c] - other[c] > 64;
        everyChannelClose = everyChannelClose && 2 * own[c] <= 3 * other[c];
    }
    return !clearlyBrighter || everyChannelClose;
}

// Glare of image 1 only: the other shot's detail, less half the difference excess. The
// full-resolution repair also requires an evaluated (non-zero) difference byte.
inline unsigned char RepairBrighter(int average, int otherExcess, int difference, int meanDifference,
                                    bool needsEvaluated) {
    int v = otherExcess;
    if ((difference != 0 || !needsEvaluated) && difference - meanDifference > 10) v -= (difference - meanDifference) >> 1;
    return ClampByte(average + v);
}

// Glare of image 2 only: the other shot's detail, plus half the (negative) difference excess.
inline unsigned char RepairDarker(int average, int otherExcess, int difference, int meanDifference) {
    int v = otherExcess;
    const int t = difference - meanDifference;
    if (difference != 0 && t < -10) v += t >> 1;  // arithmetic shift: toward minus infinity
    return ClampByte(average + v);
}

// Shots, averages, maps and difference of one 24-bit size, and a window of 0 or more.
bool RepairInputsValid(const wchar_t* name, std::initializer_list<const CImage*> images, int window) {
    if (!AllSame24(images) && Refuse(name, "images, averages, maps and difference must be 24-bit of one size"))
        return false;
    if (window < 0 && Refuse(name, "negative window")) return false;
    return true;
}

}  // namespace
}  // namespace holo

void CHologramsRemove::CollectHologramsPixels_New(CImage& image1, CImage& average1, CImage& image2, CImage& average2,
                                                  CImage& map1, CImage& map2, CImage& difference, int window) {
    if (!holo::RepairInputsValid(L"CollectHologramsPixels_New", {&image1, &average1, &image2, &average2, &map1, &map2, &difference},
                                 window))
        return;
    m_holoPixels.SetSize(0);
    const int half = window / 2;
    const int width = image1.GetWidth();
    const int height = image1.GetHeight();
    auto asRgb = [](uint8_t* out, const unsigned char* bgr) {
        out[0] = bgr[2];
        out[1] = bgr[1];
        out[2] = bgr[0];
    };
    for (int y = half; y < height - half; ++y) {
        const unsigned char* m1 = Row(map1, y);
        const unsigned char* m2 = Row(map2, y);
        for (int x = half; x < width - half; ++x) {
            const int at = 3 * x;
            if (m1[at] == 0 && m2[at] == 0) continue;
            HOLOGRAM_PIXEL record{};
            record.byteColumn = at;
            record.row = y;
            record.flags = static_cast<uint8_t>((m1[at] != 0 ? 1 : 0) | (m2[at] > 0 ? 2 : 0));
            asRgb(record.average1, Row(average1, y) + at);
            asRgb(record.image1, Row(image1, y) + at);
            asRgb(record.average2, Row(average2, y) + at);
            asRgb(record.image2, Row(image2, y) + at);
            const unsigned char* d = Row(difference, y) + at;
            for (int c = 0; c < 3; ++c) record.difference[c] = d[c];
            m_holoPixels.Add(record);
        }
    }
}

void CHologramsRemove::FixRealImages_24_New(CImage& image1, CImage& image2, int scale, int mode) {
    if (m_holoPixels.GetSize() == 0) return;
    const wchar_t* name = L"FixRealImages_24_New";
    if (mode != 1 && mode != 2 && Refuse(name, "mode must be 1 or 2")) return;
    if (scale < 1 && Refuse(name, "scale below 1")) return;
    if (!holo::AllSame24({&image1, &image2}) && Refuse(name, "the images must be 24-bit of one size")) return;
    const int width = image1.GetWidth();
    const int height = image1.GetHeight();
    int skipped = 0;
    for (const HOLOGRAM_PIXEL& record : m_holoPixels) {
        if ((record.flags & mode) == 0) continue;
        // The block of columns s*x - 1 ... s*x + s - 2 and rows s*y - s ... s*y - 1.
        const int firstX = scale * (record.byteColumn / 3) - 1;
        const int firstY = scale * record.row - scale;
        if (record.byteColumn % 3 != 0 || firstX < 0 || firstY < 0 || firstX + scale > width ||
            firstY + scale > height) {
            ++skipped;  // collected from images of another size
            continue;
        }
        int average1[3], average2[3];
        for (int c = 0; c < 3; ++c) {  // the record holds R, G, B; pixels are B, G, R
            average1[c] = record.average1[2 - c];
            average2[c] = record.average2[2 - c];
        }
        for (int y = firstY; y < firstY + scale; ++y) {
            unsigned char* p1 = Row(image1, y) + 3 * firstX;
            unsigned char* p2 = Row(image2, y) + 3 * firstX;
            for (int i = 0; i < scale; ++i, p1 += 3, p2 += 3) {
                int e1[3], e2[3];
                for (int c = 0; c < 3; ++c) {
                    e1[c] = p1[c] - average1[c];
                    e2[c] = p2[c] - average2[c];
                }
                if (record.flags == 3) {
                    if (mode == 1 && !holo::KeepsPixel(e1, e2))
                        for (int c = 0; c < 3; ++c) p1[c] = holo::ClampByte1(average1[c] + e2[c]);
                    if (mode == 2 && !holo::KeepsPixel(e2, e1))
                        for (int c = 0; c < 3; ++c) p2[c] = holo::ClampByte1(average2[c] + e1[c]);
                } else if (mode == 1 && record.flags == 1) {
                    for (int c = 0; c < 3; ++c)
                        p1[c] = holo::RepairBrighter(average1[c], e2[c], record.difference[c], m_avDifVal, true);
                } else if (mode == 2 && record.flags == 2) {
                    for (int c = 0; c < 3; ++c)
                        p2[c] = holo::RepairDarker(average2[c], e1[c], record.difference[c], m_avDifVal);
                }
            }
        }
    }
    if (skipped > 0) Trace(L"FixRealImages_24_New: %d records outside the images skipped\n", skipped);
}

void CHologramsRemove::FixSmlImages_24_New(CImage& image1, CImage& average1, CImage& image2, CImage& average2,
                                           CImage& map1, CImage& map2, CImage& difference, int window) {
    if (!holo::RepairInputsValid(L"FixSmlImages_24_New", {&image1, &average1, &image2, &average2, &map1, &map2, &difference},
                                 window))
        return;
    const int half = window / 2;
    const int width = image1.GetWidth();
    const int height = image1.GetHeight();
    for (int y = half; y < height - half; ++y) {
        unsigned char* s1 = Row(image1, y);
        unsigned char* s2 = Row(image2, y);
        const unsigned char* a1 = Row(average1, y);
        const unsigned char* a2 = Row(average2, y);
        const unsigned char* m1 = Row(map1, y);
        const unsigned char* m2 = Row(map2, y);
        const unsigned char* d = Row(difference, y);
        for (int x = half; x < width - half; ++x) {
            const int at = 3 * x;
            const bool marked1 = m1[at] != 0;
            const bool marked2 = m2[at] != 0;
            if (marked1 && !marked2) {
                for (int c = at; c < at + 3; ++c) s1[c] = holo::RepairBrighter(a1[c], s2[c] - a2[c], d[c], m_avDifVal, false);
            } else if (marked2 && !marked1) {
                for (int c = at; c < at + 3; ++c) s2[c] = holo::RepairDarker(a2[c], s1[c] - a1[c], d[c], m_avDifVal);
            } else if (marked1 && marked2) {
                int e1[3], e2[3];
                for (int c = 0; c < 3; ++c) {
                    e1[c] = s1[at + c] - a1[at + c];
                    e2[c] = s2[at + c] - a2[at + c];
                }
                if (!holo::KeepsPixel(e1, e2)) {
                    for (int c = 0; c < 3; ++c) s1[at + c] = holo::ClampByte1(a1[at + c] + e2[c]);
                } else if (!holo::KeepsPixel(e2, e1)) {
                    for (int c = 0; c < 3; ++c) s2[at + c] = holo::ClampByte1(a2[at + c] + e1[c]);
                }
            }
        }
    }
    image1.ExportFile(L"c:\\ZentLogDir\\Holograms_SmlImg1_Fix.bmp");
    image2.ExportFile(L"c:\\ZentLogDir\\Holograms_SmlImg2_Fix.bmp");
}
