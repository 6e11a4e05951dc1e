// The per-sample elements the delay-network kernels are wired from: a delay line used as a plain delay,
// as an allpass of either sign form, as a write-only or comb line read through output taps; the pre-delay
// step; output taps; and the denormal flush of a line. All inline, no allocation, double precision.
//
// The elements work on a LineView, a plain copy of a DelayLine's storage pointer, position, gain and
// modulator taken at the start of a block (ViewOf) and whose position is stored back at its end
// (StoreIndex): inside the per-sample loop nothing is reached through the owning records.
//
// Index convention of a network line: the write index moves downwards (decremented after each write,
// wrapping from -1 to length - 1). Before a write, samples[writeIndex] is the oldest entry (delay = length);
// samples[writeIndex + k] (mod length) was written k samples ago.
#pragma once

#include <cmath>
#include <cstdint>
#include <cstring>

#include "processing/BiquadSection.h"
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

// Reads a modulated line at a delay of length - m samples, m being the modulator's current excursion,
// interpolating linearly between the two stored neighbours that enclose that delay. m is split into its
// nearest integer n and a remainder f in [-0.5, 0.5]; a positive f leans towards the newer neighbour
// (one sample less delay), a negative f towards the older one (one sample more delay), so both weights
// always stay within 0..1 and the read never amplifies.
ULVETTA_ALWAYS_INLINE double ModulatedRead(LineView& l) {
    const double m = l.mod->Tick();
    const double n = std::nearbyint(m);  // ties to even under the default rounding mode
    const double f = m - n;
    int32_t p = l.writeIndex - static_cast<int32_t>(n);
    if (p < 0) p += l.length;
    if (f >= 0.0) {
        int32_t q = p - 1;
        if (q < 0) q += l.length;
        return (1.0 - f) * l.samples[p] + f * l.samples[q];
    }
    int32_t q = p + 1;
    if (q == l.length) q = 0;
    return (1.0 + f) * l.samples[p] - f * l.samples[q];
}

// The line's output before this sample's write: the oldest entry, or the modulated read.
ULVETTA_ALWAYS_INLINE double ReadLine(LineView& l) { return l.mod ? ModulatedRead(l) : l.samples[l.writeIndex]; }

// Plain delay of length samples (less the modulation excursion when modulated).
ULVETTA_ALWAYS_INLINE double Delay(LineView& l, double x) {
    const double z = ReadLine(l);
    l.samples[l.writeIndex] = x;
    StepDown(l);
    return z;
}

// Allpass, first sign form: v = x - g z stored, y = g v + z.
ULVETTA_ALWAYS_INLINE double AllpassA(LineView& l, double x) {
    const double z = ReadLine(l);
    const double v = x - l.gain * z;
    l.samples[l.writeIndex] = v;
    StepDown(l);
    return l.gain * v + z;
}

// Allpass, second sign form: v = x + g z stored, y = z - g v.
ULVETTA_ALWAYS_INLINE double AllpassB(LineView& l, double x) {
    const double z = ReadLine(l);
    const double v = x + l.gain * z;
    l.samples[l.writeIndex] = v;
    StepDown(l);
    return z - l.gain * v;
}

// Stores x without producing a value (the line is read through taps or Oldest). A modulator only advances,
// so that its phase keeps running in step with the modulated lines.
ULVETTA_ALWAYS_INLINE void WriteOnly(LineView& l, double x) {
    l.samples[l.writeIndex] = x;
    StepDown(l);
    if (l.mod) l.mod->Tick();
}

// Recirculating comb read through taps: stores x + g times the line's output.
ULVETTA_ALWAYS_INLINE void CombWrite(LineView& l, double x) {
    const double z = ReadLine(l);
    l.samples[l.writeIndex] = x + l.gain * z;
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

// True for zero and for denormal doubles (exponent field zero).
inline bool IsZeroOrDenormal(double v) {
    uint64_t bits;
    std::memcpy(&bits, &v, sizeof bits);
    return (bits & 0x7ff0000000000000ull) == 0;
}

// Denormal flush of a recirculating line, run once per block: only when the most recently written entry
// has fallen below -313 dB is the whole line scanned, and then every zero or denormal entry becomes an exact
// 0.0. Cheap while the line carries signal.
inline void FlushLine(DelayLine& line) {
    if (!line.samples) return;
    const LineView l = ViewOf(line);
    int32_t k = l.writeIndex + 1;
    if (k == l.length) k = 0;
    const double latest = l.samples[k];
    if (!(latest > -kTiny && latest < kTiny)) return;
    for (int32_t i = 0; i < l.length; ++i)
        if (IsZeroOrDenormal(l.samples[i])) l.samples[i] = 0.0;
}

}  // namespace ulvetta
