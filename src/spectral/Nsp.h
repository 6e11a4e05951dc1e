// The spectral library: real FFTs with packed spectra, the product of two packed spectra and a
// single-rate FIR filter, all in single precision. The convolution reverbs are built on it.
//
// Sizes and conventions
// - A transform of order m works on N = 2^m real floats, 0 <= m <= 31. Every routine takes the order,
//   never N. Order 0 is a single sample, which is its own spectrum.
// - Forward: X[k] = sum_n x[n] e^(-2 pi i n k / N), unscaled.
//   Inverse: x[n] = (1/N) sum_k X[k] e^(+2 pi i n k / N); FlagNoScale drops the 1/N, so that
//   inverse(forward(x)) = N x.
// - A spectrum of N reals is N floats. X[0] (DC) and X[N/2] (Nyquist) are real; X[k] = R[k] + i I[k].
//     RCPerm:  R[0], R[N/2], R[1], I[1], R[2], I[2], ..., R[N/2-1], I[N/2-1]
//     RCPack:  R[0], R[1], I[1], ..., R[N/2-1], I[N/2-1], R[N/2]
//   (order 1: both are R[0], R[1]). RCPerm is the faster layout and the one nspsMpyRCPerm2 multiplies.
// - Accuracy: single precision throughout. Each output value lies within 2 eps (order + 1) times the
//   root-mean-square magnitude of the exact output values (eps = 2^-24); in practice within a quarter of
//   that. The SSE2 and AVX2 kernels give bit-identical results; AVX2 is chosen at run time
//   when the processor and the operating system support it. No fused multiply-add is used.
// - Alignment: data need no particular alignment.
// - Aliasing: nspsRealFftlNip's inSamps and outSamps are either the same pointer (then it is the
//   in-place transform) or separate arrays; a partial overlap is refused with NspStsBadArg. The same holds
//   for nspsMpyRCPerm2's src and srcDst (the same array squares the spectrum).
//
// Memory and threads
// - The first transform of an order >= 2 (or a call with FlagInitOnly, which accepts null data) builds and
//   caches that order's tables, about 10 bytes per point (2^17 points: 1.1 MB), under a lock; that call
//   allocates. Afterwards the transforms of that order allocate nothing and take no lock. Tables stay
//   until FlagRelease is passed for that order. Orders 0 and 1 need no tables.
// - Any thread may call the transforms at any time, on its own data, including two threads asking for the
//   same order the first time at once. FlagRelease for an order must not overlap any other call that uses
//   that order (the caller keeps it apart; the engine never releases).
// - The status and the handler are library-wide and safe to read and set from any thread.
//
// Failures
// - A routine that fails stores the status code, calls the error handler with the code, its own name and
//   a short message, and returns without touching its data. The default handler does nothing more, so
//   a library error never ends the host application's process. Stand-alone tools may install
//   nspExitErrorHandler, which prints the failure on stderr and ends the process with exit code 1.
#pragma once

#include <cstdint>

namespace ulvetta {

// Flag bits passed with each transform call.
enum : int {
    FlagForward = 1,      // forward transform
    FlagInverse = 2,      // inverse transform
    FlagInitOnly = 4,     // only build the tables of this order, then return
    FlagRelease = 8,      // release the tables of this order and return
    FlagNoScale = 16,     // omit the 1/N of the inverse
    FlagOutPack = 256,    // forward output in RCPack layout
    FlagOutPerm = 512,    // forward output in RCPerm layout
    FlagInPack = 1024,    // inverse input in RCPack layout
    FlagInPerm = 4096,    // inverse input in RCPerm layout
};

// Status codes.
enum : int {
    NspStsOk = 0,
    NspStsBacktrace = -1,
    NspStsBadState = -3,
    NspStsNoMem = -4,
    NspStsBadArg = -5,
    NspStsUnsupported = -6,
    NspStsNoConv = -7,
    NspStsAutoTrace = -8,
};

// --- Real FFTs -----------------------------------------------------------------------------------

// Forward real FFT in place: samps holds N reals on entry and the spectrum on exit.
// flags: FlagForward plus exactly one of FlagOutPerm / FlagOutPack; or FlagInitOnly / FlagRelease.
// FlagNoScale has no effect (the forward transform is unscaled). FlagInverse is not offered here (use
// nspsCcsFftl): it reports NspStsUnsupported.
void nspsRealFftl(float* samps, int order, int flags);

// The same, reading N reals from inSamps (left unchanged) and writing the spectrum to outSamps.
void nspsRealFftlNip(const float* inSamps, float* outSamps, int order, int flags);

// Inverse transform in place: samps holds the spectrum on entry and N reals on exit.
// flags: FlagInverse plus exactly one of FlagInPerm / FlagInPack, optionally FlagNoScale; or FlagInitOnly
// / FlagRelease. FlagForward is not offered here: it reports NspStsUnsupported.
void nspsCcsFftl(float* samps, int order, int flags);

// srcDst = srcDst x src bin by bin, for two RCPerm spectra of order `order`: DC and Nyquist as reals, the
// 2^(order-1) - 1 bins between as complex numbers. Each product is formed in double precision and rounded
// once to float. Allocates nothing; needs no tables.
void nspsMpyRCPerm2(const float* src, float* srcDst, int order);

// --- Status and error handler ----------------------------------------------------------------------

// Called on every failure with the status code, the reporting routine's name and a short message.
using NspErrorHandler = void (*)(int status, const char* routine, const char* message);

// The default: does nothing beyond the status the library has already stored.
void nspRecordErrorHandler(int status, const char* routine, const char* message);
// For stand-alone tools: prints "routine: text (message)" on stderr and ends the process with exit code 1.
void nspExitErrorHandler(int status, const char* routine, const char* message);

// Installs handler (null: the default) and returns the one it replaces.
NspErrorHandler nspRedirectError(NspErrorHandler handler);
// The status code of the last failure (NspStsOk if none since the last nspSetErrStatus).
int nspGetErrStatus();
void nspSetErrStatus(int status);
// The fixed text of a status code; "Unknown error or status code" for codes not listed above.
const char* nspErrorStr(int status);

// --- Single-rate FIR filter ----------------------------------------------------------------------

// The state of one FIR filter, y[n] = sum_k h[k] x[n - k]. A default-constructed state is uninitialised,
// and so is a copy of an initialised one (its marker names the original). The filter keeps a window of
// the last tapsLen inputs inside a buffer that has room for `spare` further samples; when the window
// reaches windowEnd its newest dlyLen samples are moved back to the start. Processing allocates nothing; a state belongs to one thread at a time. Release every
// initialised state with nspFirFree.
struct FirState {
    std::int32_t upFactor = 0, upPhase = 0;      // 1 and 0: single rate
    std::int32_t downFactor = 0, downPhase = 0;  // 1 and 0
    std::int32_t isMultiRate = 0;                // 0
    const void* initMarker = nullptr;            // the state's own address while initialised
    std::int32_t tapsLen = 0;                    // number of taps
    std::int32_t tapsLen8 = 0;                   // tapsLen rounded down to a multiple of 8
    float* taps = nullptr;                       // taps reversed: taps[i] = h[tapsLen - 1 - i]; 32-byte aligned
    std::int32_t dlyLen = 0;                     // tapsLen - 1 past inputs
    std::int32_t spare = 0;                      // max(dlyLen, 127) + 1 steps before the window moves back
    float* buffer = nullptr;                     // dlyLen + spare floats, 32-byte aligned
    float* windowEnd = nullptr;                  // buffer + spare
    float* window = nullptr;                     // start of the current window of tapsLen samples
    const void* phaseTable = nullptr;            // multirate table: always null here
};

// Sets up state for the taps h[0..tapsLen-1] (null: all zero) and the tapsLen - 1 past inputs dlyVals,
// oldest first (null: zeros). Releases the state first if it is initialised. Allocates. Returns nonzero on
// success. A bad argument (NspStsBadArg) leaves the state as it was; a failed allocation (NspStsNoMem)
// leaves it uninitialised.
int nspsFirInit(const float* taps, int tapsLen, const float* dlyVals, FirState* state);
// Loads tapsLen taps h[0..tapsLen-1] (null: all zero). Allocates nothing.
void nspsFirSetTaps(const float* taps, FirState* state);
// Loads the dlyLen past inputs, oldest first (null: zeros). The taps are untouched. Allocates nothing.
void nspsFirSetDlyl(const float* dly, FirState* state);
// Filters one sample: returns sum_k h[k] x[n - k], accumulated in double precision and rounded to float.
// Returns 0 (and reports) for a null or uninitialised state.
float nspsFir(FirState* state, float sample);
// Frees the taps and the buffer and marks the state uninitialised. Reports itself as "nspFirnspFree".
void nspFirFree(FirState* state);

}  // namespace ulvetta
