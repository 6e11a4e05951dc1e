// The per-sample elements the delay-network kernels are wired from: a delay line used as a plain delay,
// as an allpass of either sign form, as a write-only or comb line read through output taps; the pre-delay
// step and output taps. All inline, no allocation, double precision; no stored value is ever denormal
// (inside a run, while the kernel holds its FlushDenormals).
//
// The elements work on one of two plain views of a DelayLine, taken at the start of a block and stored
// back at its end, so that inside the per-sample loop nothing is reached through the owning records:
//   LineView  - the line's storage, position, gain and modulator; each element steps the position, with
//               its wrap-around (the early lines, and single lines in the tests);
//   RunFrame  - one frame of a run (LineRuns): a stretch of frames in which no network line's write
//               position and no output tap wraps, so that frame j of the run writes line k at its starting
//               position - j and no element steps or tests for a wrap.
// Both give an element the same things: the cell at the write position and a store into it, that
// position (for the modulated read), the modulator's excursion, and a step, so that each element below is
// written once for both.
//
// Index convention of a network line: the write index moves downwards (decremented after each write,
// wrapping from -1 to length - 1). Before a write, samples[writeIndex] is the oldest entry (delay = length);
// samples[writeIndex + k] (mod length) was written k samples ago.
#pragma once

#include <algorithm>
#include <cfloat>
#include <cmath>
#include <cstdint>

#include "processing/DelayLine.h"
#include "processing/FlushDenormals.h"

namespace ulvetta {

// A denormal (or zero) becomes an exact 0.0, so that a decaying tail never leaves denormal numbers in the
// network, where every operation on them would be many times slower. Only values below 2.2e-308 change,
// some 300 orders of magnitude below the -313 dB flush threshold, so no output sample is affected. Every
// value a LineView stores passes here; inside a run the processor does the same where it can
// (FlushDenormals).
ULVETTA_ALWAYS_INLINE double NoDenormal(double v) { return std::fabs(v) < DBL_MIN ? 0.0 : v; }

struct LineView {
    double* samples;   // length doubles owned by the DelayLine
    int32_t length;
    int32_t writeIndex;
    double gain;
    Modulator* mod;    // null when the line is not modulated

    static constexpr Reads kReads = Reads::Checked;

    double& cell() const { return samples[writeIndex]; }
    void store(double v) const { samples[writeIndex] = NoDenormal(v); }
    int32_t position() const { return writeIndex; }
    void step() {
        if (--writeIndex < 0) writeIndex = length - 1;
    }
    double excursion() const { return mod->Tick(); }
    void advanceModulator() const {
        if (mod) mod->Advance();
    }
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

// A network line over one run (see LineRuns): its write position at the run's first frame and the cell
// there; for a modulated line, a copy of its modulator's rotation, stepped once per frame of the run.
struct RunLine {
    double* samples;
    int32_t length;
    int32_t writeIndex;
    double gain;
    Modulator* mod;  // null when the line is not modulated
    double* at;      // samples + writeIndex, set when a run begins
    Rotation rotation;
    double depth;
    // Set when the excursion keeps the whole part `whole` through the run and neither neighbour of the
    // modulated read wraps: then the older neighbour in frame j is readAt[-j] and the newer readAt[-j - 1].
    bool steady;
    double whole;
    const double* readAt;  // samples + writeIndex - whole
};

// One frame of a run of a network line: its storage, length, gain and modulator, its write position in
// this frame and the cell there, and how the kernel reads it. Built by At for each element call; the
// compiler keeps none of it beyond the arithmetic.
template <Reads kLineReads = Reads::Checked>
struct RunFrame {
    static constexpr Reads kReads = kLineReads;

    double* samples;
    int32_t length;
    int32_t pos;
    double gain;
    Modulator* mod;
    double* at;    // samples + pos
    RunLine* run;  // for the modulator's rotation and the steady read
    int32_t j;     // the frame within the run

    double& cell() const { return *at; }
    // Inside a run the processor flushes denormals (FlushDenormals) where it can.
    void store(double v) const { *at = FlushDenormals::kByProcessor ? v : NoDenormal(v); }
    int32_t position() const { return pos; }
    void step() const {}  // the run's frame counter moves instead
    double excursion() const {
        const double m = run->depth * run->rotation.sine;
        run->rotation.Step();
        return m;
    }
    void advanceModulator() const {}  // the run's end moves every modulator's phase
};

// A line's frame j of the run; kReads states what the kernel knows of the line's modulation (the caller
// has made sure of it).
template <Reads kReads = Reads::Checked>
ULVETTA_ALWAYS_INLINE RunFrame<kReads> At(RunLine& l, int32_t j) {
    return {l.samples, l.length, l.writeIndex - j, l.gain, l.mod, l.at - j, &l, j};
}

// Reads a modulated line at a delay of length - m samples, m being the modulator's current excursion,
// interpolating linearly between the two stored neighbours that enclose that delay. m is split into its
// nearest integer n and a remainder f in [-0.5, 0.5]; a positive f leans towards the newer neighbour
// (one sample less delay), a negative f towards the older one (one sample more delay), so both weights
// stay within 0..1 and the read never amplifies.
template <class Line>
ULVETTA_ALWAYS_INLINE double InterpolatedRead(const Line& l, double m) {
    // The excursion is never negative (a half sine from 0 to depth): with i its whole part and g its
    // fraction, the read point lies between the entries i and i + 1 samples newer than the oldest, so
    // this is the interpolation above without the rounding and the choice of side.
    const int32_t i = static_cast<int32_t>(m);
    const double g = m - i;
    int32_t p = l.position() - i;
    if (p < 0) p += l.length;
    const int32_t q = (p == 0 ? l.length : p) - 1;
    return (1.0 - g) * l.samples[p] + g * l.samples[q];
}

template <class Line>
ULVETTA_ALWAYS_INLINE double ModulatedRead(const Line& l) {
    return InterpolatedRead(l, l.excursion());
}

// In a steady run (RunLine::steady) both neighbours move with the frame like any cell: the same read
// without splitting the excursion or wrapping.
template <Reads kReads>
ULVETTA_ALWAYS_INLINE double ModulatedRead(const RunFrame<kReads>& l) {
    const double m = l.excursion();
    if (!l.run->steady) return InterpolatedRead(l, m);
    const double g = m - l.run->whole;
    const double* older = l.run->readAt - l.j;
    return (1.0 - g) * older[0] + g * older[-1];
}

// The line's output before this sample's write: the oldest entry, or the modulated read.
template <class Line>
ULVETTA_ALWAYS_INLINE double ReadLine(const Line& l) {
    if constexpr (Line::kReads == Reads::Plain)
        return l.cell();
    else if constexpr (Line::kReads == Reads::Modulated)
        return ModulatedRead(l);
    else
        return l.mod ? ModulatedRead(l) : l.cell();
}

// Plain delay of length samples (less the modulation excursion when modulated).
template <class Line>
ULVETTA_ALWAYS_INLINE double Delay(Line&& l, double x) {
    const double z = ReadLine(l);
    l.store(x);
    l.step();
    return z;
}

// Allpass, first sign form: v = x - g z stored, y = g v + z.
template <class Line>
ULVETTA_ALWAYS_INLINE double AllpassA(Line&& l, double x) {
    const double z = ReadLine(l);
    const double v = x - l.gain * z;
    l.store(v);  // the output uses v as computed: the flush stays off its path
    l.step();
    return l.gain * v + z;
}

// Allpass, second sign form: v = x + g z stored, y = z - g v.
template <class Line>
ULVETTA_ALWAYS_INLINE double AllpassB(Line&& l, double x) {
    const double z = ReadLine(l);
    const double v = x + l.gain * z;
    l.store(v);
    l.step();
    return z - l.gain * v;
}

// Stores x without producing a value (the line is read through taps or Oldest). A modulator only advances,
// so that its phase keeps running in step with the modulated lines.
template <class Line>
ULVETTA_ALWAYS_INLINE void WriteOnly(Line&& l, double x) {
    l.store(x);
    l.step();
    l.advanceModulator();
}

// Recirculating comb read through taps: stores x + g times the line's output.
template <class Line>
ULVETTA_ALWAYS_INLINE void CombWrite(Line&& l, double x) {
    const double z = ReadLine(l);
    l.store(x + l.gain * z);
    l.step();
}

// The sample about to be overwritten (delay = length), without stepping or modulation.
template <class Line>
ULVETTA_ALWAYS_INLINE double Oldest(const Line& l) {
    return l.cell();
}

// In a run, the sample the next frame will overwrite: what Oldest returns for a line that this frame has
// already written and stepped. This one position may lie past the run's end, so it wraps.
ULVETTA_ALWAYS_INLINE double OldestAfterWrite(const RunLine& l, int32_t j) {
    const int32_t p = l.writeIndex - j - 1;
    return l.samples[p < 0 ? p + l.length : p];
}

// Pre-delay: returns the sample stored length samples ago and stores x; this line moves upwards.
ULVETTA_ALWAYS_INLINE double PreDelayStep(PreDelayView& l, double x) {
    const double out = l.samples[l.writeIndex];
    l.samples[l.writeIndex] = x;
    if (++l.writeIndex == l.length) l.writeIndex = 0;
    return out;
}

// How lines first..last (inclusive) of a network are read: Modulated when every one has a modulator,
// Plain when none has, Checked otherwise.
inline Reads ReadsOf(const DelayLine* lines, int first, int last) {
    int modulated = 0;
    for (int i = first; i <= last; ++i) modulated += lines[i].mod != nullptr;
    return modulated == 0 ? Reads::Plain : modulated == last - first + 1 ? Reads::Modulated : Reads::Checked;
}

// A kernel's network lines and output taps for the length of one block, advanced in runs. Every line's
// write position and every tap index moves down by one each frame; a run lasts until the first of them is
// due to wrap (or the block ends), so inside a run frame j reads and writes at fixed offsets from where the
// run began, and the wrap is done once per run for all of them.
//
// An output tap is stepped before it is read, after the lines of its frame have been written: in frame j
// of a run it reads samples[index - 1 - j] of its line, index being its value at the run's start with 0
// taken as length.
//
// A modulated line's rotation is stepped by its reads during the run (a write-only line's is not read) and
// every modulator's phase moves past the run at its end. A run also ends where a modulator's sine is due to
// be recomputed; then all of them are recomputed, which keeps their schedules together.
struct LineRuns {
    static constexpr int kMaxLines = 24;
    static constexpr int kMaxTaps = 20;
    RunLine lines[kMaxLines];
    int32_t tapIndex[kMaxTaps];
    int32_t tapLength[kMaxTaps];
    const double* tapSamples[kMaxTaps];
    const double* tapAt[kMaxTaps];  // samples + index - 1 at the run's start
    int modulated[kMaxLines];       // the lines with a modulator
    int lineCount = 0, tapCount = 0, modulatedCount = 0;

    // Takes lines 0..count-1, and taps 0..taps-1 reading the lines tapLine names (all among those lines).
    ULVETTA_ALWAYS_INLINE void Load(DelayLine* source, int count, const OutputTap* taps, const int* tapLine,
                                    int tapsUsed) {
        lineCount = count;
        tapCount = tapsUsed;
        modulatedCount = 0;
        for (int i = 0; i < lineCount; ++i) {
            DelayLine& l = source[i];
            RunLine& r = lines[i];
            r = {l.samples.get(), l.length, l.writeIndex, l.gain, l.mod.get(), nullptr, Rotation(), 0.0, false, 0.0,
                 nullptr};
            if (r.mod) {
                r.rotation = r.mod->rotation();
                r.depth = r.mod->depth;
                modulated[modulatedCount++] = i;
            }
        }
        for (int i = 0; i < tapCount; ++i) {
            tapIndex[i] = taps[i].index;
            tapLength[i] = taps[i].length;
            tapSamples[i] = lines[tapLine[i]].samples;
        }
    }

    ULVETTA_ALWAYS_INLINE void Store(DelayLine* target, OutputTap* taps) const {
        for (int i = 0; i < lineCount; ++i) target[i].writeIndex = lines[i].writeIndex;
        for (int k = 0; k < modulatedCount; ++k) lines[modulated[k]].mod->rotation() = lines[modulated[k]].rotation;
        for (int i = 0; i < tapCount; ++i) taps[i].index = tapIndex[i] == tapLength[i] ? 0 : tapIndex[i];
    }

    // Starts a run of at most limit (>= 1) frames; returns its length, at least 1.
    ULVETTA_ALWAYS_INLINE int Begin(int limit) {
        int n = limit;
        for (int i = 0; i < lineCount; ++i) {
            RunLine& l = lines[i];
            n = std::min(n, l.writeIndex + 1);
            l.at = l.samples + l.writeIndex;
        }
        for (int i = 0; i < tapCount; ++i) {
            if (tapIndex[i] == 0) tapIndex[i] = tapLength[i];
            n = std::min(n, tapIndex[i]);
            tapAt[i] = tapSamples[i] + tapIndex[i] - 1;
        }
        if (modulatedCount > 0) n = beginModulation(n);
        return n;
    }

    // Ends a run of n frames: every position moves down by n, wrapping where the run ended at 0.
    ULVETTA_ALWAYS_INLINE void End(int n) {
        for (int i = 0; i < lineCount; ++i) {
            RunLine& l = lines[i];
            l.writeIndex -= n;
            if (l.writeIndex < 0) l.writeIndex += l.length;
        }
        for (int i = 0; i < tapCount; ++i) tapIndex[i] -= n;
        for (int k = 0; k < modulatedCount; ++k) lines[modulated[k]].mod->Skip(n);
    }

    // Output tap i in frame j of the run.
    ULVETTA_ALWAYS_INLINE double Tap(int i, int32_t j) const { return tapAt[i][-j]; }

private:
    // Recomputes every modulator's sine when one of them is due, and ends the run where a modulator is due
    // next; where a line is far enough from its wrap, ends it before the modulated read's neighbours would
    // wrap; then marks the lines whose read stays steady through the run. Returns the run's length.
    ULVETTA_ALWAYS_INLINE int beginModulation(int n) {
        bool due = false;
        for (int k = 0; k < modulatedCount; ++k) due |= lines[modulated[k]].mod->FramesBeforeResync() == 0;
        for (int k = 0; k < modulatedCount; ++k) {
            RunLine& l = lines[modulated[k]];
            if (due) {
                l.mod->Resync();
                l.rotation = l.mod->rotation();
            }
            n = std::min(n, l.mod->FramesBeforeResync());
            const int32_t room = l.writeIndex - l.mod->depth;
            if (room >= 1) n = std::min(n, room);
        }
        constexpr double kPi = 3.141592653589793;
        for (int k = 0; k < modulatedCount; ++k) {
            RunLine& l = lines[modulated[k]];
            // The excursion of the run's first frame, and how far it can move in n frames (the sine's slope
            // is at most pi / period per frame), with a margin far above the rotation's rounding.
            const double m = l.depth * l.rotation.sine;
            const double reach = l.depth * (kPi / l.mod->periodLength) * n + 1e-6;
            const int32_t whole = static_cast<int32_t>(m);
            l.steady = m - reach >= whole && m + reach < whole + 1.0 && l.writeIndex - whole >= n;
            l.whole = whole;
            l.readAt = l.samples + (l.writeIndex - whole);
        }
        return n;
    }
};

}  // namespace ulvetta
