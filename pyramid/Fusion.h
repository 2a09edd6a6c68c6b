#pragma once

#include <cstdint>

#include "frame/VarnothExport.h"
#include "imagelib/CImage.h"
#include "imagelib/Types.h"
#include "pyramid/Pyramid.h"

// Combines several shots of one document in the Laplacian domain:
// - two images (AddImage twice): at every detail pixel the image with the stronger local
//   detail wins, at the coarsest level the pixel whose channels spread wider; with a blend
//   map of the images' size (SetMap) the map blends the two at every level instead;
// - four images (AddImage four times): the pyramids are stitched side by side into one twice
//   as wide, each shifted by its placement point, and the seams blend in the collapse;
// - two images through NegateImage: the second image's detail where the first has little.
// The combination runs when the last expected image arrives; Fuse collapses the result.
// Not copyable: the object owns its pyramids, map and offsets.
class VARNOTH_API CFusion {
public:
    CFusion();
    CFusion(int levels, int images);
    ~CFusion();
    CFusion(const CFusion&) = delete;
    CFusion& operator=(const CFusion&) = delete;

    // Starts a batch of `images` (2 or 4) images with `levels` pyramid levels (1..30); other
    // values leave the object without pyramids, refusing every image. The map is kept.
    void Init(int levels, int images);
    // Accepts the next image of the batch (8- or 24-bit, larger than 2^levels both ways, the
    // first image's size and depth); a surplus image replaces the last one. The placement
    // counts in four-image mode only.
    bool AddImage(const CImage& image, CPoint placement = CPoint());
    // As AddImage for the detail negation of two images, each at least 101 x 101.
    bool NegateImage(const CImage& image);
    // An 8-bit blend map (0 selects the first image, 255 the second) for the two-image
    // selection; it applies when it has the images' size. Set it before the second image.
    void SetMap(const CImage& map);
    bool IsFuseReady() const;
    // The collapsed result; an empty image before the batch is complete. Valid until the
    // next Init or the object's end.
    CImage& Fuse();

private:
    friend class CFusionProbe;  // tests read the combined pyramid before the collapse

    void FusePyramids();
    void Fuse4Pyramids();
    void FuseLevelMasked(int level);
    void FuseLevelNonMasked(int level);
    void NegatePyramids();

    void ReleasePyramids();
    bool AcceptsImage(const CImage& image) const;
    void AddToSlot(const CImage& image, int slot);
    bool MapApplies() const;

    CPyramid* m_pPyramids = nullptr;
    CPyramid* m_pResult = nullptr;
    int32_t m_nAdded = 0;
    int32_t m_nImages = 0;
    int32_t m_nWidth = 0;
    int32_t m_nHeight = 0;
    int32_t m_nBitCount = 0;
    int32_t m_nLevels = 0;
    CPyramid* m_pMap = nullptr;
    CPoint* m_pOffsets = nullptr;
    CImage m_empty;  // what Fuse hands back when there is nothing to collapse
};
