// Plain reduce and expand: the definition of the pyramid filters, kept literal (horizontal
// pass into the work buffer, border columns, vertical pass, border rows) so that the fast
// kernels can be checked against it byte for byte.
#include <cstring>

#include "pyramid/FiltersInternal.h"
#include "pyramid/Pyramid.h"

namespace varnoth {

namespace {

int BytesPerPixel(const CImage& image) { return image.GetBitCount() / 8; }

bool UsableDepths(const CImage& src, const CImage& dst) {
    if (&src == &dst || src.IsEmpty() || dst.IsEmpty()) return false;
    if (src.GetBitCount() != 8 && src.GetBitCount() != 24) return false;
    return src.GetBitCount() == dst.GetBitCount();
}

}  // namespace

bool ReduceGeometryOk(const CImage& src, const CImage& dst) {
    if (!UsableDepths(src, dst) || src.GetWidth() < 3 || src.GetHeight() < 3) return false;
    return dst.GetWidth() == CPyramid::NextLevelSize(src.GetWidth()) &&
           dst.GetHeight() == CPyramid::NextLevelSize(src.GetHeight());
}

bool ExpandGeometryOk(const CImage& src, const CImage& dst) {
    if (!UsableDepths(src, dst) || src.GetWidth() < 2 || src.GetHeight() < 2) return false;
    return CPyramid::NextLevelSize(dst.GetWidth()) == src.GetWidth() &&
           CPyramid::NextLevelSize(dst.GetHeight()) == src.GetHeight();
}

size_t FilterWorkNeed(const CImage& src, const CImage& dst) {
    return static_cast<size_t>(src.GetHeight()) * static_cast<size_t>(dst.GetSpan());
}

void PlainReduce(const CImage& src, CImage& dst, int16_t* work) {
    const int ch = BytesPerPixel(src);
    const int sw = src.GetWidth(), sh = src.GetHeight(), dw = dst.GetWidth(), dh = dst.GetHeight();
    const size_t sspan = src.GetSpan(), dspan = dst.GetSpan();
    const uint8_t* srcBits = src.GetBits();
    uint8_t* dstBits = dst.GetBits();

    // Rows in memory order, source and destination alike.
    for (int m = 0; m < sh; ++m) {
        const uint8_t* row = srcBits + m * sspan;
        int16_t* w = work + m * dspan;
        for (int c = 0; c < ch; ++c) {
            auto p = [&](int i) { return static_cast<int>(row[i * ch + c]); };
            for (int i = 0; i < sw - 4; i += 2) {
                const int j = i / 2 + 1;
                w[j * ch + c] = static_cast<int16_t>(p(2 * j - 2) + 4 * p(2 * j - 1) + 6 * p(2 * j) +
                                                     4 * p(2 * j + 1) + p(2 * j + 2));
            }
        }
    }
    // Border columns mirror the row about its end pixels; the last output sits on the last
    // source pixel whatever the parity of the width.
    for (int m = 0; m < sh; ++m) {
        const uint8_t* row = srcBits + m * sspan;
        int16_t* w = work + m * dspan;
        for (int c = 0; c < ch; ++c) {
            auto p = [&](int i) { return static_cast<int>(row[i * ch + c]); };
            w[c] = static_cast<int16_t>(2 * (3 * p(0) + 4 * p(1) + p(2)));
            w[(dw - 1) * ch + c] = static_cast<int16_t>(2 * (3 * p(sw - 1) + 4 * p(sw - 2) + p(sw - 3)));
        }
    }
    const int n = dw * ch;
    auto W = [&](int m, int e) { return static_cast<int>(work[m * dspan + e]); };
    for (int r = 1; 2 * r + 2 <= sh - 1; ++r) {
        uint8_t* out = dstBits + r * dspan;
        for (int e = 0; e < n; ++e) {
            out[e] = static_cast<uint8_t>(
                (W(2 * r - 2, e) + 4 * W(2 * r - 1, e) + 6 * W(2 * r, e) + 4 * W(2 * r + 1, e) + W(2 * r + 2, e)) >> 8);
        }
    }
    uint8_t* first = dstBits;
    uint8_t* last = dstBits + (dh - 1) * dspan;
    for (int e = 0; e < n; ++e) {
        first[e] = static_cast<uint8_t>((2 * (3 * W(0, e) + 4 * W(1, e) + W(2, e))) >> 8);
        last[e] = static_cast<uint8_t>((2 * (3 * W(sh - 1, e) + 4 * W(sh - 2, e) + W(sh - 3, e))) >> 8);
    }
}

void PlainExpand(const CImage& src, CImage& dst, int16_t* work) {
    const int ch = BytesPerPixel(src);
    const int sw = src.GetWidth(), sh = src.GetHeight(), dw = dst.GetWidth(), dh = dst.GetHeight();
    const int dspan = dst.GetSpan();

    // Rows through GetPtrXY (top row first). Within a row the edge values are written first
    // and the interior loop may overwrite position dw - 2 (odd destination widths).
    for (int y = 0; y < sh; ++y) {
        const uint8_t* row = src.GetPtrXY(0, y);
        int16_t* w = work + static_cast<size_t>(y) * dspan;
        for (int c = 0; c < ch; ++c) {
            auto p = [&](int i) { return static_cast<int>(row[i * ch + c]); };
            auto put = [&](int x, int value) { w[x * ch + c] = static_cast<int16_t>(value); };
            put(0, 2 * (3 * p(0) + p(1)));
            put(dw - 2, 2 * (3 * p(sw - 1) + p(sw - 2)));
            put(1, 4 * (p(0) + p(1)));
            put(dw - 1, 4 * (p(sw - 1) + p(sw - 2)));
            for (int i = 1; i <= sw - 2; ++i) {
                put(2 * i, p(i - 1) + 6 * p(i) + p(i + 1));
                put(2 * i + 1, 4 * (p(i) + p(i + 1)));
            }
        }
        // The padding of the destination rows comes out as 0.
        std::memset(w + dw * ch, 0, (dspan - dw * ch) * sizeof(int16_t));
    }
    auto W = [&](int m, int e) { return static_cast<int>(work[static_cast<size_t>(m) * dspan + e]); };
    for (int k = 0; k <= sh - 3; ++k) {
        uint8_t* even = dst.GetPtrXY(0, 2 * k + 2);
        uint8_t* odd = dst.GetPtrXY(0, 2 * k + 3);
        for (int e = 0; e < dspan; ++e) {
            even[e] = static_cast<uint8_t>((W(k, e) + 6 * W(k + 1, e) + W(k + 2, e)) >> 6);
            odd[e] = static_cast<uint8_t>((4 * (W(k + 1, e) + W(k + 2, e))) >> 6);
        }
    }
    // Border rows last, in this order: with a 2-row source they overwrite one another.
    uint8_t* row0 = dst.GetPtrXY(0, 0);
    for (int e = 0; e < dspan; ++e) row0[e] = static_cast<uint8_t>((2 * (3 * W(0, e) + W(1, e))) >> 6);
    uint8_t* row1 = dst.GetPtrXY(0, 1);
    for (int e = 0; e < dspan; ++e) row1[e] = static_cast<uint8_t>((4 * (W(0, e) + W(1, e))) >> 6);
    uint8_t* rowBeforeLast = dst.GetPtrXY(0, dh - 2);
    for (int e = 0; e < dspan; ++e)
        rowBeforeLast[e] = static_cast<uint8_t>((4 * (W(sh - 2, e) + W(sh - 1, e))) >> 6);
    uint8_t* rowLast = dst.GetPtrXY(0, dh - 1);
    for (int e = 0; e < dspan; ++e)
        rowLast[e] = static_cast<uint8_t>((2 * (3 * W(sh - 1, e) + W(sh - 2, e))) >> 6);
}

}  // namespace varnoth
