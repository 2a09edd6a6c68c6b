// Repair by whole blobs: every glare blob of a mask is collected with its rim, a linear colour
// transfer from image 2 to image 1 is fitted on the rim, and the blob is painted into image 1
// from the transformed image 2.

#include <algorithm>
#include <climits>
#include <cmath>
#include <cstdint>
#include <memory>
#include <vector>

#include "holograms/HologramsRemove.h"
#include "holograms/PixelHelpersInternal.h"

using holo::Refuse;

namespace holo {
namespace {

struct Transfer {
    float gain = 1.0f;
    float offset = 0.0f;
};

// Fits image 1 = gain * image 2 + offset over the rim samples of one channel; falls back to a
// pure gain when the fit is implausible or undefined. A rim of fewer than two pixels keeps the
// identity.
Transfer FitOnRim(const unsigned char* bits1, const unsigned char* bits2, const int32_t* rim, int n, int channel) {
    Transfer t;
    if (n < 2) return t;
    int64_t sx = 0, sy = 0, sxy = 0, sxx = 0;
    for (int i = 0; i < n; ++i) {
        const int64_t x = bits2[rim[i] + channel];
        const int64_t y = bits1[rim[i] + channel];
        sx += x;
        sy += y;
        sxy += x * y;
        sxx += x * x;
    }
    const int64_t numerator = n * sxy - sx * sy;
    const int64_t denominator = n * sxx - sx * sx;  // 0 when image 2 is constant on the rim
    bool fitted = denominator != 0;
    if (fitted) {
        t.gain = static_cast<float>(numerator) / static_cast<float>(denominator);
        t.offset = (static_cast<float>(sy) - t.gain * static_cast<float>(sx)) / static_cast<float>(n);
        fitted = !(std::fabs(t.gain - 1.0f) > 0.25f) && !(std::fabs(t.offset) > 20.0f);
    }
    if (!fitted) {
        t.gain = sx != 0 ? static_cast<float>(sy) / static_cast<float>(sx) : 1.0f;
        t.offset = 0.0f;
    }
    return t;
}

// 16 fraction bits, truncated; saturates instead of overflowing for absurd gains.
int32_t FixedPoint(float v) {
    const float scaled = v * 65536.0f;
    if (!(scaled > static_cast<float>(INT_MIN))) return INT_MIN;
    if (!(scaled < static_cast<float>(INT_MAX))) return INT_MAX;
    return static_cast<int32_t>(scaled);
}

// A blob pixel lies on the rim unless all eight neighbours are glare (above 200) in the mask
// itself, or its four direct neighbours are all at least 128. Neighbours outside count as clear.
bool OnRim(const PixelGrid& mask, int x, int y) {
    int glare = 0;
    for (const auto& step : kFloodOrder) {
        const int nx = x + step[0], ny = y + step[1];
        if (mask.Inside(nx, ny) && *mask.At(nx, ny) > 200) ++glare;
    }
    if (glare >= 8) return false;
    for (const auto& step : kFourNeighbours) {
        const int nx = x + step[0], ny = y + step[1];
        if (!mask.Inside(nx, ny) || *mask.At(nx, ny) < 128) return true;
    }
    return false;
}

// Collects the blobs above 200 of an 8-bit mask that start inside the border. `imageGrid` gives
// the offsets stored in the blobs; `addBlob` fits and keeps (or rejects) each one.
template <typename AddBlob>
void CollectBlobs(CImage& mask, const PixelGrid& imageGrid, int border, AddBlob addBlob) {
    CImage copy(mask);
    const PixelGrid copyGrid(copy);
    const PixelGrid maskGrid(mask);
    const size_t cells = static_cast<size_t>(maskGrid.width) * maskGrid.height;
    std::vector<int32_t> queue(cells), rim(cells);
    auto above200 = [](const unsigned char* p) { return *p > 200; };
    auto clear = [](unsigned char* p) { *p = 0; };
    for (int y = border; y < maskGrid.height - border; ++y) {
        for (int x = border; x < maskGrid.width - border; ++x) {
            if (!above200(copyGrid.At(x, y))) continue;
            int rimCount = 0;
            const int size = FloodFill8(copyGrid, x, y, queue.data(), above200, clear, [&](int px, int py) {
                if (OnRim(maskGrid, px, py)) rim[rimCount++] = py * maskGrid.width + px;
            });
            auto blob = std::make_unique<CHologramBlob>();
            auto toOffsets = [&](const int32_t* indexes, int n) {
                auto* offsets = new int32_t[static_cast<size_t>(std::max(n, 1))];
                for (int i = 0; i < n; ++i)
                    offsets[i] = static_cast<int32_t>(
                        imageGrid.Offset(indexes[i] % maskGrid.width, indexes[i] / maskGrid.width));
                return offsets;
            };
            blob->m_pixelCount = size;
            blob->m_pixelOffsets = toOffsets(queue.data(), size);
            blob->m_rimCount = rimCount;
            blob->m_rimOffsets = toOffsets(rim.data(), rimCount);
            addBlob(std::move(blob));
        }
    }
}

void SetAllChannels(CHologramBlob& blob, const Transfer& t) {
    blob.m_gainR = blob.m_gainG = blob.m_gainB = FixedPoint(t.gain);
    blob.m_offsetR = blob.m_offsetG = blob.m_offsetB = FixedPoint(t.offset);
}

// Paints every blob of the list into image 1 at the given scale. `bytesPerPixel` is that of
// the reference the offsets index.
void PaintBlobs(const CArray<CHologramBlob*>& blobs, CImage& image1, CImage& image2, const CImage& reference,
                int bytesPerPixel, int scale) {
    const int64_t height = reference.GetHeight();
    const int64_t span = reference.GetSpan();
    const int64_t size = height * span;
    int skipped = 0;
    for (const CHologramBlob* blob : blobs) {
        if (blob == nullptr || blob->m_pixelOffsets == nullptr) continue;
        const int32_t gains[3] = {blob->m_gainB, blob->m_gainG, blob->m_gainR};
        const int32_t offsets[3] = {blob->m_offsetB, blob->m_offsetG, blob->m_offsetR};
        for (int i = 0; i < blob->m_pixelCount; ++i) {
            const int64_t o = blob->m_pixelOffsets[i];
            const int64_t row = o / span;
            const int64_t x = (o - row * span) / bytesPerPixel;
            const int64_t y = height - 1 - row;
            const int64_t left = scale * x, top = scale * y;
            if (o < 0 || o >= size || x >= reference.GetWidth() || left + scale > image1.GetWidth() ||
                top + scale > image1.GetHeight()) {
                ++skipped;  // collected on an image of another size
                continue;
            }
            for (int64_t yy = top; yy < top + scale; ++yy) {
                unsigned char* p1 = Row(image1, static_cast<int>(yy)) + 3 * left;
                const unsigned char* p2 = Row(image2, static_cast<int>(yy)) + 3 * left;
                for (int k = 0; k < 3 * scale; ++k) {
                    const int c = k % 3;
                    const int64_t v = (static_cast<int64_t>(p2[k]) * gains[c] + offsets[c]) >> 16;
                    p1[k] = static_cast<unsigned char>(std::clamp<int64_t>(v, 0, 255));
                }
            }
        }
    }
    if (skipped > 0) Trace(L"MergeImages: %d blob pixels outside the images skipped\n", skipped);
}

bool MergeInputsValid(const wchar_t* name, CImage& image1, CImage& image2, const CImage& reference, int bits,
                      int scale) {
    if (!AllSame24({&image1, &image2}) && Refuse(name, "the images must be 24-bit of one size")) return false;
    if (&image1 == &image2 && Refuse(name, "the two images are one")) return false;
    if (!HasDepth(reference, bits) && Refuse(name, "the reference has the wrong depth")) return false;
    if (scale < 1 && Refuse(name, "scale below 1")) return false;
    return true;
}

}  // namespace
}  // namespace holo

void CHologramsRemove::CollectHologramsBlobs_8(CImage& image1, CImage& image2, CImage& mask, int border) {
    const wchar_t* name = L"CollectHologramsBlobs_8";
    if ((!holo::HasDepth(mask, 8) || !holo::SameGeometry(mask, image1) || !holo::SameGeometry(mask, image2)) &&
        Refuse(name, "images and mask must be 8-bit images of one size"))
        return;
    if (border < 0 && Refuse(name, "negative border")) return;
    const holo::PixelGrid maskGrid(mask);
    const unsigned char* bits1 = image1.GetBits();
    const unsigned char* bits2 = image2.GetBits();
    holo::CollectBlobs(mask, maskGrid, border, [&](std::unique_ptr<CHologramBlob> blob) {
        const holo::Transfer t = holo::FitOnRim(bits1, bits2, blob->m_rimOffsets, blob->m_rimCount, 0);
        if (std::fabs(t.gain - 1.0f) > 0.25f) return;  // no plausible transfer: the blob is dropped
        holo::SetAllChannels(*blob, t);
        m_holoBlobs.Add(blob.release());
    });
}

void CHologramsRemove::CollectHologramsBlobs_24(CImage& image1, CImage& image2, CImage& mask, int border) {
    const wchar_t* name = L"CollectHologramsBlobs_24";
    if (!holo::AllSame24({&image1, &image2}) && Refuse(name, "the images must be 24-bit of one size")) return;
    if ((!holo::HasDepth(mask, 8) || !holo::SameSize(mask, image1)) &&
        Refuse(name, "the mask must be 8-bit of the images' size"))
        return;
    if (border < 0 && Refuse(name, "negative border")) return;
    const holo::PixelGrid imageGrid(image1);
    const unsigned char* bits1 = image1.GetBits();
    const unsigned char* bits2 = image2.GetBits();
    holo::CollectBlobs(mask, imageGrid, border, [&](std::unique_ptr<CHologramBlob> blob) {
        const holo::Transfer r = holo::FitOnRim(bits1, bits2, blob->m_rimOffsets, blob->m_rimCount, 2);
        const holo::Transfer g = holo::FitOnRim(bits1, bits2, blob->m_rimOffsets, blob->m_rimCount, 1);
        const holo::Transfer b = holo::FitOnRim(bits1, bits2, blob->m_rimOffsets, blob->m_rimCount, 0);
        blob->m_gainR = holo::FixedPoint(r.gain);
        blob->m_offsetR = holo::FixedPoint(r.offset);
        blob->m_gainG = holo::FixedPoint(g.gain);
        blob->m_offsetG = holo::FixedPoint(g.offset);
        blob->m_gainB = holo::FixedPoint(b.gain);
        blob->m_offsetB = holo::FixedPoint(b.offset);
        m_holoBlobs.Add(blob.release());
    });
}

void CHologramsRemove::MergeImages_8(CImage& image1, CImage& image2, CImage& reference, CImage&, int scale) {
    if (m_holoBlobs.GetSize() == 0) return;
    if (!holo::MergeInputsValid(L"MergeImages_8", image1, image2, reference, 8, scale)) return;
    holo::PaintBlobs(m_holoBlobs, image1, image2, reference, 1, scale);
}

void CHologramsRemove::MergeImages_24(CImage& image1, CImage& image2, CImage& reference, CImage&, int scale) {
    if (m_holoBlobs.GetSize() == 0) return;
    if (!holo::MergeInputsValid(L"MergeImages_24", image1, image2, reference, 24, scale)) return;
    holo::PaintBlobs(m_holoBlobs, image1, image2, reference, 3, scale);
}
