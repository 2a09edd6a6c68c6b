#pragma once

// Helpers shared by the CCheatIR sources and reachable from the tests; not exported.

#include <cstdint>
#include <deque>
#include <vector>

#include "channels/CheatIR.h"
#include "frame/SafeArray.h"
#include "imagelib/CImage.h"

namespace channels {

// The label image's value for "no label" (every bit set).
constexpr uint16_t kUnlabelled = 0xFFFF;
// Edge-map values: no edge, falling-edge peak (bright to dark), rising-edge peak.
constexpr uint8_t kNoEdge = 128;
constexpr uint8_t kFallingPeak = 0;
constexpr uint8_t kRisingPeak = 255;

// The run-peak rule along one line of derivatives, walked in increasing position: when the
// sign changes, the strongest position of the run that ended (the first of equal extremes)
// becomes a falling or rising peak; the line's last run is never marked.
struct RunPeakState {
    enum : int32_t { kNone = 0, kFalling = 1, kRising = 2 };
    int32_t state = kNone;
    int32_t minimum = 0;  // of the current falling run
    int32_t maximum = 0;  // of the current rising run
    int32_t peak = 0;     // position of the current run's extreme
};

// One step of the rule for derivative d at position pos. Returns the edge value to write at
// `marked` (the previous run's peak), or kNoEdge when no run ended.
inline uint8_t StepRunPeak(RunPeakState& s, int16_t d, int32_t pos, int32_t& marked) {
    uint8_t mark = kNoEdge;
    if (d < 0) {
        if (s.state == RunPeakState::kRising) {
            mark = kRisingPeak;
            marked = s.peak;
            s.maximum = 0;
        }
        s.state = RunPeakState::kFalling;
        if (d < s.minimum) {
            s.minimum = d;
            s.peak = pos;
        }
    } else if (d > 0) {
        if (s.state == RunPeakState::kFalling) {
            mark = kFallingPeak;
            marked = s.peak;
            s.minimum = 0;
        }
        s.state = RunPeakState::kRising;
        if (d > s.maximum) {
            s.maximum = d;
            s.peak = pos;
        }
    }
    return mark;
}

// The column pass walks all columns side by side, a row at a time: one state per column,
// kept as arrays so the fast version loads a vector of columns at once.
struct ColumnPeakStates {
    std::vector<int32_t> state, minimum, maximum, peak;
    explicit ColumnPeakStates(int width)
        : state(Size(width)), minimum(Size(width)), maximum(Size(width)), peak(Size(width)) {}

private:
    static size_t Size(int width) { return static_cast<size_t>(width > 0 ? width : 0); }
};

// Steps the columns [begin, end) with row y's derivatives d; a mark for column x at row r
// goes to edgeRows[r][x]. The plain version is the definition.
void StepColumnPeaksPlain(ColumnPeakStates& states, const int16_t* d, int begin, int end, int32_t y,
                          uint8_t* const* edgeRows);
void StepColumnPeaksFast(ColumnPeakStates& states, const int16_t* d, int width, int32_t y, uint8_t* const* edgeRows);

// True when `planes` points at three 8-bit planes of one width and height. `caller` names
// the operation in the trace line written when they do not.
bool PlanesUsable(const CImage* planes, const char* caller);

inline int16_t* Row16(CImage& img, int y) { return reinterpret_cast<int16_t*>(img.GetPtrXY(0, y)); }
inline const int16_t* Row16(const CImage& img, int y) {
    return reinterpret_cast<const int16_t*>(img.GetPtrXY(0, y));
}
inline uint16_t* RowU16(CImage& img, int y) { return reinterpret_cast<uint16_t*>(img.GetPtrXY(0, y)); }
inline const uint16_t* RowU16(const CImage& img, int y) {
    return reinterpret_cast<const uint16_t*>(img.GetPtrXY(0, y));
}

// Label grouping: turns a list of touching label pairs into the final mapping, sorted by
// `second`, one pair (representative, label) per merged label, the representative being the
// smallest label of its group.
// The plain version runs the sort / chain / fan iterations until nothing changes; it is the
// definition. The fast version reaches the same list through union-find.
void GroupLabelPairsIterative(std::deque<SLabelPair>& pairs);
void GroupLabelPairs(std::deque<SLabelPair>& pairs);

// Replaces every labelled value of the label image by its group's representative from the
// final pair list. The plain version scans the list from its start for every labelled pixel;
// the fast version looks the label up in a table built from the same list. `labelCount`
// bounds the labels in use.
void RelabelByPairScan(CImage& labels, const std::deque<SLabelPair>& pairs);
void RelabelByLookup(CImage& labels, const std::deque<SLabelPair>& pairs, int labelCount);

// Group boxes, index = label: the smallest and largest x and y of the label's pixels (right
// and bottom inclusive); an all-zero box is unused.
void BuildGroupBoxes(const CImage& labels, CSafeArray<RECT>& boxes);
// Each used box in index order swallows every later box it overlaps (IntersectRect: right and
// bottom exclusive, so boxes that only touch stay apart), sweeping again until a sweep merges
// nothing; a swallowed box is emptied.
void MergeOverlappingBoxes(CSafeArray<RECT>& boxes);
// Appends a segment without points for every box reaching into the middle half of the
// height, then orders all segments by left, then right.
void SelectSegments(const CSafeArray<RECT>& boxes, int height, std::deque<SSegment>& segments);
// Appends the segment's outline points: in every tenth column of the box's middle (an eighth
// of the width off each side) the first labelled pixel from the top and from the bottom, then
// in every tenth row of the band the first from the left and from the right.
void SampleOutline(const CImage& labels, SSegment& segment);

// Grading of a 5 x 5 channel window against a reference window whose mean-free values and
// sum of squares are worked out once per point. Gives the same float as Grade(a, ref).
struct ReferenceStats {
    float centred[25];
    float sumSquares;
};
ReferenceStats MakeReferenceStats(const uint8_t* window);
float GradeAgainst(const uint8_t* window, const ReferenceStats& ref);
float GradeWindows(const uint8_t* a, const uint8_t* b);

// One row of a grade map: out[c] grades the 5 x 5 window whose top-left pixel is rows[0][c]
// (rows[i] being the window's row i) against the reference, for c below count. The plain
// version copies each window and calls GradeAgainst; the fast one grades a vector of
// positions at once with the same float operations in the same order.
void GradeRowPlain(const uint8_t* const* rows, int count, const ReferenceStats& ref, float* out);
void GradeRowFast(const uint8_t* const* rows, int count, const ReferenceStats& ref, float* out);

// BuildLocalMap's definition: one BuildBaseWin-style copy and one grade per position of the
// clipped square, packed from entry 0.
void BuildLocalMapPlain(const CPoint& point, const CImage& channel, const uint8_t* reference, float* map);

}  // namespace channels
