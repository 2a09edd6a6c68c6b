#pragma once

#include "frame/VarnothExport.h"
#include "imagelib/CImage.h"
#include "imagelib/Types.h"

// Whole-image byte arithmetic. Every byte of each row's span takes part, padding included.

// out = a + b - 127 per byte, clamped to 0..255 (equal inputs of 128 give 129). When a and
// b differ in width, height or bit count nothing is done; out is reallocated to a's
// geometry when it differs. `unused` has no effect.
VARNOTH_API void ImageAdd(const CImage& a, const CImage& b, CImage& out, bool unused = false);
// out = a - b + 128 per byte, clamped to 0..255; geometry rules as ImageAdd.
VARNOTH_API void ImageSubtract(const CImage& a, const CImage& b, CImage& out);
// Contrast stretch in place from the byte range of the central window (8- or 24-bit).
VARNOTH_API void ImageStretch(CImage& img, int unused1 = 0, int unused2 = 0);
// Copies src into dst with its top-left pixel at pos; with a mask (src's geometry) only the
// bytes whose mask byte is 0. False when the block does not stay at least one pixel inside
// dst's right and bottom edges, pos is negative, the depths differ or the mask does not fit.
VARNOTH_API bool InsertImage(const CImage& src, CImage& dst, CPoint pos, const CImage* mask = nullptr);
// Always false: the plain code paths are the only ones.
VARNOTH_API bool IsMMXSuported();
