#include "varnoth/TwoImageMethods.h"

#include <algorithm>
#include <cmath>
#include <utility>

namespace {

// Parameters of the vote chain relative to the downscaled width (tuned at 200 pixels).
struct VoteChain {
    int window;
    int radius;
    int growth;
};

VoteChain VoteChainFor(int smallWidth) {
    const double f = smallWidth / 200.0;
    VoteChain c;
    c.window = std::max(15, static_cast<int>(std::lround(45 * f)) | 1);
    c.radius = std::max(4, static_cast<int>(std::lround(8 * f)));
    c.growth = std::clamp(static_cast<int>(std::lround(16 * f)), 1, 49);
    return c;
}

}  // namespace

void RunVoteTransfer(CHologramsRemove& remover, CImage& image1, CImage& image2, int top, int bottom) {
    CImage small1, small2, average1, average2, map1, map2, unused;
    remover.ScaleDownMaxImg_X3_24(image1, small1);
    remover.ScaleDownMaxImg_X3_24(image2, small2);
    const VoteChain chain = VoteChainFor(small1.GetWidth());
    remover.CalcAvImg_24(small1, average1, chain.window);
    remover.CalcAvImg_24(small2, average2, chain.window);
    int count1 = 0, count2 = 0;
    remover.FindHologramsPixels_24(small1, average1, small2, average2, map1, map2, chain.radius, top / 3, bottom / 3,
                                   count1, count2);
    // The shot with less glare (by the detect method's scores, steadier than the vote counts)
    // is repaired; the other one lends its pixels.
    int score1 = 0, score2 = 0;
    TwoImageGlareScores(remover, image1, image2, top, bottom, score1, score2);
    const bool firstIsBase = score1 < score2;
    CImage& baseMap = firstIsBase ? map1 : map2;
    CImage& baseSmall = firstIsBase ? small1 : small2;
    CImage& otherSmall = firstIsBase ? small2 : small1;
    remover.ClearHologramsDirth(baseMap, 3, chain.radius);
    // The votes find mostly the rims of large glare; growing ring by ring (250, 249, ...: all
    // still above 200) covers the halo.
    for (int ring = 0; ring < chain.growth; ++ring) remover.ExpandHologramsBolbs(baseMap, 250 - ring, chain.radius);
    remover.CollectHologramsBlobs_24(baseSmall, otherSmall, baseMap, chain.radius);
    if (firstIsBase) {
        remover.MergeImages_24(image1, image2, baseSmall, unused, 3);
    } else {
        remover.MergeImages_24(image2, image1, baseSmall, unused, 3);
        std::swap(image1, image2);
    }
}

void TwoImageGlareScores(CHologramsRemove& remover, const CImage& image1, const CImage& image2, int top,
                         int bottom, int& score1, int& score2) {
    CImage small1, small2, difference, model, map1, map2;
    // The downscaling only reads its source.
    remover.ScaleDownMaxImg_X3_24(const_cast<CImage&>(image1), small1);
    remover.ScaleDownMaxImg_X3_24(const_cast<CImage&>(image2), small2);
    remover.m_avDifVal = 128;
    remover.SubImg_24_Alg3(small1, small2, difference, 3, true, 0.75f, top / 3, bottom / 3);
    remover.CalcAvImg_24_By_XY(difference, model, 1, top / 3, bottom / 3);
    score1 = 0;
    score2 = 0;
    remover.Find_HologramPixels_24_New_Alg3(difference, model, small1, small2, map1, map2, 31, top / 3, bottom / 3,
                                            score1, score2);
    remover.Add_Saturated_Pixels(small1, small2, map1, map2, score1, score2, 31);
    remover.ClearHologramsDirth_24(map1, 3, 31, score1);
    remover.ClearHologramsDirth_24(map2, 3, 31, score2);
}

const std::vector<TwoImageMethod>& TwoImageMethods() {
    static const std::vector<TwoImageMethod> methods = {
        {"detect",
         "detect glare on the shots downscaled by 3, repair the shot with less glare at full resolution from the "
         "other shot's local detail",
         [](CHologramsRemove& r, CImage& a, CImage& b, int top, int bottom) {
             CImage unused;
             r.HologramsSeperation(a, b, unused, top, bottom);
         }},
        {"pyramid", "per pixel of a 7-level Laplacian pyramid, the detail of the shot whose largest channel is lower",
         [](CHologramsRemove& r, CImage& a, CImage& b, int top, int bottom) {
             CImage unused;
             r.HologramsSeperation2(a, b, unused, top, bottom);
         }},
        {"grow", "grow glare regions from colour seeds in shot 2 and repair them from shot 1's local detail",
         [](CHologramsRemove& r, CImage& a, CImage& b, int top, int bottom) {
             CImage unused;
             r.HologramsSeperation3(a, b, unused, top, bottom);
         }},
        {"votes",
         "neighbourhood-vote detector on the shots downscaled by 3 (averages over 45, radius 8 and 16 rings of "
         "growth per 200 downscaled pixels of width); the shot with the lower detect score is repaired: its vote "
         "mask loses specks under 3 pixels and grows, each blob gets a linear colour transfer from the other shot "
         "fitted on its rim and is painted over at full resolution",
         RunVoteTransfer},
    };
    return methods;
}

const TwoImageMethod* FindTwoImageMethod(const std::string& name) {
    for (const TwoImageMethod& m : TwoImageMethods())
        if (name == m.name) return &m;
    return nullptr;
}

std::string TwoImageMethodNames() {
    std::string names;
    for (const TwoImageMethod& m : TwoImageMethods()) {
        if (!names.empty()) names += '|';
        names += m.name;
    }
    return names;
}
