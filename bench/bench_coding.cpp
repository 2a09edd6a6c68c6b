// Correspondence tables and Huffman codes.
//
// BuildTable with radius 10 and window 7 scores 21 x 21 windows of 15 x 15 pixels; OpenCV's
// matchTemplate with TM_CCORR computes the same raw cross-correlations over the same
// 35 x 35 search block. CorrelationCalc x 441 is the same table built one plain score at a
// time, as the definition does it.
#include <benchmark/benchmark.h>

#include <random>
#include <vector>

#include "coding/CorresTable.h"
#include "coding/Huffman.h"

#ifdef VARNOTH_HAVE_OPENCV
#include <opencv2/imgproc.hpp>
#endif

namespace {

constexpr int kRadius = 10;
constexpr int kWindow = 7;
const CPoint kPoint(250, 240);
const CPoint kShift(3, -2);

// Smooth paper-like texture with print-like dark specks, so the scores vary.
CImage Texture(int w, int h, unsigned seed) {
    CImage image(w, h, 8);
    std::mt19937 rng(seed);
    for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x) {
            const int base = 180 + static_cast<int>((x * 7 + y * 3) % 50);
            *image.GetPtrXY(x, y) = static_cast<unsigned char>(rng() % 9 == 0 ? rng() % 90 : base);
        }
    return image;
}

struct Images {
    CImage a = Texture(512, 512, 1);
    CImage b = Texture(512, 512, 2);
};
Images& TestImages() {
    static Images images;
    return images;
}

void BM_CorresBuildTable(benchmark::State& state) {
    Images& images = TestImages();
    CCorresTable table(kRadius, kWindow);
    for (auto _ : state) {
        table.BuildTable(images.a, images.b, kPoint, kShift);
        benchmark::DoNotOptimize(table.GetTable(0));
    }
    state.SetLabel("r=10 n=7");
}
BENCHMARK(BM_CorresBuildTable)->Unit(benchmark::kMicrosecond);

void BM_CorresCorrelationCalcTable(benchmark::State& state) {
    Images& images = TestImages();
    CPoint p = kPoint;
    const CPoint c(kPoint.x + kShift.x, kPoint.y + kShift.y);
    for (auto _ : state) {
        float sum = 0.0f;
        for (int v = c.y - kRadius; v <= c.y + kRadius; ++v)
            for (int u = c.x - kRadius; u <= c.x + kRadius; ++u) {
                CPoint pb(u, v);
                sum += CCorresTable::CorrelationCalc(images.a, images.b, p, pb, kWindow);
            }
        benchmark::DoNotOptimize(sum);
    }
    state.SetLabel("441 plain scores");
}
BENCHMARK(BM_CorresCorrelationCalcTable)->Unit(benchmark::kMicrosecond);

#ifdef VARNOTH_HAVE_OPENCV
cv::Mat ToMat(const CImage& image) {
    cv::Mat mat(image.GetHeight(), image.GetWidth(), CV_8UC1);
    for (int y = 0; y < image.GetHeight(); ++y)
        std::copy_n(image.GetPtrXY(0, y), image.GetWidth(), mat.ptr<unsigned char>(y));
    return mat;
}

void BM_OpenCVMatchTemplateCCORR(benchmark::State& state) {
    Images& images = TestImages();
    const cv::Mat a = ToMat(images.a), b = ToMat(images.b);
    const int side = 2 * kWindow + 1;
    const cv::Mat templ = a(cv::Rect(kPoint.x - kWindow, kPoint.y - kWindow, side, side));
    const int cx = kPoint.x + kShift.x, cy = kPoint.y + kShift.y, reach = kRadius + kWindow;
    const cv::Mat area = b(cv::Rect(cx - reach, cy - reach, 2 * reach + 1, 2 * reach + 1));
    cv::Mat result;
    for (auto _ : state) {
        cv::matchTemplate(area, templ, result, cv::TM_CCORR);
        benchmark::DoNotOptimize(result.data);
    }
    state.SetLabel("21x21 results of 15x15");
}
BENCHMARK(BM_OpenCVMatchTemplateCCORR)->Unit(benchmark::kMicrosecond);
#endif

void BM_HuffmanCodeBuild(benchmark::State& state) {
    const int symbols = static_cast<int>(state.range(0));
    std::mt19937 rng(3);
    std::vector<int> histogram(symbols);
    // Geometric-like spread, as in image histograms: a few heavy bins, a long light tail.
    for (int& f : histogram) f = static_cast<int>(rng() % 1000) * static_cast<int>(rng() % 4 == 0 ? 1000 : 1);
    CHuffman huffman;
    for (auto _ : state) {
        benchmark::DoNotOptimize(huffman.CodeBuild(histogram.data(), symbols));
        benchmark::DoNotOptimize(huffman.GetCodes()[0].code);
    }
}
BENCHMARK(BM_HuffmanCodeBuild)->Arg(256)->Arg(65536)->Unit(benchmark::kMicrosecond);

}  // namespace
