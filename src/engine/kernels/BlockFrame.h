// The block frame around every kernel: the driver that runs the steps common to all of them before and
// after the kernel's frames (RunBlock, shaped by the kernel's BlockPolicy), and the per-frame pieces the
// kernels call inside their loops (meter smoother, wet/dry mix with the wet meter, guard against
// non-finite input), defined inline so that they compile into those loops.
#pragma once

#include <algorithm>
#include <cmath>

#include "engine/ReverbEngine.h"

namespace ulvetta {

// An input sample as the networks take it: a non-finite one (from a faulty upstream source) as silence,
// and one beyond +/-2^20 (120 dB over full scale, as from a float file read with the wrong byte order)
// limited to that, so that no sum or gain of the input stage can overflow and poison the recirculating
// state. Audio within that range passes unchanged.
constexpr float kInputLimit = 1048576.0f;
ULVETTA_ALWAYS_INLINE float saneInput(float v) {
    if (!std::isfinite(v)) return 0.0f;
    return v > kInputLimit ? kInputLimit : (v < -kInputLimit ? -kInputLimit : v);
}

// A mixed output sample as float. A result below the smallest normal float (-759 dB) becomes an exact
// zero instead of a denormal: a decaying tail otherwise sends denormal floats through the conversion, the
// output and the meters for minutes of silence, each many times slower than ordinary arithmetic.
ULVETTA_ALWAYS_INLINE float toOutputFloat(double v) {
    return std::fabs(v) < 1.1754943508222875e-38 ? 0.0f : static_cast<float>(v);
}

// One sample through the meter's 2.1 Hz low-pass (single precision); returns its output.
ULVETTA_ALWAYS_INLINE float ReverbEngine::smooth(float v) {
    const float* c = smoothCoefs;
    float* s = smoothState;  // x1, x2, y1, y2
    const float y = c[0] * v + c[1] * s[0] + c[2] * s[1] - c[3] * s[2] - c[4] * s[3];
    s[1] = s[0];
    s[0] = v;
    s[3] = s[2];
    s[2] = y;
    return y;
}

// Writes (or adds) one output frame: wet x wetGain + dry input x dryGain, rounded to float; runs the wet
// or the output meter when it is the meter's source.
ULVETTA_ALWAYS_INLINE void ReverbEngine::mixOutput(float* outLeft, float* outRight, const float* inLeft,
                                                   const float* inRight, int frame, int stride, int accumulate,
                                                   double wetLeft, double wetRight, double wet, double dry) {
    const int at = frame * stride;
    const float dryLeft = saneInput(inLeft[at]), dryRight = saneInput(inRight[at]);
    float l = toOutputFloat(wetLeft * wet + dryLeft * dry);
    float r = toOutputFloat(wetRight * wet + dryRight * dry);
    if (!std::isfinite(l) || !std::isfinite(r)) {
        // The network's state is no longer finite: this frame gets the dry signal alone, and the block
        // driver silences the networks after the block.
        poisoned_ = true;
        wetLeft = wetRight = 0.0;
        l = toOutputFloat(dryLeft * dry);
        r = toOutputFloat(dryRight * dry);
    }
    if (accumulate) {
        outLeft[at] += l;
        outRight[at] += r;
    } else {
        outLeft[at] = l;
        outRight[at] = r;
    }
    if (meterSource == 2) {
        const float v = toOutputFloat(std::max(std::fabs(wetLeft), std::fabs(wetRight)) * wet);
        meterPeak_ = std::max(meterPeak_, smooth(v));
    } else if (meterSource == 1) {
        // The output as stored (a sum when accumulating; the later channel when both are one buffer).
        meterPeak_ = std::max(meterPeak_, smooth(std::max(std::fabs(outLeft[at]), std::fabs(outRight[at]))));
    }
}

ULVETTA_ALWAYS_INLINE void ReverbEngine::makeStereo(const float* inLeft, const float* inRight, int frames,
                                                    int stride) {
    float* scratch = growScratch(2 * frames);
    const float gain = static_cast<float>(inputGain);
    for (int i = 0; i < frames; ++i) {
        scratch[2 * i] = saneInput(inLeft[i * stride]) * gain;
        scratch[2 * i + 1] = saneInput(inRight[i * stride]) * gain;
    }
}

// One block: the end-of-stream latch, the meter decay and the input meter (in the order the policy states),
// the input stage, the kernel's frames (kFrames writes every output frame), the block's meter and the
// network's denormal clean-up, then the number of frames that carry signal.
template <const BlockPolicy& kPolicy, ReverbEngine::KernelFrames kFrames>
ULVETTA_ALWAYS_INLINE int ReverbEngine::RunBlock(float* outLeft, float* outRight, const float* inLeft,
                                                 const float* inRight, int frames, int stride, int accumulate,
                                                 int flush) {
    if (kPolicy.meterBeforeLatch && frames > 0) meterBlockInput(inLeft, inRight, frames, stride);
    latchEndOfStream(flush, kPolicy.end);
    if (frames <= 0) return 0;
    if (!kPolicy.meterBeforeLatch) meterBlockInput(inLeft, inRight, frames, stride);
    if (kPolicy.input == InputStage::Mono) {
        makeMono(inLeft, inRight, frames, stride);
        filterMono(frames);
    } else if (kPolicy.input == InputStage::Stereo) {
        makeStereo(inLeft, inRight, frames, stride);
        filterStereo(monoBuffer.get(), frames);
    }
    startMeter();
    (this->*kFrames)(outLeft, outRight, inLeft, inRight, frames, stride, accumulate);
    if (poisoned_) {
        poisoned_ = false;
        SilenceNetworks();
    }
    finishMeter();
    if (kPolicy.flushNetworkStates) flushKernelStates();
    if (kPolicy.end == EndOfStream::ResponseLength) return countedLength(frames, flush);
    return trimmedLength(outLeft, outRight, frames, stride);
}

}  // namespace ulvetta
