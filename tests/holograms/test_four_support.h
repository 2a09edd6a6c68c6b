#pragma once

#include <cstdint>
#include <ostream>

#include "holograms/HologramsRemove.h"
#include "imagelib/CImage.h"

// Reaches the remover's private helpers from the four-image tests.
struct HologramsRemoveTestAccess {
    static void UpdateLevel(CHologramsRemove& r, const CPyramid& t, const CPyramid& b, const CPyramid& l,
                            const CPyramid& rt, CPyramid& result, int level) {
        r.UpdateLevel(t, b, l, rt, result, level);
    }
    static void UpdateLevel2(CHologramsRemove& r, const CImage& t, const CImage& b, const CImage& l,
                             const CImage& rt, const CImage& coarse, CImage& result) {
        r.UpdateLevel2(t, b, l, rt, coarse, result);
    }
    static void ColorMapCreate(CHologramsRemove& r, const CImage& t, const CImage& b, const CImage& l,
                               const CImage& rt, CImage& map) {
        r.ColorMapCreate(t, b, l, rt, map);
    }
    static void CleanMaskTop(CHologramsRemove& r, CImage& mask) { r.CleanMaskTop(mask); }
    static int AvarageNeighbours(CHologramsRemove& r, unsigned char* row, int offset, int channel, int span) {
        return r.AvarageNeighbours(row, offset, channel, span);
    }
    static void Rgb2Hsv(CHologramsRemove& r, unsigned char* p) { r.Rgb2Hsv(p); }
    static void Hsv2Rgb(CHologramsRemove& r, unsigned char* p) { r.Hsv2Rgb(p); }
};

namespace four_test {

struct Bgr {
    int b, g, r;
};

inline void Put(CImage& img, int x, int y, Bgr c) {
    unsigned char* p = img.GetPtrXY(x, y);
    p[0] = static_cast<unsigned char>(c.b);
    p[1] = static_cast<unsigned char>(c.g);
    p[2] = static_cast<unsigned char>(c.r);
}

inline void Fill(CImage& img, Bgr c) {
    for (int y = 0; y < img.GetHeight(); ++y)
        for (int x = 0; x < img.GetWidth(); ++x) Put(img, x, y, c);
}

inline CImage Solid(int w, int h, Bgr c) {
    CImage img(w, h, 24);
    Fill(img, c);
    return img;
}

// Runs a per-pixel rule rule(const unsigned char* const detail[4], unsigned char* out) on the
// four candidates d and returns the pixel it writes.
template <class Rule>
Bgr ApplyPixelRule(const Bgr d[4], Rule rule) {
    unsigned char bytes[4][3];
    const unsigned char* detail[4];
    for (int i = 0; i < 4; ++i) {
        bytes[i][0] = static_cast<unsigned char>(d[i].b);
        bytes[i][1] = static_cast<unsigned char>(d[i].g);
        bytes[i][2] = static_cast<unsigned char>(d[i].r);
        detail[i] = bytes[i];
    }
    unsigned char out[3];
    rule(detail, out);
    return {out[0], out[1], out[2]};
}

inline Bgr At(const CImage& img, int x, int y) {
    const unsigned char* p = img.GetPtrXY(x, y);
    return {p[0], p[1], p[2]};
}

inline bool operator==(Bgr a, Bgr b) { return a.b == b.b && a.g == b.g && a.r == b.r; }
inline void PrintTo(Bgr c, std::ostream* os) { *os << "(" << c.b << "," << c.g << "," << c.r << ")"; }

}  // namespace four_test
