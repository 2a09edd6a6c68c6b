// The demo's two-shot part: every two-image method on a generated document.
#include <algorithm>
#include <cstdio>
#include <string>
#include <vector>

#include "imagelib/StopWatch.h"
#include "scene/Ranking.h"
#include "scene/TwoShotScene.h"
#include "varnoth/ToolIO.h"
#include "varnoth/TwoImageMethods.h"

namespace {

// shot 1 | shot 2 | result | truth, side by side.
CImage TwoShotMontage(const scene::Scene& s, const CImage& result) {
    const int w = s.truth.GetWidth(), h = s.truth.GetHeight(), gap = 8;
    CImage montage(4 * w + 3 * gap, h, 24);
    montage.Set(255);
    const CImage* panels[4] = {&s.shots[0], &s.shots[1], &result, &s.truth};
    for (int k = 0; k < 4; ++k)
        for (int y = 0; y < h; ++y)
            std::copy_n(panels[k]->GetPtrXY(0, y), 3 * w, montage.GetPtrXY(k * (w + gap), y));
    return montage;
}

}  // namespace

void RunTwoImageDemo(const std::string& directory, int width, int height, uint32_t seed) {
    CStopWatch watch;
    const scene::Scene s = scene::GenerateTwoShotScene({width, height, seed});
    std::printf("\nTwo shots of the same card, lit from the left and from the right (%.0f ms to generate):\n",
                watch.ElapsedMicro() / 1000.0);
    static const char* const shotNames[2] = {"left", "right"};
    for (int k = 0; k < 2; ++k) {
        SaveImage(s.shots[k], directory + "two_shot_" + shotNames[k] + ".png");
        const scene::Quality q = scene::Evaluate(s, s.shots[k]);
        std::printf("  shot %d (lit from the %-5s)  PSNR %5.2f dB, still glaring %5.1f %%\n", k + 1, shotNames[k],
                    q.psnr, 100.0 * q.glareRemaining);
    }

    std::vector<scene::Outcome> outcomes;
    for (const TwoImageMethod& method : TwoImageMethods()) {
        CHologramsRemove remover;
        CImage image1 = s.shots[0], image2 = s.shots[1];
        watch.Start();
        method.run(remover, image1, image2, 0, height);
        scene::Outcome o{method.name, watch.ElapsedMicro() / 1000.0, scene::Evaluate(s, image1), std::move(image1)};
        SaveImage(o.result, directory + "two_result_" + o.name + ".png");
        outcomes.push_back(std::move(o));
    }
    std::sort(outcomes.begin(), outcomes.end(), [](const scene::Outcome& a, const scene::Outcome& b) {
        if (a.quality.glareRemaining != b.quality.glareRemaining)
            return a.quality.glareRemaining < b.quality.glareRemaining;
        return a.quality.psnr > b.quality.psnr;
    });
    scene::PrintRanking("Two-image glare separation, least glare left first:", outcomes);
    const std::string montage = directory + "montage_two.png";
    SaveImage(TwoShotMontage(s, outcomes.front().result), montage);
    std::printf("%s: shot 1 | shot 2 | the result with least glare left (%s) | the truth\n", montage.c_str(),
                outcomes.front().name.c_str());
}
