#pragma once

#include "imagelib/CImage.h"
#include "imagelib/Types.h"

// Internals of CCorresTable shared with the tests: the exact score (the definition) and
// the search-area scorer in a plain and a fast form that agree to the bit.
namespace varnoth::coding {

// Inclusive ranges of columns u and rows v of image b; every point lies inside b.
struct SearchArea {
    int uLo = 0, uHi = -1;
    int vLo = 0, vHi = -1;
    int Columns() const { return uHi >= uLo ? uHi - uLo + 1 : 0; }
    int Rows() const { return vHi >= vLo ? vHi - vLo + 1 : 0; }
};

// CCorresTable::CorrelationCalc: integer products added in scan order to a float sum,
// divided by the number of terms.
float CorrelationScore(const CImage& a, const CImage& b, CPoint pa, CPoint pb, int n);

// Scores of CorrelationScore(a, b, p, (u, v), n) for every point of the area, rows outer
// and columns inner, into scores[0 .. Rows * Columns). Both images are 8-bit.
void ScoreSearchAreaPlain(const CImage& a, const CImage& b, CPoint p, const SearchArea& area, int n,
                          float* scores);
// The same scores, bit for bit, with integer SIMD dot products.
void ScoreSearchArea(const CImage& a, const CImage& b, CPoint p, const SearchArea& area, int n,
                     float* scores);

}  // namespace varnoth::coding
