#pragma once

// The division step of the box averages: window sums to average bytes. Internal to the
// library; the tests compare the vector version with the plain one, which defines the result.

#include <cstddef>
#include <cstdint>

namespace holo {

// out[i] = sums[i] / area (truncating); the sums are at most 255 * area.
void PlainDivideSums(const uint32_t* sums, uint8_t* out, size_t n, uint32_t area);
// The same, vectorised where the area allows an exact single-precision estimate (sums below
// 2^24); otherwise the plain loop.
void FastDivideSums(const uint32_t* sums, uint8_t* out, size_t n, uint32_t area);

}  // namespace holo
