#include "imagelib/CImage.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <new>
#include <utility>
#include <vector>

namespace {

int SpanFor(int width, int bits) { return ((width * (bits / 8)) + 3) & ~3; }

bool IsSupportedDepth(int bits) { return bits == 8 || bits == 16 || bits == 24; }

}  // namespace

CImage::CImage() = default;

CImage::CImage(int width, int height, int bits) { Reallocate(width, height, bits); }

CImage::CImage(const CImage& other) { *this = other; }

CImage::CImage(CImage&& other) noexcept { *this = std::move(other); }

CImage& CImage::operator=(const CImage& other) {
    if (this == &other) return *this;
    // Same geometry: reuse the buffer instead of freeing and zero-filling a new one.
    if (other.m_pixels == nullptr) {
        Release();
        m_bits = other.m_bits;
    } else if (m_width != other.m_width || m_height != other.m_height || m_bits != other.m_bits || m_pixels == nullptr) {
        Reallocate(other.m_width, other.m_height, other.m_bits);
    }
    if (m_pixels != nullptr) std::memcpy(m_pixels, other.m_pixels, GetSize());
    if (other.m_palette != nullptr) {
        if (m_palette == nullptr) m_palette = new COLORREF[256];
        std::memcpy(m_palette, other.m_palette, 256 * sizeof(COLORREF));
    } else {
        delete[] m_palette;
        m_palette = nullptr;
    }
    return *this;
}

CImage& CImage::operator=(CImage&& other) noexcept {
    if (this == &other) return *this;
    Release();
    std::swap(m_width, other.m_width);
    std::swap(m_height, other.m_height);
    std::swap(m_bits, other.m_bits);
    std::swap(m_span, other.m_span);
    std::swap(m_pixels, other.m_pixels);
    std::swap(m_palette, other.m_palette);
    return *this;
}

CImage::~CImage() { Release(); }

void CImage::Release() {
    std::free(m_pixels);
    m_pixels = nullptr;
    delete[] m_palette;
    m_palette = nullptr;
    m_width = m_height = m_bits = m_span = 0;
}

unsigned char* CImage::GetPtrXY(int x, int y, int*, bool) {
    return m_pixels + static_cast<ptrdiff_t>(m_height - 1 - y) * m_span + static_cast<ptrdiff_t>(x) * (m_bits / 8);
}

const unsigned char* CImage::GetPtrXY(int x, int y) const {
    return m_pixels + static_cast<ptrdiff_t>(m_height - 1 - y) * m_span + static_cast<ptrdiff_t>(x) * (m_bits / 8);
}

void CImage::Set(unsigned char value) {
    if (m_pixels != nullptr) std::memset(m_pixels, value, GetSize());
}

bool CImage::Reallocate(int width, int height, int bits, int) {
    if (!IsSupportedDepth(bits)) return false;
    if (m_pixels != nullptr && width > 0 && height > 0 &&
        static_cast<size_t>(SpanFor(width, bits)) * static_cast<size_t>(height) == GetSize()) {
        // The same number of bytes: clearing the buffer in place avoids returning it to the system
        // and faulting fresh pages in again, which dominates operations that rebuild their output.
        m_width = width;
        m_height = height;
        m_bits = bits;
        m_span = SpanFor(width, bits);
        std::memset(m_pixels, 0, GetSize());
        return true;
    }
    COLORREF* palette = std::exchange(m_palette, nullptr);
    std::free(m_pixels);
    m_pixels = nullptr;
    m_width = m_height = m_span = 0;
    m_bits = bits;
    m_palette = palette;
    if (width <= 0 || height <= 0) return true;
    const int span = SpanFor(width, bits);
    // 16 spare bytes past the last row let vector loads of a final partial block stay
    // inside the allocation.
    void* pixels = std::calloc(static_cast<size_t>(span) * static_cast<size_t>(height) + 16, 1);
    if (pixels == nullptr) throw std::bad_alloc();
    m_pixels = static_cast<unsigned char*>(pixels);
    m_width = width;
    m_height = height;
    m_span = span;
    return true;
}

void CImage::Line(int x0, int y0, int x1, int y1, int value) {
    if (m_pixels == nullptr) return;
    const int bpp = m_bits / 8;
    const unsigned char v = static_cast<unsigned char>(value);
    const int dx = std::abs(x1 - x0), sx = x0 < x1 ? 1 : -1;
    const int dy = -std::abs(y1 - y0), sy = y0 < y1 ? 1 : -1;
    int err = dx + dy;
    for (;;) {
        if (x0 >= 0 && x0 < m_width && y0 >= 0 && y0 < m_height) std::memset(GetPtrXY(x0, y0), v, bpp);
        if (x0 == x1 && y0 == y1) break;
        const int e2 = 2 * err;
        if (e2 >= dy) {
            err += dy;
            x0 += sx;
        }
        if (e2 <= dx) {
            err += dx;
            y0 += sy;
        }
    }
}

void CImage::SetPaletteColor(int index, COLORREF colour) {
    if (index < 0 || index > 255) return;
    if (m_palette == nullptr) {
        m_palette = new COLORREF[256];
        for (int i = 0; i < 256; ++i) m_palette[i] = RGB(i, i, i);
    }
    m_palette[index] = colour;
}

COLORREF CImage::GetPaletteColor(int index) const {
    if (index < 0 || index > 255) return 0;
    if (m_palette == nullptr) return RGB(index, index, index);
    return m_palette[index];
}

void CImage::Rotate(float angle, unsigned char fill, float) {
    if (m_pixels == nullptr || angle == 0.0f) return;
    const CImage src(*this);
    const int bpp = m_bits / 8;
    const double radians = static_cast<double>(angle) * 3.14159265358979323846 / 180.0;
    const double c = std::cos(radians), s = std::sin(radians);
    const double cx = (m_width - 1) / 2.0, cy = (m_height - 1) / 2.0;
    for (int y = 0; y < m_height; ++y) {
        unsigned char* out = GetPtrXY(0, y);
        for (int x = 0; x < m_width; ++x, out += bpp) {
            // Inverse map: the on-screen counter-clockwise turn of (sx, sy) lands on (x, y).
            const double dx = x - cx, dy = y - cy;
            const double sx = c * dx - s * dy + cx;
            const double sy = s * dx + c * dy + cy;
            const int ix = static_cast<int>(std::floor(sx)), iy = static_cast<int>(std::floor(sy));
            if (ix < 0 || iy < 0 || ix > m_width - 1 || iy > m_height - 1) {
                std::memset(out, fill, bpp);
                continue;
            }
            const int ix1 = std::min(ix + 1, m_width - 1), iy1 = std::min(iy + 1, m_height - 1);
            const double fx = sx - ix, fy = sy - iy;
            for (int b = 0; b < bpp; ++b) {
                const double top = src.GetPtrXY(ix, iy)[b] * (1 - fx) + src.GetPtrXY(ix1, iy)[b] * fx;
                const double bottom = src.GetPtrXY(ix, iy1)[b] * (1 - fx) + src.GetPtrXY(ix1, iy1)[b] * fx;
                out[b] = static_cast<unsigned char>(std::lround(top * (1 - fy) + bottom * fy));
            }
        }
    }
}

namespace {

// One pixel of `Bytes` bytes, copied as a value so the per-pixel copy compiles to plain moves.
template <int Bytes>
struct Pixel {
    unsigned char b[Bytes];
};

// Quarter turns by destination rows: each destination row reads a source column (or a
// reversed source row), so writes stay sequential.
template <int Bytes>
void TurnPixels(const CImage& src, CImage& dst, int count) {
    using P = Pixel<Bytes>;
    const int w = src.GetWidth(), h = src.GetHeight();
    const int dw = dst.GetWidth(), dh = dst.GetHeight();
    const ptrdiff_t srcSpan = src.GetSpan();
    for (int ny = 0; ny < dh; ++ny) {
        P* out = reinterpret_cast<P*>(dst.GetPtrXY(0, ny));
        if (count == 2) {  // (x, y) -> (w-1-x, h-1-y)
            const P* in = reinterpret_cast<const P*>(src.GetPtrXY(0, h - 1 - ny));
            for (int nx = 0; nx < dw; ++nx) out[nx] = in[w - 1 - nx];
        } else if (count == 1) {  // (x, y) -> (h-1-y, x): destination row ny is source column ny
            // nx = h-1-y, so y runs from h-1 down to 0 as nx grows.
            const unsigned char* in = src.GetPtrXY(ny, h - 1);
            for (int nx = 0; nx < dw; ++nx, in += srcSpan) out[nx] = *reinterpret_cast<const P*>(in);
        } else {  // (x, y) -> (y, w-1-x): destination row ny is source column w-1-ny
            const unsigned char* in = src.GetPtrXY(w - 1 - ny, 0);
            for (int nx = 0; nx < dw; ++nx, in -= srcSpan) out[nx] = *reinterpret_cast<const P*>(in);
        }
    }
}

}  // namespace

void CImage::Rotate90ClockWise(int count) {
    count = ((count % 4) + 4) % 4;
    if (m_pixels == nullptr || count == 0) return;
    const CImage src(*this);
    if (count != 2) Reallocate(src.m_height, src.m_width, m_bits);
    switch (m_bits) {
        case 8: TurnPixels<1>(src, *this, count); break;
        case 16: TurnPixels<2>(src, *this, count); break;
        default: TurnPixels<3>(src, *this, count); break;
    }
}
