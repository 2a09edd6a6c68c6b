#pragma once

// Reaches CCheatIR's private operations and lists for the tests, plus small picture helpers.

#include <cstdint>
#include <cstdlib>
#include <deque>
#include <filesystem>
#include <string>

#include "channels/CheatIR.h"
#include "channels/CheatIRInternal.h"
#include "common/TestImages.h"

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

inline CImage Noise(int w, int h, unsigned seed) { return testing_images::RandomImage(w, h, 8, seed); }

// Debug pictures go to a fresh temporary folder while this lives.
class DumpDir {
public:
    explicit DumpDir(const char* name) : m_dir(std::filesystem::temp_directory_path() / name) {
        std::filesystem::remove_all(m_dir);
        setenv("VARNOTH_DUMP_DIR", m_dir.c_str(), 1);
    }
    ~DumpDir() {
        unsetenv("VARNOTH_DUMP_DIR");
        std::filesystem::remove_all(m_dir);
    }
    std::string File(const char* name) const { return (m_dir / "results" / name).string(); }

private:
    std::filesystem::path m_dir;
};

// Every pixel byte (padding aside) equals v.
inline bool AllBytes(const CImage& img, uint8_t v) {
    for (int y = 0; y < img.GetHeight(); ++y)
        for (int i = 0; i < img.GetWidth() * img.GetBitCount() / 8; ++i)
            if (img.GetPtrXY(0, y)[i] != v) return false;
    return true;
}

using testing_images::SamePixels;

}  // namespace testpics
