// The per-sample elements the delay-network kernels are wired from: a delay line used as a plain delay,
// as an allpass of either sign form, as a write-only or comb line read through output taps; the pre-delay
// step and output taps. All inline, no allocation, double precision; no stored value is ever denormal.
//
// The elements work on a LineView, a plain copy of a DelayLine's storage pointer, position, gain and
// modulator taken at the start of a block (ViewOf) and whose position is stored back at its end
// (StoreIndex): inside the per-sample loop nothing is reached through the owning records.
//
// Index convention of a network line: the write index moves downwards (decremented after each write,
// wrapping from -1 to length - 1). Before a write, samples[writeIndex] is the oldest entry (delay = length);
// samples[writeIndex + k] (mod length) was written k samples ago.
#pragma once

#include <cfloat>
#include <cmath>
#include <cstdint>

#include "processing/DelayLine.h"

// The elements run millions of times per second; inlining them even in unoptimised (debug and sanitizer)
// builds keeps those builds fast enough to run long renders in the tests.
#if defined(__GNUC__)
#define ULVETTA_ALWAYS_INLINE inline __attribute__((always_inline))
#else
#define ULVETTA_ALWAYS_INLINE inline
#endif

namespace ulvetta {

struct LineView {
    double* samples;   // length doubles owned by the DelayLine
    int32_t length;
    int32_t writeIndex;
    double gain;
    Modulator* mod;    // null when the line is not modulated
};

inline LineView ViewOf(DelayLine& l) { return {l.samples.get(), l.length, l.writeIndex, l.gain, l.mod.get()}; }
inline void StoreIndex(DelayLine& l, const LineView& v) { l.writeIndex = v.writeIndex; }

// The pre-delay line's storage and position for the length of a block.
struct PreDelayView {
    double* samples;
    int32_t length;
    int32_t writeIndex;
};

inline PreDelayView ViewOf(PreDelayLine& l) { return {l.samples.get(), l.length, l.writeIndex}; }
inline void StoreIndex(PreDelayLine& l, const PreDelayView& v) { l.writeIndex = v.writeIndex; }

ULVETTA_ALWAYS_INLINE void StepDown(LineView& l) {
    if (--l.writeIndex < 0) l.writeIndex = l.length - 1;
}

// Every value stored into a recirculating line passes here: a denormal (or zero) becomes an exact 0.0, so
// that a decaying tail never leaves denormal numbers in the network, where every operation on them would
// be many times slower. Only values below 2.2e-308 change, some 300 orders of magnitude below the
// -313 dB flush threshold, so no output sample is affected.
ULVETTA_ALWAYS_INLINE double NoDenormal(double v) { return std::fabs(v) < DBL_MIN ? 0.0 : v; }

// The nearest integer to v, ties to even, for 0 <= v < 2^51: adding and removing 2^52 leaves exactly the
// rounded value under the default rounding mode (IEEE arithmetic without reassociation, which the build
// guarantees). Cheaper than a library call on baseline x86-64.
ULVETTA_ALWAYS_INLINE double RoundToEven(double v) {
    constexpr double kShift = 4503599627370496.0;  // 2^52
    return (v + kShift) - kShift;
}

// Reads a modulated line at a delay of length - m samples, m being the modulator's current excursion,
// interpolating linearly between the two stored neighbours that enclose that delay. m is split into its
// nearest integer n and a remainder f in [-0.5, 0.5]; a positive f leans towards the newer neighbour
// (one sample less delay), a negative f towards the older one (one sample more delay), so both weights
// stay within 0..1 and the read never amplifies. The neighbour is chosen without a branch.
ULVETTA_ALWAYS_INLINE double ModulatedRead(LineView& l) {
    // The excursion is never negative (a half sine from 0 to depth): with i its whole part and g its
    // fraction, the read point lies between the entries i and i + 1 samples newer than the oldest, so
    // this is the interpolation above without the rounding and the choice of side.
    const double m = l.mod->Tick();
    const int32_t i = static_cast<int32_t>(m);
    const double g = m - i;
    int32_t p = l.writeIndex - i;
    if (p < 0) p += l.length;
    const int32_t q = (p == 0 ? l.length : p) - 1;
    return (1.0 - g) * l.samples[p] + g * l.samples[q];
}

// The line's output before this sample's write: the oldest entry, or the modulated read.
ULVETTA_ALWAYS_INLINE double ReadLine(LineView& l) { return l.mod ? ModulatedRead(l) : l.samples[l.writeIndex]; }

// Plain delay of length samples (less the modulation excursion when modulated).
ULVETTA_ALWAYS_INLINE double Delay(LineView& l, double x) {
    const double z = ReadLine(l);
    l.samples[l.writeIndex] = NoDenormal(x);
    StepDown(l);
    return z;
}

// Allpass, first sign form: v = x - g z stored, y = g v + z.
ULVETTA_ALWAYS_INLINE double AllpassA(LineView& l, double x) {
    const double z = ReadLine(l);
    const double v = x - l.gain * z;
    l.samples[l.writeIndex] = NoDenormal(v);  // the output uses v as computed: the flush stays off its path
    StepDown(l);
    return l.gain * v + z;
}

// Allpass, second sign form: v = x + g z stored, y = z - g v.
ULVETTA_ALWAYS_INLINE double AllpassB(LineView& l, double x) {
    const double z = ReadLine(l);
    const double v = x + l.gain * z;
    l.samples[l.writeIndex] = NoDenormal(v);
    StepDown(l);
    return z - l.gain * v;
}

// Stores x without producing a value (the line is read through taps or Oldest). A modulator only advances,
// so that its phase keeps running in step with the modulated lines.
ULVETTA_ALWAYS_INLINE void WriteOnly(LineView& l, double x) {
    l.samples[l.writeIndex] = NoDenormal(x);
    StepDown(l);
    if (l.mod) l.mod->Advance();
}

// Recirculating comb read through taps: stores x + g times the line's output.
ULVETTA_ALWAYS_INLINE void CombWrite(LineView& l, double x) {
    const double z = ReadLine(l);
    l.samples[l.writeIndex] = NoDenormal(x + l.gain * z);
    StepDown(l);
}

// The sample about to be overwritten (delay = length), without stepping or modulation.
ULVETTA_ALWAYS_INLINE double Oldest(const LineView& l) { return l.samples[l.writeIndex]; }

// Pre-delay: returns the sample stored length samples ago and stores x; this line moves upwards.
ULVETTA_ALWAYS_INLINE double PreDelayStep(PreDelayView& l, double x) {
    const double out = l.samples[l.writeIndex];
    l.samples[l.writeIndex] = x;
    if (++l.writeIndex == l.length) l.writeIndex = 0;
    return out;
}

// Moves a tap along with its line's write index; done once per sample after the lines are written.
ULVETTA_ALWAYS_INLINE void StepTap(OutputTap& t) {
    if (--t.index < 0) t.index = t.length - 1;
}

ULVETTA_ALWAYS_INLINE double ReadTap(const LineView& l, const OutputTap& t) { return l.samples[t.index]; }

// A kernel's output taps for the length of a block, positions and lengths in separate arrays so that the
// per-sample step of all taps compiles to a few vector operations.
struct TapViews {
    static constexpr int kMaxTaps = 20;
    int32_t index[kMaxTaps];
    int32_t length[kMaxTaps];
};

ULVETTA_ALWAYS_INLINE void StepTaps(TapViews& t, int count) {
    for (int i = 0; i < count; ++i) t.index[i] = (t.index[i] == 0 ? t.length[i] : t.index[i]) - 1;
}

ULVETTA_ALWAYS_INLINE double ReadTap(const LineView& l, const TapViews& t, int i) { return l.samples[t.index[i]]; }

}  // namespace ulvetta
