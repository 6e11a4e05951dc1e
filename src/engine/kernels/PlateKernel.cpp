// The plate (modes 0 and 1, and any mode value not dispatched elsewhere): a figure-of-eight tank fed by a
// coloured, pre-delayed and diffused mono input, with seven output taps per side plus an early-reflection
// path per side. Runs on the streaming thread under the core's lock; allocation-free.
#include "engine/NetworkTables.h"
#include "engine/kernels/PlateNetwork.h"

namespace ulvetta {

bool NetworkReady(const ReverbEngine& e, int lineCount, int tapCount, bool early) {
    for (int i = 0; i < lineCount; ++i)
        if (!e.delayLines[i].configured()) return false;
    if (early)
        for (const DelayLine& l : e.earlyLines)
            if (!l.configured()) return false;
    for (int i = 0; i < tapCount; ++i) {
        const OutputTap& t = e.outputTaps[i];
        if (t.length != e.delayLines[network::kTapLine[i]].length || t.index < 0 || t.index >= t.length)
            return false;
    }
    return true;
}

int ReverbEngine::processPlate(float* outLeft, float* outRight, const float* inLeft, const float* inRight,
                               int frames, int stride, int accumulate, int flush) {
    if (!NetworkReady(*this, 12, 14, true))
        return processDry(outLeft, outRight, inLeft, inRight, frames, stride, accumulate, flush);
    // The warm plate modulates the six tank lines it reads and nothing else, the classic plate nothing;
    // the loop is compiled for each, and for any other arrangement with a check at every read.
    const Reads diffusers = ReadsOf(delayLines, 0, 3), tank = ReadsOf(delayLines, 4, 6);
    if (diffusers == Reads::Plain && tank == ReadsOf(delayLines, 8, 10)) {
        if (tank == Reads::Plain)
            return runPlate<Reads::Plain, Reads::Plain>(outLeft, outRight, inLeft, inRight, frames, stride,
                                                        accumulate, flush);
        if (tank == Reads::Modulated)
            return runPlate<Reads::Plain, Reads::Modulated>(outLeft, outRight, inLeft, inRight, frames, stride,
                                                            accumulate, flush);
    }
    return runPlate<Reads::Checked, Reads::Checked>(outLeft, outRight, inLeft, inRight, frames, stride,
                                                    accumulate, flush);
}

namespace {
// The flush latch comes first; the pre-delay line holds the tail while "Pre Delay" is on.
constexpr BlockPolicy kPlateBlock = {false, EndOfStream::PreDelayWhenOn, InputStage::Mono, true};
}  // namespace

template <Reads kDiffusers, Reads kTank>
int ReverbEngine::runPlate(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames,
                           int stride, int accumulate, int flush) {
    constexpr KernelFrames kFrames = &ReverbEngine::plateFrames<kDiffusers, kTank>;
    return RunBlock<kPlateBlock, kFrames>(outLeft, outRight, inLeft, inRight, frames, stride, accumulate, flush);
}

template <Reads kDiffusers, Reads kTank>
ULVETTA_ALWAYS_INLINE void ReverbEngine::plateFrames(float* outLeft, float* outRight, const float* inLeft,
                                                     const float* inRight, int frames, int stride, int accumulate) {
    NetworkViews v;
    v.Load(*this, 12, 14, true);
    RunLine* lines = v.runs.lines;
    PlateInput front(*this, preDelayLine, v.early);
    const bool crossfade = front.crossfade;
    const double dc = diffusionCoef, decayK = decayCoef, dampK = dampingCoef;
    double dampLeft = dampingStateLeft, dampRight = dampingStateRight;
    const float* mono = monoBuffer.get();
    for (int i = 0; i < frames;) {
        const int run = v.runs.Begin(frames - i);
        for (int j = 0; j < run; ++j, ++i) {
            double eL, eR;
            const double d = front.Step<kDiffusers>(lines, j, mono[i], eL, eR);

            // Left half, fed back from the right half's end line; then the right half, fed from the left's.
            const double u = decayK * Oldest(At(lines[11], j)) + d;
            WriteOnly(At(lines[7], j), TankHalf<kTank>(lines, j, 4, u, crossfade, dc, decayK, dampK, dampLeft));
            const double u2 = decayK * OldestAfterWrite(lines[7], j) + d;
            WriteOnly(At(lines[11], j), TankHalf<kTank>(lines, j, 8, u2, false, dc, decayK, dampK, dampRight));

            const double wetLeft = PlateTapsLeft(v.runs, j) + eL;
            const double wetRight = PlateTapsRight(v.runs, j) + eR;
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
