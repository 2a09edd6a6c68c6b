#pragma once

#include <cstdint>
#include <random>

#include "imagelib/CImage.h"

// Small helpers shared by the test programs.
namespace testing_images {

// An image of the given geometry whose every byte, row padding included, is random in
// low..high.
inline CImage RandomImage(int w, int h, int bits, uint32_t seed, int low = 0, int high = 255) {
    CImage img(w, h, bits);
    std::mt19937 rng(seed);
    std::uniform_int_distribution<int> value(low, high);
    for (size_t i = 0; i < img.GetSize(); ++i) img.GetBits()[i] = static_cast<unsigned char>(value(rng));
    return img;
}

// True when both images have the same geometry and the same pixel bytes (padding ignored).
inline bool SamePixels(const CImage& a, const CImage& b) {
    if (a.GetWidth() != b.GetWidth() || a.GetHeight() != b.GetHeight() || a.GetBitCount() != b.GetBitCount())
        return false;
    const size_t rowBytes = static_cast<size_t>(a.GetWidth()) * (a.GetBitCount() / 8);
    for (int y = 0; y < a.GetHeight(); ++y)
        for (size_t i = 0; i < rowBytes; ++i)
            if (a.GetPtrXY(0, y)[i] != b.GetPtrXY(0, y)[i]) return false;
    return true;
}

}  // namespace testing_images
