#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "holograms/HologramsRemove.h"
#include "imagelib/CImage.h"

// The four-image glare removal methods the tool and the demo offer, by name.
struct FourImageMethod {
    const char* name;
    const char* description;
    // shots in the order top, bottom, left, right
    void (*run)(CHologramsRemove& remover, const CImage* const shots[4], CImage& result);
};

inline const std::vector<FourImageMethod>& FourImageMethods() {
    static const std::vector<FourImageMethod> methods = {
        {"pyramid", "choose or synthesise each detail pixel by brightness, saturation and detail strength",
         [](CHologramsRemove& r, const CImage* const s[4], CImage& out) {
             r.HologramsRemove4Img(*s[0], *s[1], *s[2], *s[3], out);
         }},
        {"pyramid3", "take the weakest detail among the candidates below brightness 250",
         [](CHologramsRemove& r, const CImage* const s[4], CImage& out) {
             r.HologramsRemove4Img3(*s[0], *s[1], *s[2], *s[3], out);
         }},
        {"steps", "the pyramid rules fed one shot per call, deciding from running per-pixel statistics",
         [](CHologramsRemove& r, const CImage* const s[4], CImage& out) {
             for (uint16_t step = 0; step < 4; ++step) r.HologramsRemove4ImgInSteps(*s[step], step, out);
         }},
        {"hsv", "lowest saturation among the unsaturated shots, hue and value of a chosen one, per pyramid level",
         [](CHologramsRemove& r, const CImage* const s[4], CImage& out) {
             r.HologramsRemove4Img4(*s[0], *s[1], *s[2], *s[3], out);
         }},
        {"brightness", "one raster pass: rebuild from the smoothest gradients, then the shot of closest colour",
         [](CHologramsRemove& r, const CImage* const s[4], CImage& out) {
             r.HologramsRemove4Img2(*s[0], *s[1], *s[2], *s[3], out);
         }},
    };
    return methods;
}

inline const FourImageMethod* FindFourImageMethod(const std::string& name) {
    for (const FourImageMethod& m : FourImageMethods())
        if (name == m.name) return &m;
    return nullptr;
}

inline std::string FourImageMethodNames() {
    std::string names;
    for (const FourImageMethod& m : FourImageMethods()) names += (names.empty() ? "" : "|") + std::string(m.name);
    return names;
}
