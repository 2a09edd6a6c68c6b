#pragma once

#include <cstddef>
#include <cstdint>

#include "frame/VarnothExport.h"
#include "imagelib/CImage.h"

// An image and its coarser copies: a Gaussian pyramid (each level the smoothed, half-size
// copy of the one above) or a Laplacian pyramid (each level the detail lost between a level
// and its smaller neighbour, stored as 128 + difference clamped to 0..255; the last level
// keeps the Gaussian residue). Level k+1 is (size(k) - 3) / 2 + 2 in each direction.
//
// Levels are ordinary CImage objects that callers read and write through GetLevel. A pyramid
// is not safe for concurrent use: Reduce and Expand share its work buffer.
class VARNOTH_API CPyramid {
public:
    enum PyrType : int32_t { PyrNone = 0, PyrGaussian = 1, PyrLaplacian = 2 };

    CPyramid();
    CPyramid(int levels, int width, int height, int channels);
    CPyramid(int levels, const CImage& image);
    CPyramid(const CPyramid& source);
    CPyramid& operator=(const CPyramid& source);
    virtual ~CPyramid();

    // Sizes every level for a width x height image of `channels` bytes per pixel (1 or 3).
    // Keeps levels, pixels and work buffer when size, depth and count are unchanged.
    // State becomes PyrNone; the image flag is kept.
    void Init(int width, int height, int channels, int levels);
    // As above with the image's geometry, then level 0 = image.
    void Init(const CImage& image, int levels);
    // New level 0 of the same width, height and depth; false (nothing changed) otherwise.
    bool SetImage(const CImage& image);

    void MakeGaussian();
    // Turns a Gaussian pyramid (built first when the state is PyrNone) into a Laplacian one;
    // `gaussianCopy`, when given, receives the Gaussian levels first.
    void MakeLaplacian(CPyramid* gaussianCopy = nullptr);
    // Collapses a Laplacian pyramid; level 0 becomes the image.
    void ReconstructGaussian();
    // Copies src's levels into this pyramid at (x, y) of level 0, halving the position per
    // level; with a mask pyramid only the bytes whose mask byte is 0.
    bool InsertPyramid(const CPyramid& src, int x, int y, const CPyramid* mask = nullptr);

    void ForceType(PyrType type) { m_eType = type; }
    PyrType GetStatus() const { return m_eType; }
    // No index check: 0 <= level < GetLevelsNum() is the caller's duty.
    CImage& GetLevel(int level) { return m_pLevels[level]; }
    const CImage& GetLevel(int level) const { return m_pLevels[level]; }
    int GetLevelsNum() const { return m_nLevels; }
    int GetChannels() const { return m_nChannels; }

    // dst = src smoothed with 1-4-6-4-1 and halved; dst must be the next coarser level size
    // of src, rows taken in memory order. Does nothing for sources below 3 x 3, a dst of
    // another size or depth, or when the work buffer is too small for the images.
    void Reduce(const CImage& src, CImage& dst);
    // dst = src doubled with the interpolating kernel; src must be the next coarser level
    // size of dst, rows taken through GetPtrXY. Does nothing for sources below 2 x 2, a dst
    // of another size or depth, or when the work buffer is too small for the images.
    void Expand(const CImage& src, CImage& dst);

    // Next coarser level size: (size - 3) / 2 + 2, truncating toward zero.
    static int NextLevelSize(int size) { return (size - 3) / 2 + 2; }

private:
    // Legacy entry points of a vector unit the library never uses; they do nothing.
    void ReduceMMX(CImage& src, CImage& dst);
    void ExpandMMX(CImage& src, CImage& dst);

    void ReleaseLevels();
    void ReleaseWork();
    // Expands level k+1 of this pyramid into `scratch` and combines it into level k.
    void ExpandAndCombine(int level, CImage& scratch, bool add);

    CImage* m_pLevels = nullptr;
    int32_t m_nLevels = 0;
    int32_t m_nChannels = 0;
    PyrType m_eType = PyrNone;
    bool m_bHasImage = false;
    int16_t* m_pWork = nullptr;
    size_t m_nWorkSize = 0;  // elements of m_pWork
};
