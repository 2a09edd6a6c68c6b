#pragma once

#include <cstdint>

#include "frame/VarnothExport.h"
#include "imagelib/CImage.h"
#include "imagelib/Types.h"
#include "pyramid/Pyramid.h"

// One glare pixel of the downscaled images, as the two-image repair lists them.
struct HOLOGRAM_PIXEL {
    int32_t byteColumn;      // 3 * x: offset of the pixel's first byte in its row
    int32_t row;             // y in the downscaled image
    uint8_t flags;           // bit 0: glare of image 1, bit 1: glare of image 2
    uint8_t average1[3];     // R, G, B
    uint8_t image1[3];       // R, G, B
    uint8_t average2[3];     // R, G, B
    uint8_t image2[3];       // R, G, B
    uint8_t difference[3];   // B, G, R
};

// One connected glare blob with its rim and the colour transfer fitted on the rim.
// Gains and offsets are fixed point with 16 fraction bits. The blob owns both offset arrays
// (array new); constructor and destructor live in HologramsRemove.cpp.
class VARNOTH_API CHologramBlob {
public:
    CHologramBlob();
    virtual ~CHologramBlob();
    CHologramBlob(const CHologramBlob&) = delete;
    CHologramBlob& operator=(const CHologramBlob&) = delete;

    int32_t m_gainR;
    int32_t m_offsetR;
    int32_t m_gainG;
    int32_t m_offsetG;
    int32_t m_gainB;
    int32_t m_offsetB;
    int32_t m_pixelCount;
    int32_t m_rimCount;
    int32_t* m_pixelOffsets;  // buffer offsets (from GetBits) of the blob pixels
    int32_t* m_rimOffsets;    // buffer offsets of the rim pixels
};

// Seed record of HologramsSeperation3; defined where that pipeline lives. The records are
// created and destroyed within one call.
struct HologramSeed;

// Removes holographic glare from document photographs: from four shots lit from the top,
// bottom, left and right (four-image family), or by comparing two shots (two-image family).
// Every four-image operation takes its images as top, bottom, left, right, then the output.
//
// The object owns the blobs in m_holoBlobs and the state of a stepwise removal; it cannot be
// copied. Not safe for concurrent calls of the stepwise or two-image operations.
class VARNOTH_API CHologramsRemove {
public:
    CHologramsRemove();
    virtual ~CHologramsRemove();
    CHologramsRemove(const CHologramsRemove&) = delete;
    CHologramsRemove& operator=(const CHologramsRemove&) = delete;

    // Kept for the interface; does nothing.
    void Barrel(CImage& image, int, int, float, float, float, float);

    // --- Four-image removal ---
    void HologramsRemove4Img(const CImage& top, const CImage& bottom, const CImage& left, const CImage& right,
                             CImage& result);
    void HologramsRemove4Img3(const CImage& top, const CImage& bottom, const CImage& left, const CImage& right,
                              CImage& result);
    void HologramsRemove4Img4(const CImage& top, const CImage& bottom, const CImage& left, const CImage& right,
                              CImage& result);
    void HologramsRemove4Img2(const CImage& top, const CImage& bottom, const CImage& left, const CImage& right,
                              CImage& result);
    // One image per call, steps 0 to 3 in order (top, bottom, left, right); step 3 writes result.
    void HologramsRemove4ImgInSteps(const CImage& image, uint16_t step, CImage& result);

    // --- Two-image separation: downscaling and local averages ---
    void ScaleDownMaxImg(CImage& source, CImage& destination, int factor);
    void ScaleDownMaxImg_X2_24(CImage& source, CImage& destination);
    void ScaleDownMaxImg_X3_8(CImage& source, CImage& destination);
    void ScaleDownMaxImg_X3_24(CImage& source, CImage& destination);
    float CalcVectSlope(int* vector, int first, int last, int step);
    void CalcAvRGBVect(int* profile, int n, int window);
    void CalcAvImg_8(CImage& source, CImage& destination, int window);
    void CalcAvImg_24(CImage& source, CImage& destination, int window);
    void CalcAvImg_24_By_XY(CImage& profile, CImage& destination, int unused, int topRow, int bottomRow);
    void FixAvMap_24(CImage& image, CImage& average, CImage& mask, int window, int maskThreshold);
    void CalcImg_HV_Av_24(CImage& image, int border, int topRow, int bottomRow);

    // --- Difference maps and hologram pixel detection ---
    void SubImg_24(CImage& image1, CImage& image2, CImage& difference, int border, bool profiles,
                   int& referenceMean, float gain, int topRow, int bottomRow);
    void SubImg_24_Alg3(CImage& image1, CImage& image2, CImage& difference, int border, bool profiles, float gain,
                        int topRow, int bottomRow);
    void FindHologramsPixels_24_New_Alg2(CImage& image1, CImage& average1, CImage& image2, CImage& average2,
                                         CImage& map1, CImage& map2, CImage& difference, int window, int unused1,
                                         int unused2, int& count1, int& count2);
    void Find_HologramPixels_24_New_Alg3(CImage& difference, CImage& model, CImage& image1, CImage& image2,
                                         CImage& map1, CImage& map2, int border, int topRow, int bottomRow,
                                         int& score1, int& score2);
    void Add_Saturated_Pixels(CImage& image1, CImage& image2, CImage& map1, CImage& map2, int& unused1,
                              int& unused2, int border);

    // --- Blob cleanup and image repair ---
    void ClearHologramsDirth(CImage& mask, int minimumSize, int border);
    void ClearHologramsDirth_24(CImage& mask, int minimumSize, int border, int& count);
    void ExpandHologramsBolbs(CImage& mask, int value, int border);
    void ExpandHologramsBolbsN(CImage& mask, int border, int iterations);
    void CollectHologramsPixels_New(CImage& image1, CImage& average1, CImage& image2, CImage& average2, CImage& map1,
                                    CImage& map2, CImage& difference, int window);
    void FixSmlImages_24_New(CImage& image1, CImage& average1, CImage& image2, CImage& average2, CImage& map1,
                             CImage& map2, CImage& difference, int window);
    void FixRealImages_24_New(CImage& image1, CImage& image2, int scale, int mode);

    // --- Separation pipelines: image 1 receives the result ---
    void HologramsSeperation(CImage& image1, CImage& image2, CImage& unused, int topRow, int bottomRow);
    void HologramsSeperation2(CImage& image1, CImage& image2, CImage& unused, int topRow, int bottomRow);
    void HologramsSeperation3(CImage& image1, CImage& image2, CImage& unused, int topRow, int bottomRow);

    // --- Alternative detectors and mask utilities ---
    void SubImg_8(CImage& image1, CImage& image2, CImage& output, int border);
    void FindHologramsPixels_8(CImage& image1, CImage& average1, CImage& image2, CImage& average2, CImage& map1,
                               CImage& map2, int radius, int topRow, int bottomRow, int& count1, int& count2);
    void FindHologramsPixels_24(CImage& image1, CImage& average1, CImage& image2, CImage& average2, CImage& map1,
                                CImage& map2, int radius, int topRow, int bottomRow, int& count1, int& count2);
    void GradImg_24(CImage& image, CImage& horizontal, CImage& vertical, int border);
    void MapHologramsEdges_24(CImage& gradient1, CImage& gradient2, CImage& edges1, CImage& edges2, int border,
                              int threshold);
    void ClearMapByMap(CImage& mask, CImage& reference, int border);

    // --- Blob colour transfer ---
    void CollectHologramsBlobs_8(CImage& image1, CImage& image2, CImage& mask, int border);
    void CollectHologramsBlobs_24(CImage& image1, CImage& image2, CImage& mask, int border);
    void MergeImages_8(CImage& image1, CImage& image2, CImage& reference, CImage& unused, int scale);
    void MergeImages_24(CImage& image1, CImage& image2, CImage& reference, CImage& unused, int scale);

private:
    // Colour-vector level updates and helpers; no public operation uses them.
    void UpdateLevel(const CPyramid& top, const CPyramid& bottom, const CPyramid& left, const CPyramid& right,
                     CPyramid& result, int level);
    void UpdateLevel2(const CImage& top, const CImage& bottom, const CImage& left, const CImage& right,
                      const CImage& coarse, CImage& result);
    void ColorMapCreate(const CImage& top, const CImage& bottom, const CImage& left, const CImage& right,
                        CImage& map);
    void CleanMaskTop(CImage& mask);
    int AvarageNeighbours(unsigned char* row, int offset, int channel, int span);

    // One pixel between B, G, R and H, S, V bytes, in place.
    void Rgb2Hsv(unsigned char* pixel);
    void Hsv2Rgb(unsigned char* pixel);

    // Unit tests reach the private members through this.
    friend struct HologramsRemoveTestAccess;

public:
    int m_avDif;
    int m_avDifVal;
    int m_avDelta;
    CArray<HOLOGRAM_PIXEL> m_holoPixels;
    CArray<CHologramBlob*> m_holoBlobs;
    CArray<HologramSeed*> m_seedList;

    // State of the stepwise removal.
    CPyramid m_resultPyr;
    CPyramid m_inputPyr[4];
    CPyramid m_inputGauss;
    CPyramid m_minBright;
    CPyramid m_minBrightIdx;
    CPyramid m_secBright;
    CPyramid m_secBrightIdx;
    CPyramid m_satInfo;
    CPyramid m_maxPeak;
    CPyramid m_maxPeakIdx;
    CPyramid m_minPeak;
    CPyramid m_minPeakIdx;

private:
    // Last stepwise step carried out since the latest step 0 (-1: none yet), so that steps
    // given out of order are refused instead of working on stale or missing pyramids.
    int m_lastStep;
};
