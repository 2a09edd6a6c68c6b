// Two-image glare separation on two generated shots of an A4 page at 300 dpi (2480 x 3508,
// 24-bit): the three pipelines, and two of their building blocks beside OpenCV (the box
// average beside cv::blur, the block-maximum downscale). Where OpenCV is present, cv::inpaint
// (Telea) of one shot under the mask of its saturated pixels stands for the single-image
// alternative. Arg = worker threads.

#include <benchmark/benchmark.h>

#include <cstring>

#include "holograms/HologramsRemove.h"
#include "imagelib/CImage.h"
#include "imagelib/Parallel.h"
#include "scene/TwoShotScene.h"

#ifdef VARNOTH_HAVE_OPENCV
#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>
#include <opencv2/photo.hpp>
#endif

namespace {

const scene::Scene& twoShotA4() {
    static const scene::Scene s = scene::GenerateTwoShotScene({2480, 3508, 5});
    return s;
}

// The first shot downscaled by 3, as the detect pipeline averages it (826 x 1169).
const CImage& downscaledA4() {
    static const CImage small = [] {
        CHologramsRemove remover;
        CImage source = twoShotA4().shots[0], out;
        remover.ScaleDownMaxImg_X3_24(source, out);
        return out;
    }();
    return small;
}

using Pipeline = void (CHologramsRemove::*)(CImage&, CImage&, CImage&, int, int);

void BM_Holo2Pipeline(benchmark::State& state, Pipeline pipeline) {
    imagelib::SetThreadLimit(static_cast<int>(state.range(0)));
    const scene::Scene& s = twoShotA4();
    CHologramsRemove remover;
    CImage unused;
    for (auto _ : state) {
        state.PauseTiming();
        CImage image1 = s.shots[0], image2 = s.shots[1];
        state.ResumeTiming();
        (remover.*pipeline)(image1, image2, unused, 0, image1.GetHeight());
        benchmark::DoNotOptimize(image1.GetBits());
    }
    imagelib::SetThreadLimit(0);
}
BENCHMARK_CAPTURE(BM_Holo2Pipeline, HologramsSeperation, &CHologramsRemove::HologramsSeperation)
    ->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK_CAPTURE(BM_Holo2Pipeline, HologramsSeperation2, &CHologramsRemove::HologramsSeperation2)
    ->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK_CAPTURE(BM_Holo2Pipeline, HologramsSeperation3, &CHologramsRemove::HologramsSeperation3)
    ->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();

void BM_Holo2_CalcAvImg_24_W28(benchmark::State& state) {
    imagelib::SetThreadLimit(static_cast<int>(state.range(0)));
    CImage source = downscaledA4(), average;
    CHologramsRemove remover;
    for (auto _ : state) {
        remover.CalcAvImg_24(source, average, 28);
        benchmark::DoNotOptimize(average.GetBits());
    }
    imagelib::SetThreadLimit(0);
}
BENCHMARK(BM_Holo2_CalcAvImg_24_W28)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();

void BM_Holo2_ScaleDownMaxImg_X3_24(benchmark::State& state) {
    imagelib::SetThreadLimit(static_cast<int>(state.range(0)));
    CImage source = twoShotA4().shots[0], small;
    CHologramsRemove remover;
    for (auto _ : state) {
        remover.ScaleDownMaxImg_X3_24(source, small);
        benchmark::DoNotOptimize(small.GetBits());
    }
    imagelib::SetThreadLimit(0);
}
BENCHMARK(BM_Holo2_ScaleDownMaxImg_X3_24)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();

#ifdef VARNOTH_HAVE_OPENCV

cv::Mat asMat(const CImage& img) {
    cv::Mat m(img.GetHeight(), img.GetWidth(), CV_8UC3);
    for (int y = 0; y < img.GetHeight(); ++y) std::memcpy(m.ptr(y), img.GetPtrXY(0, y), 3 * img.GetWidth());
    return m;
}

void BM_Holo2_OpenCV_blur_W28(benchmark::State& state) {
    cv::setNumThreads(static_cast<int>(state.range(0)));
    const cv::Mat source = asMat(downscaledA4());
    cv::Mat average;
    for (auto _ : state) {
        cv::blur(source, average, cv::Size(28, 28));
        benchmark::DoNotOptimize(average.data);
    }
    cv::setNumThreads(-1);
}
BENCHMARK(BM_Holo2_OpenCV_blur_W28)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();

// 3 x 3 dilation then nearest-neighbour resize: a block maximum by 3 in two library calls.
void BM_Holo2_OpenCV_dilate_resize_X3(benchmark::State& state) {
    cv::setNumThreads(static_cast<int>(state.range(0)));
    const cv::Mat source = asMat(twoShotA4().shots[0]);
    cv::Mat dilated, small;
    const cv::Mat kernel = cv::Mat::ones(3, 3, CV_8U);
    for (auto _ : state) {
        cv::dilate(source, dilated, kernel, cv::Point(0, 0));
        cv::resize(dilated, small, cv::Size(source.cols / 3, source.rows / 3), 0, 0, cv::INTER_NEAREST);
        benchmark::DoNotOptimize(small.data);
    }
    cv::setNumThreads(-1);
}
BENCHMARK(BM_Holo2_OpenCV_dilate_resize_X3)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();

void BM_Holo2_OpenCV_inpaint_Telea(benchmark::State& state) {
    cv::setNumThreads(static_cast<int>(state.range(0)));
    const cv::Mat shot = asMat(twoShotA4().shots[0]);
    cv::Mat mask(shot.rows, shot.cols, CV_8U);
    for (int y = 0; y < shot.rows; ++y)
        for (int x = 0; x < shot.cols; ++x) {
            const cv::Vec3b p = shot.at<cv::Vec3b>(y, x);
            mask.at<unsigned char>(y, x) = (p[0] >= 254 || p[1] >= 254 || p[2] >= 254) ? 255 : 0;
        }
    cv::Mat repaired;
    for (auto _ : state) {
        cv::inpaint(shot, mask, repaired, 3.0, cv::INPAINT_TELEA);
        benchmark::DoNotOptimize(repaired.data);
    }
    cv::setNumThreads(-1);
}
BENCHMARK(BM_Holo2_OpenCV_inpaint_Telea)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();

#endif

}  // namespace
