#pragma once

#include <array>
#include <cstdint>
#include <deque>
#include <optional>
#include <vector>

#include "frame/SafeArray.h"
#include "frame/VarnothExport.h"
#include "imagelib/CImage.h"
#include "imagelib/Types.h"

// Two run labels found to touch; `first` < `second` once the list is normalised.
struct SLabelPair {
    uint16_t first = 0;
    uint16_t second = 0;
    bool operator==(const SLabelPair&) const = default;
};

// A dark stroke of the reference plane: its bounding box (right and bottom inclusive) and
// the outline points sampled on it, in the order they were found.
struct SSegment {
    RECT rect{};
    std::deque<CPoint> points;
};

// What MatchChannels learnt about one segment: the accumulated grade maps of plane 0 and
// plane 2 against plane 1. Entry (dy + 10) * 21 + (dx + 10) sums, over the segment's points
// (x, y), the grade of the channel's window at (x + dx, y + dy) against the reference
// window at (x, y); low grades mark good matches.
struct SSegmentGrades {
    static constexpr int kRadius = 10;
    static constexpr int kSide = 2 * kRadius + 1;
    static constexpr int kEntries = kSide * kSide;

    RECT rect{};
    int pointCount = 0;
    // A point lay less than 12 pixels from the border, so its search square was clipped: its
    // grades were packed from entry 0 and no longer sit at their offsets.
    bool clipped = false;
    std::array<float, kEntries> accumulated[2]{};  // [0]: plane 0, [1]: plane 2

    // The offset (dx, dy) of the lowest accumulated grade of `channel` (0 for plane 0,
    // 1 for plane 2): the channel's content sits that far from the reference's. Ties go to
    // the first entry in row-major order. None for a clipped segment, a segment without
    // points, or a map without any contrast (all entries equal). A flat window grades 0 like
    // a perfect match, so on a noiseless picture flat paper can win over the true offset.
    std::optional<CPoint> BestOffset(int channel) const {
        if (clipped || pointCount == 0 || channel < 0 || channel > 1) return std::nullopt;
        const std::array<float, kEntries>& map = accumulated[channel];
        int best = 0;
        bool anyDifferent = false;
        for (int i = 1; i < kEntries; ++i) {
            if (map[i] != map[0]) anyDifferent = true;
            if (map[i] < map[best]) best = i;
        }
        if (!anyDifferent) return std::nullopt;
        return CPoint(best % kSide - kRadius, best / kSide - kRadius);
    }
};

// Works on three 8-bit grey planes of one picture, passed as a pointer to the first of three
// consecutive CImage objects (plane 0, 1, 2, all of one size).
// - CheatCreate builds a synthetic infrared-like picture: plane 0 with its small dark
//   features, dark in planes 0 and 1 alike, darkened further by a centre-negative
//   Laplacian-of-Gaussian response of plane 1. Read it with GetCheat.
// - MatchChannels takes plane 1 as the reference, finds its dark strokes, groups them into
//   segments and grades how well planes 0 and 2 line up with it around sampled stroke
//   points, within +-10 pixels. The planes are not changed.
// Not safe for concurrent calls on one object; distinct objects are independent.
class VARNOTH_API CCheatIR {
public:
    CCheatIR();
    // Creates the synthetic picture at once; throws CCheatIRCreateErrT when CheatCreate fails.
    explicit CCheatIR(const CImage* planes);
    CCheatIR(const CCheatIR& other);
    CCheatIR& operator=(const CCheatIR& other);
    ~CCheatIR();

    CImage& GetCheat();
    const CImage& GetCheat() const;

    // Replaces the synthetic picture. False (nothing changed) when a plane is missing or not
    // 8-bit, or the planes differ in size.
    bool CheatCreate(const CImage* planes);

    // Segment search on plane 1, then grading of plane 0 and plane 2 against it; writes
    // the debug pictures "\results\groups.bmp", "\results\localMap.bmp",
    // "\results\baseMap.bmp" and "\results\acumMap.bmp" when dumps are enabled. Both lists
    // are emptied first, so each call works on its own planes only. False (nothing done)
    // when a plane is missing or not 8-bit, or the planes differ in size.
    bool MatchChannels(CImage* planes);
    // The same, and when `grades` is not null it receives one entry per segment, in segment
    // order (it is emptied first).
    bool MatchChannels(CImage* planes, std::vector<SSegmentGrades>* grades);

private:
    friend class CCheatIRTestAccess;

    using Window = CSafeArray<uint8_t>;  // 5 x 5 bytes, row-major
    using GradeMap = CSafeArray<float>;  // 21 x 21 grades, row-major

    // Edge finding and run labelling.
    void EdgesFind(CImage& derivRows, CImage& derivCols, CImage& edgesRows, CImage& edgesCols,
                   const CImage& source);
    void InitialGrouping(const CImage& deriv, const CImage& edges, CImage& labels, int& nextLabel);
    void RecordPair(uint16_t a, uint16_t b);

    // Segment assembly.
    void SegmentsFind(const CImage& reference);

    // Window grading and channel matching.
    void BuildBaseWin(const CPoint& point, const CImage& image, Window& window);
    void BuildLocalMap(const CPoint& point, const CImage& channel, const Window& reference, GradeMap& map);
    float Grade(const Window& a, const Window& b);
    void MapAccumulate(const GradeMap& map, GradeMap& accumulator);
    bool ChannelMatchAndWarp(CImage& channel, const CImage& reference);
    // As above; when `grades` is not null, slot `slot` of its entries receives the
    // accumulators (one entry per segment, created by the caller).
    bool ChannelMatchAndWarp(CImage& channel, const CImage& reference,
                             std::vector<SSegmentGrades>* grades, int slot);

    CImage m_cheat;
    std::deque<SLabelPair> m_labelPairs;
    std::deque<SSegment> m_segments;
};
