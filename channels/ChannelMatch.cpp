// Window grading: how well 5 x 5 windows of a channel plane match the reference plane around
// each sampled stroke point, at every offset within +-10 pixels.

#include <algorithm>
#include <cmath>

#include "channels/CheatIR.h"
#include "channels/CheatIRInternal.h"
#include "imagelib/DumpPath.h"

namespace {

constexpr int kWindowSide = 5;
constexpr int kWindowHalf = kWindowSide / 2;
constexpr int kWindowSize = kWindowSide * kWindowSide;
constexpr int kSearch = SSegmentGrades::kRadius;
constexpr int kMapSide = SSegmentGrades::kSide;
constexpr int kMapSize = SSegmentGrades::kEntries;
// Window centres stay this far inside the channel, so every graded window is whole.
constexpr int kCentreMargin = kWindowHalf;

// A point's search square is clipped by the border: its grades are packed, not placed.
bool SearchClipped(const CPoint& p, int width, int height) {
    const int reach = kSearch + kCentreMargin;
    return p.x < reach || p.y < reach || p.x > width - 1 - reach || p.y > height - 1 - reach;
}

// Map values as bytes: times 255, limited to 255, truncated toward zero.
uint8_t MapByte(float v) {
    const float scaled = v * 255.0f;
    return scaled > 255.0f ? 255 : static_cast<uint8_t>(static_cast<int>(scaled));
}

// A 21 x 21 picture whose pixel in column j of row i is byteOf(entry 21 i + j).
template <typename ToByte>
void DumpMap(const float* entries, ToByte byteOf, const wchar_t* path) {
    CImage picture(kMapSide, kMapSide, 8);
    for (int i = 0; i < kMapSide; ++i) {
        uint8_t* row = picture.GetPtrXY(0, i);
        for (int j = 0; j < kMapSide; ++j) row[j] = byteOf(entries[kMapSide * i + j]);
    }
    picture.ExportFile(path);
}

void DumpWindow(const uint8_t* window) {
    CImage picture(kWindowSide, kWindowSide, 8);
    for (int i = 0; i < kWindowSide; ++i) {
        std::copy(window + kWindowSide * i, window + kWindowSide * (i + 1), picture.GetPtrXY(0, i));
    }
    picture.ExportFile(L"\\results\\baseMap.bmp");
}

}  // namespace

namespace channels {

// The order of every float operation below is what fixes the grade; the reference's mean and
// centred values come out the same whether worked out once or per call.
ReferenceStats MakeReferenceStats(const uint8_t* window) {
    ReferenceStats stats{};
    float sum = 0.0f;
    for (int i = 0; i < kWindowSize; ++i) sum += static_cast<float>(window[i]);
    const float mean = sum / static_cast<float>(kWindowSize);
    float squares = 0.0f;
    for (int i = 0; i < kWindowSize; ++i) {
        stats.centred[i] = static_cast<float>(window[i]) - mean;
        squares += stats.centred[i] * stats.centred[i];
    }
    stats.sumSquares = squares;
    return stats;
}

float GradeAgainst(const uint8_t* window, const ReferenceStats& ref) {
    const ReferenceStats own = MakeReferenceStats(window);
    float cross = 0.0f;
    for (int i = 0; i < kWindowSize; ++i) cross += own.centred[i] * ref.centred[i];
    const float g = 1.0f - cross / std::sqrt(own.sumSquares * ref.sumSquares);
    // A uniform window makes the quotient NaN, which fails the test and grades 0.
    return g > 0.0f ? g : 0.0f;
}

float GradeWindows(const uint8_t* a, const uint8_t* b) { return GradeAgainst(a, MakeReferenceStats(b)); }

}  // namespace channels

void CCheatIR::BuildBaseWin(const CPoint& point, const CImage& image, Window& window) {
    std::fill(window.data(), window.data() + kWindowSize, uint8_t{0});
    const int firstRow = std::max(point.y - kWindowHalf, 0);
    const int lastRow = std::min(point.y + kWindowHalf, image.GetHeight() - 1);
    const int firstCol = std::max(point.x - kWindowHalf, 0);
    const int lastCol = std::min(point.x + kWindowHalf, image.GetWidth() - 1);
    if (lastCol < firstCol) return;
    // At the border the part inside the image is packed at the window's top left.
    uint8_t* out = window.data();
    for (int r = firstRow; r <= lastRow; ++r, out += kWindowSide) {
        const uint8_t* row = image.GetPtrXY(0, r);
        std::copy(row + firstCol, row + lastCol + 1, out);
    }
}

float CCheatIR::Grade(const Window& a, const Window& b) { return channels::GradeWindows(a.data(), b.data()); }

namespace {

// The square of window centres within +-10 of the point that keep their whole window inside.
struct SearchSquare {
    int firstRow, lastRow, firstCol, lastCol;
    SearchSquare(const CPoint& p, const CImage& channel)
        : firstRow(std::max(p.y - kSearch, kCentreMargin)),
          lastRow(std::min(p.y + kSearch, channel.GetHeight() - 1 - kCentreMargin)),
          firstCol(std::max(p.x - kSearch, kCentreMargin)),
          lastCol(std::min(p.x + kSearch, channel.GetWidth() - 1 - kCentreMargin)) {}
};

}  // namespace

void channels::BuildLocalMapPlain(const CPoint& point, const CImage& channel, const uint8_t* reference, float* map) {
    const ReferenceStats ref = MakeReferenceStats(reference);
    const SearchSquare square(point, channel);
    uint8_t candidate[kWindowSize];
    int k = 0;
    for (int v = square.firstRow; v <= square.lastRow; ++v) {
        for (int u = square.firstCol; u <= square.lastCol; ++u) {
            for (int i = 0; i < kWindowSide; ++i) {
                const uint8_t* row = channel.GetPtrXY(0, v - kWindowHalf + i) + u - kWindowHalf;
                std::copy(row, row + kWindowSide, candidate + kWindowSide * i);
            }
            map[k++] = GradeAgainst(candidate, ref);
        }
    }
}

// Row-major over the clipped square, packed from entry 0; unwritten entries keep their zeros.
// Every window lies wholly inside the channel, so a map row is graded straight from the
// channel's rows.
void CCheatIR::BuildLocalMap(const CPoint& point, const CImage& channel, const Window& reference, GradeMap& map) {
    const channels::ReferenceStats ref = channels::MakeReferenceStats(reference.data());
    const SearchSquare square(point, channel);
    const int count = square.lastCol - square.firstCol + 1;
    if (count <= 0) return;
    int k = 0;
    for (int v = square.firstRow; v <= square.lastRow; ++v, k += count) {
        const uint8_t* rows[kWindowSide];
        for (int i = 0; i < kWindowSide; ++i)
            rows[i] = channel.GetPtrXY(0, v - kWindowHalf + i) + square.firstCol - kWindowHalf;
        channels::GradeRowFast(rows, count, ref, map.data() + k);
    }
}

void CCheatIR::MapAccumulate(const GradeMap& map, GradeMap& accumulator) {
    for (int i = 0; i < kMapSize; ++i) accumulator[i] += map[i];
}

bool CCheatIR::ChannelMatchAndWarp(CImage& channel, const CImage& reference) {
    return ChannelMatchAndWarp(channel, reference, nullptr, 0);
}

bool CCheatIR::ChannelMatchAndWarp(CImage& channel, const CImage& reference, std::vector<SSegmentGrades>* grades,
                                   int slot) {
    if (m_segments.empty()) return true;
    const bool dumps = imagelib::DumpsEnabled();
    const std::deque<SSegment> segments = m_segments;
    for (size_t s = 0; s < segments.size(); ++s) {
        GradeMap accumulator(kMapSize);
        bool clipped = false;
        for (const CPoint& point : segments[s].points) {
            Window window(kWindowSize);
            GradeMap map(kMapSize);
            BuildBaseWin(point, reference, window);
            BuildLocalMap(point, channel, window, map);
            if (dumps) {
                DumpMap(map.data(), MapByte, L"\\results\\localMap.bmp");
                DumpWindow(window.data());
            }
            MapAccumulate(map, accumulator);
            clipped = clipped || SearchClipped(point, channel.GetWidth(), channel.GetHeight());
        }
        float largest = 0.0f;
        for (int i = 0; i < kMapSize; ++i) largest = std::max(largest, accumulator[i]);
        if (dumps) {
            // Sums relative to the largest; all white when every sum is 0 (e.g. no points).
            const auto relative = [largest](float v) { return largest == 0.0f ? uint8_t{255} : MapByte(v / largest); };
            DumpMap(accumulator.data(), relative, L"\\results\\acumMap.bmp");
        }
        if (grades != nullptr && s < grades->size()) {
            SSegmentGrades& out = (*grades)[s];
            out.clipped = out.clipped || clipped;
            std::copy(accumulator.data(), accumulator.data() + kMapSize, out.accumulated[slot].begin());
        }
    }
    return true;
}
