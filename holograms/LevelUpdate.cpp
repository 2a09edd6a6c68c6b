// Colour-vector level updates, the darkest-of-four map, thin-line mask cleaning and the
// neighbour average. The vector arithmetic is single-precision, in B, G, R order, without
// fused multiply-adds (the build passes -ffp-contract=off), so near-ties between candidates
// are decided the same way everywhere.
#include <cmath>
#include <cstdlib>
#include <vector>

#include "holograms/FourImageInternal.h"
#include "holograms/HologramsRemove.h"
#include "imagelib/Trace.h"

using holo4::CopyPixel;
using holo4::RoundHalfAway;

namespace {

constexpr int kSaturated = 240;     // a channel above this saturates the pixel
constexpr uint8_t kAllSaturated = 10;  // choice value: every candidate saturated
constexpr uint8_t kNoDirection = 255;  // choice value: no candidate points along the reference
constexpr float kNoLength = 1000.0f;

bool IsSaturated(const unsigned char* p) { return p[0] > kSaturated || p[1] > kSaturated || p[2] > kSaturated; }

// A pixel's colour as a vector (B, G, R): its length and its direction. A black pixel has
// length 0 and stays the zero vector (its dot product with anything is 0).
struct ColourVector {
    float c[3];
    float length;
};

ColourVector Normalised(const unsigned char* p) {
    ColourVector v{{static_cast<float>(p[0]), static_cast<float>(p[1]), static_cast<float>(p[2])}, 0.0f};
    float square = 0.0f;
    for (int i = 0; i < 3; ++i) square += v.c[i] * v.c[i];
    v.length = std::sqrt(square);
    if (v.length > 0.0f) {
        const float inverse = 1.0f / v.length;
        for (float& x : v.c) x *= inverse;
    }
    return v;
}

float Dot(const ColourVector& a, const ColourVector& b) {
    float sum = 0.0f;
    for (int i = 0; i < 3; ++i) sum += a.c[i] * b.c[i];
    return sum;
}

// The candidates closest to a reference colour: by direction (largest dot product above 0)
// and by length (smallest length difference). Earlier candidates win ties.
struct Choice {
    int length = kAllSaturated;
    int direction = kAllSaturated;
    ColourVector directionVector{};
    float chosenLength = 0.0f;
};

Choice ChooseCandidates(const unsigned char* reference, const unsigned char* const candidates[4]) {
    const ColourVector ref = Normalised(reference);
    Choice choice;
    float bestDot = 0.0f;
    float bestLengthGap = kNoLength;
    bool anyUnsaturated = false;
    for (int i = 0; i < 4; ++i) {
        if (IsSaturated(candidates[i])) continue;
        if (!anyUnsaturated) {
            anyUnsaturated = true;
            choice.direction = kNoDirection;
        }
        const ColourVector v = Normalised(candidates[i]);
        const float dot = Dot(v, ref);
        if (dot > bestDot) {
            bestDot = dot;
            choice.direction = i;
            choice.directionVector = v;
        }
        const float gap = std::fabs(v.length - ref.length);
        if (gap < bestLengthGap) {
            bestLengthGap = gap;
            choice.length = i;
            choice.chosenLength = v.length;
        }
    }
    return choice;
}

// Mean of the same channel of the pixel to the left and of the three pixels above (left,
// centre, right), rounded down. Coordinates are clamped to the image, so on the top row the
// row itself stands in for the previous one and at the edges a pixel is its own neighbour.
int ClampedNeighbourAverage(const CImage& image, int x, int y, int channel) {
    const int left = x > 0 ? x - 1 : 0;
    const int right = x + 1 < image.GetWidth() ? x + 1 : x;
    const int up = y > 0 ? y - 1 : 0;
    const unsigned char* row = image.GetPtrXY(0, y);
    const unsigned char* above = image.GetPtrXY(0, up);
    return (row[3 * left + channel] + above[3 * left + channel] + above[3 * x + channel] +
            above[3 * right + channel]) >> 2;
}

void FillFromNeighbours(CImage& image, int x, int y) {
    unsigned char* p = image.GetPtrXY(x, y);
    for (int c = 0; c < 3; ++c) p[c] = static_cast<unsigned char>(ClampedNeighbourAverage(image, x, y, c));
}

unsigned char ClampToByte(int v) { return static_cast<unsigned char>(v > 255 ? 255 : (v < 0 ? 0 : v)); }

// The direction candidate's colour scaled to the length candidate's channel sum. When the
// direction candidate is black there is nothing to scale: the length candidate is copied.
void ScaleToSum(unsigned char* out, const unsigned char* directionPixel, const unsigned char* lengthPixel) {
    const int s1 = lengthPixel[0] + lengthPixel[1] + lengthPixel[2];
    const int s2 = directionPixel[0] + directionPixel[1] + directionPixel[2];
    if (s2 == 0) {
        CopyPixel(out, lengthPixel);
        return;
    }
    for (int c = 0; c < 3; ++c) {
        const float scaled = static_cast<float>(directionPixel[c]) * static_cast<float>(s1) / static_cast<float>(s2);
        const int rounded = RoundHalfAway(scaled);
        out[c] = static_cast<unsigned char>(rounded > 255 ? 255 : rounded);
    }
}

bool SameGeometry(const CImage& a, const CImage& b) {
    return a.GetWidth() == b.GetWidth() && a.GetHeight() == b.GetHeight() && a.GetBitCount() == b.GetBitCount();
}

void DumpFourInputs(const CImage& top, const CImage& bottom, const CImage& left, const CImage& right) {
    top.ExportFile(L"\\results\\top.jpg");
    bottom.ExportFile(L"\\results\\bot.jpg");
    left.ExportFile(L"\\results\\left.jpg");
    right.ExportFile(L"\\results\\right.jpg");
}

// Levels `level` and `level` + 1 exist in all five pyramids, are 24-bit and share sizes.
bool LevelsMatch(const CPyramid* const pyramids[5], int level) {
    if (level < 0) return false;
    for (int i = 0; i < 5; ++i)
        if (pyramids[i]->GetLevelsNum() < level + 2) return false;
    for (int k = level; k <= level + 1; ++k) {
        const CImage& reference = pyramids[0]->GetLevel(k);
        if (reference.GetBitCount() != 24 || reference.IsEmpty()) return false;
        for (int i = 1; i < 5; ++i)
            if (!SameGeometry(pyramids[i]->GetLevel(k), reference)) return false;
    }
    return true;
}

}  // namespace

void CHologramsRemove::UpdateLevel(const CPyramid& top, const CPyramid& bottom, const CPyramid& left,
                                   const CPyramid& right, CPyramid& result, int level) {
    const CPyramid* const all[5] = {&top, &bottom, &left, &right, &result};
    if (!LevelsMatch(all, level)) {
        Trace(L"UpdateLevel: level %d and the next coarser one are not 24-bit levels of one size in all five "
              L"pyramids; nothing done\n",
              level);
        return;
    }
    const CPyramid* const inputs[4] = {&top, &bottom, &left, &right};
    const int coarse = level + 1;
    const int cw = top.GetLevel(coarse).GetWidth(), ch = top.GetLevel(coarse).GetHeight();
    std::vector<uint8_t> lengthChoice(static_cast<size_t>(cw) * ch), directionChoice(lengthChoice.size());

    const CImage& reference = result.GetLevel(coarse);
    for (int y = 0; y < ch; ++y) {
        const unsigned char* refRow = reference.GetPtrXY(0, y);
        const unsigned char* rows[4];
        for (int i = 0; i < 4; ++i) rows[i] = inputs[i]->GetLevel(coarse).GetPtrXY(0, y);
        for (int x = 0; x < cw; ++x) {
            const unsigned char* candidates[4] = {rows[0] + 3 * x, rows[1] + 3 * x, rows[2] + 3 * x, rows[3] + 3 * x};
            const Choice choice = ChooseCandidates(refRow + 3 * x, candidates);
            lengthChoice[static_cast<size_t>(y) * cw + x] = static_cast<uint8_t>(choice.length);
            directionChoice[static_cast<size_t>(y) * cw + x] = static_cast<uint8_t>(choice.direction);
        }
    }

    CImage& out = result.GetLevel(level);
    const int w = out.GetWidth(), h = out.GetHeight();
    for (int y = 0; y < h; ++y) {
        const unsigned char* rows[4];
        for (int i = 0; i < 4; ++i) rows[i] = inputs[i]->GetLevel(level).GetPtrXY(0, y);
        unsigned char* outRow = out.GetPtrXY(0, y);
        for (int x = 0; x < w; ++x) {
            const size_t at = static_cast<size_t>(y / 2) * cw + x / 2;
            const int byLength = lengthChoice[at], byDirection = directionChoice[at];
            if (byLength == kAllSaturated) {
                FillFromNeighbours(out, x, y);
            } else if (byDirection == byLength || byDirection == kNoDirection) {
                CopyPixel(outRow + 3 * x, rows[byLength] + 3 * x);
            } else {
                ScaleToSum(outRow + 3 * x, rows[byDirection] + 3 * x, rows[byLength] + 3 * x);
            }
        }
    }
}

void CHologramsRemove::UpdateLevel2(const CImage& top, const CImage& bottom, const CImage& left, const CImage& right,
                                    const CImage& coarse, CImage& result) {
    if (!holo4::CheckFourInputs(top, bottom, left, right, L"UpdateLevel2", false)) return;
    const int w = top.GetWidth(), h = top.GetHeight();
    if (!SameGeometry(result, top)) {
        Trace(L"UpdateLevel2: result is not a 24-bit %dx%d image; nothing done\n", w, h);
        return;
    }
    if (coarse.GetBitCount() != 24 || coarse.GetWidth() <= (w - 1) / 2 || coarse.GetHeight() <= (h - 1) / 2) {
        Trace(L"UpdateLevel2: the coarse reference does not cover half of %dx%d in 24 bits; nothing done\n", w, h);
        return;
    }
    DumpFourInputs(top, bottom, left, right);
    const CImage* const inputs[4] = {&top, &bottom, &left, &right};
    for (int y = 0; y < h; ++y) {
        const unsigned char* rows[4];
        for (int i = 0; i < 4; ++i) rows[i] = inputs[i]->GetPtrXY(0, y);
        const unsigned char* refRow = coarse.GetPtrXY(0, y / 2);
        unsigned char* outRow = result.GetPtrXY(0, y);
        for (int x = 0; x < w; ++x) {
            const unsigned char* candidates[4] = {rows[0] + 3 * x, rows[1] + 3 * x, rows[2] + 3 * x, rows[3] + 3 * x};
            const Choice choice = ChooseCandidates(refRow + 3 * (x / 2), candidates);
            unsigned char* p = outRow + 3 * x;
            if (choice.length == kAllSaturated) {
                FillFromNeighbours(result, x, y);
            } else if (choice.direction == kNoDirection) {
                CopyPixel(p, candidates[choice.length]);
            } else {
                for (int c = 0; c < 3; ++c)
                    p[c] = ClampToByte(RoundHalfAway(choice.directionVector.c[c] * choice.chosenLength));
            }
        }
    }
}

void CHologramsRemove::ColorMapCreate(const CImage& top, const CImage& bottom, const CImage& left,
                                      const CImage& right, CImage& map) {
    if (!holo4::CheckFourInputs(top, bottom, left, right, L"ColorMapCreate", false)) return;
    if (!SameGeometry(map, top)) {
        Trace(L"ColorMapCreate: map is not a 24-bit %dx%d image; nothing done\n", top.GetWidth(), top.GetHeight());
        return;
    }
    DumpFourInputs(top, bottom, left, right);
    const CImage* const inputs[4] = {&top, &bottom, &left, &right};
    for (int y = 0; y < top.GetHeight(); ++y) {
        const unsigned char* rows[4];
        for (int i = 0; i < 4; ++i) rows[i] = inputs[i]->GetPtrXY(0, y);
        unsigned char* out = map.GetPtrXY(0, y);
        for (int x = 0; x < top.GetWidth(); ++x) {
            int darkest = 0;
            for (int i = 1; i < 4; ++i)
                if (holo4::MaxChannel(rows[i] + 3 * x) < holo4::MaxChannel(rows[darkest] + 3 * x)) darkest = i;
            CopyPixel(out + 3 * x, rows[darkest] + 3 * x);
        }
    }
    map.ExportFile(L"\\results\\Level5.bmp");
}

void CHologramsRemove::CleanMaskTop(CImage& mask) {
    if (mask.GetBitCount() != 8 || mask.GetHeight() < 3) return;
    const int w = mask.GetWidth(), h = mask.GetHeight();
    for (int y = 1; y < h - 1; ++y) {
        unsigned char* row = mask.GetPtrXY(0, y);
        const unsigned char* above = mask.GetPtrXY(0, y - 1);
        const unsigned char* below = mask.GetPtrXY(0, y + 1);
        for (int x = 1; x < w - 1; ++x) {
            if (row[x] == 0) continue;
            if ((row[x - 1] == 0 && row[x + 1] == 0) || (above[x] == 0 && below[x] == 0)) row[x] = 0;
        }
    }
}

// `row` + `offset` is a pixel of a 24-bit image; the row `span` bytes higher in memory is
// the previous one (rows are stored bottom-up). The first pixel of a row (offset below 3)
// is its own left neighbour. The caller keeps the previous row and the upper right
// neighbour inside the image.
int CHologramsRemove::AvarageNeighbours(unsigned char* row, int offset, int channel, int span) {
    const int b = offset + channel;
    const int leftStep = offset >= 3 ? 3 : 0;
    return (row[b - leftStep] + row[b + span - leftStep] + row[b + span] + row[b + span + 3]) >> 2;
}
