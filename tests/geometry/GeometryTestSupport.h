#pragma once

#include <hwy/targets.h>

#include <cstdint>
#include <cstring>
#include <functional>
#include <string>
#include <vector>

#include "common/TestImages.h"
#include "imagelib/CImage.h"
#include "imagelib/Trace.h"

namespace geometry_test {

// Deterministic pixels; values stay below `limit`.
inline CImage noiseImage(int width, int height, int bits, uint32_t seed = 1, int limit = 256) {
    CImage img(width, height, bits);
    uint32_t state = seed * 2654435761u + 1;
    for (int y = 0; y < height; ++y) {
        unsigned char* p = img.GetPtrXY(0, y);
        for (int i = 0; i < width * bits / 8; ++i) {
            state = state * 1664525u + 1013904223u;
            p[i] = static_cast<unsigned char>((state >> 24) % static_cast<uint32_t>(limit));
        }
    }
    return img;
}

// Same size, depth and pixel bytes (row padding ignored).
inline bool samePixels(const CImage& a, const CImage& b) { return testing_images::SamePixels(a, b); }

// Runs `body` once with each vector target this machine supports forced, then restores the
// normal choice, so the dispatched kernels are checked on every instruction set they use here.
inline void forEachVectorTarget(const std::function<void(const char* target)>& body) {
    for (int64_t target : hwy::SupportedAndGeneratedTargets()) {
        hwy::SetSupportedTargetsForTest(target);
        body(hwy::TargetName(target));
    }
    hwy::SetSupportedTargetsForTest(0);
}

// Collects trace lines while alive.
class TraceCapture {
public:
    TraceCapture() { lines().clear(); m_previous = SetTraceHandler(&TraceCapture::record); }
    ~TraceCapture() { SetTraceHandler(m_previous); }
    bool saw(const std::wstring& line) const {
        for (const auto& l : lines())
            if (l == line) return true;
        return false;
    }

private:
    static std::vector<std::wstring>& lines() {
        static std::vector<std::wstring> all;
        return all;
    }
    static void record(const wchar_t* line) { lines().emplace_back(line); }
    TraceHandler m_previous;
};

}  // namespace geometry_test
