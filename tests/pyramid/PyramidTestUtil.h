#pragma once

#include <cstdint>
#include <random>

#include "common/TestImages.h"
#include "imagelib/CImage.h"

namespace pyramid_test {

using testing_images::RandomImage;

// Every pixel byte `value`.
inline CImage Flat(int w, int h, int bits, uint8_t value) {
    CImage image(w, h, bits);
    image.Set(value);
    return image;
}

// Sets the bytes of image row y (GetPtrXY order) to `values`, repeated for every channel.
inline void FillRowPixels(CImage& image, int y, std::initializer_list<int> values) {
    const int ch = image.GetBitCount() / 8;
    uint8_t* row = image.GetPtrXY(0, y);
    int x = 0;
    for (int v : values) {
        for (int c = 0; c < ch; ++c) row[x * ch + c] = static_cast<uint8_t>(v);
        ++x;
    }
}

inline bool SameBytes(const CImage& a, const CImage& b) {
    if (a.GetSize() != b.GetSize() || a.GetWidth() != b.GetWidth() || a.GetHeight() != b.GetHeight()) return false;
    for (size_t i = 0; i < a.GetSize(); ++i)
        if (a.GetBits()[i] != b.GetBits()[i]) return false;
    return true;
}

}  // namespace pyramid_test
