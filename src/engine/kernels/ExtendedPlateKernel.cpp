// The twenty-line plates (modes 2 and 6): the plate tank with combs and plain delays hung off both halves,
// read through six more taps per side for a denser echo. Mode 2 sums all taps with weight 1; mode 6 weights
// them for a swelling, "reversed" envelope. Runs on the streaming thread under the core's lock.
#include "engine/kernels/PlateNetwork.h"

namespace ulvetta {

int ReverbEngine::processExtendedPlate(float* outLeft, float* outRight, const float* inLeft,
                                       const float* inRight, int frames, int stride, int accumulate, int flush) {
    if (!NetworkReady(*this, 20, 20, true))
        return processDry(outLeft, outRight, inLeft, inRight, frames, stride, accumulate, flush);
    // These plates modulate no line; the loop is compiled for that, and with a check at every read for
    // anything else.
    if (ReadsOf(delayLines, 0, 19) == Reads::Plain)
        return runExtendedPlate<Reads::Plain>(outLeft, outRight, inLeft, inRight, frames, stride, accumulate, flush);
    return runExtendedPlate<Reads::Checked>(outLeft, outRight, inLeft, inRight, frames, stride, accumulate, flush);
}

namespace {
// These plates meter before latching the flush flag; the pre-delay line holds the tail while it is on.
constexpr BlockPolicy kExtendedPlateBlock = {true, EndOfStream::PreDelayWhenOn, InputStage::Mono, true};
}  // namespace

template <Reads kReads>
int ReverbEngine::runExtendedPlate(float* outLeft, float* outRight, const float* inLeft, const float* inRight,
                                   int frames, int stride, int accumulate, int flush) {
    constexpr KernelFrames kFrames = &ReverbEngine::extendedPlateFrames<kReads>;
    return RunBlock<kExtendedPlateBlock, kFrames>(outLeft, outRight, inLeft, inRight, frames, stride, accumulate,
                                                  flush);
}

template <Reads kReads>
ULVETTA_ALWAYS_INLINE void ReverbEngine::extendedPlateFrames(float* outLeft, float* outRight, const float* inLeft,
                                                             const float* inRight, int frames, int stride,
                                                             int accumulate) {
    NetworkViews v;
    v.Load(*this, 20, 20, true);
    RunLine* lines = v.runs.lines;
    const LineRuns& r = v.runs;
    PlateInput front(*this, preDelayLine, v.early);
    const bool crossfade = front.crossfade;
    const bool weighted = (mode == 6);
    const double dc = diffusionCoef, decayK = decayCoef, dampK = dampingCoef;
    double dampLeft = dampingStateLeft, dampRight = dampingStateRight;
    const float* mono = monoBuffer.get();
    for (int i = 0; i < frames;) {
        const int run = v.runs.Begin(frames - i);
        for (int j = 0; j < run; ++j, ++i) {
            double eL, eR;
            const double d = front.Step<kReads>(lines, j, mono[i], eL, eR);

            const double u = decayK * Oldest(At(lines[11], j)) + d;
            CombWrite(At<kReads>(lines[17], j), u);
            const double t = TankHalf<kReads>(lines, j, 4, u, crossfade, dc, decayK, dampK, dampLeft);
            CombWrite(At<kReads>(lines[12], j), t);
            WriteOnly(At(lines[13], j), t);
            WriteOnly(At(lines[7], j), t);

            const double u2 = decayK * OldestAfterWrite(lines[7], j) + d;
            WriteOnly(At(lines[19], j), u2);
            const double t2 = TankHalf<kReads>(lines, j, 8, u2, false, dc, decayK, dampK, dampRight);
            CombWrite(At<kReads>(lines[14], j), t2);
            WriteOnly(At(lines[15], j), t2);
            WriteOnly(At(lines[11], j), t2);

            // Taps 14..19 read lines 12, 14, 13, 15, 19 and 17.
            double wetLeft, wetRight;
            if (!weighted) {
                wetLeft = PlateTapsLeft(r, j) + r.Tap(14, j) - r.Tap(15, j) + r.Tap(18, j) + eL;
                wetRight = PlateTapsRight(r, j) + r.Tap(16, j) - r.Tap(17, j) + r.Tap(19, j) + eR;
            } else {
                wetLeft = -0.3 * r.Tap(2, j) + 2.0 * r.Tap(3, j) - 0.3 * r.Tap(5, j) - 2.0 * r.Tap(6, j) +
                          2.0 * r.Tap(14, j) - 2.0 * r.Tap(15, j) + 0.3 * r.Tap(18, j) + eL;
                wetRight = -0.3 * r.Tap(9, j) + 2.0 * r.Tap(10, j) - 0.3 * r.Tap(12, j) - 2.0 * r.Tap(13, j) +
                           2.0 * r.Tap(16, j) - 2.0 * r.Tap(17, j) + 0.3 * r.Tap(19, j) + eR;
            }
            mixOutput(outLeft, outRight, inLeft, inRight, i, stride, accumulate, wetLeft, wetRight);
        }
        v.runs.End(run);
    }
    v.Store(*this);
    front.Store(*this, preDelayLine);
    dampingStateLeft = dampLeft;
    dampingStateRight = dampRight;
}

}  // namespace ulvetta
