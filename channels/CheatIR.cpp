// CCheatIR: construction, copying and the synthetic infrared picture.

#include "channels/CheatIR.h"

#include <vector>

#include "channels/CheatIRInternal.h"
#include "frame/Errors.h"
#include "imagelib/Trace.h"

namespace channels {

bool PlanesUsable(const CImage* planes, const char* caller) {
    if (planes == nullptr) {
        Trace(L"CCheatIR::%hs: no planes given\n", caller);
        return false;
    }
    for (int i = 0; i < 3; ++i) {
        if (planes[i].GetBitCount() != 8) return false;  // the documented refusal: no trace
    }
    for (int i = 1; i < 3; ++i) {
        if (planes[i].GetWidth() != planes[0].GetWidth() || planes[i].GetHeight() != planes[0].GetHeight()) {
            Trace(L"CCheatIR::%hs: plane %d is %dx%d, plane 0 is %dx%d\n", caller, i, planes[i].GetWidth(),
                  planes[i].GetHeight(), planes[0].GetWidth(), planes[0].GetHeight());
            return false;
        }
    }
    return true;
}

}  // namespace channels

namespace {

// Centre-negative Laplacian of Gaussian, 9 x 9; weights sum to 0, positive ones to 184.
constexpr int kLogSize = 9;
constexpr int kLogHalf = kLogSize / 2;
constexpr int kLogPositiveSum = 184;
constexpr int kLogWeights[kLogSize][kLogSize] = {
    {0, 1, 1, 2, 2, 2, 1, 1, 0},
    {1, 2, 4, 5, 5, 5, 4, 2, 1},
    {1, 4, 5, 3, 0, 3, 5, 4, 1},
    {2, 5, 3, -12, -24, -12, 3, 5, 2},
    {2, 5, 0, -24, -40, -24, 0, 5, 2},
    {2, 5, 3, -12, -24, -12, 3, 5, 2},
    {1, 4, 5, 3, 0, 3, 5, 4, 1},
    {1, 2, 4, 5, 5, 5, 4, 2, 1},
    {0, 1, 1, 2, 2, 2, 1, 1, 0},
};

// Pixels this close to any edge are never examined: the candidate test looks 5 pixels away.
constexpr int kBorder = 5;
// A candidate has a neighbour at distance kBorder brighter by more than this.
constexpr int kCandidateContrast = 20;
// Marked candidates are dark in both planes.
constexpr int kMaxPlane1 = 150;
constexpr int kMaxPlane0 = 149;

// Marks the row's candidates (a pixel 5 away, left, right, above or below, brighter by more
// than 20) that are dark in both planes.
void MarkDarkFeatures(const CImage& plane0, const CImage& plane1, int y, uint8_t* mask) {
    const uint8_t* row = plane0.GetPtrXY(0, y);
    const uint8_t* above = plane0.GetPtrXY(0, y - kBorder);
    const uint8_t* below = plane0.GetPtrXY(0, y + kBorder);
    const uint8_t* row1 = plane1.GetPtrXY(0, y);
    for (int x = kBorder; x < plane0.GetWidth() - kBorder; ++x) {
        const int p = row[x];
        const int brighter = p + kCandidateContrast;
        const bool candidate =
            row[x - kBorder] > brighter || row[x + kBorder] > brighter || above[x] > brighter || below[x] > brighter;
        mask[x] = candidate && row1[x] <= kMaxPlane1 && p <= kMaxPlane0 ? 255 : 0;
    }
}

// The table's response on plane 1 around (x, y), scaled by the positive weights and kept
// only where it darkens (d >= 0).
int Darkening(const uint8_t* const* plane1Rows, int x) {
    int sum = 0;
    for (int i = 0; i < kLogSize; ++i) {
        const uint8_t* row = plane1Rows[i] + x - kLogHalf;
        for (int j = 0; j < kLogSize; ++j) sum += kLogWeights[i][j] * row[j];
    }
    const int d = sum / kLogPositiveSum;  // truncates toward zero
    return d < 0 ? 0 : d;
}

}  // namespace

CCheatIR::CCheatIR() = default;

CCheatIR::CCheatIR(const CImage* planes) {
    if (!CheatCreate(planes)) throw CCheatIRCreateErrT();
}

CCheatIR::CCheatIR(const CCheatIR& other) = default;

CCheatIR& CCheatIR::operator=(const CCheatIR& other) {
    if (this != &other) {
        m_cheat = other.m_cheat;
        m_labelPairs = other.m_labelPairs;
        m_segments = other.m_segments;
    }
    return *this;
}

// Members go in reverse order: segments, label pairs, then the picture.
CCheatIR::~CCheatIR() = default;

CImage& CCheatIR::GetCheat() { return m_cheat; }
const CImage& CCheatIR::GetCheat() const { return m_cheat; }

bool CCheatIR::CheatCreate(const CImage* planes) {
    if (!channels::PlanesUsable(planes, "CheatCreate")) return false;
    const CImage& plane0 = planes[0];
    const CImage& plane1 = planes[1];
    const int width = plane0.GetWidth();
    const int height = plane0.GetHeight();

    // The whole mask first, then the darkening, so the 81-term sum runs on marked pixels only.
    std::vector<uint8_t> mask(static_cast<size_t>(width > 0 ? width : 0) * (height > 0 ? height : 0), 0);
    for (int y = kBorder; y < height - kBorder; ++y)
        MarkDarkFeatures(plane0, plane1, y, mask.data() + static_cast<size_t>(y) * width);

    m_cheat = plane0;  // the border and every unmarked pixel keep plane 0's value
    const uint8_t* plane1Rows[kLogSize];
    for (int y = kBorder; y < height - kBorder; ++y) {
        const uint8_t* maskRow = mask.data() + static_cast<size_t>(y) * width;
        const uint8_t* source = plane0.GetPtrXY(0, y);
        uint8_t* target = m_cheat.GetPtrXY(0, y);
        for (int i = 0; i < kLogSize; ++i) plane1Rows[i] = plane1.GetPtrXY(0, y - kLogHalf + i);
        for (int x = kBorder; x < width - kBorder; ++x) {
            if (maskRow[x] == 0) continue;
            const int v = source[x] - Darkening(plane1Rows, x);
            target[x] = static_cast<uint8_t>(v < 0 ? 0 : v);
        }
    }
    return true;
}

bool CCheatIR::MatchChannels(CImage* planes) { return MatchChannels(planes, nullptr); }

bool CCheatIR::MatchChannels(CImage* planes, std::vector<SSegmentGrades>* grades) {
    if (!channels::PlanesUsable(planes, "MatchChannels")) return false;
    if (grades != nullptr) grades->clear();
    // Each call grades its own planes: nothing of an earlier call's lists is kept.
    m_labelPairs.clear();
    m_segments.clear();

    SegmentsFind(planes[1]);
    if (grades != nullptr) {
        grades->resize(m_segments.size());
        for (size_t i = 0; i < m_segments.size(); ++i) {
            (*grades)[i].rect = m_segments[i].rect;
            (*grades)[i].pointCount = static_cast<int>(m_segments[i].points.size());
        }
    }
    ChannelMatchAndWarp(planes[0], planes[1], grades, 0);
    ChannelMatchAndWarp(planes[2], planes[1], grades, 1);
    return true;
}
