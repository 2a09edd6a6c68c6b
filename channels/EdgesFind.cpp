// Edge finding along rows and columns, and the labelling of dark runs between edge peaks.

#include <algorithm>
#include <cstdlib>
#include <vector>

#include "channels/CheatIR.h"
#include "channels/CheatIRInternal.h"
#include "frame/SafeArray.h"

using channels::kFallingPeak;
using channels::kNoEdge;
using channels::kRisingPeak;
using channels::kUnlabelled;

namespace {

constexpr int kHistogramSize = 256;
// Runs this wide or wider between their edge peaks are no stroke.
constexpr int kMaxRunWidth = 50;
// The row above is searched for a label this many pixels from a run's start.
constexpr int kAboveReach = 2;
// A label value handed out must stay below the unlabelled value.
constexpr int kLabelLimit = kUnlabelled;

// Five-tap derivative: positive where brightness increases along the line.
inline int16_t Derivative(int minus2, int minus1, int plus1, int plus2) {
    return static_cast<int16_t>(2 * (plus2 - minus2) + plus1 - minus1);
}

// Counts |D| limited to 255. Four interleaved tables keep successive counts of one level from
// waiting on each other; Merge adds them into the histogram.
class MagnitudeCounter {
public:
    void Count(const int16_t* d, int begin, int end) {
        for (int x = begin; x < end; ++x) {
            const int magnitude = std::abs(static_cast<int>(d[x]));
            ++m_tables[x & 3][magnitude < 255 ? magnitude : 255];
        }
    }
    void MergeInto(CSafeArray<uint32_t>& histogram) const {
        for (int level = 0; level < kHistogramSize; ++level)
            histogram[level] = m_tables[0][level] + m_tables[1][level] + m_tables[2][level] + m_tables[3][level];
    }

private:
    uint32_t m_tables[4][kHistogramSize] = {};
};

// The largest magnitude level whose count reaches a tenth of the zero-derivative count.
int ThresholdFromHistogram(const CSafeArray<uint32_t>& histogram) {
    const double tenthOfFlat = 0.1 * histogram[0];
    for (int level = kHistogramSize - 1; level > 0; --level) {
        if (histogram[level] >= tenthOfFlat) return level;
    }
    return 0;
}

// Marks of weak derivatives go back to "no edge".
void DropWeakPeaks(const CImage& deriv, CImage& edges, int threshold) {
    const int width = deriv.GetWidth();
    for (int y = 0; y < deriv.GetHeight(); ++y) {
        const int16_t* d = channels::Row16(deriv, y);
        uint8_t* e = edges.GetPtrXY(0, y);
        for (int x = 0; x < width; ++x) {
            const bool weak = std::abs(static_cast<int>(d[x])) < threshold;
            e[x] = weak ? kNoEdge : e[x];  // a select, so the loop vectorises
        }
    }
}

}  // namespace

void CCheatIR::EdgesFind(CImage& derivRows, CImage& derivCols, CImage& edgesRows, CImage& edgesCols,
                         const CImage& source) {
    const int width = source.GetWidth();
    const int height = source.GetHeight();
    CSafeArray<uint32_t> histogram(kHistogramSize);
    derivRows.Set(0);
    derivCols.Set(0);
    edgesRows.Set(kNoEdge);
    edgesCols.Set(kNoEdge);

    // The histogram counts the same positions whatever the order, so each row's derivatives
    // are computed first, then counted, then walked by the run-peak rule.
    MagnitudeCounter rowCounts;
    for (int y = 0; y < height; ++y) {
        const uint8_t* p = source.GetPtrXY(0, y);
        int16_t* d = channels::Row16(derivRows, y);
        uint8_t* e = edgesRows.GetPtrXY(0, y);
        for (int x = 2; x <= width - 3; ++x) d[x] = Derivative(p[x - 2], p[x - 1], p[x + 1], p[x + 2]);
        rowCounts.Count(d, 2, width - 2);
        channels::RunPeakState state;
        int32_t peak = 0;
        for (int x = 2; x <= width - 3; ++x) {
            const uint8_t mark = channels::StepRunPeak(state, d[x], x, peak);
            if (mark != kNoEdge) e[peak] = mark;
        }
    }
    rowCounts.MergeInto(histogram);
    const int rowThreshold = ThresholdFromHistogram(histogram);

    // Every column keeps its own marker, so the columns are walked side by side, a row at a
    // time, each with increasing y.
    MagnitudeCounter columnCounts;
    channels::ColumnPeakStates states(width);
    std::vector<uint8_t*> edgeRows(static_cast<size_t>(height > 0 ? height : 0));
    for (int y = 0; y < height; ++y) edgeRows[y] = edgesCols.GetPtrXY(0, y);
    for (int y = 2; y <= height - 3; ++y) {
        const uint8_t* up2 = source.GetPtrXY(0, y - 2);
        const uint8_t* up1 = source.GetPtrXY(0, y - 1);
        const uint8_t* down1 = source.GetPtrXY(0, y + 1);
        const uint8_t* down2 = source.GetPtrXY(0, y + 2);
        int16_t* d = channels::Row16(derivCols, y);
        for (int x = 0; x < width; ++x) d[x] = Derivative(up2[x], up1[x], down1[x], down2[x]);
        columnCounts.Count(d, 0, width);
        channels::StepColumnPeaksFast(states, d, width, y, edgeRows.data());
    }
    columnCounts.MergeInto(histogram);
    const int columnThreshold = ThresholdFromHistogram(histogram);

    DropWeakPeaks(derivRows, edgesRows, rowThreshold);
    DropWeakPeaks(derivCols, edgesCols, columnThreshold);
}

void CCheatIR::RecordPair(uint16_t a, uint16_t b) {
    const SLabelPair pair{std::min(a, b), std::max(a, b)};
    if (!m_labelPairs.empty() && m_labelPairs.back() == pair) return;
    m_labelPairs.push_back(pair);
}

void CCheatIR::InitialGrouping(const CImage& deriv, const CImage& edges, CImage& labels, int& nextLabel) {
    const int width = deriv.GetWidth();
    const int height = deriv.GetHeight();
    int n = nextLabel;

    for (int y = 1; y < height; ++y) {
        const int16_t* d = channels::Row16(deriv, y);
        const uint8_t* e = edges.GetPtrXY(0, y);
        uint16_t* cur = channels::RowU16(labels, y);
        const uint16_t* prev = channels::RowU16(labels, y - 1);
        bool open = false;
        int start = -1;
        int x = 1;
        while (x < width - 1) {
            if (e[x] < kNoEdge) {
                if (!open) {
                    open = true;
                    start = x;
                } else if (d[x] < d[start]) {
                    start = x;
                }
                ++x;
                continue;
            }
            if (e[x] == kNoEdge || !open) {
                ++x;
                continue;
            }
            // A rising peak closes the run; it ends at the strongest rising peak before the
            // next falling one, where the walk resumes.
            int end = x;
            int k = x + 1;
            for (; k < width && e[k] >= kNoEdge; ++k) {
                if (e[k] > kNoEdge && d[k] > d[end]) end = k;
            }
            open = false;
            x = k;
            if (end - start >= kMaxRunWidth) continue;

            int label = std::min<int>(n, cur[end - 1]);
            int above = -1;
            for (int j = start; j <= start + kAboveReach && j < width; ++j) {
                if (prev[j] != kUnlabelled) {
                    above = prev[j];
                    break;
                }
            }
            if (above < 0) {
                // A fresh label when the run's last pixel carried none. Once the labels are
                // used up, runs that would need a new one stay unlabelled.
                if (label == n && n >= kLabelLimit) continue;
                if (n < kLabelLimit) ++n;
            } else if (label < n) {
                if (label != above) RecordPair(static_cast<uint16_t>(label), static_cast<uint16_t>(above));
            } else {
                label = above;
            }
            const uint16_t runLabel = static_cast<uint16_t>(label);
            for (int i = start + 1; i <= end - 1; ++i) {
                if (cur[i] != kUnlabelled && cur[i] != runLabel) RecordPair(cur[i], runLabel);
                if (prev[i + 1] != kUnlabelled && prev[i + 1] != runLabel) RecordPair(prev[i + 1], runLabel);
                cur[i] = runLabel;
            }
        }
    }

    // Normalise the whole list: sorted by first, then second, without repeats or self-pairs.
    std::sort(m_labelPairs.begin(), m_labelPairs.end(), [](const SLabelPair& a, const SLabelPair& b) {
        return a.first != b.first ? a.first < b.first : a.second < b.second;
    });
    std::deque<SLabelPair> normalised;
    for (const SLabelPair& pair : m_labelPairs) {
        if (normalised.empty()) {
            normalised.push_back(pair);
        } else if (!(pair == normalised.back()) && pair.first != pair.second) {
            normalised.push_back(pair);
        }
    }
    m_labelPairs.swap(normalised);
    nextLabel = n;
}
