// Difference images of two shots and the detectors that turn them into glare masks.

#include <algorithm>
#include <array>
#include <cstdint>
#include <initializer_list>

#include "holograms/HologramsRemove.h"
#include "holograms/PixelHelpersInternal.h"

using holo::Refuse;
using holo::Row;

namespace holo {
namespace {

// Entry d + 256: d * gain + 128 limited to 1 ... 255, so that 0 in a difference image always
// means "not evaluated".
std::array<unsigned char, 512> DifferenceTable(float gain) {
    std::array<unsigned char, 512> table{};
    for (int d = -256; d < 256; ++d) {
        float v = static_cast<float>(d) * gain + 128.0f;
        if (v > 255.0f) v = 255.0f;
        if (v < 1.0f) v = 1.0f;
        table[d + 256] = static_cast<unsigned char>(static_cast<int>(v));
    }
    return table;
}

struct DifferenceStats {
    int64_t count = 0;
    int64_t valueSum = 0;
    int64_t rawSum = 0;
};

// The common part of SubImg_24 and SubImg_24_Alg3; false when the inputs are refused.
bool BuildDifference(const wchar_t* name, CImage& image1, CImage& image2, CImage& difference, int border,
                     float gain, DifferenceStats& stats) {
    if (image1.GetBitCount() != 24 || image2.GetBitCount() != 24) return false;
    if (!SameGeometry(image1, image2) && Refuse(name, "the images differ in size")) return false;
    if (border < 0 && Refuse(name, "negative border")) return false;
    if ((&difference == &image1 || &difference == &image2) && Refuse(name, "the difference image is an input"))
        return false;
    difference.Reallocate(image1.GetWidth(), image1.GetHeight(), 24, 0);
    const auto table = DifferenceTable(gain);
    const int width = image1.GetWidth();
    const int height = image1.GetHeight();
    for (int y = border; y < height - border; ++y) {
        const unsigned char* p1 = Row(image1, y);
        const unsigned char* p2 = Row(image2, y);
        unsigned char* d = Row(difference, y);
        for (int i = 3 * border; i < 3 * (width - border); ++i) {
            if (p1[i] < 32 && p2[i] < 32) continue;  // both dark: left 0
            const int raw = p1[i] - p2[i];
            d[i] = table[raw + 256];
            ++stats.count;
            stats.valueSum += d[i];
            stats.rawSum += raw;
        }
    }
    return true;
}

// The row and column profiles of the difference and of both shots, in that order.
void AddProfiles(CHologramsRemove& self, std::initializer_list<CImage*> images, int border, int topRow,
                 int bottomRow) {
    for (CImage* image : images) self.CalcImg_HV_Av_24(*image, border, topRow, bottomRow);
}

// Tolerance of the glare test for one channel: lower near saturation, where an excess cannot grow.
inline int Tolerance(int value) { return value > 240 ? 270 - value : 30; }

}  // namespace
}  // namespace holo

void CHologramsRemove::SubImg_24(CImage& image1, CImage& image2, CImage& difference, int border, bool profiles,
                                 int& referenceMean, float gain, int topRow, int bottomRow) {
    holo::DifferenceStats stats;
    if (!holo::BuildDifference(L"SubImg_24", image1, image2, difference, border, gain, stats)) return;
    if (profiles) holo::AddProfiles(*this, {&difference, &image1, &image2}, border, topRow, bottomRow);
    referenceMean = 128;
    if (stats.count >= 11) referenceMean = static_cast<int>(stats.valueSum / stats.count);
}

void CHologramsRemove::SubImg_24_Alg3(CImage& image1, CImage& image2, CImage& difference, int border, bool profiles,
                                      float gain, int topRow, int bottomRow) {
    holo::DifferenceStats stats;
    if (!holo::BuildDifference(L"SubImg_24_Alg3", image1, image2, difference, border, gain, stats)) return;
    if (profiles) holo::AddProfiles(*this, {&difference, &image1, &image2}, border, topRow, bottomRow);
    m_avDifVal = 128;
    m_avDif = 0;
    if (stats.count >= 11) {
        m_avDifVal = static_cast<int>(stats.valueSum / stats.count);
        m_avDif = static_cast<int>(stats.rawSum / stats.count);
    }
}

void CHologramsRemove::Find_HologramPixels_24_New_Alg3(CImage& difference, CImage& model, CImage& image1,
                                                       CImage& image2, CImage& map1, CImage& map2, int border,
                                                       int topRow, int bottomRow, int& score1, int& score2) {
    const wchar_t* name = L"Find_HologramPixels_24_New_Alg3";
    if (!holo::AllSame24({&difference, &model, &image1, &image2}) &&
        Refuse(name, "difference, model and images must be 24-bit images of one size"))
        return;
    if (border < 0 && Refuse(name, "negative border")) return;
    if (&map1 == &map2 && Refuse(name, "the two maps are one image")) return;
    for (const CImage* input : {&difference, &model, &image1, &image2})
        if ((input == &map1 || input == &map2) && Refuse(name, "a map is also an input")) return;

    score1 = 0;
    score2 = 0;
    const int width = difference.GetWidth();
    const int height = difference.GetHeight();
    map1.Reallocate(width, height, 24, 0);
    map2.Reallocate(width, height, 24, 0);

    const int firstRow = std::max(topRow - 10, border);
    const int endRow = std::min(height - border, bottomRow + 10);
    if (firstRow >= endRow) return;
    int64_t sum1 = 0;
    int64_t sum2 = 0;
    for (int y = firstRow; y < endRow; ++y) {
        const unsigned char* d = Row(difference, y);
        const unsigned char* m = Row(model, y);
        const unsigned char* i1 = Row(image1, y);
        const unsigned char* i2 = Row(image2, y);
        unsigned char* out1 = Row(map1, y);
        unsigned char* out2 = Row(map2, y);
        for (int x = border; x <= width - 1 - border / 2; ++x) {  // the right margin is half the left one
            const int at = 3 * x;
            if (d[at] == 0 || d[at + 1] == 0 || d[at + 2] == 0) continue;
            int excess[3];
            for (int c = 0; c < 3; ++c) excess[c] = d[at + c] - m[at + c];
            const int highest = std::max({excess[0], excess[1], excess[2]});
            const int lowest = std::min({excess[0], excess[1], excess[2]});
            const int total = excess[0] + excess[1] + excess[2];

            bool glare1 = false;
            if (lowest >= -10) {
                for (int c = 0; c < 3; ++c) glare1 = glare1 || excess[c] > holo::Tolerance(i1[at + c]);
                if (!glare1) glare1 = lowest >= 10 && total >= 60;
            }
            bool glare2 = false;
            if (highest <= 10) {
                for (int c = 0; c < 3; ++c) glare2 = glare2 || excess[c] < -holo::Tolerance(i2[at + c]);
                if (!glare2) glare2 = highest <= -10 && total <= -60;
            }
            if (glare1) {
                sum1 += highest;
                for (int c = 0; c < 3; ++c) out1[at + c] = d[at + c];
            }
            if (glare2) {
                sum2 -= lowest;
                for (int c = 0; c < 3; ++c) out2[at + c] = static_cast<unsigned char>(255 - d[at + c]);
            }
        }
    }
    score1 = static_cast<int>(sum1 >> 7);
    score2 = static_cast<int>(sum2 >> 7);
}

void CHologramsRemove::Add_Saturated_Pixels(CImage& image1, CImage& image2, CImage& map1, CImage& map2, int&, int&,
                                            int border) {
    if (!holo::AllSame24({&image1, &image2, &map1, &map2}) &&
        Refuse(L"Add_Saturated_Pixels", "images and maps must be 24-bit images of one size"))
        return;
    if (border < 0 && Refuse(L"Add_Saturated_Pixels", "negative border")) return;
    const int width = image1.GetWidth();
    const int height = image1.GetHeight();
    auto saturated = [](const unsigned char* p) { return p[0] >= 254 || p[1] >= 254 || p[2] >= 254; };
    for (int y = border; y < height - border; ++y) {
        const unsigned char* i1 = Row(image1, y);
        const unsigned char* i2 = Row(image2, y);
        unsigned char* m1 = Row(map1, y);
        unsigned char* m2 = Row(map2, y);
        for (int x = border; x < width - border; ++x) {
            const int at = 3 * x;
            if (m1[at] != 0 || m2[at] != 0) continue;
            const bool saturated1 = saturated(i1 + at);
            const bool saturated2 = saturated(i2 + at);
            if (saturated1 && !saturated2) std::copy(i1 + at, i1 + at + 3, m1 + at);
            if (saturated2 && !saturated1) std::copy(i2 + at, i2 + at + 3, m2 + at);
        }
    }
}

void CHologramsRemove::FindHologramsPixels_24_New_Alg2(CImage& image1, CImage& average1, CImage& image2,
                                                       CImage& average2, CImage& map1, CImage& map2,
                                                       CImage& difference, int window, int, int, int& count1,
                                                       int& count2) {
    const wchar_t* name = L"FindHologramsPixels_24_New_Alg2";
    if ((window < 1 || window > 15 || window % 2 == 0) && Refuse(name, "the window must be odd, 1 to 15")) return;
    if (!holo::AllSame24({&image1, &average1, &image2, &average2}) &&
        Refuse(name, "images and averages must be 24-bit images of one size"))
        return;
    for (const CImage* output : {&map1, &map2, &difference})
        for (const CImage* input : {&image1, &average1, &image2, &average2})
            if (output == input && Refuse(name, "an output is also an input")) return;
    if ((&map1 == &map2 || &map1 == &difference || &map2 == &difference) && Refuse(name, "two outputs are one image"))
        return;

    count1 = 0;
    count2 = 0;
    const int width = image1.GetWidth();
    const int height = image1.GetHeight();
    const int half = window / 2;
    map1.Reallocate(width, height, 24, 0);
    map2.Reallocate(width, height, 24, 0);

    // Pre-masks: sub-pixels well above their own average.
    const holo::ShotImages shots{image1, average1, image2, average2, map1, map2};
    for (int y = half; y < height - half; ++y) {
        const holo::ShotRows r(shots, y);
        for (int i = 3 * half; i < 3 * (width - half); ++i) {
            const int d1 = r.i1[i] - r.a1[i];
            const int d2 = r.i2[i] - r.a2[i];
            r.m1[i] = static_cast<unsigned char>(d1 > 20 ? d1 : 0);
            r.m2[i] = static_cast<unsigned char>(d2 > 20 ? d2 : 0);
        }
    }
    FixAvMap_24(image1, average1, map1, window, 20);
    FixAvMap_24(image2, average2, map2, window, 20);
    m_avDifVal = 128;
    SubImg_24(average1, average2, difference, window, false, m_avDifVal, 1.0f, -1, -1);

    const int high = m_avDifVal + 10;
    const int low = m_avDifVal - 10;
    for (int y = half; y < height - half; ++y) {
        const holo::ShotRows r(shots, y);
        const unsigned char* d = Row(difference, y);
        for (int i = 3 * half; i < 3 * (width - half); ++i) {
            r.m1[i] = 0;
            r.m2[i] = 0;
            const int d1 = r.i1[i] - r.a1[i];
            const int d2 = r.i2[i] - r.a2[i];
            // The excess can reach 510; it saturates so that a strong mark never wraps to 0.
            if (d1 > 10 && d1 - d2 > 30 && d[i] > high) {
                ++count1;
                r.m1[i] = holo::ClampByte(d1 - d2);
            }
            if (d2 > 10 && d2 - d1 > 30 && d[i] < low) {
                ++count2;
                r.m2[i] = holo::ClampByte(d2 - d1);
            }
        }
    }
}
