#include "holograms/FourImageInternal.h"

#include "pyramid/Pyramid.h"
#include "imagelib/Trace.h"

namespace holo4 {

bool ReducibleToLevels(int width, int height, int levels) {
    if (width < 1 || height < 1) return false;
    for (int k = 0; k + 1 < levels; ++k) {
        if (width < 3 || height < 3) return false;
        width = CPyramid::NextLevelSize(width);
        height = CPyramid::NextLevelSize(height);
    }
    return true;
}

bool CheckFourInputs(const CImage& top, const CImage& bottom, const CImage& left, const CImage& right,
                     const wchar_t* operation, bool needPyramid) {
    const CImage* images[4] = {&top, &bottom, &left, &right};
    static const wchar_t* const names[4] = {L"top", L"bottom", L"left", L"right"};
    for (int i = 0; i < 4; ++i) {
        if (images[i]->GetBitCount() != 24 || images[i]->IsEmpty()) {
            Trace(L"%ls: %ls is not a 24-bit image; result left unchanged\n", operation, names[i]);
            return false;
        }
        if (images[i]->GetWidth() != top.GetWidth() || images[i]->GetHeight() != top.GetHeight()) {
            Trace(L"%ls: %ls is %dx%d, top is %dx%d; result left unchanged\n", operation, names[i],
                  images[i]->GetWidth(), images[i]->GetHeight(), top.GetWidth(), top.GetHeight());
            return false;
        }
    }
    if (needPyramid && !ReducibleToLevels(top.GetWidth(), top.GetHeight(), kLevels)) {
        Trace(L"%ls: %dx%d is too small for %d pyramid levels; result left unchanged\n", operation, top.GetWidth(),
              top.GetHeight(), kLevels);
        return false;
    }
    return true;
}

}  // namespace holo4
