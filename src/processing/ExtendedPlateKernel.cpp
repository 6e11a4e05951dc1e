// The twenty-line plates (modes 2 and 6): the plate tank with combs and plain delays hung off both halves,
// read through six more taps per side for a denser echo. Mode 2 sums all taps with weight 1; mode 6 weights
// them for a swelling, "reversed" envelope. Runs on the streaming thread under the core's lock.
#include "processing/PlateNetwork.h"

namespace ulvetta {

int ReverbEngine::processExtendedPlate(float* outLeft, float* outRight, const float* inLeft,
                                       const float* inRight, int frames, int stride, int accumulate, int flush) {
    if (!NetworkReady(*this, 20, 20, true))
        return processDry(outLeft, outRight, inLeft, inRight, frames, stride, accumulate, flush);

    // These plates meter before latching the flush flag.
    if (frames > 0) {
        decayMeter(frames);
        if (meterSource == 0) meterInput(inLeft, inRight, frames, stride);
    }
    latchFlush(flush, preDelayOn);
    if (frames <= 0) return 0;
    makeMono(inLeft, inRight, frames, stride);
    filterMono(frames);

    NetworkViews v;
    v.Load(*this, 20, 20, true);
    LineView* lines = v.lines;
    LineView* early = v.early;
    TapViews& taps = v.taps;
    PreDelayView pre = ViewOf(preDelayLine);
    const bool usePreDelay = preDelayOn && pre.length > 0;
    const bool crossfade = (diffusion != 100);
    const bool weighted = (mode == 6);
    const double dc = diffusionCoef, decayK = decayCoef, dampK = dampingCoef, cutoff = colourCutoff;
    const double eGain = earlyGain;
    double colour = colourState, dampLeft = dampingStateLeft, dampRight = dampingStateRight;
    const float* mono = monoBuffer.get();
    wetPeak_ = 0.0f;
    for (int i = 0; i < frames; ++i) {
        const double c = ColourStep(colour, mono[i], cutoff);
        const double eL = EarlyLeft(early, c) * eGain;
        const double eR = EarlyRight(early, c) * eGain;
        const double p = usePreDelay ? PreDelayStep(pre, c) : c;
        double d = Diffuse(lines, p);
        if (crossfade) d = dc * d + (1.0 - dc) * p;

        const double u = decayK * Oldest(lines[11]) + d;
        CombWrite(lines[17], u);
        const double t = TankHalf(lines, 4, u, crossfade, dc, decayK, dampK, dampLeft);
        CombWrite(lines[12], t);
        WriteOnly(lines[13], t);
        WriteOnly(lines[7], t);

        const double u2 = decayK * Oldest(lines[7]) + d;
        WriteOnly(lines[19], u2);
        const double t2 = TankHalf(lines, 8, u2, false, dc, decayK, dampK, dampRight);
        CombWrite(lines[14], t2);
        WriteOnly(lines[15], t2);
        WriteOnly(lines[11], t2);

        StepTaps(taps, 20);
        double wetLeft, wetRight;
        if (!weighted) {
            wetLeft = PlateTapsLeft(lines, taps) + ReadTap(lines[12], taps, 14) - ReadTap(lines[14], taps, 15) +
                      ReadTap(lines[19], taps, 18) + eL;
            wetRight = PlateTapsRight(lines, taps) + ReadTap(lines[13], taps, 16) -
                       ReadTap(lines[15], taps, 17) + ReadTap(lines[17], taps, 19) + eR;
        } else {
            wetLeft = -0.3 * ReadTap(lines[10], taps, 2) + 2.0 * ReadTap(lines[11], taps, 3) -
                      0.3 * ReadTap(lines[6], taps, 5) - 2.0 * ReadTap(lines[7], taps, 6) +
                      2.0 * ReadTap(lines[12], taps, 14) - 2.0 * ReadTap(lines[14], taps, 15) +
                      0.3 * ReadTap(lines[19], taps, 18) + eL;
            wetRight = -0.3 * ReadTap(lines[6], taps, 9) + 2.0 * ReadTap(lines[7], taps, 10) -
                       0.3 * ReadTap(lines[10], taps, 12) - 2.0 * ReadTap(lines[11], taps, 13) +
                       2.0 * ReadTap(lines[13], taps, 16) - 2.0 * ReadTap(lines[15], taps, 17) +
                       0.3 * ReadTap(lines[17], taps, 19) + eR;
        }
        mixOutput(outLeft, outRight, inLeft, inRight, i, stride, accumulate, wetLeft, wetRight);
    }
    v.Store(*this);
    StoreIndex(preDelayLine, pre);
    colourState = colour;
    dampingStateLeft = dampLeft;
    dampingStateRight = dampRight;
    if (meterSource == 2) {
        raiseLevel(wetPeak_);
        cleanSmoothState();
    }
    flushKernelStates();
    if (meterSource == 1) meterOutput(outLeft, outRight, frames, stride);
    return trimmedLength(outLeft, outRight, frames, stride);
}

}  // namespace ulvetta
