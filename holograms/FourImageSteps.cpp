// Stepwise four-image glare removal: the four shots arrive one per call; each call folds
// its Laplacian pyramid into per-pixel running statistics kept in the remover's member
// pyramids, and the fourth call decides the result pyramid and collapses it.
#include <cstring>

#include "holograms/FourImageInternal.h"
#include "holograms/FourImagePyramidInternal.h"
#include "holograms/FourImageStepsInternal.h"
#include "holograms/HologramsRemove.h"
#include "imagelib/Trace.h"

using holo4::CopyPixel;
using holo4::kLevels;
using holo4::MaxChannel;
using holo4::MinChannel;

namespace holo4 {

void FoldCandidate(StepPixel& st, int step, int g, int p) {
    const uint8_t flag = static_cast<uint8_t>(1u << (4 + step));
    if (g >= kSaturatedBrightness && !(st.satInfo & flag)) st.satInfo = static_cast<uint8_t>((st.satInfo + 1) | flag);
    // Strict comparisons: on equal values the earlier step keeps its place.
    if (g < st.minBright) {
        st.secBright = st.minBright;
        st.secBrightIdx = st.minBrightIdx;
        st.minBright = static_cast<uint8_t>(g);
        st.minBrightIdx = static_cast<uint8_t>(step);
    } else if (g < st.secBright) {
        st.secBright = static_cast<uint8_t>(g);
        st.secBrightIdx = static_cast<uint8_t>(step);
    }
    if (p < st.minPeak) {
        st.minPeak = static_cast<uint8_t>(p);
        st.minPeakIdx = static_cast<uint8_t>(step);
    }
    if (p > st.maxPeak) {
        st.maxPeak = static_cast<uint8_t>(p);
        st.maxPeakIdx = static_cast<uint8_t>(step);
    }
}

void DecideStepPixel(StepPixel& st, const unsigned char* const detail[4], unsigned char* out) {
    const int saturated = st.satInfo & 0x0F;
    // Four saturated: the least bright, as the one-shot composition does; three: the one left.
    if (saturated >= 3) {
        CopyPixel(out, detail[st.minBrightIdx & 3]);
        return;
    }
    if (saturated == 0 && st.maxPeak - st.minPeak < kPeakSpread) {
        // The peak farther from the neutral 127.
        const bool minFarther = st.maxPeak - 127 <= 127 - st.minPeak;
        CopyPixel(out, detail[(minFarther ? st.minPeakIdx : st.maxPeakIdx) & 3]);
        return;
    }
    int peak[4];
    int colour = 0;
    float bestNeutrality = 0.0f;
    for (int i = 0; i < 4; ++i) {
        peak[i] = MaxChannel(detail[i]);
        const float neutrality =
            peak[i] == 0 ? 0.0f : static_cast<float>(MinChannel(detail[i])) / static_cast<float>(peak[i]);
        if (!(st.satInfo & (1u << (4 + i))) && neutrality > bestNeutrality) {
            bestNeutrality = neutrality;
            colour = i;
        }
    }
    if (peak[st.secBrightIdx & 3] < peak[st.minBrightIdx & 3]) {
        const uint8_t swap = st.minBrightIdx;
        st.minBrightIdx = st.secBrightIdx;
        st.secBrightIdx = swap;
    }
    int v = peak[st.minBrightIdx & 3];
    const int q = peak[st.secBrightIdx & 3];
    if (v > 127 && q - v < kPeakSpread) v = q;
    for (int c = 0; c < 3; ++c) {
        // A colour candidate without detail has no proportions to scale: 0.
        out[c] = peak[colour] == 0 ? 0
                                   : static_cast<unsigned char>(static_cast<int>(
                                         static_cast<float>(detail[colour][c]) / static_cast<float>(peak[colour]) *
                                         static_cast<float>(v)));
    }
}

void FoldPixels(uint8_t* const map[9], int step, const unsigned char* bright, const unsigned char* detail, int begin,
                int end) {
    for (int x = begin; x < end; ++x) {
        StepPixel st{map[0][x], map[1][x], map[2][x], map[3][x], map[4][x], map[5][x], map[6][x], map[7][x], map[8][x]};
        FoldCandidate(st, step, MaxChannel(bright + 3 * x), MaxChannel(detail + 3 * x));
    }
}

void DecidePixels(uint8_t* const map[9], const unsigned char* const detail[4], unsigned char* out, int begin,
                  int end) {
    for (int x = begin; x < end; ++x) {
        StepPixel st{map[0][x], map[1][x], map[2][x], map[3][x], map[4][x], map[5][x], map[6][x], map[7][x], map[8][x]};
        const unsigned char* at[4] = {detail[0] + 3 * x, detail[1] + 3 * x, detail[2] + 3 * x, detail[3] + 3 * x};
        DecideStepPixel(st, at, out + 3 * x);
    }
}

}  // namespace holo4

namespace {

constexpr int kMapLevels = kLevels - 1;

struct StateMaps {
    CPyramid* sat;
    CPyramid* minBright;
    CPyramid* minBrightIdx;
    CPyramid* secBright;
    CPyramid* secBrightIdx;
    CPyramid* maxPeak;
    CPyramid* maxPeakIdx;
    CPyramid* minPeak;
    CPyramid* minPeakIdx;

    CPyramid* all(int i) const {
        CPyramid* const list[9] = {sat, minBright, minBrightIdx, secBright, secBrightIdx,
                                   maxPeak, maxPeakIdx, minPeak, minPeakIdx};
        return list[i];
    }
};

// Sizes the maps for the step-0 image (nothing is reallocated when the geometry is the
// same) and resets the statistics of every level.
void ResetMaps(const StateMaps& maps, int width, int height) {
    for (int i = 0; i < 9; ++i) maps.all(i)->Init(width, height, 1, kMapLevels);
    for (int level = 0; level < kMapLevels; ++level) {
        maps.sat->GetLevel(level).Set(0);
        maps.minBright->GetLevel(level).Set(255);
        maps.secBright->GetLevel(level).Set(255);
        maps.minPeak->GetLevel(level).Set(255);
        maps.maxPeak->GetLevel(level).Set(0);
        // Indexes too, so that a pixel no candidate ever moved reads candidate 0, not a
        // leftover of an earlier composition.
        maps.minBrightIdx->GetLevel(level).Set(0);
        maps.secBrightIdx->GetLevel(level).Set(0);
        maps.maxPeakIdx->GetLevel(level).Set(0);
        maps.minPeakIdx->GetLevel(level).Set(0);
    }
}

// Level 6 of the result: the darker of the step-0 and step-1 pixels (step 0 on ties).
void SettleCoarsest(CImage& result, const CImage& second) {
    for (int y = 0; y < result.GetHeight(); ++y) {
        unsigned char* out = result.GetPtrXY(0, y);
        const unsigned char* in = second.GetPtrXY(0, y);
        for (int x = 0; x < result.GetWidth(); ++x)
            if (MaxChannel(in + 3 * x) < MaxChannel(out + 3 * x)) CopyPixel(out + 3 * x, in + 3 * x);
    }
}

void FoldLevel(const StateMaps& maps, const CPyramid inputs[4], const CPyramid& gauss, CPyramid& result, int step,
                 int level) {
    const int width = gauss.GetLevel(level).GetWidth();
    holo4::ForEachRowBand(gauss.GetLevel(level).GetHeight(), [&](int begin, int end) {
        for (int y = begin; y < end; ++y) {
            uint8_t* row[9];
            for (int i = 0; i < 9; ++i) row[i] = maps.all(i)->GetLevel(level).GetPtrXY(0, y);
            const unsigned char* bright = gauss.GetLevel(level).GetPtrXY(0, y);
            // Before step 3 only the current step's pyramid is read (the others may not exist yet).
            const unsigned char* detailRow[4] = {nullptr, nullptr, nullptr, nullptr};
            for (int i = 0; i < 4; ++i)
                if (i == step || step == 3) detailRow[i] = inputs[i].GetLevel(level).GetPtrXY(0, y);
            // Every pixel is independent: the whole row is folded, then (step 3) decided.
            holo4::FoldRowFast(row, step, bright, detailRow[step], width);
            if (step == 3) holo4::DecideRowFast(row, detailRow, result.GetLevel(level).GetPtrXY(0, y), width);
        }
    });
}

}  // namespace

void CHologramsRemove::HologramsRemove4ImgInSteps(const CImage& image, uint16_t step, CImage& result) {
    if (step > 3) {
        Trace(L"HologramsRemove4ImgInSteps: step %d is not 0 to 3; ignored\n", static_cast<int>(step));
        return;
    }
    if (step == 0) {
        if (image.GetBitCount() != 24 || !holo4::ReducibleToLevels(image.GetWidth(), image.GetHeight(), kLevels)) {
            Trace(L"HologramsRemove4ImgInSteps: step 0 needs a 24-bit image of at least 65 x 65; ignored\n");
            return;
        }
    } else {
        // Step s follows step s - 1 (or repeats the latest step) of the composition that
        // the latest step 0 started, with an image of the same size.
        if (m_lastStep < 0 || (step != m_lastStep + 1 && step != m_lastStep)) {
            Trace(L"HologramsRemove4ImgInSteps: step %d out of order (latest step %d); ignored\n",
                  static_cast<int>(step), m_lastStep);
            return;
        }
        const CImage& first = m_resultPyr.GetLevel(0);
        if (image.GetBitCount() != 24 || image.GetWidth() != first.GetWidth() ||
            image.GetHeight() != first.GetHeight()) {
            Trace(L"HologramsRemove4ImgInSteps: step %d image differs from the step-0 image; ignored\n",
                  static_cast<int>(step));
            return;
        }
    }

    // Until this step completes the members are in flux: if it throws (out of memory), later
    // steps 1 to 3 are refused until a new step 0.
    m_lastStep = -1;
    m_inputPyr[step].Init(image, kLevels);
    m_inputPyr[step].MakeLaplacian(&m_inputGauss);
    const StateMaps maps{&m_satInfo, &m_minBright, &m_minBrightIdx, &m_secBright, &m_secBrightIdx,
                         &m_maxPeak, &m_maxPeakIdx, &m_minPeak,     &m_minPeakIdx};
    if (step == 0) {
        m_resultPyr.Init(image.GetWidth(), image.GetHeight(), 3, kLevels);
        m_resultPyr.ForceType(CPyramid::PyrLaplacian);
        const CImage& coarse = m_inputPyr[0].GetLevel(kLevels - 1);
        std::memcpy(m_resultPyr.GetLevel(kLevels - 1).GetBits(), coarse.GetBits(), coarse.GetSize());
        ResetMaps(maps, image.GetWidth(), image.GetHeight());
    } else if (step == 1) {
        SettleCoarsest(m_resultPyr.GetLevel(kLevels - 1), m_inputPyr[1].GetLevel(kLevels - 1));
    }
    for (int level = kMapLevels - 1; level >= 0; --level)
        FoldLevel(maps, m_inputPyr, m_inputGauss, m_resultPyr, step, level);
    m_lastStep = step;
    if (step == 3) {
        // The member pyramid stays Laplacian, so a repeated step 3 collapses it again.
        CPyramid collapsed(m_resultPyr);
        holo4::CollapseInto(collapsed, result);
    }
}
