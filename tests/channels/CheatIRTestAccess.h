#pragma once

// Reaches CCheatIR's private operations and lists for the tests, plus small picture helpers.

#include <cstdint>
#include <deque>
#include <string>

#include "channels/CheatIR.h"
#include "channels/CheatIRInternal.h"

class CCheatIRTestAccess {
public:
    using Window = CCheatIR::Window;
    using GradeMap = CCheatIR::GradeMap;

    static std::deque<SLabelPair>& Pairs(CCheatIR& c) { return c.m_labelPairs; }
    static std::deque<SSegment>& Segments(CCheatIR& c) { return c.m_segments; }

    static void EdgesFind(CCheatIR& c, CImage& dr, CImage& dc, CImage& er, CImage& ec, const CImage& src) {
        c.EdgesFind(dr, dc, er, ec, src);
    }
    static void InitialGrouping(CCheatIR& c, const CImage& d, const CImage& e, CImage& labels, int& n) {
        c.InitialGrouping(d, e, labels, n);
    }
    static void SegmentsFind(CCheatIR& c, const CImage& ref) { c.SegmentsFind(ref); }
    static void BuildBaseWin(CCheatIR& c, const CPoint& p, const CImage& img, Window& w) { c.BuildBaseWin(p, img, w); }
    static void BuildLocalMap(CCheatIR& c, const CPoint& p, const CImage& img, const Window& w, GradeMap& m) {
        c.BuildLocalMap(p, img, w, m);
    }
    static float Grade(CCheatIR& c, const Window& a, const Window& b) { return c.Grade(a, b); }
    static bool ChannelMatchAndWarp(CCheatIR& c, CImage& ch, const CImage& ref) { return c.ChannelMatchAndWarp(ch, ref); }
};

namespace testpics {

inline CImage Grey(int w, int h, uint8_t value) {
    CImage img(w, h, 8);
    img.Set(value);
    return img;
}

inline void Fill(CImage& img, int x0, int y0, int x1, int y1, uint8_t value) {  // inclusive corners
    for (int y = y0; y <= y1; ++y)
        for (int x = x0; x <= x1; ++x) img.GetPtrXY(0, y)[x] = value;
}

inline uint8_t At(const CImage& img, int x, int y) { return img.GetPtrXY(0, y)[x]; }
inline uint16_t Label(const CImage& img, int x, int y) { return channels::RowU16(img, y)[x]; }
inline int16_t Deriv(const CImage& img, int x, int y) { return channels::Row16(img, y)[x]; }

inline bool SamePixels(const CImage& a, const CImage& b) {
    if (a.GetWidth() != b.GetWidth() || a.GetHeight() != b.GetHeight() || a.GetBitCount() != b.GetBitCount())
        return false;
    const int bytes = a.GetWidth() * a.GetBitCount() / 8;
    for (int y = 0; y < a.GetHeight(); ++y)
        for (int i = 0; i < bytes; ++i)
            if (a.GetPtrXY(0, y)[i] != b.GetPtrXY(0, y)[i]) return false;
    return true;
}

}  // namespace testpics
