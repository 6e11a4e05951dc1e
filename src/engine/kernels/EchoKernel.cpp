// The diffused echo (mode 7): a stereo feedback echo whose memory is the pre-delay line, holding interleaved
// left/right frames. Each repeat is darkened by the colour low-pass, fed back with a 0.4 cross-feed between
// the channels, and the sum of both channels drives the plate tank. The input stage stays stereo. Runs on
// the streaming thread under the core's lock.
#include "engine/kernels/PlateNetwork.h"

namespace ulvetta {

namespace {
constexpr double kCrossFeed = 0.4;  // share of the other channel's repeat fed back into each channel
}

int ReverbEngine::processEcho(float* outLeft, float* outRight, const float* inLeft, const float* inRight,
                              int frames, int stride, int accumulate, int flush) {
    if (!NetworkReady(*this, 12, 14, false) || preDelayLine.length < 2)
        return processDry(outLeft, outRight, inLeft, inRight, frames, stride, accumulate, flush);
    // The echo modulates no line; the loop is compiled for that, and with a check at every read for
    // anything else.
    if (ReadsOf(delayLines, 0, 11) == Reads::Plain)
        return runEcho<Reads::Plain>(outLeft, outRight, inLeft, inRight, frames, stride, accumulate, flush);
    return runEcho<Reads::Checked>(outLeft, outRight, inLeft, inRight, frames, stride, accumulate, flush);
}

namespace {
// The echo meters before latching the flush flag; its memory, the pre-delay line, is always in the path.
// The input stage stays stereo: gain, then the three filter sections with a state per channel.
constexpr BlockPolicy kEchoBlock = {true, EndOfStream::PreDelayAlways, InputStage::Stereo, true};
}  // namespace

template <Reads kReads>
int ReverbEngine::runEcho(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames,
                          int stride, int accumulate, int flush) {
    return RunBlock<kEchoBlock, &ReverbEngine::echoFrames<kReads>>(outLeft, outRight, inLeft, inRight, frames,
                                                                   stride, accumulate, flush);
}

template <Reads kReads>
ULVETTA_ALWAYS_INLINE void ReverbEngine::echoFrames(float* outLeft, float* outRight, const float* inLeft,
                                                    const float* inRight, int frames, int stride, int accumulate) {
    const float* scratch = monoBuffer.get();  // the filtered input, interleaved
    NetworkViews v;
    v.Load(*this, 12, 14, false);
    RunLine* lines = v.runs.lines;
    double* echo = preDelayLine.samples.get();
    const int32_t echoLength = preDelayLine.length;
    int32_t k = preDelayLine.writeIndex;
    const double dc = diffusionCoef, decayK = decayCoef, dampK = dampingCoef, feedback = echoFeedback;
    const double cutoff = colourCutoff;
    double colourL = colourState, colourR = colourState2, dampLeft = dampingStateLeft, dampRight = dampingStateRight;
    for (int i = 0; i < frames;) {
        const int run = v.runs.Begin(frames - i);
        for (int j = 0; j < run; ++j, ++i) {
            int32_t k1 = k + 1;
            if (k1 >= echoLength) k1 -= echoLength;
            const double cL = ColourStep(colourL, echo[k], cutoff);
            const double cR = ColourStep(colourR, echo[k1], cutoff);

            const double q = Diffuse<kReads>(lines, j, (cL + cR) * dc);
            const double u = decayK * Oldest(At(lines[11], j)) + q;
            WriteOnly(At(lines[7], j), TankHalf<kReads>(lines, j, 4, u, false, dc, decayK, dampK, dampLeft));
            const double u2 = decayK * OldestAfterWrite(lines[7], j) + q;
            WriteOnly(At(lines[11], j), TankHalf<kReads>(lines, j, 8, u2, false, dc, decayK, dampK, dampRight));
            const double tankLeft = PlateTapsLeft(v.runs, j);
            const double tankRight = PlateTapsRight(v.runs, j);

            echo[k] = NoDenormal(scratch[2 * i] + feedback * (cL + kCrossFeed * cR));
            k = k1;
            echo[k] = NoDenormal(scratch[2 * i + 1] + feedback * (cR + kCrossFeed * cL));
            if (++k == echoLength) k = 0;

            mixOutput(outLeft, outRight, inLeft, inRight, i, stride, accumulate, tankLeft + cL, tankRight + cR);
        }
        v.runs.End(run);
    }
    v.Store(*this);
    preDelayLine.writeIndex = k;
    colourState = colourL;
    colourState2 = colourR;
    dampingStateLeft = dampLeft;
    dampingStateRight = dampRight;
}

}  // namespace ulvetta
