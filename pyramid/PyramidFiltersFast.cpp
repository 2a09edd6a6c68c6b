// Fast reduce and expand (placeholder: the plain kernels until the vector kernels land).
#include "pyramid/FiltersInternal.h"

namespace varnoth {

void FastReduce(const CImage& src, CImage& dst, int16_t* work, size_t) { PlainReduce(src, dst, work); }
void FastExpand(const CImage& src, CImage& dst, int16_t* work, size_t) { PlainExpand(src, dst, work); }

}  // namespace varnoth
