#pragma once

#include "frame/VarnothExport.h"
#include "imagelib/CImage.h"
#include "imagelib/Types.h"

// Geometric correction and thresholding: affine and radial warps, straightening of the
// seam of a two-sensor scan, and the hills-and-valleys threshold. Images are 8-bit grey or
// 24-bit B, G, R; other depths are refused. src and dst may be the same image.

// Resamples src through the affine map m = {a0 … a5}: output pixel (X, Y) reads source
// position (a0·X + a1·Y + a2, a3·X + a4·Y + a5), bilinear in 16.16 fixed point; no byte
// taken from the source exceeds 254. A near-identity map copies src (bytes capped at 254).
// With fit, dst is resized to the bounding box of the transformed source and `corners`
// (four points, may be null) receives where the source corners (0, 0), (W-1, 0),
// (W-1, H-1), (0, H-1) land. `shift` (may be null) moves the sampling by a sub-pixel
// fraction and, when negative, the content by whole pixels to the right / down. Output
// pixels whose source lies outside src keep what dst held. False on a singular map with
// fit, a depth other than 8 or 24 bits, or an empty processing window.
VARNOTH_API bool WarpAffine(const float* m, const CImage& src, CImage& dst, bool fit, const SPoint* shift,
                            CPoint* corners);

// Radial lens correction with f(r²) = k1·r² + k2·r⁴ + k3·r⁶ about (cx, cy), coordinates
// normalised to -1 … +1; p = {k1, k2, k3, cx, cy}.
// WarpRadial maps every source pixel forward and copies it (later pixels win; pixels no
// source reaches are 255). src and dst must have the same size and depth.
VARNOTH_API bool WarpRadial(const float* p, const CImage& src, CImage& dst);
// WarpRadialAndScale maps every output pixel backward in Q14 with bilinear sampling (255
// outside src), so it also rescales src to dst's size. dst is never reallocated: it must
// have src's depth and a non-zero size.
VARNOTH_API bool WarpRadialAndScale(const float* p, const CImage& src, CImage& dst);

// Straightens the seam y(x) = q0·x² + q1·x + q2 of a two-sensor scan, measured over the
// columns range.x … range.y (range.y > range.x): every column's content on the seam's side
// of the chord is moved by the curve's deviation from the chord, blended in over a band of
// rows. dst then gets Rotate(angle, 255, second) and one quarter turn clockwise.
VARNOTH_API void DualCMOSFixAlongCurve(const CImage& src, CImage& dst, float angle, float second, const float* q,
                                       SPoint range);

// Three-level rendering of an 8-bit grey image, row by row: 200 after a strong rising edge
// (hill), 0 after a strong falling edge (valley), 100 before the first and from the last
// edge. Rows without edges and the two rows at the top and bottom keep their values.
// Other depths are left unchanged.
VARNOTH_API void HillsVallysThreshold(CImage& img, int threshold);
