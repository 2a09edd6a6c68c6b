// The three two-image glare separations: detection on downscaled shots with repair at full
// resolution, a per-pixel choice inside Laplacian pyramids, and region growing from seeds.

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <deque>
#include <utility>

#include "frame/ImageArithmetic.h"
#include "frame/Matrix.h"
#include "holograms/HologramsRemove.h"
#include "holograms/PixelHelpersInternal.h"
#include "imagelib/Parallel.h"
#include "imagelib/StopWatch.h"
#include "imagelib/Trace.h"

using holo::Refuse;
using holo::Row;

// A seed of HologramsSeperation3. Glare seeds (kind 1) carry the B, G, R bytes of image 2,
// image 1 and both local averages; tint seeds (kind 0) the local average of image 2 and a
// brightness correction.
struct HologramSeed {
    int32_t x;
    int32_t y;
    int32_t kind;
    unsigned char image2[3];
    unsigned char image1[3];
    unsigned char average2[3];
    unsigned char average1[3];
    int16_t correction;
};

namespace holo {
namespace {

constexpr int kGlareSeed = 1;
constexpr int kTintSeed = 0;

bool PipelineInputsValid(const wchar_t* name, const CImage& image1, const CImage& image2) {
    if (&image1 == &image2) return !Refuse(name, "the two shots are one image");
    if (HasDepth(image1, 24) && SameGeometry(image1, image2)) return true;
    return !Refuse(name, "the shots must be 24-bit images of one size");
}

// Largest and smallest byte of a B, G, R pixel and the channel of the largest (ties: B, then G).
struct ChannelRange {
    int largest;
    int smallest;
    int channel;
};

ChannelRange RangeOf(const unsigned char* p) {
    ChannelRange r{p[0], std::min({p[0], p[1], p[2]}), 0};
    if (p[1] > r.largest) r = {p[1], r.smallest, 1};
    if (p[2] > r.largest) r = {p[2], r.smallest, 2};
    return r;
}

// The pixel's bytes as a float vector of length 1 (all zero when the pixel is black).
void UnitVector(const unsigned char* p, ZentMatrix::CMatrix<float>& v) {
    for (uint32_t c = 0; c < 3; ++c) v[c] = static_cast<float>(p[c]);
    const float length = std::sqrt(v.dot(v));
    if (length > 0.0f) v.scale(1.0f / length);
}

// The seed list is emptied however the pipeline ends; the records belong to SeedGrowth.
struct SeedListGuard {
    CArray<HologramSeed*>& list;
    ~SeedListGuard() { list.RemoveAll(); }
};

class SeedGrowth {
public:
    SeedGrowth(CImage& image1, CImage& image2, CImage& average1, CImage& average2, CImage& detail1,
               CImage& detail2, CArray<HologramSeed*>& list)
        : m_image1(image1), m_image2(image2), m_average1(average1), m_average2(average2), m_detail1(detail1),
          m_detail2(detail2), m_list(list) {
        m_marks.Reallocate(image2.GetWidth(), image2.GetHeight(), 8, 0);
    }

    void PlantSeeds(int topRow, int bottomRow) {
        const int height = m_image2.GetHeight();
        for (int y = std::max(topRow + 20, 0); y <= std::min(bottomRow - 21, height - 1); ++y) {
            for (int x = 0; x < m_image2.GetWidth(); ++x) {
                const ChannelRange d2 = RangeOf(Row(m_detail2, y) + 3 * x);
                const ChannelRange d1 = RangeOf(Row(m_detail1, y) + 3 * x);
                const bool glare = d2.largest > 148 && d1.largest > 0 &&
                                   (d2.largest > d1.largest + 20 || (d2.largest > d1.largest && d2.channel != d1.channel));
                if (glare) {
                    AddGlareSeed(x, y);
                } else if (d2.smallest < 90 && d2.largest > 150 && Row(m_image2, y)[3 * x + d2.channel] > 180) {
                    AddTintSeed(x, y, d2.smallest - 128);
                }
            }
        }
    }

    // Visits the list while it grows: every seed may add its unmarked 8-neighbours.
    void Grow() {
        ZentMatrix::CMatrix<float> reference(3, 1), unit2(3, 1), unit1(3, 1);
        const int width = m_image2.GetWidth();
        const int height = m_image2.GetHeight();
        for (int i = 0; i < m_list.GetSize(); ++i) {
            const HologramSeed seed = *m_list[i];
            UnitVector(Row(m_detail2, seed.y) + 3 * seed.x, reference);
            for (int dy = -1; dy <= 1; ++dy) {
                for (int dx = -1; dx <= 1; ++dx) {
                    const int x = seed.x + dx;
                    const int y = seed.y + dy;
                    if (x < 0 || y < 0 || x >= width || y >= height || Row(m_marks, y)[x] != 0) continue;
                    const unsigned char* d2 = Row(m_detail2, y) + 3 * x;
                    UnitVector(d2, unit2);
                    if (!(unit2.dot(reference) > 0.997)) continue;
                    const unsigned char* d1 = Row(m_detail1, y) + 3 * x;
                    UnitVector(d1, unit1);
                    const float direction = unit1.dot(reference);
                    const ChannelRange r2 = RangeOf(d2);
                    const ChannelRange r1 = RangeOf(d1);
                    if (IsGlare(direction, r1, r2)) {
                        AddGlareSeed(x, y);
                    } else if (seed.kind == kTintSeed && r2.largest > 150 && r2.smallest < r2.largest - 30) {
                        AddTintSeed(x, y, (r2.smallest - 128) / 2);
                    }
                }
            }
        }
    }

    // Image 2 takes, at every seed in list order, image 1's bytes moved onto its own average
    // (glare) or its average with the correction (tint).
    void Repair() {
        for (int i = 0; i < m_list.GetSize(); ++i) {
            const HologramSeed& seed = *m_list[i];
            unsigned char* p = Row(m_image2, seed.y) + 3 * seed.x;
            for (int c = 0; c < 3; ++c) {
                p[c] = seed.kind == kGlareSeed
                           ? ClampByte(seed.average2[c] - seed.average1[c] + seed.image1[c])
                           : ClampByte(seed.average2[c] + seed.correction);
            }
        }
    }

private:
    static bool IsGlare(float direction, const ChannelRange& r1, const ChannelRange& r2) {
        if (r1.largest <= 0) return false;
        const float ratio1 = static_cast<float>(r1.smallest) / static_cast<float>(r1.largest);
        if (direction < 0.994 && r2.largest > 0 &&
            ratio1 > static_cast<float>(r2.smallest) / static_cast<float>(r2.largest))
            return true;
        return r2.largest > 150 && r2.smallest < r2.largest - 30 &&
               ratio1 - 0.05 > static_cast<float>(r2.smallest) / static_cast<float>(r2.largest);
    }

    HologramSeed& NewSeed(int x, int y, int kind, unsigned char mark) {
        Row(m_marks, y)[x] = mark;
        HologramSeed& seed = m_storage.emplace_back();
        seed = HologramSeed{};
        seed.x = x;
        seed.y = y;
        seed.kind = kind;
        m_list.Add(&seed);
        return seed;
    }

    void AddGlareSeed(int x, int y) {
        HologramSeed& seed = NewSeed(x, y, kGlareSeed, 255);
        const int at = 3 * x;
        std::copy_n(Row(m_image2, y) + at, 3, seed.image2);
        std::copy_n(Row(m_image1, y) + at, 3, seed.image1);
        std::copy_n(Row(m_average2, y) + at, 3, seed.average2);
        std::copy_n(Row(m_average1, y) + at, 3, seed.average1);
    }

    void AddTintSeed(int x, int y, int correction) {
        HologramSeed& seed = NewSeed(x, y, kTintSeed, 150);
        std::copy_n(Row(m_average2, y) + 3 * x, 3, seed.average2);
        seed.correction = static_cast<int16_t>(correction);
    }

    CImage& m_image1;
    CImage& m_image2;
    CImage& m_average1;
    CImage& m_average2;
    CImage& m_detail1;
    CImage& m_detail2;
    CArray<HologramSeed*>& m_list;
    CImage m_marks;
    std::deque<HologramSeed> m_storage;  // stable addresses for the list's pointers
};

}  // namespace
}  // namespace holo

void CHologramsRemove::HologramsSeperation(CImage& image1, CImage& image2, CImage&, int topRow, int bottomRow) {
    if (!holo::PipelineInputsValid(L"HologramsSeperation", image1, image2)) return;
    // One stopwatch per thread: concurrent pipelines on different objects do not race on it.
    thread_local CStopWatch stopWatch;
    stopWatch.Start();

    CImage small1, small2, difference, model, map1, map2, average1, average2;
    ScaleDownMaxImg_X3_24(image1, small1);
    ScaleDownMaxImg_X3_24(image2, small2);
    m_avDifVal = 128;
    const int top3 = topRow / 3;
    const int bottom3 = bottomRow / 3;
    SubImg_24_Alg3(small1, small2, difference, 3, true, 0.75f, top3, bottom3);
    m_avDelta = m_avDifVal - 128;
    CalcAvImg_24_By_XY(difference, model, 1, top3, bottom3);

    int score1 = 0;
    int score2 = 0;
    Find_HologramPixels_24_New_Alg3(difference, model, small1, small2, map1, map2, 31, top3, bottom3, score1, score2);
    Add_Saturated_Pixels(small1, small2, map1, map2, score1, score2, 31);

    const auto startOfAverages = static_cast<int64_t>(stopWatch.ElapsedMicro());
    CalcAvImg_24(small1, average1, 28);
    CalcAvImg_24(small2, average2, 28);
    const auto afterAverages = static_cast<int64_t>(stopWatch.ElapsedMicro());
    Trace(L"CalcAvImg_24 Time = %8.3f\n", static_cast<float>(afterAverages - startOfAverages) / 1000.0);

    ClearHologramsDirth_24(map1, 3, 31, score1);
    ClearHologramsDirth_24(map2, 3, 31, score2);
    ExpandHologramsBolbsN(map1, 13, 2);
    ExpandHologramsBolbsN(map2, 13, 2);
    CollectHologramsPixels_New(small1, average1, small2, average2, map1, map2, difference, 31);

    // The shot with less glare is the base; the other one only lends its detail.
    if (score1 < score2) {
        FixRealImages_24_New(image1, image2, 3, 1);
    } else {
        FixRealImages_24_New(image1, image2, 3, 2);
        std::swap(image1, image2);  // the repaired image 2 is the result; image 2 keeps image 1
    }
    const auto total = static_cast<int64_t>(stopWatch.ElapsedMicro());
    Trace(L"HologramsSeperation Time %8.3f  [img1Pixels=%7d - img2Pixels=%7d] [m_avDifVal=%3d - m_avDelta=%4d]\n",
          static_cast<float>(total) / 1000.0, score1, score2, m_avDifVal, m_avDelta);
}

void CHologramsRemove::HologramsSeperation2(CImage& image1, CImage& image2, CImage&, int, int) {
    if (!holo::PipelineInputsValid(L"HologramsSeperation2", image1, image2)) return;
    constexpr int kLevels = 7;
    // Image 1's Laplacian pyramid is turned into the result in place: every level starts as
    // image 1's and takes image 2's pixel where that one wins, which is the same as filling a
    // fresh result pyramid, without allocating and copying a third pyramid.
    CPyramid result, pyramid2;
    {
        imagelib::TaskGroup tasks;
        tasks.Run([&] {
            pyramid2.Init(image2, kLevels);
            pyramid2.MakeLaplacian();
        });
        tasks.Run([&] {
            result.Init(image1, kLevels);
            result.MakeLaplacian();
        });
        tasks.Wait();
    }
    result.GetLevel(kLevels - 1) = std::move(pyramid2.GetLevel(kLevels - 1));
    // Per pixel, the detail whose largest channel is smaller; ties go to image 1.
    for (int level = kLevels - 2; level >= 0; --level) {
        CImage& out = result.GetLevel(level);
        const CImage& level2 = pyramid2.GetLevel(level);
        const int width = out.GetWidth();
        imagelib::ParallelFor(
            0, out.GetHeight(),
            [&](int begin, int end) {
                for (int y = begin; y < end; ++y) {
                    unsigned char* o = Row(out, y);
                    const unsigned char* p2 = Row(level2, y);
                    for (int x = 0; x < width; ++x) {
                        const int at = 3 * x;
                        const int largest2 = std::max({p2[at], p2[at + 1], p2[at + 2]});
                        const int largest1 = std::max({o[at], o[at + 1], o[at + 2]});
                        if (largest2 < largest1) std::copy_n(p2 + at, 3, o + at);
                    }
                }
            },
            16);
    }
    result.ForceType(CPyramid::PyrLaplacian);
    result.ReconstructGaussian();
    image1 = std::move(result.GetLevel(0));
}

void CHologramsRemove::HologramsSeperation3(CImage& image1, CImage& image2, CImage&, int topRow, int bottomRow) {
    if (!holo::PipelineInputsValid(L"HologramsSeperation3", image1, image2)) return;
    CImage average1, average2, detail1, detail2;
    CalcAvImg_24(image2, average2, 64);
    CalcAvImg_24(image1, average1, 64);
    // Detail = image - average + 128 per byte, clamped: the frame's vectorised subtraction.
    ImageSubtract(image2, average2, detail2);
    ImageSubtract(image1, average1, detail1);

    holo::SeedListGuard guard{m_seedList};
    m_seedList.RemoveAll();
    holo::SeedGrowth growth(image1, image2, average1, average2, detail1, detail2, m_seedList);
    growth.PlantSeeds(topRow, bottomRow);
    growth.Grow();
    growth.Repair();
    image1 = image2;
}
