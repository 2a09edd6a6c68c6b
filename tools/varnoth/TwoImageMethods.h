#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "holograms/HologramsRemove.h"
#include "imagelib/CImage.h"

// The two-image glare separation methods the tool and the demo offer, by name. Each takes two
// aligned 24-bit shots of one size and the document rows [top, bottom) and leaves the glare-free
// result in image 1 (image 2 may change too).
struct TwoImageMethod {
    const char* name;
    const char* description;
    void (*run)(CHologramsRemove& remover, CImage& image1, CImage& image2, int top, int bottom);
};

// The vote detector on the pair downscaled by 3 (block maximum), then blob colour transfer:
// the shot with the lower glare score (TwoImageGlareScores) is the base; its vote mask loses
// specks of fewer than 3 pixels and grows ring by ring; every blob gets a linear colour transfer
// from the other shot fitted on its rim and is painted into the full-resolution base from the
// other shot. Window, radius and growth scale with the image width.
void RunVoteTransfer(CHologramsRemove& remover, CImage& image1, CImage& image2, int top, int bottom);

// Glare scores of the two shots as the detect method measures them (detection on the pair
// downscaled by 3, small specks removed); the shots are not changed.
void TwoImageGlareScores(CHologramsRemove& remover, const CImage& image1, const CImage& image2, int top,
                         int bottom, int& score1, int& score2);

const std::vector<TwoImageMethod>& TwoImageMethods();
const TwoImageMethod* FindTwoImageMethod(const std::string& name);
std::string TwoImageMethodNames();

// The demo's two-shot part: the generated document under a left and a right light, through
// every method above, scored against the ground truth; writes the shots, the results and
// "montage_two.png" (shot 1 | shot 2 | best result | truth) into `directory` (ending in '/').
void RunTwoImageDemo(const std::string& directory, int width, int height, uint32_t seed);
