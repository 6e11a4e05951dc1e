// The FFT kernels in plain C++: the fallback without SIMD and the path of the smallest orders.
#include "spectral/FftKernelImpl.h"

namespace ulvetta {
namespace spectral {

namespace {

void complexFft(const FftTables& t, const float* in, float* out, bool inverse) {
    complexFftT<VScalar>(t, in, out, inverse);
}
void splitForward(const FftTables& t, float* x) { splitForwardT<VScalar>(t, x); }
void splitInverse(const FftTables& t, float* x, float scale) { splitInverseT<VScalar>(t, x, scale); }
void multiplyPairs(const float* src, float* dst, std::size_t pairs) {
    for (std::size_t j = 0; j < pairs; ++j) multiplyPairScalar(src + 2 * j, dst + 2 * j);
}

const FftKernels kKernels{&complexFft, &splitForward, &splitInverse, &multiplyPairs, &dot8Scalar};

}  // namespace

const FftKernels& scalarKernels() { return kKernels; }

}  // namespace spectral
}  // namespace ulvetta
