// Four-image glare removal judged in hue, saturation and value: at most detail pixels the
// result takes the lowest saturation among the unsaturated shots with the hue and value of
// one chosen shot. Per level, the thresholds are the 85th percentiles of the per-pixel
// saturation and value spreads.
#include <algorithm>
#include <cmath>
#include <cstdint>
#include <memory>
#include <vector>

#include "holograms/FourImageHsvInternal.h"
#include "holograms/FourImageInternal.h"
#include "holograms/FourImagePyramidInternal.h"
#include "holograms/HologramsRemove.h"
#include "imagelib/Parallel.h"

using holo4::CopyPixel;
using holo4::kLevels;
using holo4::MaxChannel;
using holo4::RoundHalfAway;

namespace holo4 {

void RgbToHsv(unsigned char* pixel) {
    const float b = pixel[0], g = pixel[1], r = pixel[2];
    const float max = std::max(b, std::max(g, r));
    const float min = std::min(b, std::min(g, r));
    const float delta = max - min;
    const float s = max == 0.0f ? 0.0f : delta / max * 255.0f;
    float h = 0.0f;
    if (delta >= 0.1f) {
        if (r == max)
            h = (g - b) / delta;
        else if (g == max)
            h = (b - r) / delta + 2.0f;
        else
            h = (r - g) / delta + 4.0f;
    }
    float hue = h * 42.5f;
    if (hue < 0.0f) hue += 255.0f;
    const int roundedHue = RoundHalfAway(hue);
    pixel[0] = static_cast<unsigned char>(roundedHue >= 255 ? 255 : (roundedHue < 0 ? 0 : roundedHue));
    pixel[1] = static_cast<unsigned char>(RoundHalfAway(s));
    pixel[2] = static_cast<unsigned char>(max);
}

void HsvToRgb(unsigned char* pixel) {
    const int hue = pixel[0], saturation = pixel[1], value = pixel[2];
    if (saturation == 0) {
        pixel[0] = pixel[1] = pixel[2] = static_cast<unsigned char>(value);
        return;
    }
    const float v = static_cast<float>(value);
    const float x = static_cast<float>(hue) * 0.023529412f;  // six sectors over 0..255
    const float k = v * static_cast<float>(saturation) / 255.0f;
    const float m = v - k;
    float r, g, b;
    switch (static_cast<int>(std::floor(x))) {
    case 0: r = v, g = m + k * x, b = m; break;
    case 1: g = v, r = m + k * (2.0f - x), b = m; break;
    case 2: g = v, b = m + k * (x - 2.0f), r = m; break;
    case 3: b = v, g = m + k * (4.0f - x), r = m; break;
    case 4: b = v, r = m + k * (x - 4.0f), g = m; break;
    default: r = v, b = m + k * (6.0f - x), g = m; break;  // sector 5, and 6 at H = 255
    }
    auto toByte = [](float f) { return static_cast<unsigned char>(std::clamp(RoundHalfAway(f), 0, 255)); };
    pixel[0] = toByte(b);
    pixel[1] = toByte(g);
    pixel[2] = toByte(r);
}

int SpreadThreshold(const uint32_t histogram[256], int64_t n) {
    if (n <= 0) return 0;
    int64_t sum = 0;
    for (int bin = 255; bin >= 0; --bin) {
        sum += histogram[bin];
        if (sum >= n) return bin;
    }
    return 0;
}

void AverageOfTwoDarkest(const unsigned char* const lap[4], unsigned char* out) {
    // Ascending by peak; among equal peaks the later candidate ranks first.
    int order[4] = {3, 2, 1, 0};
    std::stable_sort(order, order + 4, [&](int a, int b) { return MaxChannel(lap[a]) < MaxChannel(lap[b]); });
    for (int c = 0; c < 3; ++c) out[c] = static_cast<unsigned char>((lap[order[0]][c] + lap[order[1]][c]) >> 1);
}

Spreads SpreadsOf(const unsigned char* const hsv[4], const bool saturated[4]) {
    Spreads s;
    int minS = 256, maxS = -1, minV = 256, maxV = -1;
    for (int i = 0; i < 4; ++i) {
        if (saturated[i]) continue;
        s.any = true;
        minS = std::min(minS, static_cast<int>(hsv[i][1]));
        maxS = std::max(maxS, static_cast<int>(hsv[i][1]));
        minV = std::min(minV, static_cast<int>(hsv[i][2]));
        maxV = std::max(maxV, static_cast<int>(hsv[i][2]));
    }
    if (s.any) {
        s.dS = maxS - minS;
        s.dV = maxV - minV;
    }
    return s;
}

void DecidePixel(const unsigned char* const lap[4], const unsigned char* const hsv[4], const bool maskedIn[4],
                 int thresholdS, int thresholdV, unsigned char* out) {
    bool saturated[4] = {maskedIn[0], maskedIn[1], maskedIn[2], maskedIn[3]};
    if (saturated[0] && saturated[1] && saturated[2] && saturated[3])
        saturated[0] = saturated[1] = saturated[2] = saturated[3] = false;
    const Spreads spreads = SpreadsOf(hsv, saturated);
    int leastSaturated = -1;
    for (int i = 0; i < 4; ++i)
        if (!saturated[i] && (leastSaturated < 0 || hsv[i][1] < hsv[leastSaturated][1])) leastSaturated = i;

    if ((spreads.dS <= thresholdS && spreads.dV <= thresholdV) || 3 * spreads.dS > 2 * spreads.dV) {
        const int minS = hsv[leastSaturated][1];
        int darkest = leastSaturated, brightest = leastSaturated;
        for (int i = 0; i < 4; ++i) {
            if (saturated[i] || std::abs(hsv[i][1] - minS) > kSaturationSimilarity) continue;
            if (hsv[i][2] < hsv[darkest][2]) darkest = i;
            if (hsv[i][2] > hsv[brightest][2]) brightest = i;
        }
        const int source = hsv[darkest][2] > 127 ? brightest : darkest;
        out[0] = hsv[source][0];
        out[1] = static_cast<unsigned char>(minS);
        out[2] = hsv[source][2];
        HsvToRgb(out);
    } else {
        int darkest = -1;
        for (int i = 0; i < 4; ++i)
            if (!saturated[i] && (darkest < 0 || hsv[i][2] < hsv[darkest][2])) darkest = i;
        CopyPixel(out, lap[darkest]);
    }
}

}  // namespace holo4

namespace {

// Rows are handled in fixed bands so that each band can keep its own histograms, which
// are added up afterwards (sums of counts do not depend on the split).
constexpr int kBands = 64;

// The candidates' HSV triples of one level. Allocated once for the finest level and reused
// by the coarser ones; every byte is written before it is read. The saturation masks are
// not stored: they are read off the brightness kept with the pyramids.
struct LevelPlanes {
    explicit LevelPlanes(size_t maxPixels) {
        for (int i = 0; i < 4; ++i) hsv[i] = std::make_unique_for_overwrite<uint8_t[]>(3 * maxPixels);
    }
    int width = 0, height = 0;
    std::unique_ptr<uint8_t[]> hsv[4];  // 3 bytes a pixel
};

void FirstPass(const holo4::CandidatePyramids& c, int level, LevelPlanes& planes,
               uint32_t histS[256], uint32_t histV[256]) {
    const int w = planes.width, h = planes.height;
    std::vector<uint32_t> bandHist(static_cast<size_t>(kBands) * 512, 0);
    imagelib::ParallelFor(0, kBands, [&](int first, int last) {
        for (int band = first; band < last; ++band) {
            uint32_t* hs = &bandHist[static_cast<size_t>(band) * 512];
            uint32_t* hv = hs + 256;
            for (int y = static_cast<int>(static_cast<int64_t>(h) * band / kBands);
                 y < static_cast<int>(static_cast<int64_t>(h) * (band + 1) / kBands); ++y) {
                const holo4::CandidateLevelRows rows(c, level, y);
                const size_t rowStart = static_cast<size_t>(y) * w;
                for (int i = 0; i < 4; ++i) holo4::RgbToHsvRowFast(rows.lap[i], &planes.hsv[i][3 * rowStart], w);
                for (int x = 0; x < w; ++x) {
                    const size_t at = rowStart + x;
                    const unsigned char* hsv[4];
                    bool saturated[4];
                    for (int i = 0; i < 4; ++i) {
                        hsv[i] = &planes.hsv[i][3 * at];
                        saturated[i] = holo4::IsHsvSaturated(rows.bright[i][x]);
                    }
                    // Pixels where every shot is saturated have no spread and stay out.
                    const holo4::Spreads s = holo4::SpreadsOf(hsv, saturated);
                    if (!s.any) continue;
                    ++hs[s.dS];
                    ++hv[s.dV];
                }
            }
        }
    });
    for (int band = 0; band < kBands; ++band)
        for (int bin = 0; bin < 256; ++bin) {
            histS[bin] += bandHist[static_cast<size_t>(band) * 512 + bin];
            histV[bin] += bandHist[static_cast<size_t>(band) * 512 + 256 + bin];
        }
}

void SecondPass(const holo4::CandidatePyramids& c, int level, const LevelPlanes& planes, int ts, int tv,
                CImage& out) {
    const int w = planes.width;
    holo4::ForEachRowBand(planes.height, [&](int begin, int end) {
        for (int y = begin; y < end; ++y) {
            const holo4::CandidateLevelRows rows(c, level, y);
            unsigned char* outRow = out.GetPtrXY(0, y);
            for (int x = 0; x < w; ++x) {
                const size_t at = static_cast<size_t>(y) * w + x;
                const unsigned char* detail[4] = {rows.lap[0] + 3 * x, rows.lap[1] + 3 * x, rows.lap[2] + 3 * x,
                                                  rows.lap[3] + 3 * x};
                const unsigned char* hsv[4] = {&planes.hsv[0][3 * at], &planes.hsv[1][3 * at],
                                               &planes.hsv[2][3 * at], &planes.hsv[3][3 * at]};
                const bool masked[4] = {
                    holo4::IsHsvSaturated(rows.bright[0][x]), holo4::IsHsvSaturated(rows.bright[1][x]),
                    holo4::IsHsvSaturated(rows.bright[2][x]), holo4::IsHsvSaturated(rows.bright[3][x])};
                holo4::DecidePixel(detail, hsv, masked, ts, tv, outRow + 3 * x);
            }
        }
    });
}

}  // namespace

void CHologramsRemove::Rgb2Hsv(unsigned char* pixel) { holo4::RgbToHsv(pixel); }

void CHologramsRemove::Hsv2Rgb(unsigned char* pixel) { holo4::HsvToRgb(pixel); }

void CHologramsRemove::HologramsRemove4Img4(const CImage& top, const CImage& bottom, const CImage& left,
                                            const CImage& right, CImage& result) {
    if (!holo4::CheckFourInputs(top, bottom, left, right, L"HologramsRemove4Img4")) return;
    CPyramid resultPyr(kLevels, top.GetWidth(), top.GetHeight(), 3);
    const CImage* const candidates[4] = {&top, &bottom, &left, &right};
    holo4::CandidatePyramids pyramids;
    holo4::BuildCandidatePyramids(candidates, pyramids);
    const CPyramid* laplacian = pyramids.laplacian;
    resultPyr.ForceType(CPyramid::PyrLaplacian);

    const int coarsest = kLevels - 1;
    const CImage& coarse0 = laplacian[0].GetLevel(coarsest);
    holo4::ForEachRowBand(coarse0.GetHeight(), [&](int begin, int end) {
        for (int y = begin; y < end; ++y) {
            unsigned char* out = resultPyr.GetLevel(coarsest).GetPtrXY(0, y);
            for (int x = 0; x < coarse0.GetWidth(); ++x) {
                const unsigned char* lap[4];
                for (int i = 0; i < 4; ++i) lap[i] = laplacian[i].GetLevel(coarsest).GetPtrXY(x, y);
                holo4::AverageOfTwoDarkest(lap, out + 3 * x);
            }
        }
    });

    LevelPlanes planes(static_cast<size_t>(top.GetWidth()) * top.GetHeight());
    for (int level = coarsest - 1; level >= 0; --level) {
        planes.width = laplacian[0].GetLevel(level).GetWidth();
        planes.height = laplacian[0].GetLevel(level).GetHeight();
        uint32_t histS[256] = {}, histV[256] = {};
        FirstPass(pyramids, level, planes, histS, histV);
        const int64_t n = static_cast<int64_t>(planes.width) * planes.height * 15 / 100;
        const int ts = holo4::SpreadThreshold(histS, n), tv = holo4::SpreadThreshold(histV, n);
        SecondPass(pyramids, level, planes, ts, tv, resultPyr.GetLevel(level));
    }
    holo4::CollapseInto(resultPyr, result);
}
