// The block processor: the real-time entry into the engine. Runs the common input stage (meter, mono sum,
// filter sections), the kernel of the current mode, the wet/dry mix, the meters and the end-of-stream tail
// trimming. Called on the streaming thread with the core's lock held; allocates only to grow the mono
// scratch buffer.
#include <algorithm>
#include <cmath>
#include <cstring>

#include "engine/kernels/BlockFrame.h"

namespace ulvetta {

namespace {

constexpr double kMeterDecayPerMs = 0.9993910013652971;  // -0.00529 dB per millisecond

// Zero or denormal float: its exponent field is zero.
inline bool exponentIsZero(float v) {
    uint32_t bits;
    std::memcpy(&bits, &v, sizeof bits);
    return (bits & 0x7f800000u) == 0;
}

}  // namespace

void ReverbEngine::raiseLevel(float peak) {
    if (owner != nullptr) owner->level = std::max(owner->level, peak);
}

void ReverbEngine::cleanSmoothState() {
    for (float& s : smoothState)
        if (exponentIsZero(s)) s = 0.0f;
}

void ReverbEngine::latchEndOfStream(int flush, EndOfStream rule) {
    if (rule == EndOfStream::ResponseLength) {
        // The tail is the response's length after the last input frame, counted from the first flush block.
        if (flush && !flushLatched) {
            flushLatched = true;
            tailCountdown = response_ ? std::max(0, response_->irLength - 1) : 0;
        }
        return;
    }
    if (!flushLatched) flushLatched = (flush != 0);
    if (!flushLatched) return;
    // A line out of the signal path is never written again, so whatever it still holds (from before
    // "Pre Delay" went to 0, or from the echo of another mode) would hold the tail open forever.
    const bool preDelayInPath =
        rule == EndOfStream::PreDelayAlways || (rule == EndOfStream::PreDelayWhenOn && preDelayOn);
    if (!preDelayInPath) {
        tailTrimArmed = true;
        return;
    }
    bool silent = true;
    for (int32_t i = 0; i < preDelayLine.length && silent; ++i) {
        const double v = preDelayLine.samples[i];
        silent = (v >= -kTiny && v <= kTiny);
    }
    if (silent) tailTrimArmed = true;
}

void ReverbEngine::decayMeter(int frames) {
    if (owner == nullptr || sampleRate <= 0) return;
    const int ms = static_cast<int>(static_cast<int64_t>(frames) * 1000 / sampleRate);
    owner->level = owner->level * static_cast<float>(std::pow(kMeterDecayPerMs, ms));
}

void ReverbEngine::meterInput(const float* inLeft, const float* inRight, int frames, int stride) {
    const float gain = static_cast<float>(inputGain);
    float peak = 0.0f;
    for (int i = 0; i < frames; ++i) {
        const float l = saneInput(inLeft[i * stride]);
        const float r = saneInput(inRight[i * stride]);
        peak = std::max(peak, smooth(std::max(std::fabs(l), std::fabs(r)) * gain));
    }
    raiseLevel(peak);
    cleanSmoothState();
}

float* ReverbEngine::growScratch(int32_t count) {
    if (monoCapacity < count) {
        // The old buffer goes first, so that the peak footprint stays one buffer.
        monoBuffer.reset();
        monoBuffer.reset(new float[count]);
        monoCapacity = count;
    }
    return monoBuffer.get();
}

void ReverbEngine::makeMono(const float* inLeft, const float* inRight, int frames, int stride) {
    float* mono = growScratch(frames);
    const float gain = static_cast<float>(inputGain);
    for (int i = 0; i < frames; ++i) {
        const float l = saneInput(inLeft[i * stride]);
        const float r = saneInput(inRight[i * stride]);
        mono[i] = (l + r) * 0.5f * gain;
    }
}

namespace {

bool isPassThrough(const BiquadSection& s) {
    return s.b0 == 1.0 && s.b1 == 0.0 && s.b2 == 0.0 && s.a1 == 0.0 && s.a2 == 0.0;
}

// What filtering with the pass-through coefficients leaves in one channel's history: outputs equal to the
// inputs, the last two of them (or the previous ones for a one-sample block).
void passThroughHistory(double& x1, double& x2, double& y1, double& y2, const float* last, int count, int step) {
    if (count > 1) {
        x2 = y2 = flushTiny(last[-step]);
    } else {
        x2 = flushTiny(x1);
        y2 = flushTiny(y1);
    }
    x1 = y1 = flushTiny(last[0]);
}

}  // namespace

// A section set to pass-through leaves the samples as they are, so it is skipped; only its history moves on.
void ReverbEngine::filterMono(int frames) {
    float* mono = monoBuffer.get();
    for (int i = 0; i < 3; ++i) {
        BiquadSection& s = filterSections[i];
        if (!isPassThrough(s))
            ProcessMono(s, mono, frames);
        else
            passThroughHistory(s.x1L, s.x2L, s.y1L, s.y2L, mono + frames - 1, frames, 1);
    }
}

void ReverbEngine::filterStereo(float* frames, int count) {
    for (int i = 0; i < 3; ++i) {
        BiquadSection& s = filterSections[i];
        if (!isPassThrough(s)) {
            ProcessInterleaved(s, frames, count);
            continue;
        }
        passThroughHistory(s.x1L, s.x2L, s.y1L, s.y2L, frames + 2 * (count - 1), count, 2);
        passThroughHistory(s.x1R, s.x2R, s.y1R, s.y2R, frames + 2 * (count - 1) + 1, count, 2);
    }
}

void ReverbEngine::finishMeter() {
    if (meterSource != 1 && meterSource != 2) return;
    raiseLevel(meterPeak_);
    cleanSmoothState();
}

// The colour states (the second is the echo's right channel) and the two damping states.
void ReverbEngine::flushKernelStates() {
    colourState = flushTiny(colourState);
    colourState2 = flushTiny(colourState2);
    dampingStateLeft = flushTiny(dampingStateLeft);
    dampingStateRight = flushTiny(dampingStateRight);
}

int ReverbEngine::trimmedLength(const float* outLeft, const float* outRight, int frames, int stride) const {
    if (!tailTrimArmed) return frames;
    for (int i = frames - 1; i >= 0; --i) {
        const float l = outLeft[i * stride], r = outRight[i * stride];
        if (l < -kTiny || l > kTiny || r < -kTiny || r > kTiny) return i + 1;
    }
    return 0;
}

int ReverbEngine::countedLength(int frames, int flush) {
    if (!flush) return frames;
    const int produced = std::min(frames, tailCountdown);
    tailCountdown -= produced;
    return produced;
}

int ReverbEngine::ProcessBlock(float* outLeft, float* outRight, const float* inLeft, const float* inRight,
                               int frames, int stride, int accumulate, int flush) {
    switch (mode) {
        case 7:
            return processEcho(outLeft, outRight, inLeft, inRight, frames, stride, accumulate, flush);
        case 2:
        case 6:
            return processExtendedPlate(outLeft, outRight, inLeft, inRight, frames, stride, accumulate, flush);
        case 3:
        case 4:
        case 5:
            return processConvolution(outLeft, outRight, inLeft, inRight, frames, stride, accumulate, flush);
        default:
            return processPlate(outLeft, outRight, inLeft, inRight, frames, stride, accumulate, flush);
    }
}

namespace {
// A mode whose network does not exist (yet) passes the dry signal; nothing in a line holds the tail.
constexpr BlockPolicy kDryBlock = {false, EndOfStream::PreDelayNever, InputStage::None, false};
}  // namespace

int ReverbEngine::processDry(float* outLeft, float* outRight, const float* inLeft, const float* inRight,
                             int frames, int stride, int accumulate, int flush) {
    return RunBlock<kDryBlock, &ReverbEngine::dryFrames>(outLeft, outRight, inLeft, inRight, frames, stride,
                                                        accumulate, flush);
}

ULVETTA_ALWAYS_INLINE void ReverbEngine::dryFrames(float* outLeft, float* outRight, const float* inLeft,
                                                   const float* inRight, int frames, int stride, int accumulate) {
    for (int i = 0; i < frames; ++i) mixOutput(outLeft, outRight, inLeft, inRight, i, stride, accumulate, 0.0, 0.0);
}

}  // namespace ulvetta
