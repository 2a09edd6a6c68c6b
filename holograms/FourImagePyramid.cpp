// Four-image glare removal inside Laplacian pyramids: every pixel of every level of the
// result is chosen or synthesised from the four candidates by brightness (of the Gaussian
// level), saturation and detail strength (of the Laplacian level).
#include <cstdint>
#include <utility>

#include "holograms/FourImageInternal.h"
#include "holograms/FourImagePyramidInternal.h"
#include "holograms/HologramsRemove.h"
#include "imagelib/Parallel.h"
#include "imagelib/StopWatch.h"
#include "imagelib/Trace.h"

using holo4::CopyPixel;
using holo4::kLevels;
using holo4::MaxChannel;
using holo4::MinChannel;

namespace holo4 {

void BrightnessRow(const unsigned char* pixels, unsigned char* out, int begin, int end) {
    for (int x = begin; x < end; ++x) out[x] = static_cast<unsigned char>(MaxChannel(pixels + 3 * x));
}

void BuildCandidatePyramids(const CImage* const images[4], CandidatePyramids& c) {
    // Distinct pyramids share nothing, so the four decompositions run side by side; each
    // one's filters split their rows further. Of the Gaussian levels only the brightness
    // (largest channel) of each pixel is needed, so it is kept instead of a copy of the
    // levels; the Laplacian levels are the same bytes either way.
    imagelib::TaskGroup tasks;
    for (int i = 0; i < 4; ++i) {
        tasks.Run([&c, &images, i] {
            CPyramid& pyr = c.laplacian[i];
            pyr.Init(*images[i], kLevels);
            pyr.MakeGaussian();
            for (int k = 0; k < kLevels; ++k) {
                const CImage& level = pyr.GetLevel(k);
                CImage& bright = c.brightness[i][k];
                bright.Reallocate(level.GetWidth(), level.GetHeight(), 8);
                ForEachRowBand(level.GetHeight(), [&](int begin, int end) {
                    for (int y = begin; y < end; ++y)
                        BrightnessRowFast(level.GetPtrXY(0, y), bright.GetPtrXY(0, y), level.GetWidth());
                });
            }
            pyr.MakeLaplacian();
        });
    }
    tasks.Wait();
}

void CollapseInto(CPyramid& result, CImage& out) {
    result.ReconstructGaussian();
    // The pyramid is discarded afterwards: hand its level 0 over instead of copying it.
    out = std::move(result.GetLevel(0));
}

void ForEachRowBand(int height, const std::function<void(int, int)>& body) {
    imagelib::ParallelFor(0, height, body, 16);
}

// Coarsest level of HologramsRemove4Img: the darker of top and bottom (top on ties).
void DarkerOfFirstTwoRow(const unsigned char* const lap[4], unsigned char* out, int width) {
    for (int x = 0; x < width; ++x) {
        const unsigned char* p0 = lap[0] + 3 * x;
        const unsigned char* p1 = lap[1] + 3 * x;
        CopyPixel(out + 3 * x, MaxChannel(p1) < MaxChannel(p0) ? p1 : p0);
    }
}

void ComposePixels(const unsigned char* const lap[4], const unsigned char* const bright[4], unsigned char* out,
                   int begin, int end) {
    for (int x = begin; x < end; ++x) {
        const unsigned char* detail[4] = {lap[0] + 3 * x, lap[1] + 3 * x, lap[2] + 3 * x, lap[3] + 3 * x};
        const int brightness[4] = {bright[0][x], bright[1][x], bright[2][x], bright[3][x]};
        ComposePixel(detail, brightness, out + 3 * x);
    }
}

void ComposePixel(const unsigned char* const detail[4], const int bright[4], unsigned char* out) {
    int saturatedCount = 0;
    int darkestSaturated = -1;
    int least = -1, second = -1;
    int leastBright = 1000, secondBright = 1000;
    int peak[4] = {0, 0, 0, 0};
    int largestPeak = -1, largestCandidate = -1, smallestPeak = 1000;
    int unsaturated = -1;

    for (int i = 0; i < 4; ++i) {
        if (bright[i] >= kSaturatedBrightness) {
            ++saturatedCount;
            if (darkestSaturated < 0 || bright[i] < bright[darkestSaturated]) darkestSaturated = i;
            continue;
        }
        unsaturated = i;
        if (bright[i] <= leastBright) {  // on ties the later candidate becomes the least
            second = least;
            secondBright = leastBright;
            least = i;
            leastBright = bright[i];
        } else if (bright[i] <= secondBright) {
            second = i;
            secondBright = bright[i];
        }
        peak[i] = MaxChannel(detail[i]);
        if (peak[i] > largestPeak) {
            largestPeak = peak[i];
            largestCandidate = i;
        }
        if (peak[i] < smallestPeak) smallestPeak = peak[i];
    }

    if (saturatedCount == 4) {
        CopyPixel(out, detail[darkestSaturated]);
        return;
    }
    if (saturatedCount == 3) {
        CopyPixel(out, detail[unsaturated]);
        return;
    }
    if (saturatedCount == 0 && largestPeak - smallestPeak < kPeakSpread) {
        CopyPixel(out, detail[largestCandidate]);
        return;
    }
    // Synthesis. The colour comes from the most neutral unsaturated detail (the earliest on
    // ties); with none above 0 the coefficients stay 1 and the pixel is the grey value v.
    float neutrality = 0.0f;
    float coefficient[3] = {1.0f, 1.0f, 1.0f};
    for (int i = 0; i < 4; ++i) {
        if (bright[i] >= kSaturatedBrightness || peak[i] == 0) continue;
        const float ratio = static_cast<float>(MinChannel(detail[i])) / static_cast<float>(peak[i]);
        if (ratio > neutrality) {
            neutrality = ratio;
            for (int c = 0; c < 3; ++c) coefficient[c] = static_cast<float>(detail[i][c]) / static_cast<float>(peak[i]);
        }
    }
    // At least two candidates are unsaturated here, so both least and second exist.
    const bool secondIsFlatter = peak[second] < peak[least];
    const int p = secondIsFlatter ? second : least;
    const int q = secondIsFlatter ? least : second;
    int v = peak[p];
    if (v > 127 && peak[q] - v < kPeakSpread) v = peak[q];
    for (int c = 0; c < 3; ++c)
        out[c] = static_cast<unsigned char>(static_cast<int>(static_cast<float>(v) * coefficient[c]));
}

// HologramsRemove4Img3: the flattest detail among candidates below 250; top if none.
void FlattestUnsaturatedPixels(const unsigned char* const lap[4], const unsigned char* const bright[4],
                               unsigned char* out, int begin, int end) {
    for (int x = begin; x < end; ++x) {
        int best = 1000, chosen = 0;
        for (int i = 0; i < 4; ++i) {
            const int peak = MaxChannel(lap[i] + 3 * x);
            if (peak < best && bright[i][x] < kBrightLimit3) {
                best = peak;
                chosen = i;
            }
        }
        CopyPixel(out + 3 * x, lap[chosen] + 3 * x);
    }
}

}  // namespace holo4

namespace {

// Runs `rowRule` over every row of level L of the result, with the candidates' rows.
template <typename RowRule>
void ComposeLevel(CPyramid& result, const holo4::CandidatePyramids& c, int level, RowRule rowRule) {
    const int width = c.laplacian[0].GetLevel(level).GetWidth();
    const int height = c.laplacian[0].GetLevel(level).GetHeight();
    holo4::ForEachRowBand(height, [&](int begin, int end) {
        for (int y = begin; y < end; ++y) {
            const holo4::CandidateLevelRows rows(c, level, y);
            rowRule(rows.lap, rows.bright, result.GetLevel(level).GetPtrXY(0, y), width);
        }
    });
}

}  // namespace

void CHologramsRemove::HologramsRemove4Img(const CImage& top, const CImage& bottom, const CImage& left,
                                           const CImage& right, CImage& result) {
    if (!holo4::CheckFourInputs(top, bottom, left, right, L"HologramsRemove4Img")) return;
    CPyramid resultPyr(kLevels, top.GetWidth(), top.GetHeight(), 3);
    CStopWatch watch;
    watch.Start();
    // Candidate order: top, bottom, right, left.
    const CImage* const candidates[4] = {&top, &bottom, &right, &left};
    holo4::CandidatePyramids pyramids;
    holo4::BuildCandidatePyramids(candidates, pyramids);
    resultPyr.ForceType(CPyramid::PyrLaplacian);
    Trace(L"Pyramid creation time: %f\n", watch.ElapsedMicro() / 1000.0);

    ComposeLevel(resultPyr, pyramids, kLevels - 1,
                 [](const unsigned char* const lap[4], const unsigned char* const*, unsigned char* out, int width) {
                     holo4::DarkerOfFirstTwoRow(lap, out, width);
                 });
    for (int level = kLevels - 2; level >= 0; --level)
        ComposeLevel(resultPyr, pyramids, level, holo4::ComposeRowFast);
    holo4::CollapseInto(resultPyr, result);
}

void CHologramsRemove::HologramsRemove4Img3(const CImage& top, const CImage& bottom, const CImage& left,
                                            const CImage& right, CImage& result) {
    if (!holo4::CheckFourInputs(top, bottom, left, right, L"HologramsRemove4Img3")) return;
    CPyramid resultPyr(kLevels, top.GetWidth(), top.GetHeight(), 3);
    // Parameter order here. The brightness kept from the Laplacian construction is that of
    // a separately built Gaussian pyramid, byte for byte.
    const CImage* const candidates[4] = {&top, &bottom, &left, &right};
    holo4::CandidatePyramids pyramids;
    holo4::BuildCandidatePyramids(candidates, pyramids);
    resultPyr.ForceType(CPyramid::PyrLaplacian);
    for (int level = kLevels - 1; level >= 0; --level)
        ComposeLevel(resultPyr, pyramids, level, holo4::FlattestUnsaturatedRowFast);
    holo4::CollapseInto(resultPyr, result);
}
