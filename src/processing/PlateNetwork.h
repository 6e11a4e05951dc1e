// Pieces of the figure-of-eight plate tank shared by the plate, extended-plate and diffused-echo kernels:
// the colour one-pole, the early-reflection paths, the input diffusers, one tank half and the fourteen-tap
// output sums; the per-block views of a kernel's lines and taps; and the check that a mode's lines exist
// before a kernel touches them. Internal to the processing folder; allocation-free.
#pragma once

#include "engine/ReverbEngine.h"
#include "processing/BlockFrame.h"
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
ULVETTA_ALWAYS_INLINE double Diffuse(LineView* lines, double x) {
    return AllpassA(lines[3], AllpassA(lines[2], AllpassA(lines[1], AllpassA(lines[0], x))));
}

// One tank half from its input u: allpass (second form), an optional crossfade with its input, the
// (possibly modulated) delay, the damping one-pole and the second allpass. Returns the half's output, which
// the caller writes into the half's end line. first is the index of the half's first allpass (4 or 8).
ULVETTA_ALWAYS_INLINE double TankHalf(LineView* lines, int first, double u, bool crossfade, double diffusionCoef,
                                      double decayCoef, double dampingCoef, double& dampingState) {
    double v = AllpassB(lines[first], u);
    if (crossfade) v = diffusionCoef * v + (1.0 - diffusionCoef) * u;
    const double w = Delay(lines[first + 1], v);
    dampingState = w + (dampingState - w) * dampingCoef;
    return AllpassA(lines[first + 2], decayCoef * dampingState);
}

// The seven-tap sums of the plate (taps 0..6 left, 7..13 right), summed in the order written.
ULVETTA_ALWAYS_INLINE double PlateTapsLeft(const LineView* d, const TapViews& t) {
    return ReadTap(d[9], t, 1) + ReadTap(d[9], t, 0) - ReadTap(d[10], t, 2) + ReadTap(d[11], t, 3) -
           ReadTap(d[5], t, 4) - ReadTap(d[6], t, 5) - ReadTap(d[7], t, 6);
}

ULVETTA_ALWAYS_INLINE double PlateTapsRight(const LineView* d, const TapViews& t) {
    return ReadTap(d[5], t, 8) + ReadTap(d[5], t, 7) - ReadTap(d[6], t, 9) + ReadTap(d[7], t, 10) -
           ReadTap(d[9], t, 11) - ReadTap(d[10], t, 12) - ReadTap(d[11], t, 13);
}

// Lines 0..lineCount-1 (and the early lines when early is set) have storage, and taps 0..tapCount-1 point
// inside the lines they read. False before the first rebuild (mode or room size unset) or after a rebuild
// that configured fewer lines than the kernel needs.
bool NetworkReady(const ReverbEngine& e, int lineCount, int tapCount, bool early);

// A kernel's lines and taps as plain views for the length of one block.
struct NetworkViews {
    LineView lines[ReverbEngine::kNetworkLines];
    LineView early[ReverbEngine::kEarlyLines];
    TapViews taps;
    int lineCount = 0, tapCount = 0;
    bool hasEarly = false;

    void Load(ReverbEngine& e, int lines, int tapsUsed, bool withEarly) {
        lineCount = lines;
        tapCount = tapsUsed;
        hasEarly = withEarly;
        for (int i = 0; i < lineCount; ++i) this->lines[i] = ViewOf(e.delayLines[i]);
        if (hasEarly)
            for (int i = 0; i < ReverbEngine::kEarlyLines; ++i) early[i] = ViewOf(e.earlyLines[i]);
        for (int i = 0; i < tapCount; ++i) {
            taps.index[i] = e.outputTaps[i].index;
            taps.length[i] = e.outputTaps[i].length;
        }
    }

    void Store(ReverbEngine& e) const {
        for (int i = 0; i < lineCount; ++i) StoreIndex(e.delayLines[i], lines[i]);
        if (hasEarly)
            for (int i = 0; i < ReverbEngine::kEarlyLines; ++i) StoreIndex(e.earlyLines[i], early[i]);
        for (int i = 0; i < tapCount; ++i) e.outputTaps[i].index = taps.index[i];
    }
};

}  // namespace ulvetta
