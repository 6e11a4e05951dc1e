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

    DelayLine* lines = delayLines;
    DelayLine* early = earlyLines;
    const OutputTap* taps = outputTaps;
    const bool crossfade = (diffusion != 100);
    const bool weighted = (mode == 6);
    const double dc = diffusionCoef, decayK = decayCoef, dampK = dampingCoef;
    const bool usePreDelay = preDelayOn && preDelayLine.length > 0;
    wetPeak_ = 0.0f;
    for (int i = 0; i < frames; ++i) {
        const double c = ColourStep(colourState, monoBuffer[i], colourCutoff);
        const double eL = EarlyLeft(early, c) * earlyGain;
        const double eR = EarlyRight(early, c) * earlyGain;
        const double p = usePreDelay ? PreDelayStep(preDelayLine, c) : c;
        double d = Diffuse(lines, p);
        if (crossfade) d = dc * d + (1.0 - dc) * p;

        const double u = decayK * Oldest(lines[11]) + d;
        CombWrite(lines[17], u);
        const double t = TankHalf(lines, 4, u, crossfade, dc, decayK, dampK, dampingStateLeft);
        CombWrite(lines[12], t);
        WriteOnly(lines[13], t);
        WriteOnly(lines[7], t);

        const double u2 = decayK * Oldest(lines[7]) + d;
        WriteOnly(lines[19], u2);
        const double t2 = TankHalf(lines, 8, u2, false, dc, decayK, dampK, dampingStateRight);
        CombWrite(lines[14], t2);
        WriteOnly(lines[15], t2);
        WriteOnly(lines[11], t2);

        for (int k = 0; k < 20; ++k) StepTap(outputTaps[k]);
        double wetLeft, wetRight;
        if (!weighted) {
            wetLeft = PlateTapsLeft(lines, taps) + ReadTap(lines[12], taps[14]) - ReadTap(lines[14], taps[15]) +
                      ReadTap(lines[19], taps[18]) + eL;
            wetRight = PlateTapsRight(lines, taps) + ReadTap(lines[13], taps[16]) -
                       ReadTap(lines[15], taps[17]) + ReadTap(lines[17], taps[19]) + eR;
        } else {
            wetLeft = -0.3 * ReadTap(lines[10], taps[2]) + 2.0 * ReadTap(lines[11], taps[3]) -
                      0.3 * ReadTap(lines[6], taps[5]) - 2.0 * ReadTap(lines[7], taps[6]) +
                      2.0 * ReadTap(lines[12], taps[14]) - 2.0 * ReadTap(lines[14], taps[15]) +
                      0.3 * ReadTap(lines[19], taps[18]) + eL;
            wetRight = -0.3 * ReadTap(lines[6], taps[9]) + 2.0 * ReadTap(lines[7], taps[10]) -
                       0.3 * ReadTap(lines[10], taps[12]) - 2.0 * ReadTap(lines[11], taps[13]) +
                       2.0 * ReadTap(lines[13], taps[16]) - 2.0 * ReadTap(lines[15], taps[17]) +
                       0.3 * ReadTap(lines[17], taps[19]) + eR;
        }
        mixOutput(outLeft, outRight, inLeft, inRight, i, stride, accumulate, wetLeft, wetRight);
    }
    if (meterSource == 2) {
        raiseLevel(wetPeak_);
        cleanSmoothState();
    }
    // The comb lines are left alone: only the allpass lines and the one-pole states are flushed.
    FlushAllpassLines(*this);
    flushKernelStates();
    if (meterSource == 1) meterOutput(outLeft, outRight, frames, stride);
    return trimmedLength(outLeft, outRight, frames, stride);
}

}  // namespace ulvetta
