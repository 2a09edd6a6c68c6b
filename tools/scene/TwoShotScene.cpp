#include "scene/TwoShotScene.h"

#include <utility>

namespace scene {

Scene GenerateTwoShotScene(const SceneOptions& options) {
    Scene four = GenerateScene(options);
    Scene two;
    two.shots[0] = std::move(four.shots[LightLeft]);
    two.shots[1] = std::move(four.shots[LightRight]);
    two.truth = std::move(four.truth);
    two.document = std::move(four.document);
    two.glare = std::move(four.glare);
    // Keep only the glare of the two lights used, renumbered as bits 0 and 1.
    for (int y = 0; y < two.glare.GetHeight(); ++y) {
        unsigned char* g = two.glare.GetPtrXY(0, y);
        for (int x = 0; x < two.glare.GetWidth(); ++x) {
            const int left = (g[x] >> LightLeft) & 1;
            const int right = (g[x] >> LightRight) & 1;
            g[x] = static_cast<unsigned char>(left | (right << 1));
        }
    }
    return two;
}

}  // namespace scene
