// Four-image glare removal on four generated shots of an A4 page at 300 dpi (2480 x 3508,
// 24-bit), beside OpenCV: building the four 7-level Laplacian pyramids with pyrDown/pyrUp
// (the work every pyramid method has to do) and Mertens exposure fusion of the same four
// shots (what one would otherwise reach for). Arg = worker threads.

#include <benchmark/benchmark.h>

#include <cstring>
#include <string>
#include <vector>

#include "holograms/HologramsRemove.h"
#include "imagelib/CImage.h"
#include "imagelib/Parallel.h"
#include "scene/Scene.h"
#include "varnoth/FourImageMethods.h"

#ifdef VARNOTH_HAVE_OPENCV
#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>
#include <opencv2/photo.hpp>
#endif

namespace {

const scene::Scene& a4Scene() {
    static const scene::Scene s = scene::GenerateScene({2480, 3508, 7});
    return s;
}

void BM_Holo4(benchmark::State& state, const FourImageMethod* method) {
    imagelib::SetThreadLimit(static_cast<int>(state.range(0)));
    const scene::Scene& s = a4Scene();
    const CImage* const shots[4] = {&s.shots[0], &s.shots[1], &s.shots[2], &s.shots[3]};
    CHologramsRemove remover;
    CImage result;
    for (auto _ : state) {
        method->run(remover, shots, result);
        benchmark::DoNotOptimize(result.GetBits());
    }
    imagelib::SetThreadLimit(0);
}

[[maybe_unused]] const bool registered = [] {
    for (const FourImageMethod& m : FourImageMethods())
        benchmark::RegisterBenchmark((std::string("BM_Holo4/") + m.name).c_str(), BM_Holo4, &m)
            ->Arg(1)
            ->Arg(2)
            ->Unit(benchmark::kMillisecond)
            ->UseRealTime();
    return true;
}();

#ifdef VARNOTH_HAVE_OPENCV

cv::Mat asMat(const CImage& img) {
    cv::Mat m(img.GetHeight(), img.GetWidth(), CV_8UC3);
    for (int y = 0; y < img.GetHeight(); ++y) std::memcpy(m.ptr(y), img.GetPtrXY(0, y), 3 * img.GetWidth());
    return m;
}

const std::vector<cv::Mat>& a4Mats() {
    static const std::vector<cv::Mat> mats = [] {
        std::vector<cv::Mat> v;
        for (const CImage& shot : a4Scene().shots) v.push_back(asMat(shot));
        return v;
    }();
    return mats;
}

void BM_OpenCV_FourLaplacianPyramids(benchmark::State& state) {
    cv::setNumThreads(static_cast<int>(state.range(0)));
    const std::vector<cv::Mat>& shots = a4Mats();
    for (auto _ : state) {
        for (const cv::Mat& shot : shots) {
            std::vector<cv::Mat> gauss(7), lap(7);
            gauss[0] = shot;
            for (int k = 1; k < 7; ++k) cv::pyrDown(gauss[k - 1], gauss[k]);
            for (int k = 0; k < 6; ++k) {
                cv::Mat up;
                cv::pyrUp(gauss[k + 1], up, gauss[k].size());
                cv::subtract(gauss[k], up, lap[k], cv::noArray(), CV_16SC3);
            }
            lap[6] = gauss[6];
            benchmark::DoNotOptimize(lap[0].data);
        }
    }
    cv::setNumThreads(-1);
}
BENCHMARK(BM_OpenCV_FourLaplacianPyramids)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();

void BM_OpenCV_MergeMertens(benchmark::State& state) {
    cv::setNumThreads(static_cast<int>(state.range(0)));
    const std::vector<cv::Mat>& shots = a4Mats();
    cv::Ptr<cv::MergeMertens> merge = cv::createMergeMertens();
    for (auto _ : state) {
        cv::Mat fused;
        merge->process(shots, fused);
        benchmark::DoNotOptimize(fused.data);
    }
    cv::setNumThreads(-1);
}
BENCHMARK(BM_OpenCV_MergeMertens)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime()->Iterations(2);

#endif

}  // namespace
