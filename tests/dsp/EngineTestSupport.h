// Test support for the engine: settings applied the way the effect core applies them (rate, the setters in
// parameter order with engine-ready values, the mode last, then the stream-start reset), interleaved
// stereo rendering in blocks, and the end-of-stream drain.
#pragma once

#include <algorithm>
#include <cmath>
#include <random>
#include <vector>

#include "engine/EngineProbe.h"

namespace ulvetta::test {

// The fifteen sound parameters in raw steps, plus the algorithm. Levels in tenths of a dB (-600 is off).
struct Settings {
    int diffusion, preDelay, decay, damping, roomSize, early, wet, dry, colour, inputGain, lowPass, highPass,
        notchQ, notchGain, notchFreq, mode;
};

// Every stage in use: crossfaded diffusion, pre-delay, colour, filters "Off", notch at 0 dB.
inline Settings Typical(int mode) { return {70, 20, 60, 30, 50, 0, -60, 0, 60, 0, 10000, 125, 30, 0, 2000, mode}; }

// A wet path easy to reason about: no filtering (colour 100 is a pass-through up to 28 kHz), unity wet,
// no dry, no pre-delay.
inline Settings Transparent(int mode) {
    return {100, 0, 50, 0, 50, 0, 0, -600, 100, 0, 10000, 100, 30, 0, 2000, mode};
}

inline double LevelGain(int tenthsDb) { return tenthsDb == -600 ? 0.0 : std::pow(10.0, tenthsDb * 0.005); }

inline void Start(ReverbEngine& e, int rate, const Settings& s) {
    e.SetSampleRate(rate);
    e.SetDiffusion(s.diffusion);
    e.SetPreDelay(s.preDelay);
    e.SetDecay(s.decay);
    e.SetDamping(s.damping);
    e.SetRoomSize(s.roomSize);
    e.SetEarlyLevel(LevelGain(s.early));
    e.SetWetLevel(LevelGain(s.wet));
    e.SetDryLevel(LevelGain(s.dry));
    e.SetColour(s.colour);
    e.SetInputGain(s.inputGain);
    e.SetLowPassFreq(s.lowPass);
    e.SetHighPassFreq(s.highPass);
    e.SetNotchFreq(s.notchFreq);
    e.SetNotchGain(s.notchGain * 0.1);
    e.SetNotchQ(s.notchQ * 0.1);
    e.SetMode(s.mode);
    e.ResetState();
}

// An engine started with the given settings.
struct Started : ReverbEngine {
    Started(int rate, const Settings& s) { Start(*this, rate, s); }
};

// Interleaved stereo noise, seeded.
inline std::vector<float> Noise(size_t frames, float amplitude, unsigned seed) {
    std::vector<float> v(2 * frames);
    std::mt19937 rng(seed);
    std::uniform_real_distribution<float> u(-amplitude, amplitude);
    for (float& x : v) x = u(rng);
    return v;
}

// Runs interleaved input through the engine in blocks; returns the interleaved output.
inline std::vector<float> Render(ReverbEngine& e, const std::vector<float>& in, int block = 512, int flush = 0) {
    std::vector<float> out(in.size(), 0.0f);
    const int frames = static_cast<int>(in.size() / 2);
    for (int at = 0; at < frames; at += block) {
        const int n = std::min(block, frames - at);
        e.ProcessBlock(&out[2 * at], &out[2 * at + 1], &in[2 * at], &in[2 * at + 1], n, 2, 0, flush);
    }
    return out;
}

// The end-of-stream drain: silent blocks with the flush flag until one returns fewer frames than asked. It
// ends well when that happens within maxBlocks with finite samples, silent (-313 dB) past the count.
struct DrainResult {
    bool endedWell = false;
    float firstPeak = 0.0f;
};

inline DrainResult Drain(ReverbEngine& e, long maxBlocks, int block = 512) {
    DrainResult r;
    std::vector<float> in(2 * block, 0.0f), out(2 * block);
    for (long b = 0; b < maxBlocks; ++b) {
        const int got = e.ProcessBlock(out.data(), out.data() + 1, in.data(), in.data() + 1, block, 2, 0, 1);
        for (int i = 0; i < 2 * block; ++i) {
            if (!std::isfinite(out[i]) || (i >= 2 * got && std::fabs(out[i]) > 2.2387211385683394e-16)) return r;
            if (b == 0) r.firstPeak = std::max(r.firstPeak, std::fabs(out[i]));
        }
        if (got < block) {
            r.endedWell = true;
            return r;
        }
    }
    return r;
}

}  // namespace ulvetta::test
