#pragma once

#include <string>
#include <vector>

#include "imagelib/CImage.h"
#include "scene/Scene.h"

// The result of one glare removal method on a scene, and the table that ranks several.
namespace scene {

struct Outcome {
    std::string name;
    double ms;
    Quality quality;
    CImage result;
};

// Prints an empty line, the heading, the column titles and one row per outcome in the order
// given (the caller sorts by what "best" means for its methods).
void PrintRanking(const char* heading, const std::vector<Outcome>& outcomes);

}  // namespace scene
