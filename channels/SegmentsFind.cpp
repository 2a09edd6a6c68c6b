// Segment assembly: dark runs labelled along rows and columns, grouped, boxed, merged,
// selected and sampled into outline points.

#include <algorithm>
#include <numeric>
#include <vector>

#include "channels/CheatIR.h"
#include "channels/CheatIRInternal.h"
#include "frame/SafeArray.h"
#include "imagelib/DumpPath.h"

using channels::kUnlabelled;

namespace channels {

namespace {

bool ByFirstThenSecond(const SLabelPair& a, const SLabelPair& b) {
    return a.first != b.first ? a.first < b.first : a.second < b.second;
}

bool BySecondThenFirst(const SLabelPair& a, const SLabelPair& b) {
    return a.second != b.second ? a.second < b.second : a.first < b.first;
}

// Sorted by first, then second; keeps the first element and every later one that differs
// from the one kept last and is no self-pair.
void SortAndDropRepeats(std::deque<SLabelPair>& pairs) {
    std::sort(pairs.begin(), pairs.end(), ByFirstThenSecond);
    std::deque<SLabelPair> kept;
    for (const SLabelPair& pair : pairs) {
        if (kept.empty() || (!(pair == kept.back()) && pair.first != pair.second)) kept.push_back(pair);
    }
    pairs.swap(kept);
}

// A pair (a, b) followed later by (b, c) becomes (a, c); only the first candidate position
// is looked at. Returns whether anything changed.
bool ChainStep(std::deque<SLabelPair>& pairs) {
    bool changed = false;
    for (size_t i = 0; i < pairs.size(); ++i) {
        for (size_t j = i + 1; j < pairs.size(); ++j) {
            if (pairs[j].first < pairs[i].second) continue;
            if (pairs[j].first == pairs[i].second) {
                pairs[j].first = pairs[i].first;
                changed = true;
            }
            break;
        }
    }
    return changed;
}

// Pairs sharing a `second` tie their `first`s together: (a, c) and (b, c) add (a, b).
bool FanStep(std::deque<SLabelPair>& pairs) {
    std::vector<SLabelPair> added;
    for (size_t i = 0; i < pairs.size(); ++i) {
        for (size_t j = i + 1; j < pairs.size() && pairs[j].second == pairs[i].second; ++j) {
            if (pairs[j].first != pairs[i].first) added.push_back({pairs[i].first, pairs[j].first});
        }
    }
    pairs.insert(pairs.end(), added.begin(), added.end());
    return !added.empty();
}

int FindRoot(std::vector<int>& parent, int label) {
    while (parent[label] != label) {
        parent[label] = parent[parent[label]];
        label = parent[label];
    }
    return label;
}

}  // namespace

void GroupLabelPairsIterative(std::deque<SLabelPair>& pairs) {
    for (;;) {
        SortAndDropRepeats(pairs);
        if (pairs.empty()) return;
        bool changed = ChainStep(pairs);
        std::sort(pairs.begin(), pairs.end(), BySecondThenFirst);
        changed = FanStep(pairs) || changed;
        if (!changed) return;
    }
}

void GroupLabelPairs(std::deque<SLabelPair>& pairs) {
    if (pairs.empty()) return;
    int largest = 0;
    for (const SLabelPair& pair : pairs) largest = std::max<int>(largest, std::max(pair.first, pair.second));
    std::vector<int> parent(static_cast<size_t>(largest) + 1);
    std::iota(parent.begin(), parent.end(), 0);
    std::vector<bool> inPair(parent.size(), false);
    for (const SLabelPair& pair : pairs) {
        inPair[pair.first] = inPair[pair.second] = true;
        const int a = FindRoot(parent, pair.first);
        const int b = FindRoot(parent, pair.second);
        // The smaller root wins, so every root is the smallest label of its group.
        if (a < b) parent[b] = a;
        if (b < a) parent[a] = b;
    }
    std::deque<SLabelPair> grouped;
    for (int label = 0; label <= largest; ++label) {
        if (!inPair[label]) continue;
        const int root = FindRoot(parent, label);
        if (root != label) grouped.push_back({static_cast<uint16_t>(root), static_cast<uint16_t>(label)});
    }
    pairs.swap(grouped);
}

void RelabelByPairScan(CImage& labels, const std::deque<SLabelPair>& pairs) {
    for (int y = 0; y < labels.GetHeight(); ++y) {
        uint16_t* row = RowU16(labels, y);
        for (int x = 0; x < labels.GetWidth(); ++x) {
            if (row[x] == kUnlabelled) continue;
            for (const SLabelPair& pair : pairs) {
                if (pair.second < row[x]) continue;
                if (pair.second == row[x]) row[x] = pair.first;
                break;
            }
        }
    }
}

void RelabelByLookup(CImage& labels, const std::deque<SLabelPair>& pairs, int labelCount) {
    std::vector<uint16_t> representative(static_cast<size_t>(std::max(labelCount, 0)));
    std::iota(representative.begin(), representative.end(), uint16_t{0});
    for (const SLabelPair& pair : pairs) {
        if (pair.second < labelCount) representative[pair.second] = pair.first;
    }
    for (int y = 0; y < labels.GetHeight(); ++y) {
        uint16_t* row = RowU16(labels, y);
        for (int x = 0; x < labels.GetWidth(); ++x) {
            if (row[x] < labelCount) row[x] = representative[row[x]];
        }
    }
}

namespace {

// A box that no pixel has touched yet: all four fields 0.
bool IsUnused(const RECT& box) { return box.left == 0 && box.top == 0 && box.right == 0 && box.bottom == 0; }

bool IsLabelled(const CImage& labels, int x, int y) { return RowU16(labels, y)[x] != kUnlabelled; }

}  // namespace

void BuildGroupBoxes(const CImage& labels, CSafeArray<RECT>& boxes) {
    const int count = static_cast<int>(boxes.count());
    for (int y = 0; y < labels.GetHeight(); ++y) {
        const uint16_t* row = RowU16(labels, y);
        for (int x = 0; x < labels.GetWidth(); ++x) {
            if (row[x] >= count) continue;  // unlabelled
            RECT& box = boxes[row[x]];
            if (IsUnused(box)) {
                box = RECT{x, y, x, y};
            } else {
                box.left = std::min(box.left, x);
                box.right = std::max(box.right, x);
                box.top = std::min(box.top, y);
                box.bottom = std::max(box.bottom, y);
            }
        }
    }
}

// Unused boxes overlap nothing, so only the used ones are visited.
void MergeOverlappingBoxes(CSafeArray<RECT>& boxes) {
    std::vector<int> used;
    for (uint32_t i = 0; i < boxes.count(); ++i) {
        if (!IsUnused(boxes[i])) used.push_back(static_cast<int>(i));
    }
    for (size_t a = 0; a < used.size(); ++a) {
        RECT& box = boxes[used[a]];
        if (IsUnused(box)) continue;
        bool merged = true;
        while (merged) {
            merged = false;
            for (size_t b = a + 1; b < used.size(); ++b) {
                RECT& other = boxes[used[b]];
                // Boxes apart along x cannot overlap; IntersectRect decides for the rest.
                if (other.left >= box.right || box.left >= other.right) continue;
                RECT overlap;
                if (!IntersectRect(&overlap, &box, &other)) continue;
                UnionRect(&box, &box, &other);
                SetRectEmpty(&other);
                merged = true;
            }
        }
    }
}

// The band height b bounds the column search, the width the row search.
void SampleOutline(const CImage& labels, SSegment& segment) {
    const int height = labels.GetHeight();
    const RECT& r = segment.rect;
    const int w = r.right - r.left;
    const int b = std::min(r.bottom, 7 * height / 8) - std::max(r.top, height / 8);

    const int sx = w / 8;
    for (int x = r.left + sx; x < r.right - sx; x += 10) {
        int yt = r.top, yb = r.bottom;
        bool topFound = false, bottomFound = false;
        for (int step = 0; step < b && !(topFound && bottomFound) && yt < yb; ++step) {
            if (!topFound) {
                topFound = IsLabelled(labels, x, yt);
                if (topFound) segment.points.emplace_back(x, yt);
                ++yt;
            }
            if (!bottomFound) {
                bottomFound = IsLabelled(labels, x, yb);
                if (bottomFound) segment.points.emplace_back(x, yb);
                --yb;
            }
        }
    }

    const int sy = b >> 3;
    for (int y = r.top + sy; y < r.bottom - sy; y += 10) {
        int xl = r.left, xr = r.right;
        bool leftFound = false, rightFound = false;
        for (int step = 0; step < w && !(leftFound && rightFound) && xl < xr; ++step) {
            if (!leftFound) {
                leftFound = IsLabelled(labels, xl, y);
                if (leftFound) segment.points.emplace_back(xl, y);
                ++xl;
            }
            if (!rightFound) {
                rightFound = IsLabelled(labels, xr, y);
                if (rightFound) segment.points.emplace_back(xr, y);
                --xr;
            }
        }
    }
}

void SelectSegments(const CSafeArray<RECT>& boxes, int height, std::deque<SSegment>& segments) {
    const double h = height;
    for (uint32_t i = 0; i < boxes.count(); ++i) {
        const RECT& box = boxes[i];
        if (box.top < 0.75 * h && box.bottom > 0.25 * h && box.top <= box.bottom) {
            SSegment segment;
            segment.rect = box;
            segments.push_back(std::move(segment));
        }
    }
    // Left to right; equal boxes keep their index order.
    std::stable_sort(segments.begin(), segments.end(), [](const SSegment& a, const SSegment& b) {
        return a.rect.left != b.rect.left ? a.rect.left < b.rect.left : a.rect.right < b.rect.right;
    });
}

}  // namespace channels

namespace {

// Labels in spread-out greys, segment boxes in red (palette entry 254).
void DumpGroups(const CImage& labels, int labelCount, const std::deque<SSegment>& segments) {
    CImage picture(labels.GetWidth(), labels.GetHeight(), 8);
    picture.Set(255);
    const int spread = labelCount > 0 ? 240 / labelCount : 0;
    for (int y = 0; y < labels.GetHeight(); ++y) {
        const uint16_t* row = channels::RowU16(labels, y);
        uint8_t* out = picture.GetPtrXY(0, y);
        for (int x = 0; x < labels.GetWidth(); ++x) {
            if (row[x] != kUnlabelled) out[x] = static_cast<uint8_t>((row[x] & 0xFF) * spread);
        }
    }
    for (const SSegment& segment : segments) {
        const RECT& r = segment.rect;
        picture.Line(r.left, r.top, r.right, r.top, 254);
        picture.Line(r.right, r.top, r.right, r.bottom, 254);
        picture.Line(r.left, r.bottom, r.right, r.bottom, 254);
        picture.Line(r.left, r.top, r.left, r.bottom, 254);
    }
    picture.SetPaletteColor(254, 0x0000FF);
    picture.SetPaletteColor(253, 0x00FF00);
    picture.ExportFile(L"\\results\\groups.bmp");
}

}  // namespace

void CCheatIR::SegmentsFind(const CImage& reference) {
    const int width = reference.GetWidth();
    const int height = reference.GetHeight();
    CImage labels(width, height, 16);
    labels.Set(255);
    int labelCount = 0;
    {
        CImage derivRows(width, height, 16), derivCols(width, height, 16);
        CImage edgesRows(width, height, 8), edgesCols(width, height, 8);
        EdgesFind(derivRows, derivCols, edgesRows, edgesCols, reference);
        InitialGrouping(derivRows, edgesRows, labels, labelCount);
        derivRows.Reallocate(1, 1, 8);  // done with: keeps the turns below from adding to the peak
        edgesRows.Reallocate(1, 1, 8);
        // Columns are walked as the rows of the turned images, the first pass's labels in place.
        derivCols.Rotate90ClockWise(3);
        edgesCols.Rotate90ClockWise(3);
        labels.Rotate90ClockWise(3);
        InitialGrouping(derivCols, edgesCols, labels, labelCount);
        labels.Rotate90ClockWise(1);
    }

    // The final pair list maps each merged label to its group's smallest label. A table built
    // from it relabels in one pass what scanning the list per labelled pixel would give; on a
    // printed A4 page the scan alone took longer than the rest of the search.
    channels::GroupLabelPairs(m_labelPairs);
    channels::RelabelByLookup(labels, m_labelPairs, labelCount);

    CSafeArray<RECT> boxes(static_cast<uint32_t>(labelCount));
    channels::BuildGroupBoxes(labels, boxes);
    channels::MergeOverlappingBoxes(boxes);

    channels::SelectSegments(boxes, height, m_segments);
    for (SSegment& segment : m_segments) channels::SampleOutline(labels, segment);

    if (imagelib::DumpsEnabled()) DumpGroups(labels, labelCount, m_segments);
}
