// Byte-vector pieces shared by the vector rows of the four-image compositions. Included once
// per Highway target from a file that includes hwy/foreach_target.h, hence the toggled guard
// instead of #pragma once.
#if defined(HOLOGRAMS_FOUR_IMAGE_VECTOR_INTERNAL_H_) == defined(HWY_TARGET_TOGGLE)
#ifdef HOLOGRAMS_FOUR_IMAGE_VECTOR_INTERNAL_H_
#undef HOLOGRAMS_FOUR_IMAGE_VECTOR_INTERNAL_H_
#else
#define HOLOGRAMS_FOUR_IMAGE_VECTOR_INTERNAL_H_
#endif

#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace holo4 {
namespace HWY_NAMESPACE {
namespace hn = hwy::HWY_NAMESPACE;

using D8 = hn::ScalableTag<uint8_t>;
using V8 = hn::Vec<D8>;
using M8 = hn::Mask<D8>;

// a >= threshold for unsigned bytes
HWY_INLINE M8 AtLeast(const D8 d, V8 a, uint8_t threshold) { return hn::Eq(hn::Max(a, hn::Set(d, threshold)), a); }

// The largest channel of each of a vector's worth of 24-bit pixels.
HWY_INLINE V8 LargestChannel(const D8 d, const unsigned char* pixels) {
    V8 b, g, r;
    hn::LoadInterleaved3(d, pixels, b, g, r);
    return hn::Max(hn::Max(b, g), r);
}

// Stores, per lane, the pixel of candidate 0, 1, 2 or 3: the first whose mask is set, else 3.
HWY_INLINE void StorePicked(const D8 d, M8 is0, M8 is1, M8 is2, const V8 b[4], const V8 g[4], const V8 r[4],
                            unsigned char* out) {
    auto pick = [&](const V8* ch) {
        return hn::IfThenElse(is0, ch[0], hn::IfThenElse(is1, ch[1], hn::IfThenElse(is2, ch[2], ch[3])));
    };
    hn::StoreInterleaved3(pick(b), pick(g), pick(r), d, out);
}

// Calls plain(x + j, x + j + 1) for every lane j the vector rule did not handle.
template <class Plain>
HWY_INLINE void RedoUnhandledLanes(const D8 d, M8 handled, int x, Plain plain) {
    if (hn::AllTrue(d, handled)) return;
    uint8_t bits[HWY_MAX_BYTES / 8 + 8];
    hn::StoreMaskBits(d, handled, bits);
    const int lanes = static_cast<int>(hn::Lanes(d));
    for (int j = 0; j < lanes; ++j)
        if (!(bits[j >> 3] & (1u << (j & 7)))) plain(x + j, x + j + 1);
}

}  // namespace HWY_NAMESPACE
}  // namespace holo4
HWY_AFTER_NAMESPACE();

#endif  // HOLOGRAMS_FOUR_IMAGE_VECTOR_INTERNAL_H_ toggle
