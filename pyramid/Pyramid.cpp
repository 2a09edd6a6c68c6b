#include "pyramid/Pyramid.h"

#include <cstring>
#include <memory>

#include "frame/ImageArithmetic.h"
#include "imagelib/Trace.h"
#include "pyramid/FiltersInternal.h"

namespace {

// dst = src; when the geometry is already right the pixels are copied into place, which
// spares a scan-sized reallocation for every refill of a long-lived pyramid.
void CopyImage(CImage& dst, const CImage& src) {
    if (&dst == &src) return;
    const bool sameGeometry = !dst.IsEmpty() && dst.GetWidth() == src.GetWidth() &&
                              dst.GetHeight() == src.GetHeight() && dst.GetBitCount() == src.GetBitCount();
    if (!sameGeometry) {
        dst = src;
        return;
    }
    std::memcpy(dst.GetBits(), src.GetBits(), src.GetSize());
    for (int i = 0; i < 256; ++i) {
        if (dst.GetPaletteColor(i) != src.GetPaletteColor(i)) dst.SetPaletteColor(i, src.GetPaletteColor(i));
    }
}

}  // namespace

CPyramid::CPyramid() = default;

CPyramid::CPyramid(int levels, int width, int height, int channels) { Init(width, height, channels, levels); }

CPyramid::CPyramid(int levels, const CImage& image) { Init(image, levels); }

CPyramid::CPyramid(const CPyramid& source) { *this = source; }

CPyramid::~CPyramid() {
    ReleaseLevels();
    ReleaseWork();
}

void CPyramid::ReleaseLevels() {
    delete[] m_pLevels;
    m_pLevels = nullptr;
}

void CPyramid::ReleaseWork() {
    delete[] m_pWork;
    m_pWork = nullptr;
    m_nWorkSize = 0;
}

CPyramid& CPyramid::operator=(const CPyramid& source) {
    if (this == &source) return *this;
    if (source.m_pLevels != nullptr && source.m_nLevels > 0) {
        Init(source.m_pLevels[0], source.m_nLevels);
        if (m_nLevels == source.m_nLevels) {
            for (int k = 1; k < m_nLevels; ++k) CopyImage(m_pLevels[k], source.m_pLevels[k]);
        }
    } else {
        ReleaseLevels();
        ReleaseWork();
        m_nLevels = 0;
    }
    m_eType = source.m_eType;
    m_bHasImage = source.m_bHasImage;
    return *this;
}

void CPyramid::Init(int width, int height, int channels, int levels) {
    if (levels < 0 || width < 1 || height < 1 || (channels != 1 && channels != 3)) {
        Trace(L"CPyramid::Init refused: %d x %d, %d channels, %d levels\n", width, height, channels, levels);
        return;
    }
    const bool hasLevel0 = m_pLevels != nullptr && m_nLevels > 0;
    const bool sizeChanged = !hasLevel0 || m_pLevels[0].GetWidth() != width || m_pLevels[0].GetHeight() != height ||
                             m_pLevels[0].GetBitCount() / 8 != channels;
    const bool countChanged = m_pLevels != nullptr && m_nLevels != levels;
    if (countChanged) ReleaseLevels();
    if (sizeChanged) ReleaseWork();
    bool created = false;
    if (m_pLevels == nullptr) {
        m_pLevels = new CImage[levels];
        created = true;
    }
    if (sizeChanged || created) {
        int w = width, h = height;
        for (int k = 0; k < levels; ++k) {
            m_pLevels[k].Reallocate(w, h, channels * 8, 0);
            w = NextLevelSize(w);
            h = NextLevelSize(h);
        }
    }
    m_nLevels = levels;
    m_nChannels = channels;
    if (sizeChanged && levels > 0) {
        m_nWorkSize = m_pLevels[0].GetSize();
        m_pWork = new int16_t[m_nWorkSize];
    }
    m_eType = PyrNone;
}

void CPyramid::Init(const CImage& image, int levels) {
    // The image may be one of our own levels, which a changed level count would free.
    std::unique_ptr<CImage> ownCopy;
    const CImage* source = &image;
    if (m_pLevels != nullptr && &image >= m_pLevels && &image < m_pLevels + m_nLevels) {
        ownCopy = std::make_unique<CImage>(image);
        source = ownCopy.get();
    }
    const int channels = source->GetBitCount() / 8;
    if (source->IsEmpty() || (channels != 1 && channels != 3) || levels < 1) {
        Trace(L"CPyramid::Init refused an image of %d bits for %d levels\n", source->GetBitCount(), levels);
        return;
    }
    Init(source->GetWidth(), source->GetHeight(), channels, levels);
    CopyImage(m_pLevels[0], *source);
    m_bHasImage = true;
}

bool CPyramid::SetImage(const CImage& image) {
    if (m_pLevels == nullptr || m_nLevels < 1 || image.GetBitCount() / 8 != m_nChannels) return false;
    // A level 0 of another size would no longer match the coarser levels and the work buffer.
    if (image.GetWidth() != m_pLevels[0].GetWidth() || image.GetHeight() != m_pLevels[0].GetHeight()) return false;
    m_eType = PyrNone;
    CopyImage(m_pLevels[0], image);
    m_bHasImage = true;
    m_nChannels = image.GetBitCount() / 8;
    return true;
}

void CPyramid::MakeGaussian() {
    if (m_pLevels == nullptr || !m_bHasImage || m_eType != PyrNone) return;
    for (int k = 1; k < m_nLevels; ++k) Reduce(m_pLevels[k - 1], m_pLevels[k]);
    m_eType = PyrGaussian;
}

void CPyramid::MakeLaplacian(CPyramid* gaussianCopy) {
    if (m_eType == PyrNone) MakeGaussian();
    if (m_eType != PyrGaussian) return;
    if (gaussianCopy != nullptr && gaussianCopy != this) {
        gaussianCopy->Init(m_pLevels[0], m_nLevels);
        if (gaussianCopy->m_nLevels == m_nLevels) {
            for (int k = 1; k < m_nLevels; ++k) CopyImage(gaussianCopy->m_pLevels[k], m_pLevels[k]);
        }
    }
    // Ascending: level k+1 is still Gaussian when level k is formed.
    CImage scratch;
    for (int k = 0; k + 1 < m_nLevels; ++k) ExpandAndCombine(k, scratch, false);
    m_eType = PyrLaplacian;
}

void CPyramid::ReconstructGaussian() {
    if (m_eType != PyrLaplacian) return;
    // Descending: each level is restored before it is expanded into the next finer one.
    CImage scratch;
    for (int k = m_nLevels - 1; k >= 1; --k) ExpandAndCombine(k - 1, scratch, true);
    m_eType = PyrGaussian;
}

void CPyramid::ExpandAndCombine(int level, CImage& scratch, bool add) {
    CImage& target = m_pLevels[level];
    const CImage& coarse = m_pLevels[level + 1];
    // Row by row without the intermediate image when the levels fit the filter.
    if (varnoth::ExpandGeometryOk(coarse, target) && varnoth::FilterWorkNeed(coarse, target) <= m_nWorkSize &&
        varnoth::FastExpandCombine(coarse, target, add, m_pWork, m_nWorkSize)) {
        return;
    }
    scratch.Reallocate(target.GetWidth(), target.GetHeight(), target.GetBitCount(), 0);
    Expand(coarse, scratch);
    if (add) {
        ImageAdd(target, scratch, target, true);
    } else {
        ImageSubtract(target, scratch, target);
    }
}

bool CPyramid::InsertPyramid(const CPyramid& src, int x, int y, const CPyramid* mask) {
    if (x < 0 || y < 0 || m_pLevels == nullptr || src.m_pLevels == nullptr || m_nLevels < 1) return false;
    if (src.m_nLevels != m_nLevels || src.m_nChannels != m_nChannels) return false;
    if (src.m_pLevels[0].GetWidth() + x >= m_pLevels[0].GetWidth()) return false;
    if (src.m_pLevels[0].GetHeight() + y >= m_pLevels[0].GetHeight()) return false;
    // A mask pyramid with fewer levels would be read past its end.
    if (mask != nullptr && (mask->m_pLevels == nullptr || mask->m_nLevels < m_nLevels)) return false;
    for (int k = 0; k < m_nLevels; ++k) {
        const CImage* maskLevel = mask != nullptr ? &mask->m_pLevels[k] : nullptr;
        if (!InsertImage(src.m_pLevels[k], m_pLevels[k], CPoint(x, y), maskLevel)) return false;
        x >>= 1;
        y >>= 1;
    }
    return true;
}

void CPyramid::Reduce(const CImage& src, CImage& dst) {
    if (!varnoth::ReduceGeometryOk(src, dst) || varnoth::FilterWorkNeed(src, dst) > m_nWorkSize) {
        Trace(L"CPyramid::Reduce refused: %d x %d (%d bits) into %d x %d (%d bits)\n", src.GetWidth(),
              src.GetHeight(), src.GetBitCount(), dst.GetWidth(), dst.GetHeight(), dst.GetBitCount());
        return;
    }
    varnoth::FastReduce(src, dst, m_pWork, m_nWorkSize);
}

void CPyramid::Expand(const CImage& src, CImage& dst) {
    if (!varnoth::ExpandGeometryOk(src, dst) || varnoth::FilterWorkNeed(src, dst) > m_nWorkSize) {
        Trace(L"CPyramid::Expand refused: %d x %d (%d bits) into %d x %d (%d bits)\n", src.GetWidth(),
              src.GetHeight(), src.GetBitCount(), dst.GetWidth(), dst.GetHeight(), dst.GetBitCount());
        return;
    }
    varnoth::FastExpand(src, dst, m_pWork, m_nWorkSize);
}

void CPyramid::ReduceMMX(CImage&, CImage&) {}

void CPyramid::ExpandMMX(CImage&, CImage&) {}
