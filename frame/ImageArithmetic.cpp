// Whole-image byte arithmetic. The add and subtract kernels are vectorised with Highway
// (dispatched at run time); PlainAddBytes / PlainSubtractBytes are their definitions.
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "frame/ImageArithmetic.cpp"
#include <hwy/foreach_target.h>  // IWYU pragma: keep
#include <hwy/highway.h>

#include <algorithm>
#include <cstdint>
#include <cstring>

#include "frame/ArithmeticInternal.h"
#include "frame/ImageArithmetic.h"
#include "imagelib/Parallel.h"

HWY_BEFORE_NAMESPACE();
namespace varnoth {
namespace HWY_NAMESPACE {
namespace hn = hwy::HWY_NAMESPACE;

// a + b - 127 clamped equals a + (b - 127) when b >= 127 and a - (127 - b) otherwise; one of
// the two saturating offsets is always 0, so two saturating steps give the exact byte.
void AddBytes(const uint8_t* a, const uint8_t* b, uint8_t* out, size_t n) {
    const hn::ScalableTag<uint8_t> d;
    const size_t lanes = hn::Lanes(d);
    const auto k127 = hn::Set(d, 127);
    size_t i = 0;
    for (; i + lanes <= n; i += lanes) {
        const auto va = hn::LoadU(d, a + i), vb = hn::LoadU(d, b + i);
        const auto up = hn::SaturatedSub(vb, k127), down = hn::SaturatedSub(k127, vb);
        hn::StoreU(hn::SaturatedSub(hn::SaturatedAdd(va, up), down), d, out + i);
    }
    PlainAddBytes(a + i, b + i, out + i, n - i);
}

// a - b + 128 clamped, by the same split around 128.
void SubtractBytes(const uint8_t* a, const uint8_t* b, uint8_t* out, size_t n) {
    const hn::ScalableTag<uint8_t> d;
    const size_t lanes = hn::Lanes(d);
    const auto k128 = hn::Set(d, 128);
    size_t i = 0;
    for (; i + lanes <= n; i += lanes) {
        const auto va = hn::LoadU(d, a + i), vb = hn::LoadU(d, b + i);
        const auto up = hn::SaturatedSub(k128, vb), down = hn::SaturatedSub(vb, k128);
        hn::StoreU(hn::SaturatedSub(hn::SaturatedAdd(va, up), down), d, out + i);
    }
    PlainSubtractBytes(a + i, b + i, out + i, n - i);
}

}  // namespace HWY_NAMESPACE
}  // namespace varnoth
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace varnoth {

HWY_EXPORT(AddBytes);
HWY_EXPORT(SubtractBytes);

void PlainAddBytes(const uint8_t* a, const uint8_t* b, uint8_t* out, size_t n) {
    for (size_t i = 0; i < n; ++i) out[i] = static_cast<uint8_t>(std::clamp(a[i] + b[i] - 127, 0, 255));
}

void PlainSubtractBytes(const uint8_t* a, const uint8_t* b, uint8_t* out, size_t n) {
    for (size_t i = 0; i < n; ++i) out[i] = static_cast<uint8_t>(std::clamp(a[i] - b[i] + 128, 0, 255));
}

void FastAddBytes(const uint8_t* a, const uint8_t* b, uint8_t* out, size_t n) {
    HWY_DYNAMIC_DISPATCH(AddBytes)(a, b, out, n);
}

void FastSubtractBytes(const uint8_t* a, const uint8_t* b, uint8_t* out, size_t n) {
    HWY_DYNAMIC_DISPATCH(SubtractBytes)(a, b, out, n);
}

namespace {

bool SameGeometry(const CImage& a, const CImage& b) {
    return a.GetWidth() == b.GetWidth() && a.GetHeight() == b.GetHeight() && a.GetBitCount() == b.GetBitCount();
}

using ByteKernel = void (*)(const uint8_t*, const uint8_t*, uint8_t*, size_t);

// Runs a byte kernel over every byte of every row, padding included. The rows of an image
// are contiguous, so bands of rows are handed to the workers as single runs of bytes.
void CombineImages(const CImage& a, const CImage& b, CImage& out, ByteKernel kernel) {
    if (!SameGeometry(a, b) || a.IsEmpty()) return;
    if (!SameGeometry(a, out)) out.Reallocate(a.GetWidth(), a.GetHeight(), a.GetBitCount());
    const size_t span = static_cast<size_t>(a.GetSpan());
    const uint8_t* pa = a.GetBits();
    const uint8_t* pb = b.GetBits();
    uint8_t* po = out.GetBits();
    imagelib::ParallelFor(0, a.GetHeight(), [&](int begin, int end) {
        const size_t offset = span * static_cast<size_t>(begin);
        kernel(pa + offset, pb + offset, po + offset, span * static_cast<size_t>(end - begin));
    }, 64);
}

}  // namespace
}  // namespace varnoth

void ImageAdd(const CImage& a, const CImage& b, CImage& out, bool) {
    varnoth::CombineImages(a, b, out, varnoth::FastAddBytes);
}

void ImageSubtract(const CImage& a, const CImage& b, CImage& out) {
    varnoth::CombineImages(a, b, out, varnoth::FastSubtractBytes);
}

void ImageStretch(CImage& img, int, int) {
    if (img.IsEmpty() || (img.GetBitCount() != 8 && img.GetBitCount() != 24)) return;
    const int w = img.GetWidth(), h = img.GetHeight(), span = img.GetSpan();
    const int p = img.GetBitCount() / 8;
    int minimum = 1000, maximum = 0;
    for (int y = h / 4; y < h - h / 4; ++y) {
        const unsigned char* row = img.GetPtrXY(0, y);
        for (int i = (w / 4) * p; i < span - (w / 4) * p; ++i) {
            minimum = std::min<int>(minimum, row[i]);
            maximum = std::max<int>(maximum, row[i]);
        }
    }
    // A flat window has no range to stretch by.
    if (maximum - minimum <= 0) return;
    unsigned char table[256];
    for (int v = 0; v < 256; ++v) {
        const int d = std::max(std::min(v, maximum) - minimum, 0);
        table[v] = static_cast<unsigned char>(std::min(d * 256 / (maximum - minimum), 255));
    }
    unsigned char* bytes = img.GetBits();
    for (size_t i = 0; i < img.GetSize(); ++i) bytes[i] = table[bytes[i]];
}

bool InsertImage(const CImage& src, CImage& dst, CPoint pos, const CImage* mask) {
    if (pos.x < 0 || pos.y < 0) return false;
    // In 64 bits: a position near INT_MAX must not wrap round into one that seems to fit.
    if (int64_t{src.GetWidth()} + pos.x >= dst.GetWidth() ||
        int64_t{src.GetHeight()} + pos.y >= dst.GetHeight())
        return false;
    if (src.GetBitCount() != dst.GetBitCount()) return false;
    if (mask != nullptr && !varnoth::SameGeometry(*mask, src)) return false;
    const size_t n = static_cast<size_t>(src.GetWidth()) * (dst.GetBitCount() / 8);
    for (int y = 0; y < src.GetHeight(); ++y) {
        const unsigned char* from = src.GetPtrXY(0, y);
        unsigned char* to = dst.GetPtrXY(pos.x, pos.y + y);
        if (mask == nullptr) {
            std::memcpy(to, from, n);
            continue;
        }
        const unsigned char* keep = mask->GetPtrXY(0, y);
        for (size_t i = 0; i < n; ++i)
            if (keep[i] == 0) to[i] = from[i];
    }
    return true;
}

bool IsMMXSuported() { return false; }
#endif  // HWY_ONCE
