#pragma once

#include "scene/Scene.h"

// The two-shot variant of the scene: the same document photographed under two lights (from
// the left and from the right), so that each shot glares where the other does not. The
// result is an ordinary Scene whose shots[0] and shots[1] are the two photographs (shots[2]
// and shots[3] stay empty) and whose glare bits 0 and 1 mark where each of them glares, so
// that Evaluate and GlareShare measure a two-image result against the same ground truth.
namespace scene {

Scene GenerateTwoShotScene(const SceneOptions& options);

}  // namespace scene
