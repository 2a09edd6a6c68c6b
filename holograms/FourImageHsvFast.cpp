// Vector form of the byte HSV conversion of whole rows. The scalar RgbToHsv is the
// definition; this performs the same single-precision operations in the same order
// (separate multiplies and adds, correctly rounded divisions, truncating conversions), so
// every byte is the same.
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "holograms/FourImageHsvFast.cpp"
#include <hwy/foreach_target.h>  // IWYU pragma: keep
#include <hwy/highway.h>

#include <cstring>

#include "holograms/FourImageHsvInternal.h"

HWY_BEFORE_NAMESPACE();
namespace holo4 {
namespace HWY_NAMESPACE {
namespace hn = hwy::HWY_NAMESPACE;

using DF = hn::ScalableTag<float>;
using DI = hn::RebindToSigned<DF>;
using D8 = hn::Rebind<uint8_t, DF>;
using VF = hn::Vec<DF>;

// Half away from zero, then truncation toward zero.
hn::Vec<DI> RoundHalfAway(const DF df, VF v) {
    const VF half = hn::Set(df, 0.5f);
    return hn::ConvertTo(DI(), hn::IfThenElse(hn::Gt(v, hn::Zero(df)), hn::Add(v, half), hn::Sub(v, half)));
}

void RgbToHsvRowVector(const unsigned char* src, unsigned char* dst, int n) {
    const DF df;
    const DI di;
    const D8 d8;
    const int lanes = static_cast<int>(hn::Lanes(df));
    int x = 0;
    for (; x + lanes <= n; x += lanes) {
        hn::Vec<D8> b8, g8, r8;
        hn::LoadInterleaved3(d8, src + 3 * x, b8, g8, r8);
        const VF b = hn::ConvertTo(df, hn::PromoteTo(di, b8));
        const VF g = hn::ConvertTo(df, hn::PromoteTo(di, g8));
        const VF r = hn::ConvertTo(df, hn::PromoteTo(di, r8));
        const VF max = hn::Max(b, hn::Max(g, r));
        const VF min = hn::Min(b, hn::Min(g, r));
        const VF delta = hn::Sub(max, min);
        const VF zero = hn::Zero(df);
        // Lanes masked out below may divide by 0; their values are never used.
        const VF s = hn::IfThenElseZero(hn::Gt(max, zero), hn::Mul(hn::Div(delta, max), hn::Set(df, 255.0f)));
        const VF fromR = hn::Div(hn::Sub(g, b), delta);
        const VF fromG = hn::Add(hn::Div(hn::Sub(b, r), delta), hn::Set(df, 2.0f));
        const VF fromB = hn::Add(hn::Div(hn::Sub(r, g), delta), hn::Set(df, 4.0f));
        VF h = hn::IfThenElse(hn::Eq(r, max), fromR, hn::IfThenElse(hn::Eq(g, max), fromG, fromB));
        h = hn::IfThenElseZero(hn::Ge(delta, hn::Set(df, 0.1f)), h);
        VF hue = hn::Mul(h, hn::Set(df, 42.5f));
        hue = hn::IfThenElse(hn::Lt(hue, zero), hn::Add(hue, hn::Set(df, 255.0f)), hue);
        const auto hueInt = hn::Min(hn::Max(RoundHalfAway(df, hue), hn::Zero(di)), hn::Set(di, 255));
        const auto sInt = RoundHalfAway(df, s);
        const auto vInt = hn::ConvertTo(di, max);
        hn::StoreInterleaved3(hn::DemoteTo(d8, hueInt), hn::DemoteTo(d8, sInt), hn::DemoteTo(d8, vInt), d8,
                              dst + 3 * x);
    }
    for (; x < n; ++x) {
        std::memcpy(dst + 3 * x, src + 3 * x, 3);
        RgbToHsv(dst + 3 * x);
    }
}

}  // namespace HWY_NAMESPACE
}  // namespace holo4
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace holo4 {

HWY_EXPORT(RgbToHsvRowVector);

void RgbToHsvRowFast(const unsigned char* src, unsigned char* dst, int n) {
    HWY_DYNAMIC_DISPATCH(RgbToHsvRowVector)(src, dst, n);
}

}  // namespace holo4
#endif  // HWY_ONCE
