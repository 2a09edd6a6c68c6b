#pragma once

#include <cstdint>

// Per-pixel rules of the stepwise composition, exposed to the tests (not exported).
namespace holo4 {

// The running statistics of one pixel of one level: references into the state maps.
struct StepPixel {
    uint8_t& satInfo;  // bits 0-3: saturated candidates seen; bit 4 + s: candidate s saturated
    uint8_t& minBright;
    uint8_t& minBrightIdx;
    uint8_t& secBright;
    uint8_t& secBrightIdx;
    uint8_t& maxPeak;
    uint8_t& maxPeakIdx;
    uint8_t& minPeak;
    uint8_t& minPeakIdx;
};

// Folds candidate `step` with brightness g and detail peak p into the statistics. A
// candidate already flagged saturated is not counted twice (a repeated step).
void FoldCandidate(StepPixel& st, int step, int g, int p);

// Decides the result pixel at step 3 from the statistics and the four candidates' detail
// pixels; may exchange the two brightness indexes, as the rule reads them.
void DecideStepPixel(StepPixel& st, const unsigned char* const detail[4], unsigned char* out);

// Whole rows. `map` holds the nine state-map rows in StepPixel order; `bright` and the
// detail rows are 24-bit (brightness and peak are their largest channels). The plain forms
// take the pixels [begin, end) and define the bytes; the fast forms use vectors.
void FoldPixels(uint8_t* const map[9], int step, const unsigned char* bright, const unsigned char* detail, int begin,
                int end);
void FoldRowFast(uint8_t* const map[9], int step, const unsigned char* bright, const unsigned char* detail,
                 int width);
void DecidePixels(uint8_t* const map[9], const unsigned char* const detail[4], unsigned char* out, int begin,
                  int end);
void DecideRowFast(uint8_t* const map[9], const unsigned char* const detail[4], unsigned char* out, int width);

}  // namespace holo4
