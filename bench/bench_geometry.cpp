// Geometry on an A4 page at 300 dpi (2480 x 3508, 24-bit): WarpAffine with a small rotation
// and fit, and WarpRadialAndScale, beside OpenCV's warpAffine (bilinear, inverse map) and
// remap with a precomputed fixed-point map. Arg = worker threads.

#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdint>

#include "geometry/Geometry.h"
#include "imagelib/CImage.h"
#include "imagelib/Parallel.h"

#ifdef VARNOTH_HAVE_OPENCV
#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>
#endif

namespace {

constexpr int kPageWidth = 2480;
constexpr int kPageHeight = 3508;

// A page with print-like detail: stripes, gradients and deterministic noise.
const CImage& pageImage() {
    static const CImage page = [] {
        CImage img(kPageWidth, kPageHeight, 24);
        uint32_t state = 12345;
        for (int y = 0; y < kPageHeight; ++y) {
            unsigned char* p = img.GetPtrXY(0, y);
            for (int x = 0; x < kPageWidth; ++x, p += 3) {
                state = state * 1664525u + 1013904223u;
                const int noise = static_cast<int>(state >> 28);
                p[0] = static_cast<unsigned char>((x * 7 + noise) & 255);
                p[1] = static_cast<unsigned char>(((y / 9) % 2 ? 40 : 220) + noise);
                p[2] = static_cast<unsigned char>((x + y) / 24 + noise);
            }
        }
        return img;
    }();
    return page;
}

// Rotation by 1.5 degrees about the origin, as output -> source.
void smallRotation(float m[6]) {
    const double a = 1.5 * 3.14159265358979323846 / 180.0;
    m[0] = static_cast<float>(std::cos(a));
    m[1] = static_cast<float>(-std::sin(a));
    m[2] = 0.0f;
    m[3] = static_cast<float>(std::sin(a));
    m[4] = static_cast<float>(std::cos(a));
    m[5] = 0.0f;
}

const float kRadial[5] = {0.08f, -0.02f, 0.004f, 0.02f, -0.03f};

void BM_WarpAffine(benchmark::State& state) {
    imagelib::SetThreadLimit(static_cast<int>(state.range(0)));
    float m[6];
    smallRotation(m);
    CImage dst;
    CPoint corners[4];
    for (auto _ : state) {
        WarpAffine(m, pageImage(), dst, true, nullptr, corners);
        benchmark::DoNotOptimize(dst.GetBits());
    }
    imagelib::SetThreadLimit(0);
}
BENCHMARK(BM_WarpAffine)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();

// The same warp into a destination of the fitted size that is kept between calls, as
// OpenCV's is: the sampling alone, without the fresh output's page faults.
void BM_WarpAffineKeptOutput(benchmark::State& state) {
    imagelib::SetThreadLimit(static_cast<int>(state.range(0)));
    float m[6];
    smallRotation(m);
    CImage dst;
    WarpAffine(m, pageImage(), dst, true, nullptr, nullptr);
    for (auto _ : state) {
        WarpAffine(m, pageImage(), dst, false, nullptr, nullptr);
        benchmark::DoNotOptimize(dst.GetBits());
    }
    imagelib::SetThreadLimit(0);
}
BENCHMARK(BM_WarpAffineKeptOutput)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();

void BM_WarpRadialAndScale(benchmark::State& state) {
    imagelib::SetThreadLimit(static_cast<int>(state.range(0)));
    CImage dst(kPageWidth, kPageHeight, 24);
    for (auto _ : state) {
        WarpRadialAndScale(kRadial, pageImage(), dst);
        benchmark::DoNotOptimize(dst.GetBits());
    }
    imagelib::SetThreadLimit(0);
}
BENCHMARK(BM_WarpRadialAndScale)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();

// Single-threaded operations, for scale.
void BM_DualCMOSFixAlongCurve(benchmark::State& state) {
    const float seam[3] = {-2e-6f, 0.004f, 1200.0f};  // bulges 3 rows over the page width
    CImage dst;
    for (auto _ : state) {
        DualCMOSFixAlongCurve(pageImage(), dst, 0.0f, 0.0f, seam, SPoint(0.0f, kPageWidth - 1.0f));
        benchmark::DoNotOptimize(dst.GetBits());
    }
}
BENCHMARK(BM_DualCMOSFixAlongCurve)->Unit(benchmark::kMillisecond)->UseRealTime();

void BM_HillsVallysThreshold(benchmark::State& state) {
    CImage grey(kPageWidth, kPageHeight, 8);
    const CImage& page = pageImage();
    for (int y = 0; y < kPageHeight; ++y)
        for (int x = 0; x < kPageWidth; ++x) *grey.GetPtrXY(x, y) = page.GetPtrXY(x, y)[1];
    for (auto _ : state) {
        state.PauseTiming();
        CImage img(grey);
        state.ResumeTiming();
        HillsVallysThreshold(img, 120);
        benchmark::DoNotOptimize(img.GetBits());
    }
}
BENCHMARK(BM_HillsVallysThreshold)->Unit(benchmark::kMillisecond)->UseRealTime();

#ifdef VARNOTH_HAVE_OPENCV

cv::Mat pageMat() {
    const CImage& page = pageImage();
    return cv::Mat(page.GetHeight(), page.GetWidth(), CV_8UC3, const_cast<unsigned char*>(page.GetBits()),
                   page.GetSpan());
}

void BM_CvWarpAffine(benchmark::State& state) {
    cv::setNumThreads(static_cast<int>(state.range(0)));
    float m[6];
    smallRotation(m);
    // The same output window as WarpAffine's fit.
    CImage fitted;
    WarpAffine(m, pageImage(), fitted, true, nullptr, nullptr);
    const cv::Mat map = (cv::Mat_<double>(2, 3) << m[0], m[1], m[2], m[3], m[4], m[5]);
    const cv::Mat src = pageMat();
    cv::Mat dst;
    for (auto _ : state) {
        cv::warpAffine(src, dst, map, cv::Size(fitted.GetWidth(), fitted.GetHeight()),
                       cv::INTER_LINEAR | cv::WARP_INVERSE_MAP, cv::BORDER_CONSTANT);
        benchmark::DoNotOptimize(dst.data);
    }
    cv::setNumThreads(-1);
}
BENCHMARK(BM_CvWarpAffine)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();

void BM_CvRemapRadial(benchmark::State& state) {
    cv::setNumThreads(static_cast<int>(state.range(0)));
    cv::Mat mapX(kPageHeight, kPageWidth, CV_32FC1), mapY(kPageHeight, kPageWidth, CV_32FC1);
    for (int y = 0; y < kPageHeight; ++y)
        for (int x = 0; x < kPageWidth; ++x) {
            const float xn = 2.0f * x / kPageWidth - 1.0f - kRadial[3], yn = 2.0f * y / kPageHeight - 1.0f - kRadial[4];
            const float r2 = xn * xn + yn * yn;
            const float f = 1.0f + r2 * (kRadial[0] + r2 * (kRadial[1] + r2 * kRadial[2]));
            mapX.at<float>(y, x) = (f * xn + kRadial[3] + 1.0f) * kPageWidth / 2;
            mapY.at<float>(y, x) = (f * yn + kRadial[4] + 1.0f) * kPageHeight / 2;
        }
    cv::Mat fixedXY, fixedFrac;
    cv::convertMaps(mapX, mapY, fixedXY, fixedFrac, CV_16SC2);
    const cv::Mat src = pageMat();
    cv::Mat dst;
    for (auto _ : state) {
        cv::remap(src, dst, fixedXY, fixedFrac, cv::INTER_LINEAR, cv::BORDER_CONSTANT, cv::Scalar::all(255));
        benchmark::DoNotOptimize(dst.data);
    }
    cv::setNumThreads(-1);
}
BENCHMARK(BM_CvRemapRadial)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();

#endif

}  // namespace
