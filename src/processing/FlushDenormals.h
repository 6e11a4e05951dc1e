// While an object of this class lives, the processor takes denormal operands as zero and flushes denormal
// results to zero on the calling thread (on x86-64 the DAZ and FTZ bits of MXCSR); the caller's mode comes
// back when it is destroyed, so a host's own arithmetic is never affected. The delay-network kernels run
// under it, so that a decaying tail never leaves denormal numbers in their lines, where every operation on
// them would be many times slower. Values change only below 2.2e-308, hundreds of orders of magnitude under
// anything audible or the smallest float the output can hold.
//
// kByProcessor tells whether the processor does this here; where it does not, the elements flush each
// stored value themselves.
#pragma once

#if defined(__SSE2__) || defined(_M_X64)
#include <xmmintrin.h>
#define ULVETTA_FLUSH_BY_PROCESSOR 1
#else
#define ULVETTA_FLUSH_BY_PROCESSOR 0
#endif

namespace ulvetta {

class FlushDenormals {
public:
    static constexpr bool kByProcessor = ULVETTA_FLUSH_BY_PROCESSOR != 0;

#if ULVETTA_FLUSH_BY_PROCESSOR
    FlushDenormals() : saved_(_mm_getcsr()) { _mm_setcsr(saved_ | kFlushToZero | kDenormalsAreZero); }
    ~FlushDenormals() { _mm_setcsr(saved_); }
#else
    FlushDenormals() = default;
#endif
    FlushDenormals(const FlushDenormals&) = delete;
    FlushDenormals& operator=(const FlushDenormals&) = delete;

private:
#if ULVETTA_FLUSH_BY_PROCESSOR
    static constexpr unsigned kFlushToZero = 0x8000;      // MXCSR bit 15
    static constexpr unsigned kDenormalsAreZero = 0x0040; // MXCSR bit 6
    unsigned saved_;
#endif
};

}  // namespace ulvetta
