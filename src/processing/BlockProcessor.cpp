// The block processor: the real-time entry into the engine. Runs the common input stage (meter, mono sum,
// filter sections), the kernel of the current mode, the wet/dry mix, the meters and the end-of-stream tail
// trimming. Called on the streaming thread with the core's lock held; allocates only to grow the mono
// scratch buffer.
#include <algorithm>
#include <cmath>
#include <cstring>

#include "engine/ReverbEngine.h"

namespace ulvetta {

namespace {

constexpr float kMeterDecayPerMs = 0.9993910013652971f;

// A non-finite input sample (from a faulty upstream source) is taken as silence, so that it can never
// poison the recirculating state or the mix.
inline float finiteOrZero(float v) { return std::isfinite(v) ? v : 0.0f; }

// Zero or denormal float: its exponent field is zero.
inline bool exponentIsZero(float v) {
    uint32_t bits;
    std::memcpy(&bits, &v, sizeof bits);
    return (bits & 0x7f800000u) == 0;
}

}  // namespace

float ReverbEngine::smooth(float v) {
    const float* c = smoothCoefs;
    float* s = smoothState;  // x1, x2, y1, y2
    const float y = c[0] * v + c[1] * s[0] + c[2] * s[1] - c[3] * s[2] - c[4] * s[3];
    s[1] = s[0];
    s[0] = v;
    s[3] = s[2];
    s[2] = y;
    return y;
}

void ReverbEngine::raiseLevel(float peak) {
    if (owner != nullptr) owner->level = std::max(owner->level, peak);
}

void ReverbEngine::cleanSmoothState() {
    for (float& s : smoothState)
        if (exponentIsZero(s)) s = 0.0f;
}

void ReverbEngine::latchFlush(int flush, bool preDelayInPath) {
    if (!flushLatched) flushLatched = (flush != 0);
    if (!flushLatched) return;
    // A line out of the signal path is never written again, so whatever it still holds (from before
    // "Pre Delay" went to 0, or from the echo of another mode) would hold the tail open forever.
    bool silent = true;
    if (!preDelayInPath) {
        tailTrimArmed = true;
        return;
    }
    for (int32_t i = 0; i < preDelayLine.length && silent; ++i) {
        const double v = preDelayLine.samples[i];
        silent = (v >= -kTiny && v <= kTiny);
    }
    if (silent) tailTrimArmed = true;
}

void ReverbEngine::decayMeter(int frames) {
    if (owner == nullptr || sampleRate <= 0) return;
    const int ms = static_cast<int>(static_cast<int64_t>(frames) * 1000 / sampleRate);
    owner->level = owner->level * std::pow(kMeterDecayPerMs, static_cast<float>(ms));
}

void ReverbEngine::meterInput(const float* inLeft, const float* inRight, int frames, int stride) {
    const float gain = static_cast<float>(inputGain);
    float peak = 0.0f;
    for (int i = 0; i < frames; ++i) {
        const float l = finiteOrZero(inLeft[i * stride]);
        const float r = finiteOrZero(inRight[i * stride]);
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
        const float l = finiteOrZero(inLeft[i * stride]);
        const float r = finiteOrZero(inRight[i * stride]);
        mono[i] = (l + r) * 0.5f * gain;
    }
}

void ReverbEngine::filterMono(int frames) {
    for (int s = 0; s < 3; ++s) ProcessMono(filterSections[s], monoBuffer.get(), frames);
}

void ReverbEngine::mixOutput(float* outLeft, float* outRight, const float* inLeft, const float* inRight,
                             int frame, int stride, int accumulate, double wetLeft, double wetRight) {
    const int at = frame * stride;
    const float l = static_cast<float>(wetLeft * wetGain + finiteOrZero(inLeft[at]) * dryGain);
    const float r = static_cast<float>(wetRight * wetGain + finiteOrZero(inRight[at]) * dryGain);
    if (accumulate) {
        outLeft[at] += l;
        outRight[at] += r;
    } else {
        outLeft[at] = l;
        outRight[at] = r;
    }
    if (meterSource == 2) {
        const float v = static_cast<float>(std::max(std::fabs(wetLeft), std::fabs(wetRight)) * wetGain);
        wetPeak_ = std::max(wetPeak_, smooth(v));
    }
}

void ReverbEngine::meterOutput(const float* outLeft, const float* outRight, int frames, int stride) {
    float peak = 0.0f;
    for (int i = 0; i < frames; ++i)
        peak = std::max(peak, smooth(std::max(std::fabs(outLeft[i * stride]), std::fabs(outRight[i * stride]))));
    raiseLevel(peak);
    cleanSmoothState();
}

void ReverbEngine::flushKernelStates() {
    colourState = flushTiny(colourState);
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
            // The convolution kernel is not part of this build yet: these modes pass the dry signal.
            return processDry(outLeft, outRight, inLeft, inRight, frames, stride, accumulate, flush);
        default:
            return processPlate(outLeft, outRight, inLeft, inRight, frames, stride, accumulate, flush);
    }
}

int ReverbEngine::processDry(float* outLeft, float* outRight, const float* inLeft, const float* inRight,
                             int frames, int stride, int accumulate, int flush) {
    latchFlush(flush, false);
    if (frames <= 0) return 0;
    decayMeter(frames);
    if (meterSource == 0) meterInput(inLeft, inRight, frames, stride);
    wetPeak_ = 0.0f;
    for (int i = 0; i < frames; ++i) mixOutput(outLeft, outRight, inLeft, inRight, i, stride, accumulate, 0.0, 0.0);
    if (meterSource == 2) {
        raiseLevel(wetPeak_);
        cleanSmoothState();
    }
    if (meterSource == 1) meterOutput(outLeft, outRight, frames, stride);
    return trimmedLength(outLeft, outRight, frames, stride);
}

}  // namespace ulvetta
