#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "common/TestImages.h"
#include "holograms/HologramsRemove.h"
#include "imagelib/CImage.h"
#include "imagelib/Trace.h"

namespace two_test {

// Small deterministic generator (xorshift) so that the tests do not depend on a library.
struct Random {
    uint32_t state;
    explicit Random(uint32_t seed) : state(seed * 2654435761u + 1) {}
    uint32_t Next() {
        state ^= state << 13;
        state ^= state >> 17;
        state ^= state << 5;
        return state;
    }
    int Below(int n) { return static_cast<int>(Next() % static_cast<uint32_t>(n)); }
};

using testing_images::RandomImage;
using testing_images::SamePixels;

inline CImage Grey(int w, int h, int value) {
    CImage img(w, h, 8);
    img.Set(static_cast<unsigned char>(value));
    return img;
}

inline void Put24(CImage& img, int x, int y, int b, int g, int r) {
    unsigned char* p = img.GetPtrXY(x, y);
    p[0] = static_cast<unsigned char>(b);
    p[1] = static_cast<unsigned char>(g);
    p[2] = static_cast<unsigned char>(r);
}

inline CImage Solid24(int w, int h, int b, int g, int r) {
    CImage img(w, h, 24);
    for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x) Put24(img, x, y, b, g, r);
    return img;
}

inline std::vector<int> Px(const CImage& img, int x, int y) {
    const unsigned char* p = img.GetPtrXY(x, y);
    std::vector<int> v;
    for (int c = 0; c < img.GetBitCount() / 8; ++c) v.push_back(p[c]);
    return v;
}

inline int CountMarked(const CImage& map) {
    int n = 0;
    for (int y = 0; y < map.GetHeight(); ++y)
        for (int x = 0; x < map.GetWidth(); ++x) n += map.GetPtrXY(x, y)[0] != 0;
    return n;
}

// Collects the trace lines written while it lives.
class TraceCapture {
public:
    TraceCapture() {
        Lines().clear();
        m_previous = SetTraceHandler(&TraceCapture::Sink);
    }
    ~TraceCapture() { SetTraceHandler(m_previous); }
    static std::vector<std::wstring>& Lines() {
        static std::vector<std::wstring> lines;
        return lines;
    }

private:
    static void Sink(const wchar_t* line) { Lines().push_back(line); }
    TraceHandler m_previous;
};

}  // namespace two_test
