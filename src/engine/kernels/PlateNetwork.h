// Pieces of the figure-of-eight plate tank shared by the plate, extended-plate and diffused-echo kernels:
// the colour one-pole, the early-reflection paths, the input diffusers and the plates' input stage built
// from them, one tank half and the fourteen-tap output sums; the per-block views of a kernel's lines and
// taps, advanced in runs; and the check that a mode's lines exist before a kernel touches them. Internal
// to the processing folder; allocation-free.
#pragma once

#include "engine/NetworkTables.h"
#include "engine/ReverbEngine.h"
#include "engine/kernels/BlockFrame.h"
#include "processing/DelayElements.h"

namespace ulvetta {

// The colour low-pass, a one-pole computed in single precision; the state is kept as a double.
ULVETTA_ALWAYS_INLINE double ColourStep(double& state, double x, double cutoff) {
    const float s = static_cast<float>(state);
    const float c = s + (static_cast<float>(x) - s) * static_cast<float>(cutoff);
    state = c;
    return c;
}

// Left early path: allpass, then a plain delay; the impulse arrives after the delay's length.
ULVETTA_ALWAYS_INLINE double EarlyLeft(LineView* early, double c) { return Delay(early[2], AllpassA(early[0], c)); }

// Right early path: plain delay, then allpass.
ULVETTA_ALWAYS_INLINE double EarlyRight(LineView* early, double c) { return AllpassB(early[5], Delay(early[3], c)); }

// The four input diffusers in series.
template <Reads kReads>
ULVETTA_ALWAYS_INLINE double Diffuse(RunLine* lines, int32_t j, double x) {
    const double a = AllpassA(At<kReads>(lines[0], j), x);
    const double b = AllpassA(At<kReads>(lines[1], j), a);
    const double c = AllpassA(At<kReads>(lines[2], j), b);
    return AllpassA(At<kReads>(lines[3], j), c);
}

// The plates' input stage over one block: for each frame the colour low-pass, the two early-reflection
// paths, the pre-delay and the four input diffusers with their crossfade. Holds the block's coefficients,
// the colour state and the pre-delay position; Store puts the last two back.
struct PlateInput {
    LineView* early;
    PreDelayView pre;
    bool usePreDelay, crossfade;
    double cutoff, diffusionCoef, earlyGain;
    double colour;

    PlateInput(const ReverbEngine& e, PreDelayLine& preDelay, LineView* earlyLines)
        : early(earlyLines),
          pre(ViewOf(preDelay)),
          usePreDelay(e.preDelayOn && pre.length > 0),
          crossfade(e.diffusion != 100),
          cutoff(e.colourCutoff),
          diffusionCoef(e.diffusionCoef),
          earlyGain(e.earlyGain),
          colour(e.colourState) {}

    // The tank's input for mono sample m; eL and eR receive the early paths' output.
    template <Reads kDiffusers>
    ULVETTA_ALWAYS_INLINE double Step(RunLine* lines, int32_t j, float m, double& eL, double& eR) {
        const double c = ColourStep(colour, m, cutoff);
        eL = EarlyLeft(early, c) * earlyGain;
        eR = EarlyRight(early, c) * earlyGain;
        const double p = usePreDelay ? PreDelayStep(pre, c) : c;
        const double d = Diffuse<kDiffusers>(lines, j, p);
        return crossfade ? diffusionCoef * d + (1.0 - diffusionCoef) * p : d;
    }

    void Store(ReverbEngine& e, PreDelayLine& preDelay) const {
        StoreIndex(preDelay, pre);
        e.colourState = colour;
    }
};

// One tank half from its input u: allpass (second form), an optional crossfade with its input, the
// (possibly modulated) delay, the damping one-pole and the second allpass. Returns the half's output, which
// the caller writes into the half's end line. first is the index of the half's first allpass (4 or 8).
template <Reads kReads>
ULVETTA_ALWAYS_INLINE double TankHalf(RunLine* lines, int32_t j, int first, double u, bool crossfade,
                                      double diffusionCoef, double decayCoef, double dampingCoef,
                                      double& dampingState) {
    double v = AllpassB(At<kReads>(lines[first], j), u);
    if (crossfade) v = diffusionCoef * v + (1.0 - diffusionCoef) * u;
    const double w = Delay(At<kReads>(lines[first + 1], j), v);
    dampingState = w + (dampingState - w) * dampingCoef;
    return AllpassA(At<kReads>(lines[first + 2], j), decayCoef * dampingState);
}

// The seven-tap sums of the plate, summed in the order written: taps 0..6 read lines 9, 9, 10, 11, 5, 6, 7
// (left), taps 7..13 lines 5, 5, 6, 7, 9, 10, 11 (right).
ULVETTA_ALWAYS_INLINE double PlateTapsLeft(const LineRuns& r, int32_t j) {
    return r.Tap(1, j) + r.Tap(0, j) - r.Tap(2, j) + r.Tap(3, j) - r.Tap(4, j) - r.Tap(5, j) - r.Tap(6, j);
}

ULVETTA_ALWAYS_INLINE double PlateTapsRight(const LineRuns& r, int32_t j) {
    return r.Tap(8, j) + r.Tap(7, j) - r.Tap(9, j) + r.Tap(10, j) - r.Tap(11, j) - r.Tap(12, j) - r.Tap(13, j);
}

// Lines 0..lineCount-1 (and the early lines when early is set) have storage, and taps 0..tapCount-1 point
// inside the lines they read. False before the first rebuild (mode or room size unset) or after a rebuild
// that configured fewer lines than the kernel needs.
bool NetworkReady(const ReverbEngine& e, int lineCount, int tapCount, bool early);

// A kernel's network lines and taps, run by run, and its early lines as stepping views, for the length of
// one block, during which the processor flushes denormals.
struct NetworkViews {
    FlushDenormals flushDenormals;
    LineRuns runs;
    LineView early[ReverbEngine::kEarlyLines];
    bool hasEarly = false;

    ULVETTA_ALWAYS_INLINE void Load(ReverbEngine& e, int lines, int tapsUsed, bool withEarly) {
        runs.Load(e.delayLines, lines, e.outputTaps, network::kTapLine, tapsUsed);
        hasEarly = withEarly;
        if (hasEarly)
            for (int i = 0; i < ReverbEngine::kEarlyLines; ++i) early[i] = ViewOf(e.earlyLines[i]);
    }

    ULVETTA_ALWAYS_INLINE void Store(ReverbEngine& e) const {
        runs.Store(e.delayLines, e.outputTaps);
        if (hasEarly)
            for (int i = 0; i < ReverbEngine::kEarlyLines; ++i) StoreIndex(e.earlyLines[i], early[i]);
    }
};

}  // namespace ulvetta
