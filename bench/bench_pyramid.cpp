// Pyramid filters on an A4 page at 300 dpi (2480 x 3508), 8- and 24-bit: Reduce level 0 -> 1,
// Expand level 1 -> 0, and a 7-level MakeLaplacian + ReconstructGaussian, beside OpenCV's
// pyrDown / pyrUp on the same bytes and a plain copy of level 0 (the memory-traffic floor).
// Args = {bits per pixel, worker threads}.

#include <benchmark/benchmark.h>

#include <cstdint>
#include <cstring>

#include "imagelib/CImage.h"
#include "imagelib/Parallel.h"
#include "pyramid/Pyramid.h"

#ifdef VARNOTH_HAVE_OPENCV
#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>
#endif

namespace {

constexpr int kPageWidth = 2480;
constexpr int kPageHeight = 3508;

// A page with print-like detail: stripes, gradients and deterministic noise.
CImage makePage(int bits) {
    CImage img(kPageWidth, kPageHeight, bits);
    const int ch = bits / 8;
    uint32_t state = 777;
    for (int y = 0; y < kPageHeight; ++y) {
        unsigned char* p = img.GetPtrXY(0, y);
        for (int x = 0; x < kPageWidth; ++x, p += ch) {
            state = state * 1664525u + 1013904223u;
            const int noise = static_cast<int>(state >> 27);
            for (int c = 0; c < ch; ++c) {
                const int ink = ((y / 11) % 3 == 0 && (x / 5) % 4 != 0) ? 30 : 225;
                p[c] = static_cast<unsigned char>((ink + noise + c * 7 + (x + y) / 64) & 255);
            }
        }
    }
    return img;
}

const CImage& page(int bits) {
    static const CImage grey = makePage(8);
    static const CImage colour = makePage(24);
    return bits == 8 ? grey : colour;
}

void setThreads(int threads) {
    imagelib::SetThreadLimit(threads);
#ifdef VARNOTH_HAVE_OPENCV
    cv::setNumThreads(threads);
#endif
}

void BM_PyramidReduce(benchmark::State& state) {
    const int bits = static_cast<int>(state.range(0));
    setThreads(static_cast<int>(state.range(1)));
    CPyramid pyramid(2, page(bits));
    for (auto _ : state) {
        pyramid.Reduce(pyramid.GetLevel(0), pyramid.GetLevel(1));
        benchmark::DoNotOptimize(pyramid.GetLevel(1).GetBits());
    }
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(page(bits).GetSize()));
    setThreads(0);
}

void BM_PyramidExpand(benchmark::State& state) {
    const int bits = static_cast<int>(state.range(0));
    setThreads(static_cast<int>(state.range(1)));
    CPyramid pyramid(2, page(bits));
    pyramid.MakeGaussian();
    CImage out(kPageWidth, kPageHeight, bits);
    for (auto _ : state) {
        pyramid.Expand(pyramid.GetLevel(1), out);
        benchmark::DoNotOptimize(out.GetBits());
    }
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(out.GetSize()));
    setThreads(0);
}

// SetImage (a copy of level 0) restarts the pyramid for every round.
void BM_PyramidLaplacianRoundTrip(benchmark::State& state) {
    const int bits = static_cast<int>(state.range(0));
    setThreads(static_cast<int>(state.range(1)));
    CPyramid pyramid(7, page(bits));
    for (auto _ : state) {
        pyramid.SetImage(page(bits));
        pyramid.MakeLaplacian();
        pyramid.ReconstructGaussian();
        benchmark::DoNotOptimize(pyramid.GetLevel(0).GetBits());
    }
    setThreads(0);
}

// The memory-traffic floor: level 0 copied once, in bands like the filters.
void BM_PyramidCopyFloor(benchmark::State& state) {
    const int bits = static_cast<int>(state.range(0));
    setThreads(static_cast<int>(state.range(1)));
    const CImage& src = page(bits);
    CImage dst(kPageWidth, kPageHeight, bits);
    const size_t span = src.GetSpan();
    for (auto _ : state) {
        imagelib::ParallelFor(0, kPageHeight, [&](int begin, int end) {
            std::memcpy(dst.GetBits() + begin * span, src.GetBits() + begin * span, (end - begin) * span);
        }, 64);
        benchmark::DoNotOptimize(dst.GetBits());
    }
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(src.GetSize()));
    setThreads(0);
}

#ifdef VARNOTH_HAVE_OPENCV
cv::Mat wrap(const CImage& image) {
    return cv::Mat(image.GetHeight(), image.GetWidth(), image.GetBitCount() == 8 ? CV_8UC1 : CV_8UC3,
                   const_cast<unsigned char*>(image.GetBits()), image.GetSpan());
}

void BM_OpenCvPyrDown(benchmark::State& state) {
    const int bits = static_cast<int>(state.range(0));
    setThreads(static_cast<int>(state.range(1)));
    const cv::Mat src = wrap(page(bits));
    cv::Mat dst;
    for (auto _ : state) {
        cv::pyrDown(src, dst, cv::Size(CPyramid::NextLevelSize(kPageWidth), CPyramid::NextLevelSize(kPageHeight)));
        benchmark::DoNotOptimize(dst.data);
    }
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(page(bits).GetSize()));
    setThreads(0);
}

void BM_OpenCvPyrUp(benchmark::State& state) {
    const int bits = static_cast<int>(state.range(0));
    setThreads(static_cast<int>(state.range(1)));
    cv::Mat small;
    const cv::Size half(CPyramid::NextLevelSize(kPageWidth), CPyramid::NextLevelSize(kPageHeight));
    cv::pyrDown(wrap(page(bits)), small, half);
    cv::Mat dst;
    for (auto _ : state) {
        cv::pyrUp(small, dst, cv::Size(kPageWidth, kPageHeight));
        benchmark::DoNotOptimize(dst.data);
    }
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(page(bits).GetSize()));
    setThreads(0);
}

// The same work with OpenCV: six pyrDown, then six pyrUp + subtract and six pyrUp + add
// (saturating 8-bit, so not the 128-centred detail format; an analogue for timing only).
void BM_OpenCvLaplacianRoundTrip(benchmark::State& state) {
    const int bits = static_cast<int>(state.range(0));
    setThreads(static_cast<int>(state.range(1)));
    const cv::Mat src = wrap(page(bits));
    std::vector<cv::Mat> levels(7), up(7);
    for (auto _ : state) {
        src.copyTo(levels[0]);
        for (int k = 1; k < 7; ++k) cv::pyrDown(levels[k - 1], levels[k]);
        for (int k = 0; k < 6; ++k) {
            cv::pyrUp(levels[k + 1], up[k], levels[k].size());
            cv::subtract(levels[k], up[k], levels[k]);
        }
        for (int k = 5; k >= 0; --k) {
            cv::pyrUp(levels[k + 1], up[k], levels[k].size());
            cv::add(levels[k], up[k], levels[k]);
        }
        benchmark::DoNotOptimize(levels[0].data);
    }
    setThreads(0);
}
#endif

void pageArgs(benchmark::internal::Benchmark* b) {
    b->ArgNames({"bits", "threads"});
    for (int bits : {24, 8})
        for (int threads : {1, 2}) b->Args({bits, threads});
    b->Unit(benchmark::kMillisecond)->UseRealTime();
}

}  // namespace

BENCHMARK(BM_PyramidReduce)->Apply(pageArgs);
#ifdef VARNOTH_HAVE_OPENCV
BENCHMARK(BM_OpenCvPyrDown)->Apply(pageArgs);
#endif
BENCHMARK(BM_PyramidExpand)->Apply(pageArgs);
#ifdef VARNOTH_HAVE_OPENCV
BENCHMARK(BM_OpenCvPyrUp)->Apply(pageArgs);
#endif
BENCHMARK(BM_PyramidLaplacianRoundTrip)->Apply(pageArgs);
#ifdef VARNOTH_HAVE_OPENCV
BENCHMARK(BM_OpenCvLaplacianRoundTrip)->Apply(pageArgs);
#endif
BENCHMARK(BM_PyramidCopyFloor)->Apply(pageArgs);
