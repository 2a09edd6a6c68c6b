// The neighbourhood-vote glare detectors, the thresholded grey difference, the gradient edge
// classifier and the mask-clearing utility.

#include <cstdint>
#include <array>
#include <cstdlib>
#include <initializer_list>

#include "holograms/HologramsRemove.h"
#include "holograms/PixelHelpersInternal.h"
#include "imagelib/Parallel.h"

using holo::Refuse;
using holo::Row;

namespace holo {
namespace {

struct Offset {
    int dx;
    int dy;
};

// Eight neighbours on the square of radius r, then four on the diagonal square of radius r / 2.
std::array<Offset, 12> VoteNeighbours(int radius) {
    const int r = radius;
    const int h = radius / 2;
    return {{{-r, -r}, {0, -r}, {r, -r}, {-r, 0}, {r, 0}, {-r, r}, {0, r}, {r, r}, {-h, -h}, {h, -h}, {-h, h}, {h, h}}};
}


// Inputs of one depth and geometry, maps that are not inputs. On success the maps are 8-bit of
// image 1's size and clear.
bool PrepareVote(const wchar_t* name, int bits, ShotImages& v, int radius, int& count1, int& count2) {
    const std::initializer_list<const CImage*> inputs = {&v.image1, &v.average1, &v.image2, &v.average2};
    for (const CImage* input : inputs)
        if ((!HasDepth(*input, bits) || !SameGeometry(v.image1, *input)) &&
            Refuse(name, "images and averages must be non-empty images of one size and the detector's depth"))
            return false;
    for (const CImage* input : inputs)
        if ((input == &v.map1 || input == &v.map2) && Refuse(name, "a map is also an input")) return false;
    if (&v.map1 == &v.map2 && Refuse(name, "the two maps are one image")) return false;
    v.map1.Reallocate(v.image1.GetWidth(), v.image1.GetHeight(), 8, 0);
    v.map2.Reallocate(v.image1.GetWidth(), v.image1.GetHeight(), 8, 0);
    count1 = 0;
    count2 = 0;
    // Any radius of 0 or more keeps the neighbours of every evaluated pixel inside the rows;
    // a negative one would reach outside.
    if (radius < 0 && Refuse(name, "negative radius")) return false;
    return true;
}

// Rows y + dy of the twelve neighbours, for one image.
std::array<const unsigned char*, 12> NeighbourRows(const CImage& image, int y, const std::array<Offset, 12>& at) {
    std::array<const unsigned char*, 12> rows{};
    for (size_t k = 0; k < at.size(); ++k) rows[k] = Row(image, y + at[k].dy);
    return rows;
}

// Row y of the shots, averages and maps, and the neighbour rows of the shots and averages.
struct VoteRows : ShotRows {
    std::array<const unsigned char*, 12> n1, n2, na1, na2;

    VoteRows(const ShotImages& s, int y, const std::array<Offset, 12>& at)
        : ShotRows(s, y), n1(NeighbourRows(s.image1, y, at)), n2(NeighbourRows(s.image2, y, at)),
          na1(NeighbourRows(s.average1, y, at)), na2(NeighbourRows(s.average2, y, at)) {}
};

struct Verdict {
    bool candidate1, candidate2;
    int votes1, votes2, similar;

    // A candidate is bright, not clearly darker than the other shot and more than `excess`
    // above its local average.
    Verdict(int p1, int p2, int average1, int average2, int excess)
        : candidate1(p1 >= 96 && p2 - p1 < 8 && p1 - average1 > excess),
          candidate2(p2 >= 96 && p1 - p2 < 8 && p2 - average2 > excess), votes1(0), votes2(0), similar(0) {}
};

// Marks the pixel (shot values p1, p2) by the bright and strong rules; counts strong glare
// inside the document rows.
void MarkVerdict(const Verdict& v, int p1, int p2, unsigned char& mark1, unsigned char& mark2, bool inRows,
                 int& count1, int& count2) {
    const bool bright1 = p1 >= 240 && p2 <= 230;
    const bool bright2 = p2 >= 240 && p1 <= 230;
    const bool strong1 = v.candidate1 && v.votes1 >= 8 && v.similar < 6;
    const bool strong2 = v.candidate2 && v.votes2 >= 8 && v.similar < 6;
    if ((bright1 && !bright2) || strong1) {
        if (mark1 == 0) mark1 = 250;
        if (strong1 && inRows) ++count1;
    }
    if ((bright2 && !bright1) || strong2) {
        if (mark2 == 0) mark2 = 250;
        if (strong2 && inRows) ++count2;
    }
}

}  // namespace
}  // namespace holo

void CHologramsRemove::SubImg_8(CImage& image1, CImage& image2, CImage& output, int border) {
    if (image1.GetBitCount() != 8) return;
    if (!holo::SameGeometry(image1, image2) && Refuse(L"SubImg_8", "the images differ in size or depth")) return;
    if ((&output == &image1 || &output == &image2) && Refuse(L"SubImg_8", "the output is an input")) return;
    if (border < 0 && Refuse(L"SubImg_8", "negative border")) return;
    output.Reallocate(image1.GetWidth(), image1.GetHeight(), 8, 0);
    for (int y = border; y < image1.GetHeight() - border; ++y) {
        const unsigned char* p1 = Row(image1, y);
        const unsigned char* p2 = Row(image2, y);
        unsigned char* out = Row(output, y);
        for (int x = border; x < image1.GetWidth() - border; ++x)
            if (p1[x] - p2[x] > 10) out[x] = p1[x];
    }
}

void CHologramsRemove::FindHologramsPixels_8(CImage& image1, CImage& average1, CImage& image2, CImage& average2,
                                             CImage& map1, CImage& map2, int radius, int topRow, int bottomRow,
                                             int& count1, int& count2) {
    holo::ShotImages shots{image1, average1, image2, average2, map1, map2};
    if (!holo::PrepareVote(L"FindHologramsPixels_8", 8, shots, radius, count1, count2)) return;
    const auto at = holo::VoteNeighbours(radius);
    const int height = image1.GetHeight();
    const int span = image1.GetSpan();  // the padding of each row takes part like pixels
    for (int y = radius; y < height - radius; ++y) {
        const holo::VoteRows r(shots, y, at);
        for (int x = radius; x < span - radius; ++x) {
            const int p1 = r.i1[x];
            const int p2 = r.i2[x];
            holo::Verdict v(p1, p2, r.a1[x], r.a2[x], 10);
            if (!v.candidate1 && !v.candidate2) continue;
            bool aborted = false;
            for (size_t k = 0; k < at.size() && !aborted; ++k) {
                const int nx = x + at[k].dx;
                const int e1 = p1 - r.n1[k][nx];
                const int e2 = p2 - r.n2[k][nx];
                if (p1 - r.na1[k][nx] > 10) ++v.votes1;
                if (p2 - r.na2[k][nx] > 10) ++v.votes2;
                aborted = (p1 >= 161 && e1 > 128) || (p2 >= 161 && e2 > 128);
                if (!aborted && std::abs(e1 - e2) < 20) ++v.similar;
            }
            if (aborted) {
                r.m1[x] = 0;
                r.m2[x] = 0;
                continue;
            }
            holo::MarkVerdict(v, p1, p2, r.m1[x], r.m2[x], topRow < y && y < bottomRow, count1, count2);
        }
    }
    Trace(L"img1HologramPixels=%4d  - img2HologramPixels=%4d\n", count1, count2);
}

void CHologramsRemove::FindHologramsPixels_24(CImage& image1, CImage& average1, CImage& image2, CImage& average2,
                                              CImage& map1, CImage& map2, int radius, int topRow, int bottomRow,
                                              int& count1, int& count2) {
    holo::ShotImages shots{image1, average1, image2, average2, map1, map2};
    if (!holo::PrepareVote(L"FindHologramsPixels_24", 24, shots, radius, count1, count2)) return;
    const auto at = holo::VoteNeighbours(radius);
    const int height = image1.GetHeight();
    const int span = image1.GetSpan();  // the padding of each row takes part like sub-pixels
    for (int y = radius; y < height - radius; ++y) {
        const holo::VoteRows r(shots, y, at);
        for (int i = 3 * radius; i < span - 3 * radius; ++i) {
            const int pixel = i / 3;  // the three channels share one mask byte
            const int p1 = r.i1[i];
            const int p2 = r.i2[i];
            holo::Verdict v(p1, p2, r.a1[i], r.a2[i], 20);
            if (!v.candidate1 && !v.candidate2) continue;
            bool aborted = false;
            int steep1 = 0, steep2 = 0;
            for (size_t k = 0; k < at.size() && !aborted; ++k) {
                const int ni = i + 3 * at[k].dx;
                const int e1 = p1 - r.n1[k][ni];
                const int e2 = p2 - r.n2[k][ni];
                const int local1 = p1 - r.na1[k][ni];
                const int local2 = p2 - r.na2[k][ni];
                if (local1 > 10) ++v.votes1;
                if (local2 > 10) ++v.votes2;
                if (p1 >= 161 && e1 >= 129) ++steep1;
                if (p2 >= 161 && e2 >= 129) ++steep2;
                aborted = e1 < -64 || e2 < -64 || steep1 > 2 || steep2 > 2;
                if (!aborted && std::abs(local1 - local2) < 30) ++v.similar;
            }
            if (aborted) {
                r.m1[pixel] = 0;
                r.m2[pixel] = 0;
                i = 3 * pixel + 2;  // skip the pixel's remaining channels
                continue;
            }
            holo::MarkVerdict(v, p1, p2, r.m1[pixel], r.m2[pixel], topRow < y && y < bottomRow, count1, count2);
        }
    }
    Trace(L"img1HologramPixels=%4d  - img2HologramPixels=%4d\n", count1, count2);
}

void CHologramsRemove::GradImg_24(CImage& image, CImage& horizontal, CImage& vertical, int border) {
    if (image.GetBitCount() != 24) return;
    // The vertical taps reach six rows and the horizontal ones two pixels.
    if (border < 6 && Refuse(L"GradImg_24", "border below 6, the reach of the vertical taps")) return;
    if (&horizontal == &vertical && Refuse(L"GradImg_24", "both gradients are one image")) return;
    CImage copy;
    const CImage& source = (&image == &horizontal || &image == &vertical) ? (copy = image) : image;
    const int width = source.GetWidth();
    const int height = source.GetHeight();
    horizontal.Reallocate(width, height, 24, 0);
    vertical.Reallocate(width, height, 24, 0);
    const int span = source.GetSpan();
    imagelib::ParallelFor(
        border, height - border,
        [&](int begin, int end) {
            for (int y = begin; y < end; ++y) {
                const unsigned char* p = Row(source, y);
                // Rows are stored bottom-up: row y + k lies k spans lower in memory.
                const unsigned char* before6 = p + 6 * span;
                const unsigned char* before3 = p + 3 * span;
                const unsigned char* after3 = p - 3 * span;
                const unsigned char* after6 = p - 6 * span;
                unsigned char* h = Row(horizontal, y);
                unsigned char* v = Row(vertical, y);
                for (int i = 3 * border; i < 3 * (width - border); ++i) {
                    h[i] = static_cast<unsigned char>((((p[i + 6] - p[i - 6]) >> 1) + p[i + 3] - p[i - 3]) / 3 + 128);
                    v[i] = static_cast<unsigned char>((((after6[i] - before6[i]) >> 1) + after3[i] - before3[i]) / 3 + 128);
                }
            }
        },
        16);
}

void CHologramsRemove::MapHologramsEdges_24(CImage& gradient1, CImage& gradient2, CImage& edges1, CImage& edges2,
                                            int border, int threshold) {
    if (gradient1.GetBitCount() != 24 || gradient2.GetBitCount() != 24) return;
    const wchar_t* name = L"MapHologramsEdges_24";
    if (!holo::AllSame24({&gradient1, &gradient2, &edges1, &edges2}) &&
        Refuse(name, "gradients and edge masks must be 24-bit images of one size"))
        return;
    if (border < 0 && Refuse(name, "negative border")) return;
    const int64_t t = threshold;  // 2 * t must not wrap for large thresholds
    const int width = gradient1.GetWidth();
    for (int y = border; y < gradient1.GetHeight() - border; ++y) {
        const unsigned char* g1 = Row(gradient1, y);
        const unsigned char* g2 = Row(gradient2, y);
        unsigned char* e1 = Row(edges1, y);
        unsigned char* e2 = Row(edges2, y);
        for (int i = 3 * border; i < 3 * (width - border); ++i) {
            const int a = g1[i] - 128;
            const int b = g2[i] - 128;
            if (a > 2 * t && b < t)
                e1[i] = 250;
            else if (a < -2 * t && b > -t)
                e1[i] = 200;
            else if (b > 2 * t && a < t)
                e2[i] = 250;
            else if (b < -2 * t && a > -t)
                e2[i] = 200;
        }
    }
}

void CHologramsRemove::ClearMapByMap(CImage& mask, CImage& reference, int border) {
    if ((!holo::HasDepth(mask, 8) || !holo::SameGeometry(mask, reference)) &&
        Refuse(L"ClearMapByMap", "mask and reference must be 8-bit images of one size"))
        return;
    if (border < 0 && Refuse(L"ClearMapByMap", "negative border")) return;
    for (int y = border; y < mask.GetHeight() - border; ++y) {
        unsigned char* m = Row(mask, y);
        const unsigned char* r = Row(reference, y);
        for (int x = border; x < mask.GetWidth() - border; ++x)
            if (r[x] > 128) m[x] = 0;
    }
}
