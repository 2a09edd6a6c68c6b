#pragma once

#include <cstddef>
#include <cstdint>

#include "imagelib/CImage.h"

// The reduce and expand filters behind CPyramid. The plain versions are the definition of
// every output byte (single thread, one literal pass after the other); the fast versions
// give the same bytes with vector kernels and rows split among workers.
namespace varnoth {

// True when dst is the next coarser level of a source of at least 3 x 3 (same depth, 8 or 24
// bits, distinct images).
bool ReduceGeometryOk(const CImage& src, const CImage& dst);
// True when src is the next coarser level of dst and at least 2 x 2 (same depth, 8 or 24
// bits, distinct images).
bool ExpandGeometryOk(const CImage& src, const CImage& dst);
// 16-bit work elements the plain filters use: one destination span per source row.
size_t FilterWorkNeed(const CImage& src, const CImage& dst);

// `work` holds at least FilterWorkNeed elements. Reduce leaves dst's row padding alone;
// Expand writes 0 into it.
void PlainReduce(const CImage& src, CImage& dst, int16_t* work);
void PlainExpand(const CImage& src, CImage& dst, int16_t* work);

// The same results; `work` holds `capacity` elements (at least FilterWorkNeed). Falls back to
// the plain version when the work buffer has no room for a band of rows.
void FastReduce(const CImage& src, CImage& dst, int16_t* work, size_t capacity);
void FastExpand(const CImage& src, CImage& dst, int16_t* work, size_t capacity);

// target = target - expand(coarse) + 128 (add false) or target + expand(coarse) - 127 (add
// true), clamped, over every byte of each row: Expand into an image of target's geometry
// followed by ImageSubtract / ImageAdd, without the intermediate image. The caller checks
// ExpandGeometryOk(coarse, target) and FilterWorkNeed. False (target untouched) when the work
// buffer has no room for a band of rows.
bool FastExpandCombine(const CImage& coarse, CImage& target, bool add, int16_t* work, size_t capacity);

}  // namespace varnoth
