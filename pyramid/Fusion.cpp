// CFusion: the batch of images, their pyramids and the blend map.
#include "pyramid/Fusion.h"

#include "imagelib/Trace.h"

namespace {

constexpr int kMaxLevels = 30;          // 1 << levels must stay a positive int
constexpr int kNegateMinimumSize = 101;

}  // namespace

CFusion::CFusion() = default;

CFusion::CFusion(int levels, int images) { Init(levels, images); }

CFusion::~CFusion() {
    ReleasePyramids();
    delete m_pMap;
}

void CFusion::ReleasePyramids() {
    if (m_pResult != nullptr && m_pResult != m_pPyramids) delete m_pResult;
    m_pResult = nullptr;
    delete[] m_pPyramids;
    m_pPyramids = nullptr;
    delete[] m_pOffsets;
    m_pOffsets = nullptr;
}

void CFusion::Init(int levels, int images) {
    ReleasePyramids();
    m_nAdded = 0;
    if (levels < 1 || levels > kMaxLevels || (images != 2 && images != 4)) {
        Trace(L"CFusion::Init refused: %d levels, %d images\n", levels, images);
        m_nLevels = 0;
        m_nImages = 0;
        return;
    }
    m_pPyramids = new CPyramid[images];
    if (images >= 3) {
        m_pResult = new CPyramid;
        m_pOffsets = new CPoint[images];
    } else {
        m_pResult = m_pPyramids;
    }
    m_nLevels = levels;
    m_nImages = images;
}

bool CFusion::AcceptsImage(const CImage& image) const {
    if (m_pPyramids == nullptr) return false;
    if (image.IsEmpty() || (image.GetBitCount() != 8 && image.GetBitCount() != 24)) return false;
    if (m_nAdded >= 1 && (image.GetWidth() != m_nWidth || image.GetHeight() != m_nHeight ||
                          image.GetBitCount() != m_nBitCount))
        return false;
    // Every level must stay within the filters' range.
    const int bound = 1 << m_nLevels;
    return image.GetWidth() > bound && image.GetHeight() > bound;
}

void CFusion::AddToSlot(const CImage& image, int slot) {
    CPyramid& pyramid = m_pPyramids[slot];
    if (pyramid.GetLevelsNum() == 0 || !pyramid.SetImage(image)) pyramid.Init(image, m_nLevels);
    pyramid.MakeLaplacian(nullptr);
}

bool CFusion::AddImage(const CImage& image, CPoint placement) {
    if (!AcceptsImage(image)) return false;
    if (m_nAdded == 0) {
        m_nWidth = image.GetWidth();
        m_nHeight = image.GetHeight();
        m_nBitCount = image.GetBitCount();
        if (m_nImages >= 3) m_pResult->Init(2 * m_nWidth, m_nHeight, m_nBitCount / 8, m_nLevels);
    }
    const int slot = m_nAdded < m_nImages ? m_nAdded : m_nImages - 1;
    AddToSlot(image, slot);
    if (m_nImages >= 3) m_pOffsets[slot] = placement;
    if (++m_nAdded < m_nImages) return true;
    m_nAdded = m_nImages;
    if (m_nImages == 2) {
        FusePyramids();
    } else {
        Fuse4Pyramids();
    }
    return true;
}

bool CFusion::NegateImage(const CImage& image) {
    if (!AcceptsImage(image)) return false;
    if (image.GetWidth() < kNegateMinimumSize || image.GetHeight() < kNegateMinimumSize) return false;
    if (m_nAdded == 0) {
        m_nWidth = image.GetWidth();
        m_nHeight = image.GetHeight();
        m_nBitCount = image.GetBitCount();
    }
    AddToSlot(image, m_nAdded < 2 ? m_nAdded : 1);
    if (++m_nAdded < 2) return true;
    m_nAdded = 2;
    NegatePyramids();
    return true;
}

void CFusion::SetMap(const CImage& map) {
    if (m_nLevels == 0 || map.GetBitCount() != 8 || map.IsEmpty()) return;
    delete m_pMap;
    m_pMap = nullptr;
    m_pMap = new CPyramid(m_nLevels, map);
    m_pMap->MakeGaussian();
}

bool CFusion::MapApplies() const {
    // A map set before an Init with another level count has levels the fusion would run past.
    return m_pMap != nullptr && m_pMap->GetLevelsNum() == m_nLevels && m_pMap->GetLevel(0).GetWidth() == m_nWidth &&
           m_pMap->GetLevel(0).GetHeight() == m_nHeight;
}

bool CFusion::IsFuseReady() const { return m_pPyramids != nullptr && m_nAdded >= m_nImages; }

CImage& CFusion::Fuse() {
    if (!IsFuseReady() || m_pResult == nullptr || m_pResult->GetLevelsNum() == 0) {
        Trace(L"CFusion::Fuse: the batch is not complete (%d of %d images)\n", m_nAdded, m_nImages);
        m_empty = CImage();
        return m_empty;
    }
    m_pResult->ForceType(CPyramid::PyrLaplacian);
    m_pResult->ReconstructGaussian();
    return m_pResult->GetLevel(0);
}
