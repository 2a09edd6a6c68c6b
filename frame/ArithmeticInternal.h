#pragma once

#include <cstddef>
#include <cstdint>

// Byte kernels of the image arithmetic: the plain definitions and their vector versions.
namespace varnoth {

void PlainAddBytes(const uint8_t* a, const uint8_t* b, uint8_t* out, size_t n);
void PlainSubtractBytes(const uint8_t* a, const uint8_t* b, uint8_t* out, size_t n);
void FastAddBytes(const uint8_t* a, const uint8_t* b, uint8_t* out, size_t n);
void FastSubtractBytes(const uint8_t* a, const uint8_t* b, uint8_t* out, size_t n);

}  // namespace varnoth
