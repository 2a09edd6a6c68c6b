#pragma once

// Small pixel helpers shared by the two-image operations of CHologramsRemove: geometry checks,
// row addressing, clamping, the 8-connected flood fill of the blob operations and the refusal
// trace. Internal to the library (tests reach it through the object library).

#include <cstdint>
#include <initializer_list>
#include <vector>

#include "imagelib/CImage.h"
#include "imagelib/Trace.h"

namespace holo {

inline bool SameGeometry(const CImage& a, const CImage& b) {
    return a.GetWidth() == b.GetWidth() && a.GetHeight() == b.GetHeight() && a.GetBitCount() == b.GetBitCount();
}

inline bool SameSize(const CImage& a, const CImage& b) {
    return a.GetWidth() == b.GetWidth() && a.GetHeight() == b.GetHeight();
}

// A non-empty image of the given depth.
inline bool HasDepth(const CImage& image, int bits) {
    return image.GetBitCount() == bits && !image.IsEmpty() && image.GetWidth() > 0 && image.GetHeight() > 0;
}

// Non-empty 24-bit images, all of the first one's size.
inline bool AllSame24(std::initializer_list<const CImage*> images) {
    const CImage& first = **images.begin();
    if (!HasDepth(first, 24)) return false;
    for (const CImage* image : images)
        if (!SameGeometry(first, *image)) return false;
    return true;
}

inline unsigned char ClampByte(int v) { return static_cast<unsigned char>(v < 0 ? 0 : (v > 255 ? 255 : v)); }
// The repair rules that must never produce 0 (0 marks "not evaluated" downstream).
inline unsigned char ClampByte1(int v) { return static_cast<unsigned char>(v < 1 ? 1 : (v > 255 ? 255 : v)); }

// Row y (top-down coordinates) of an image: rows are stored bottom-up.
inline unsigned char* Row(CImage& image, int y) {
    return image.GetBits() + static_cast<size_t>(image.GetHeight() - 1 - y) * image.GetSpan();
}
inline const unsigned char* Row(const CImage& image, int y) {
    return image.GetBits() + static_cast<size_t>(image.GetHeight() - 1 - y) * image.GetSpan();
}

// Two shots, their local averages and one output map per shot.
struct ShotImages {
    CImage& image1;
    CImage& average1;
    CImage& image2;
    CImage& average2;
    CImage& map1;
    CImage& map2;
};

// Row y of each of the six images.
struct ShotRows {
    const unsigned char* i1;
    const unsigned char* a1;
    const unsigned char* i2;
    const unsigned char* a2;
    unsigned char* m1;
    unsigned char* m2;

    ShotRows(const ShotImages& s, int y)
        : i1(Row(s.image1, y)), a1(Row(s.average1, y)), i2(Row(s.image2, y)), a2(Row(s.average2, y)),
          m1(Row(s.map1, y)), m2(Row(s.map2, y)) {}
};

// One trace line naming the operation and why it did nothing; always returns true so that
// callers can write `if (bad && Refuse(...)) return;`.
inline bool Refuse(const wchar_t* operation, const char* reason) {
    Trace(L"%ls: refused, %s\n", operation, reason);
    return true;
}

// Pixel addressing of one image by pixel index y * width + x, for the flood fills.
struct PixelGrid {
    unsigned char* bits;
    int width;
    int height;
    int span;
    int bytesPerPixel;

    explicit PixelGrid(CImage& image)
        : bits(image.GetBits()), width(image.GetWidth()), height(image.GetHeight()), span(image.GetSpan()),
          bytesPerPixel(image.GetBitCount() / 8) {}
    size_t Offset(int x, int y) const {
        return static_cast<size_t>(height - 1 - y) * span + static_cast<size_t>(x) * bytesPerPixel;
    }
    unsigned char* At(int x, int y) const { return bits + Offset(x, y); }
    bool Inside(int x, int y) const { return x >= 0 && y >= 0 && x < width && y < height; }
};

// Left, right, upper and lower neighbour, as (dx, dy).
inline constexpr int kFourNeighbours[4][2] = {{-1, 0}, {1, 0}, {0, -1}, {0, 1}};

// The neighbour order of the blob flood fills, as (dx, dy).
inline constexpr int kFloodOrder[8][2] = {{0, 1}, {1, 1}, {1, 0}, {1, -1}, {0, -1}, {-1, -1}, {-1, 0}, {-1, 1}};

// Breadth-first 8-connected fill of the working copy from (x, y), which must qualify. Every
// pixel is cleared in the copy when it is queued, so it is queued at most once. `queue` must
// hold width * height entries; it receives the blob's pixel indexes (y * width + x) in visiting
// order. `expanded(x, y)` is called for every pixel as it is taken from the queue. Returns the
// number of blob pixels.
template <typename Qualifies, typename Clear, typename Expanded>
int FloodFill8(const PixelGrid& copy, int x, int y, int32_t* queue, Qualifies qualifies, Clear clear,
               Expanded expanded) {
    int tail = 0;
    queue[tail++] = y * copy.width + x;
    clear(copy.At(x, y));
    for (int head = 0; head < tail; ++head) {
        const int px = queue[head] % copy.width;
        const int py = queue[head] / copy.width;
        expanded(px, py);
        for (const auto& step : kFloodOrder) {
            const int nx = px + step[0];
            const int ny = py + step[1];
            if (!copy.Inside(nx, ny)) continue;
            unsigned char* p = copy.At(nx, ny);
            if (!qualifies(p)) continue;
            clear(p);
            queue[tail++] = ny * copy.width + nx;
        }
    }
    return tail;
}

}  // namespace holo
