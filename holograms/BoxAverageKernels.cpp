// The division step of the box averages, vectorised with Highway (dispatched at run time);
// PlainDivideSums is its definition.
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "holograms/BoxAverageKernels.cpp"
#include <hwy/foreach_target.h>  // IWYU pragma: keep
#include <hwy/highway.h>

#include "holograms/BoxAverageInternal.h"

HWY_BEFORE_NAMESPACE();
namespace holo {
namespace HWY_NAMESPACE {
namespace hn = hwy::HWY_NAMESPACE;

// A single-precision estimate of sum / area is off by at most one for sums below 2^24; one
// correction step in each direction makes it the exact truncated quotient.
void DivideSums(const uint32_t* sums, uint8_t* out, size_t n, uint32_t area) {
    const hn::ScalableTag<int32_t> di;
    const hn::Rebind<float, decltype(di)> df;
    const hn::Rebind<uint8_t, decltype(di)> d8;
    const size_t lanes = hn::Lanes(di);
    const auto divisor = hn::Set(di, static_cast<int32_t>(area));
    const auto inverse = hn::Set(df, 1.0f / static_cast<float>(area));
    const auto one = hn::Set(di, 1);
    size_t i = 0;
    for (; i + lanes <= n; i += lanes) {
        const auto sum = hn::BitCast(di, hn::LoadU(hn::Rebind<uint32_t, decltype(di)>(), sums + i));
        auto q = hn::ConvertTo(di, hn::Mul(hn::ConvertTo(df, sum), inverse));
        q = hn::IfThenElse(hn::Gt(hn::Mul(q, divisor), sum), hn::Sub(q, one), q);
        q = hn::IfThenElse(hn::Lt(sum, hn::Mul(hn::Add(q, one), divisor)), q, hn::Add(q, one));
        hn::StoreU(hn::DemoteTo(d8, q), d8, out + i);
    }
    PlainDivideSums(sums + i, out + i, n - i, area);
}

}  // namespace HWY_NAMESPACE
}  // namespace holo
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace holo {

HWY_EXPORT(DivideSums);

void PlainDivideSums(const uint32_t* sums, uint8_t* out, size_t n, uint32_t area) {
    for (size_t i = 0; i < n; ++i) out[i] = static_cast<uint8_t>(sums[i] / area);
}

void FastDivideSums(const uint32_t* sums, uint8_t* out, size_t n, uint32_t area) {
    // 255 * area + area must stay below 2^24 (exact floats) and within int32 products.
    if (area == 0 || area > (1u << 24) / 256) {
        PlainDivideSums(sums, out, n, area);
        return;
    }
    HWY_DYNAMIC_DISPATCH(DivideSums)(sums, out, n, area);
}

}  // namespace holo
#endif  // HWY_ONCE
