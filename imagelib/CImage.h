#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

#include "imagelib/ImageLibExport.h"

// A palette colour as the host platform writes it: 0x00BBGGRR.
using COLORREF = uint32_t;
constexpr COLORREF RGB(uint8_t r, uint8_t g, uint8_t b) {
    return static_cast<COLORREF>(r) | (static_cast<COLORREF>(g) << 8) | (static_cast<COLORREF>(b) << 16);
}

// The image library's bitmap: 8-bit grey, 24-bit B, G, R or 16-bit labels per pixel.
// Rows are GetSpan() bytes (a multiple of 4) and stored bottom-up: row y starts at
// GetBits() + (height - 1 - y) * span, so row y + 1 lies one span lower in memory.
// Fresh and reallocated pixels are 0.
class CIMAGE_API CImage {
public:
    CImage();
    CImage(int width, int height, int bits);
    CImage(const CImage& other);
    CImage(CImage&& other) noexcept;
    CImage& operator=(const CImage& other);
    CImage& operator=(CImage&& other) noexcept;
    virtual ~CImage();

    int GetWidth() const { return m_width; }
    int GetHeight() const { return m_height; }
    int GetBitCount() const { return m_bits; }
    int GetSpan() const { return m_span; }
    // Number of pixel bytes: span * height.
    size_t GetSize() const { return static_cast<size_t>(m_span) * static_cast<size_t>(m_height); }
    unsigned char* GetBits() { return m_pixels; }
    const unsigned char* GetBits() const { return m_pixels; }
    bool IsEmpty() const { return m_pixels == nullptr; }

    // Address of the first byte of pixel (x, y). `pointer` and `flag` are accepted for the
    // callers' sake and have no effect. No range check: callers stay inside the image.
    virtual unsigned char* GetPtrXY(int x, int y, int* pointer = nullptr, bool flag = false);
    const unsigned char* GetPtrXY(int x, int y) const;

    void Set(unsigned char value);
    // New size and depth (8, 16, 24); every pixel becomes 0. `flag` has no effect. A zero
    // or negative width or height gives an empty image. Returns false for other depths.
    bool Reallocate(int width, int height, int bits, int flag = 0);

    // Writes the image; format by extension: .bmp, .png, .jpg/.jpeg, .tif/.tiff. A Windows
    // path (drive prefix or backslash) is a debug dump, written under $VARNOTH_DUMP_DIR or
    // not at all (see DumpPath.h). Returns false on any failure; never throws.
    bool ExportFile(const wchar_t* path) const;
    bool ExportFile(const std::string& path) const;
    // Reads an 8-bit grey or 24-bit colour image from a .bmp, .png, .jpg or .tif file; other
    // variants are converted (grey+alpha, RGBA, 16-bit samples, palettes) or refused. On
    // failure the image is unchanged, false is returned and `error` says why.
    bool ImportFile(const std::string& path, std::string* error = nullptr);

    // Draws a straight line of `value` bytes (every byte of each pixel) from (x0, y0) to
    // (x1, y1) inclusive, Bresenham; points outside the image are skipped.
    void Line(int x0, int y0, int x1, int y1, int value);
    // Sets one entry of the 256-entry palette that 8-bit images carry into .bmp files.
    // The palette starts as a grey ramp. Out-of-range indexes are ignored.
    void SetPaletteColor(int index, COLORREF colour);
    COLORREF GetPaletteColor(int index) const;

    // Rotates the image in place about its centre by `angle` degrees, counter-clockwise as
    // seen on screen (rows top-down), keeping its size. Each output pixel is sampled
    // bilinearly from the source; pixels whose source lies outside take `fill`. `second`
    // is accepted and ignored. An angle of 0 leaves the image untouched.
    void Rotate(float angle, unsigned char fill, float second);
    // `count` quarter turns clockwise (count taken modulo 4, negative counts turn back).
    // With count 3 the pixel (x, y) of a W x H image goes to (y, W - 1 - x); 1 is the
    // inverse. Works on 8-, 16- and 24-bit images.
    void Rotate90ClockWise(int count);

private:
    void Release();

    int m_width = 0;
    int m_height = 0;
    int m_bits = 0;
    int m_span = 0;
    unsigned char* m_pixels = nullptr;
    COLORREF* m_palette = nullptr;  // 256 entries, allocated on first SetPaletteColor
};
