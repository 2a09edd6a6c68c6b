// Vector helpers of the bilinear warps, compiled once per Highway target: reading each lane's
// pixel with its right neighbour, taking bytes apart, and storing packed pixels. Included
// from the kernels' per-target sections (the guard toggles with HWY_TARGET_TOGGLE).

#if defined(VARNOTH_GEOMETRY_PIXEL_PAIRS_INL_H_) == defined(HWY_TARGET_TOGGLE)
#ifdef VARNOTH_GEOMETRY_PIXEL_PAIRS_INL_H_
#undef VARNOTH_GEOMETRY_PIXEL_PAIRS_INL_H_
#else
#define VARNOTH_GEOMETRY_PIXEL_PAIRS_INL_H_
#endif

#include <hwy/highway.h>

#include <cstdint>
#include <cstring>

HWY_BEFORE_NAMESPACE();
namespace geometry {
namespace HWY_NAMESPACE {

#if HWY_TARGET != HWY_SCALAR
// One-lane targets take the scalar rules for every pixel.
using D32 = hwy::HWY_NAMESPACE::ScalableTag<int32_t>;
using V32 = hwy::HWY_NAMESPACE::Vec<D32>;
using M32 = hwy::HWY_NAMESPACE::Mask<D32>;
constexpr size_t kMaxLanes = HWY_MAX_BYTES / sizeof(int32_t);

HWY_INLINE V32 byteOf(V32 word, int index) {
    namespace hn = hwy::HWY_NAMESPACE;
    const D32 d;
    return hn::And(hn::ShiftRightSame(word, 8 * index), hn::Set(d, 0xFF));
}

// Reads, for every lane, the pixel at byte offset `at` and its right neighbour. Colour lanes
// read the eight bytes ending at the neighbour (two bytes of the pixel before, then B G R of
// both), split into a low and a high word, so the pixel must not be its row's first. Grey
// lanes read the two bytes into `low`. Gathers are slow on the machines we measured, so each
// lane is one scalar load.
template <int BPP>
HWY_INLINE void loadNeighbourPairs(const uint8_t* bits, V32 at, V32& low, V32& high) {
    namespace hn = hwy::HWY_NAMESPACE;
    const D32 d;
    HWY_ALIGN int32_t offsets[kMaxLanes], lows[kMaxLanes], highs[kMaxLanes];
    const int lanes = static_cast<int>(hn::Lanes(d));
    if constexpr (BPP == 3) {
        hn::Store(hn::Sub(at, hn::Set(d, 2)), d, offsets);
        for (int j = 0; j < lanes; ++j) {
            uint64_t pair;
            std::memcpy(&pair, bits + offsets[j], 8);
            lows[j] = static_cast<int32_t>(static_cast<uint32_t>(pair));
            highs[j] = static_cast<int32_t>(static_cast<uint32_t>(pair >> 32));
        }
        high = hn::Load(d, highs);
    } else {
        hn::Store(at, d, offsets);
        for (int j = 0; j < lanes; ++j) {
            uint16_t pair;
            std::memcpy(&pair, bits + offsets[j], 2);
            lows[j] = pair;
        }
        high = hn::Zero(d);
    }
    low = hn::Load(d, lows);
}

// The four neighbours' bytes of one channel, from the pairs of the upper and lower row.
struct ChannelQuad {
    V32 s00, s10, s01, s11;
};

template <int BPP>
HWY_INLINE ChannelQuad channelOf(V32 low0, V32 high0, V32 low1, V32 high1, int channel) {
    if constexpr (BPP == 1) {
        return {byteOf(low0, 0), byteOf(low0, 1), byteOf(low1, 0), byteOf(low1, 1)};
    } else {
        // Bytes: low = (x, x, B, G) of the pixel, high = (R, B, G, R) of pixel then neighbour.
        switch (channel) {
            case 0: return {byteOf(low0, 2), byteOf(high0, 1), byteOf(low1, 2), byteOf(high1, 1)};
            case 1: return {byteOf(low0, 3), byteOf(high0, 2), byteOf(low1, 3), byteOf(high1, 2)};
            default: return {byteOf(high0, 0), byteOf(high0, 3), byteOf(high1, 0), byteOf(high1, 3)};
        }
    }
}

// Writes the low BPP bytes of every lane to consecutive pixels. Colour: every 128-bit block
// is packed to 12 bytes in the register, then copied.
template <int BPP>
HWY_INLINE void storePixels(V32 pixels, uint8_t* out) {
    namespace hn = hwy::HWY_NAMESPACE;
    const D32 d;
    if constexpr (BPP == 1) {
        const hn::Rebind<uint8_t, D32> d8;
        hn::StoreU(hn::DemoteTo(d8, pixels), d8, out);
    } else {
        const hn::Repartition<uint8_t, D32> d8;
        alignas(16) static constexpr uint8_t kPack[16] = {0, 1, 2, 4, 5, 6, 8, 9, 10, 12, 13, 14, 15, 15, 15, 15};
        HWY_ALIGN uint8_t packed[HWY_MAX_BYTES];
        hn::Store(hn::TableLookupBytes(hn::BitCast(d8, pixels), hn::LoadDup128(d8, kPack)), d8, packed);
        const int blocks = static_cast<int>(hn::Lanes(d)) / 4;
        for (int block = 0; block < blocks; ++block) std::memcpy(out + 12 * block, packed + 16 * block, 12);
    }
}
#endif  // HWY_TARGET != HWY_SCALAR

}  // namespace HWY_NAMESPACE
}  // namespace geometry
HWY_AFTER_NAMESPACE();

#endif  // include guard
