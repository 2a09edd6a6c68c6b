// Synthetic infrared picture and colour-plane matching on an A4 300-dpi page of print-like
// strokes (2480 x 3508): about 55 lines of letter-sized shapes on slightly noisy paper, with
// plane 0 and plane 2 offset from plane 1 by a pixel.
//
// OpenCV columns: filter2D with the same 9 x 9 table over the whole page (CheatCreate applies
// it to the marked pixels only), and matchTemplate with TM_CCOEFF_NORMED, which computes the
// same correlation coefficients as the window grading, over a 25 x 25 block per point.
#include <benchmark/benchmark.h>

#include <cstdlib>
#include <filesystem>
#include <algorithm>
#include <random>
#include <string>
#include <vector>

#include "channels/CheatIR.h"
#include "imagelib/Parallel.h"

#ifdef VARNOTH_HAVE_OPENCV
#include <opencv2/imgproc.hpp>
#endif

namespace {

constexpr int kWidth = 2480;
constexpr int kHeight = 3508;

void FillBox(CImage& img, int x0, int y0, int x1, int y1, int value) {
    for (int y = y0; y <= y1; ++y)
        for (int x = x0; x <= x1; ++x) img.GetPtrXY(0, y)[x] = static_cast<unsigned char>(value);
}

// Letters drawn from bars, rings and diagonals, 30 pixels high with 4-pixel strokes.
void DrawLetter(CImage& img, int x, int y, unsigned shape, int ink) {
    switch (shape % 5) {
        case 0: FillBox(img, x, y, x + 3, y + 29, ink); break;
        case 1:
            FillBox(img, x, y, x + 17, y + 29, ink);
            FillBox(img, x + 4, y + 4, x + 13, y + 25, 215);
            break;
        case 2:
            FillBox(img, x, y, x + 3, y + 29, ink);
            FillBox(img, x, y + 13, x + 15, y + 16, ink);
            FillBox(img, x + 12, y, x + 15, y + 29, ink);
            break;
        case 3:
            for (int i = 0; i < 30; ++i) FillBox(img, x + i / 2, y + i, x + i / 2 + 3, y + i, ink);
            break;
        default:
            FillBox(img, x, y, x + 15, y + 3, ink);
            FillBox(img, x + 6, y, x + 9, y + 29, ink);
            break;
    }
}

CImage PrintedPage() {
    CImage page(kWidth, kHeight, 8);
    page.Set(215);
    std::mt19937 rng(11);
    for (int line = 0; line < 55; ++line) {
        const int y = 150 + line * 58;
        for (int x = 150; x < kWidth - 180; x += 26) {
            if (rng() % 7 == 0) continue;  // word gaps
            DrawLetter(page, x, y, rng(), 25 + static_cast<int>(rng() % 40));
        }
    }
    for (int y = 0; y < kHeight; ++y)
        for (int x = 0; x < kWidth; ++x) page.GetPtrXY(0, y)[x] += static_cast<unsigned char>(rng() % 7 - 3);
    return page;
}

CImage Shifted(const CImage& src, int dx, int dy) {
    CImage out(src.GetWidth(), src.GetHeight(), 8);
    out.Set(215);
    for (int y = std::max(0, dy); y < std::min(src.GetHeight(), src.GetHeight() + dy); ++y)
        for (int x = std::max(0, dx); x < std::min(src.GetWidth(), src.GetWidth() + dx); ++x)
            out.GetPtrXY(0, y)[x] = src.GetPtrXY(0, y - dy)[x - dx];
    return out;
}

struct Planes {
    CImage p[3];
};
Planes& Page() {
    static Planes planes = [] {
        Planes made;
        made.p[1] = PrintedPage();
        made.p[0] = Shifted(made.p[1], 1, 0);
        made.p[2] = Shifted(made.p[1], 0, -1);
        return made;
    }();
    return planes;
}

// Points graded over all segments.
size_t TotalPoints(const std::vector<SSegmentGrades>& grades) {
    size_t points = 0;
    for (const SSegmentGrades& g : grades) points += static_cast<size_t>(g.pointCount);
    return points;
}

void BM_CheatCreate(benchmark::State& state) {
    Planes& planes = Page();
    CCheatIR cheat;
    for (auto _ : state) {
        cheat.CheatCreate(planes.p);
        benchmark::DoNotOptimize(cheat.GetCheat().GetBits());
    }
    state.SetLabel("A4 2480x3508");
}
BENCHMARK(BM_CheatCreate)->Unit(benchmark::kMillisecond);

void BM_MatchChannels(benchmark::State& state) {
    Planes& planes = Page();
    CCheatIR cheat;
    std::vector<SSegmentGrades> grades;
    for (auto _ : state) {
        cheat.MatchChannels(planes.p, &grades);
        benchmark::DoNotOptimize(grades.data());
    }
    state.counters["segments"] = static_cast<double>(grades.size());
    state.counters["points"] = static_cast<double>(TotalPoints(grades));
    state.SetLabel("A4 2480x3508, no dumps");
}
BENCHMARK(BM_MatchChannels)->Unit(benchmark::kMillisecond);

// A 620 x 440 piece of the page (about 8 short lines of print), without and with the debug
// pictures (three small BMP files rewritten at every point and segment): what skipping them
// when no dump directory is set saves.
constexpr int kBandWidth = 620;
constexpr int kBandHeight = 440;
Planes& Band() {
    static Planes band = [] {
        Planes planes;
        for (int i = 0; i < 3; ++i) {
            CImage part(kBandWidth, kBandHeight, 8);
            for (int y = 0; y < kBandHeight; ++y) {
                const unsigned char* row = Page().p[i].GetPtrXY(0, 1300 + y);
                std::copy(row, row + kBandWidth, part.GetPtrXY(0, y));
            }
            planes.p[i] = std::move(part);
        }
        return planes;
    }();
    return band;
}

void BM_MatchChannelsBand(benchmark::State& state) {
    Planes& planes = Band();
    const std::string dir = std::filesystem::temp_directory_path() / "varnoth_bench_channels";
    if (state.range(0) != 0) setenv("VARNOTH_DUMP_DIR", dir.c_str(), 1);
    CCheatIR cheat;
    std::vector<SSegmentGrades> grades;
    for (auto _ : state) benchmark::DoNotOptimize(cheat.MatchChannels(planes.p, &grades));
    unsetenv("VARNOTH_DUMP_DIR");
    std::filesystem::remove_all(dir);
    state.counters["points"] = static_cast<double>(TotalPoints(grades));
    state.SetLabel(state.range(0) != 0 ? "620x440, dumps on" : "620x440, no dumps");
}
BENCHMARK(BM_MatchChannelsBand)->Arg(0)->Arg(1)->ArgName("dumps")->Unit(benchmark::kMillisecond)->Iterations(1);

#ifdef VARNOTH_HAVE_OPENCV
void BM_OpenCV_Filter2DLoG(benchmark::State& state) {
    Planes& planes = Page();
    static const float weights[81] = {
        0, 1, 1, 2,   2,   2,   1, 1, 0, 1, 2, 4, 5,   5,   5,   4, 2, 1, 1, 4, 5, 3, 0,   3,   5, 4, 1,
        2, 5, 3, -12, -24, -12, 3, 5, 2, 2, 5, 0, -24, -40, -24, 0, 5, 2, 2, 5, 3, -12, -24, -12, 3, 5, 2,
        1, 4, 5, 3,   0,   3,   5, 4, 1, 1, 2, 4, 5,   5,   5,   4, 2, 1, 0, 1, 1, 2,   2,   2,   1, 1, 0};
    const cv::Mat kernel(9, 9, CV_32F, const_cast<float*>(weights));
    const cv::Mat src(kHeight, kWidth, CV_8U, planes.p[1].GetBits(), planes.p[1].GetSpan());
    cv::Mat response;
    for (auto _ : state) {
        cv::filter2D(src, response, CV_32F, kernel);
        benchmark::DoNotOptimize(response.data);
    }
    state.SetLabel("whole page, float");
}
BENCHMARK(BM_OpenCV_Filter2DLoG)->Unit(benchmark::kMillisecond);

// The grading part of MatchChannels done by OpenCV at the same points (the segment search
// is ours in both), two planes.
void BM_OpenCV_MatchTemplateAtPoints(benchmark::State& state) {
    Planes& planes = Page();
    CCheatIR cheat;
    std::vector<SSegmentGrades> grades;
    cheat.MatchChannels(planes.p, &grades);
    // Points are not exported; grade at a grid over the segment boxes' outline instead.
    std::vector<CPoint> points;
    for (const SSegmentGrades& g : grades)
        for (int i = 0; i < g.pointCount; ++i) points.emplace_back(g.rect.left + (i * 7) % std::max(1, g.rect.right - g.rect.left + 1), g.rect.top);
    auto toMat = [](CImage& img) { return cv::Mat(kHeight, kWidth, CV_8U, img.GetBits(), img.GetSpan()); };
    const cv::Mat ref = toMat(planes.p[1]);
    const cv::Mat channels[2] = {toMat(planes.p[0]), toMat(planes.p[2])};
    cv::Mat result;
    for (auto _ : state) {
        for (const cv::Mat& channel : channels)
            for (const CPoint& p : points) {
                if (p.x < 12 || p.y < 12 || p.x > kWidth - 13 || p.y > kHeight - 13) continue;
                // Rows are stored bottom-up: the picture is upside down for OpenCV, which
                // changes nothing for the grades.
                const int row = kHeight - 1 - p.y;
                const cv::Mat templ = ref(cv::Rect(p.x - 2, row - 2, 5, 5));
                const cv::Mat block = channel(cv::Rect(p.x - 12, row - 12, 25, 25));
                cv::matchTemplate(block, templ, result, cv::TM_CCOEFF_NORMED);
                benchmark::DoNotOptimize(result.data);
            }
    }
    state.counters["points"] = static_cast<double>(points.size());
}
BENCHMARK(BM_OpenCV_MatchTemplateAtPoints)->Unit(benchmark::kMillisecond);
#endif

}  // namespace
