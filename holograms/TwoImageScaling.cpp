// Downscaling by block maximum, box averages and the two-profile illumination model of the
// two-image separation.

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <vector>

#include "holograms/BoxAverageInternal.h"
#include "holograms/HologramsRemove.h"
#include "holograms/PixelHelpersInternal.h"
#include "imagelib/Parallel.h"
#include "imagelib/Round.h"

using holo::Refuse;
using holo::Row;

namespace holo {
namespace {

// Output rows [yBegin, yEnd) of a block-maximum downscale by `factor`. The maxima of each
// channel are taken over the block's rows first (one running row of maxima), then across the
// block's columns. `kGrey` stores (maxB + maxG + maxR) / 3 in an 8-bit destination. kFactor is
// 0 for a factor known only at run time; the fixed factors let the compiler unroll the blocks.
template <int kFactor, int kBytesPerPixel, bool kGrey>
void BlockMaxRows(const CImage& source, CImage& destination, int runtimeFactor, int yBegin, int yEnd) {
    const int factor = kFactor != 0 ? kFactor : runtimeFactor;
    const int outWidth = destination.GetWidth();
    const size_t rowBytes = static_cast<size_t>(outWidth) * factor * kBytesPerPixel;
    std::vector<unsigned char> columnMax(rowBytes);
    for (int y = yBegin; y < yEnd; ++y) {
        const unsigned char* first = Row(source, factor * y);
        std::copy(first, first + rowBytes, columnMax.begin());
        for (int k = 1; k < factor; ++k) {
            const unsigned char* row = Row(source, factor * y + k);
            unsigned char* m = columnMax.data();
            for (size_t i = 0; i < rowBytes; ++i) m[i] = m[i] < row[i] ? row[i] : m[i];
        }
        unsigned char* out = Row(destination, y);
        for (int x = 0; x < outWidth; ++x) {
            const unsigned char* block = columnMax.data() + static_cast<size_t>(x) * factor * kBytesPerPixel;
            int maxima[kBytesPerPixel] = {};
            for (int j = 0; j < factor; ++j)
                for (int c = 0; c < kBytesPerPixel; ++c) maxima[c] = std::max<int>(maxima[c], block[j * kBytesPerPixel + c]);
            if constexpr (kGrey) {
                out[x] = static_cast<unsigned char>((maxima[0] + maxima[1] + maxima[2]) / 3);
            } else {
                for (int c = 0; c < kBytesPerPixel; ++c) out[x * kBytesPerPixel + c] = static_cast<unsigned char>(maxima[c]);
            }
        }
    }
}

using BlockMaxKernel = void (*)(const CImage&, CImage&, int, int, int);

BlockMaxKernel ChooseBlockMax(int factor, int bytesPerPixel, bool toGrey) {
    if (bytesPerPixel == 1) return BlockMaxRows<0, 1, false>;
    if (toGrey) return factor == 3 ? BlockMaxRows<3, 3, true> : BlockMaxRows<0, 3, true>;
    if (factor == 2) return BlockMaxRows<2, 3, false>;
    if (factor == 3) return BlockMaxRows<3, 3, false>;
    return BlockMaxRows<0, 3, false>;
}

void ScaleDownBlockMax(const CImage& source, CImage& destination, int factor, bool toGrey) {
    const BlockMaxKernel kernel = ChooseBlockMax(factor, source.GetBitCount() / 8, toGrey);
    destination.Reallocate(source.GetWidth() / factor, source.GetHeight() / factor, toGrey ? 8 : source.GetBitCount(), 0);
    if (destination.IsEmpty()) return;
    imagelib::ParallelFor(
        0, destination.GetHeight(), [&](int begin, int end) { kernel(source, destination, factor, begin, end); }, 16);
}

// The fixed-factor variants read three bytes per pixel; anything but a 24-bit source would be
// read past its rows.
void ScaleDownFixed(const wchar_t* name, CImage& source, CImage& destination, int factor, bool toGrey) {
    if (source.GetBitCount() != 24 && Refuse(name, "the source is not 24-bit")) return;
    if (&source == &destination) {
        const CImage copy(source);
        ScaleDownBlockMax(copy, destination, factor, toGrey);
    } else {
        ScaleDownBlockMax(source, destination, factor, toGrey);
    }
}

// Exact n / d for the box sums: a floating-point estimate, corrected by one step (the estimate
// is never off by more than one for the sums that occur).
class ExactDivider {
public:
    explicit ExactDivider(uint64_t divisor) : m_divisor(divisor), m_inverse(1.0 / static_cast<double>(divisor)) {}
    uint64_t operator()(uint64_t n) const {
        uint64_t q = static_cast<uint64_t>(static_cast<double>(n) * m_inverse);
        if (q * m_divisor > n)
            --q;
        else if ((q + 1) * m_divisor <= n)
            ++q;
        return q;
    }

private:
    uint64_t m_divisor;
    double m_inverse;
};

// Box-average output rows for the input rows y in [yBegin, yEnd), W <= y < height. The column
// sums are rebuilt from rows yBegin - W ... yBegin - 1, so bands are independent and the result
// is that of one pass over all rows. Each output row first collects its window sums, then
// divides them all at once (vectorised) when kBatched; otherwise it divides one by one.
template <int kBytesPerPixel, bool kBatched>
void BoxAverageBand(const CImage& source, CImage& destination, int window, int yBegin, int yEnd) {
    const int width = source.GetWidth();
    const int half = window / 2;
    const size_t rowBytes = static_cast<size_t>(width) * kBytesPerPixel;
    const size_t outputs = static_cast<size_t>(width - window) * kBytesPerPixel;
    const uint64_t area = static_cast<uint64_t>(window) * static_cast<uint64_t>(window);
    const ExactDivider divide(area);
    std::vector<uint32_t> columnSum(rowBytes, 0);
    std::vector<uint32_t> windowSums(kBatched ? outputs : 0);
    for (int r = yBegin - window; r < yBegin; ++r) {
        const unsigned char* row = Row(source, r);
        for (size_t i = 0; i < rowBytes; ++i) columnSum[i] += row[i];
    }
    const uint32_t* columns = columnSum.data();
    for (int y = yBegin; y < yEnd; ++y) {
        unsigned char* out = Row(destination, y - window + half) + static_cast<size_t>(half) * kBytesPerPixel;
        uint64_t sums[kBytesPerPixel] = {};
        for (int x = 0; x < window; ++x)
            for (int c = 0; c < kBytesPerPixel; ++c) sums[c] += columns[x * kBytesPerPixel + c];
        // Window x - W ... x - 1 lands at x - W + h; then it slides by one column.
        for (int x = window; x < width; ++x) {
            const size_t dropped = static_cast<size_t>(x - window) * kBytesPerPixel;
            const size_t added = static_cast<size_t>(x) * kBytesPerPixel;
            for (int c = 0; c < kBytesPerPixel; ++c) {
                if constexpr (kBatched)
                    windowSums[dropped + c] = static_cast<uint32_t>(sums[c]);
                else
                    out[dropped + c] = static_cast<unsigned char>(divide(sums[c]));
                sums[c] += static_cast<uint64_t>(columns[added + c]) - columns[dropped + c];
            }
        }
        if constexpr (kBatched) FastDivideSums(windowSums.data(), out, outputs, static_cast<uint32_t>(area));
        const unsigned char* leaving = Row(source, y - window);
        const unsigned char* entering = Row(source, y);
        for (size_t i = 0; i < rowBytes; ++i) columnSum[i] = columnSum[i] - leaving[i] + entering[i];
    }
}

// True when at least one window fits in each direction.
bool WindowFits(const CImage& image, int window) {
    return window <= image.GetWidth() - 1 && window <= image.GetHeight() - 1;
}

void BoxAverage(const CImage& source, CImage& destination, int window) {
    // Windows up to 256 keep every sum within the vectorised division's exact range.
    const bool batched = window <= 256;
    const bool grey = source.GetBitCount() == 8;
    const auto band = grey ? (batched ? BoxAverageBand<1, true> : BoxAverageBand<1, false>)
                           : (batched ? BoxAverageBand<3, true> : BoxAverageBand<3, false>);
    destination.Reallocate(source.GetWidth(), source.GetHeight(), source.GetBitCount(), 0);
    if (!WindowFits(source, window)) return;
    // Bands of at least 4 windows keep the cost of rebuilding the column sums small.
    imagelib::ParallelFor(
        window, source.GetHeight(), [&](int begin, int end) { band(source, destination, window, begin, end); },
        std::max(4 * window, 32));
}

// The pixels of a 24-bit box average that no window reaches are copied from the source.
void CopyAverageBorder(const CImage& source, CImage& destination, int window) {
    const int width = source.GetWidth();
    const int height = source.GetHeight();
    const int half = std::min(window / 2, std::max(width, height));
    const size_t rowBytes = static_cast<size_t>(width) * 3;
    for (int y = 0; y < height; ++y) {
        const unsigned char* in = Row(source, y);
        unsigned char* out = Row(destination, y);
        if (y < half || y >= height - half) {
            std::copy(in, in + rowBytes, out);
            continue;
        }
        const size_t left = static_cast<size_t>(std::min(half, width)) * 3;
        std::copy(in, in + left, out);
        const size_t right = static_cast<size_t>(std::max(width - half, 0)) * 3;
        std::copy(in + right, in + rowBytes, out + right);
    }
}

}  // namespace
}  // namespace holo

void CHologramsRemove::ScaleDownMaxImg(CImage& source, CImage& destination, int factor) {
    if (factor < 1 && Refuse(L"ScaleDownMaxImg", "factor below 1")) return;
    const int bits = source.GetBitCount();
    if (bits != 8 && bits != 24) {
        // Other depths: the destination is resized and left unwritten.
        if (&source != &destination)
            destination.Reallocate(source.GetWidth() / factor, source.GetHeight() / factor, bits, 0);
        return;
    }
    if (&source == &destination) {
        const CImage copy(source);
        holo::ScaleDownBlockMax(copy, destination, factor, false);
    } else {
        holo::ScaleDownBlockMax(source, destination, factor, false);
    }
}

void CHologramsRemove::ScaleDownMaxImg_X2_24(CImage& source, CImage& destination) {
    holo::ScaleDownFixed(L"ScaleDownMaxImg_X2_24", source, destination, 2, false);
}

void CHologramsRemove::ScaleDownMaxImg_X3_8(CImage& source, CImage& destination) {
    holo::ScaleDownFixed(L"ScaleDownMaxImg_X3_8", source, destination, 3, true);
}

void CHologramsRemove::ScaleDownMaxImg_X3_24(CImage& source, CImage& destination) {
    holo::ScaleDownFixed(L"ScaleDownMaxImg_X3_24", source, destination, 3, false);
}

float CHologramsRemove::CalcVectSlope(int* vector, int first, int last, int step) {
    const float notANumber = std::numeric_limits<float>::quiet_NaN();
    if (first > last) return notANumber;
    if ((vector == nullptr || step < 1) && Refuse(L"CalcVectSlope", "null vector or step below 1")) return notANumber;
    float numerator = 0.0f;
    float denominator = 0.0f;
    for (int i = first; i <= last; i += step) {
        for (int j = i + step; j <= last; j += step) {
            numerator += static_cast<float>(vector[j] - vector[i]);
            denominator += static_cast<float>((j - i) / step);
        }
    }
    return numerator / denominator;  // 0 / 0 with fewer than two indices: a NaN
}

void CHologramsRemove::CalcAvRGBVect(int* profile, int n, int window) {
    // Each slope reads 15 averages; the averages fill elements h ... n - 1 - W + h, so n must be
    // at least 2h + 16: window + 15 for an odd window, one more for an even one.
    if ((profile == nullptr || window < 1 || n < 2 * (window / 2) + 16) &&
        Refuse(L"CalcAvRGBVect", "needs a window of at least 1 and 15 averages for each end slope"))
        return;
    const int half = window / 2;
    const size_t count = static_cast<size_t>(n) * 3;
    std::vector<int> smooth(count, 0);

    // Holes (0) are filled outward from the middle with the same channel of the neighbour.
    const int middle = 3 * (n / 2);
    for (int i = middle; i >= 0; --i)
        if (profile[i] == 0) profile[i] = profile[i + 3];
    for (int i = middle; i < 3 * n; ++i)
        if (profile[i] == 0) profile[i] = profile[i - 3];

    // Centred moving average: the window starting at element s is stored at s + h.
    int64_t sums[3] = {0, 0, 0};
    for (int p = 0; p < n; ++p) {
        if (p >= window) {
            for (int c = 0; c < 3; ++c) {
                smooth[3 * (p - window + half) + c] = static_cast<int>(sums[c] / window);
                sums[c] -= profile[3 * (p - window) + c];
            }
        }
        for (int c = 0; c < 3; ++c) sums[c] += profile[3 * p + c];
    }

    // Linear extension of the smoothed curve to both ends, never below 0.
    const int endElement = n - 2 - half;
    for (int c = 0; c < 3; ++c) {
        const float startSlope = CalcVectSlope(smooth.data(), 3 * half + c, 3 * half + c + 42, 3);
        const float startValue = static_cast<float>(smooth[3 * half + c]);
        const float endSlope = CalcVectSlope(smooth.data(), 3 * (n - 16 - half) + c, 3 * endElement + c, 3);
        const float endValue = static_cast<float>(smooth[3 * endElement + c]);
        float running = startValue;
        for (int e = half - 1; e >= 0; --e) {
            running -= startSlope;
            if (running < 0.0f) running = 0.0f;
            smooth[3 * e + c] = imagelib::round(running);
        }
        running = endValue;
        for (int e = n - 1 - half; e < n; ++e) {
            running += endSlope;
            if (running < 0.0f) running = 0.0f;
            smooth[3 * e + c] = imagelib::round(running);
        }
    }
    std::copy(smooth.begin(), smooth.end(), profile);
}

void CHologramsRemove::CalcAvImg_8(CImage& source, CImage& destination, int window) {
    if (window < 1 && Refuse(L"CalcAvImg_8", "window below 1")) return;
    if (source.GetBitCount() != 8 && Refuse(L"CalcAvImg_8", "the source is not 8-bit")) return;
    const CImage* input = &source;
    CImage copy;
    if (&source == &destination) input = &(copy = source);
    holo::BoxAverage(*input, destination, window);
}

void CHologramsRemove::CalcAvImg_24(CImage& source, CImage& destination, int window) {
    if (window < 1 && Refuse(L"CalcAvImg_24", "window below 1")) return;
    if (source.GetBitCount() != 24 && Refuse(L"CalcAvImg_24", "the source is not 24-bit")) return;
    const CImage* input = &source;
    CImage copy;
    if (&source == &destination) input = &(copy = source);
    // With an odd window the window ending at the last row or column is not produced, so the row
    // height-1-h and the column width-1-h keep the reallocated 0; callers' results rely on it.
    holo::BoxAverage(*input, destination, window);
    holo::CopyAverageBorder(*input, destination, window);
}

void CHologramsRemove::CalcAvImg_24_By_XY(CImage& profile, CImage& destination, int, int topRow, int bottomRow) {
    if (!holo::HasDepth(profile, 24) && Refuse(L"CalcAvImg_24_By_XY", "the profile image is not a non-empty 24-bit image"))
        return;
    if (&profile == &destination && Refuse(L"CalcAvImg_24_By_XY", "the profile and destination are one image")) return;
    const int width = profile.GetWidth();
    const int height = profile.GetHeight();
    destination.Reallocate(width, height, 24, 0);

    // Channel means of the row profile (column 0) over the document rows, zeros left out.
    int64_t sums[3] = {0, 0, 0};
    int counts[3] = {0, 0, 0};
    for (int y = std::max(topRow + 20, 0); y <= std::min(bottomRow - 21, height - 1); ++y) {
        const unsigned char* p = Row(profile, y);
        for (int c = 0; c < 3; ++c) {
            if (p[c] == 0) continue;
            sums[c] += p[c];
            ++counts[c];
        }
    }
    float means[3];
    for (int c = 0; c < 3; ++c)
        means[c] = counts[c] > 0 ? static_cast<float>(sums[c]) / static_cast<float>(counts[c]) : 128.0f;

    // The model is the column profile scaled by each row's brightness relative to the mean.
    // The product is formed in 64 bits: a very dark mean would overflow 32.
    const unsigned char* columnProfile = Row(profile, 0);
    int64_t byteSum = 0;
    for (int y = 0; y < height; ++y) {
        const unsigned char* rowProfile = Row(profile, y);
        int factors[3];
        for (int c = 0; c < 3; ++c) factors[c] = static_cast<int>(static_cast<float>(rowProfile[c]) / means[c] * 65536.0);
        unsigned char* out = Row(destination, y);
        for (int x = 0; x < width; ++x) {
            for (int c = 0; c < 3; ++c) {
                const int64_t scaled = (static_cast<int64_t>(columnProfile[3 * x + c]) * factors[c]) >> 16;
                out[3 * x + c] = static_cast<unsigned char>(scaled & 0xFF);
                byteSum += out[3 * x + c];
            }
        }
    }
    const int mean = static_cast<int>(byteSum / (3LL * width * height));
    const unsigned char shift = static_cast<unsigned char>((m_avDifVal - mean) & 0xFF);
    for (int y = 0; y < height; ++y) {
        unsigned char* out = Row(destination, y);
        for (int i = 0; i < 3 * width; ++i) out[i] = static_cast<unsigned char>(out[i] + shift);
    }
}

void CHologramsRemove::FixAvMap_24(CImage& image, CImage& average, CImage& mask, int window, int maskThreshold) {
    const wchar_t* name = L"FixAvMap_24";
    if ((window < 1 || window > 15 || window % 2 == 0) && Refuse(name, "the window must be odd, 1 to 15")) return;
    if ((!holo::HasDepth(image, 24) || !holo::SameGeometry(image, average) || !holo::SameGeometry(image, mask)) &&
        Refuse(name, "image, average and mask must be 24-bit images of one size"))
        return;
    const int width = image.GetWidth();
    const int height = image.GetHeight();
    const int half = window / 2;
    const int area = window * window;
    const size_t rowCells = static_cast<size_t>(width) * 3;
    // 16-bit sums and 8-bit counts, as the window limit allows.
    std::vector<uint16_t> sums(rowCells * height, 0);
    std::vector<uint8_t> counts(rowCells * height, 0);
    auto cell = [&](int x, int y, int c) { return static_cast<size_t>(y) * rowCells + 3 * static_cast<size_t>(x) + c; };

    for (int y = half; y < height - half; ++y) {
        const unsigned char* av = Row(average, y);
        for (int x = half; x < width - half; ++x)
            for (int c = 0; c < 3; ++c) {
                sums[cell(x, y, c)] = static_cast<uint16_t>(av[3 * x + c] * area);
                counts[cell(x, y, c)] = static_cast<uint8_t>(area);
            }
    }
    for (int y = half; y < height - half; ++y) {
        const unsigned char* m = Row(mask, y);
        const unsigned char* in = Row(image, y);
        for (int x = half; x < width - half; ++x)
            for (int c = 0; c < 3; ++c) {
                if (m[3 * x + c] <= maskThreshold) continue;
                const int value = in[3 * x + c];
                for (int dy = -half; dy <= half; ++dy)
                    for (int dx = -half; dx <= half; ++dx) {
                        const size_t at = cell(x + dx, y + dy, c);
                        if (counts[at] <= 1) continue;  // a count never drops below 1
                        --counts[at];
                        sums[at] = static_cast<uint16_t>(sums[at] - value);
                    }
            }
    }
    for (int y = half; y < height - half; ++y) {
        unsigned char* av = Row(average, y);
        for (int x = half; x < width - half; ++x)
            for (int c = 0; c < 3; ++c) {
                const size_t at = cell(x, y, c);
                if (counts[at] >= area) continue;
                // Saturates rather than keeping the low 8 bits: a sum that wrapped in 16 bits, or few
                // pixels left over a large remainder, can put the quotient above 255.
                av[3 * x + c] = holo::ClampByte((sums[at] + area / 2) / counts[at]);
            }
    }
}

void CHologramsRemove::CalcImg_HV_Av_24(CImage& image, int border, int topRow, int bottomRow) {
    if (image.GetBitCount() != 24 || image.IsEmpty()) return;
    if (border < 0 && Refuse(L"CalcImg_HV_Av_24", "negative border")) return;
    const int width = image.GetWidth();
    const int height = image.GetHeight();
    std::vector<int> columnSum(3 * static_cast<size_t>(width), 0), columnCount(columnSum.size(), 0);
    std::vector<int> rowSum(3 * static_cast<size_t>(height), 0), rowCount(rowSum.size(), 0);

    for (int y = std::max(border, topRow); y < std::min(height - border, bottomRow); ++y) {
        const unsigned char* p = Row(image, y);
        for (int x = border; x < width - border; ++x)
            for (int c = 0; c < 3; ++c) {
                const int v = p[3 * x + c];
                if (v < 32 || v > 250) continue;
                columnSum[3 * x + c] += v;
                ++columnCount[3 * x + c];
                rowSum[3 * y + c] += v;
                ++rowCount[3 * y + c];
            }
    }
    for (size_t i = 0; i < columnSum.size(); ++i)
        if (columnCount[i] > 0) columnSum[i] /= columnCount[i];
    for (size_t i = 0; i < rowSum.size(); ++i)
        if (rowCount[i] > 0) rowSum[i] /= rowCount[i];
    CalcAvRGBVect(columnSum.data(), width, 63);
    CalcAvRGBVect(rowSum.data(), height, 63);

    // Low 8 bits, not clamped.
    unsigned char* top = Row(image, 0);
    for (int i = 0; i < 3 * width; ++i) top[i] = static_cast<unsigned char>(columnSum[i] & 0xFF);
    for (int y = 0; y < height; ++y) {
        unsigned char* p = Row(image, y);
        for (int c = 0; c < 3; ++c) p[c] = static_cast<unsigned char>(rowSum[3 * y + c] & 0xFF);
    }
}
