// Per-order tables of the real FFT and the library-wide cache that builds them on first use.
// An order's tables are immutable once published, so transforms read them without a lock.
#pragma once

#include <cstddef>
#include <cstdint>

namespace ulvetta {
namespace spectral {

// Tables of a real transform of order `order` (N = 2^order reals), computed through a half-length complex
// transform of M = N/2 points. Only built for order >= 2. All arrays are interleaved complex floats
// (re, im), 32-byte aligned, carved from one block.
struct FftTables {
    int order = 0;
    std::size_t m = 0;    // complex points
    int log2m = 0;
    // Radix-4 stages of span L = 1, 4, 16, ... (log2m / 2 of them); a radix-2 stage of span M/2 follows
    // when log2m is odd. Stage s keeps, for each run of four j (0 <= j < L), the twiddles W^j, W^2j, W^3j
    // (W = e^(-2 pi i / 4L)) as three runs of four complex values: 24 floats per run.
    int radix4Stages = 0;
    const float* radix4Tw[16] = {};
    const float* radix2Tw = nullptr;  // W_M^j, 0 <= j < M/2
    // Real split, k = 0 .. M/2: forward 0.5 i W_N^k, inverse i conj(W_N^k).
    const float* splitFwd = nullptr;
    const float* splitInv = nullptr;
    // Bit reversal over log2m - 2 bits of j, 0 <= j < M/4 (log2m >= 2). The reversal of the full index
    // is (reverse of its low 2 bits) << (log2m - 2) | revQuarter[j >> 2]; the reversal over fewer bits k
    // is revQuarter[j] >> (log2m - 2 - k).
    const std::uint32_t* revQuarter = nullptr;
    void* block = nullptr;  // the one allocation holding everything above
};

// The tables of `order` (2..31), built on first use under the cache's lock; null when memory is short.
const FftTables* acquireTables(int order);
// Frees the tables of `order` (no transform of that order may be running).
void releaseTables(int order);

// out[reverse(j)] = in[j] for the M complex values; in == out permutes in place, otherwise they must not
// overlap. The plain version, for the smallest orders and processors without SIMD.
void bitReverse(const FftTables& t, const float* in, float* out);

// The arithmetic kernels of one instruction set. All of them work on tables of order >= 2.
struct FftKernels {
    // Complex FFT of the M values in `in` into `out` (in == out: in place; otherwise no overlap);
    // `inverse` flips the sign. Includes the bit-reversal permutation.
    void (*complexFft)(const FftTables& t, const float* in, float* out, bool inverse);
    // Turns the half-length complex spectrum into the real spectrum, RCPerm layout, in place.
    void (*splitForward)(const FftTables& t, float* data);
    // Undoes splitForward and multiplies by scale (a power of two, so it changes no rounding).
    void (*splitInverse)(const FftTables& t, float* data, float scale);
    // pairs complex products dst[j] *= src[j] in double precision, j counted in complex values.
    void (*multiplyPairs)(const float* src, float* dst, std::size_t pairs);
    // The FIR dot product sum h[i] w[i], i < n (a multiple of 8), in double precision with eight running
    // sums (sum k takes the i with i mod 8 = k), combined as ((s0 + s1) + (s2 + s3)) + ((s4 + s5) + (s6 + s7)).
    // The same additions in the same order on every instruction set.
    double (*dot8)(const float* h, const float* w, std::size_t n);
};

enum class Isa { Scalar, Sse2, Avx2 };

const FftKernels& scalarKernels();
const FftKernels& sse2Kernels();
const FftKernels& avx2Kernels();

// The kernels in use: the best the processor supports, unless a test chose another with selectIsa.
const FftKernels& activeKernels();
Isa activeIsa();
// Chooses the instruction set; false (and no change) if this build or processor lacks it.
bool selectIsa(Isa isa);

}  // namespace spectral
}  // namespace ulvetta
