// Test support for the delay-network kernels: an engine set up the way the effect core applies parameters
// (sample rate, then the setters in parameter-id order with engine-ready values, the mode last, then the
// stream-start reset), and block rendering over interleaved stereo buffers.
#pragma once

#include <algorithm>
#include <cmath>
#include <vector>

#include "engine/ReverbEngine.h"

namespace ulvetta::test {

// The fifteen sound parameters in raw parameter steps, plus the algorithm.
struct Settings {
    int diffusion, preDelay, decay, damping, roomSize;
    int early, wet, dry;  // tenths of a dB; -600 is "-Inf." for each
    int colour, inputGain, lowPass, highPass;
    int notchQ, notchGain;  // tenths
    int notchFreq;
    int mode;
};

// The factory settings of each algorithm (Damping of the diffused delay clamped to its maximum 99).
inline Settings FactorySettings(int mode) {
    static const Settings rows[8] = {
        {17, 15, 55, 5, 38, -100, -170, 0, 90, 0, 10000, 125, 30, 0, 2000, 0},
        {100, 19, 58, 33, 41, -250, -160, 0, 36, 0, 10000, 125, 30, 0, 2000, 1},
        {100, 32, 47, 30, 46, 0, -180, 0, 56, 0, 10000, 125, 30, 0, 2000, 2},
        {100, 0, 93, 0, 136, 0, -100, 0, 33, 0, 10000, 125, 30, 0, 2000, 3},
        {100, 0, 81, 0, 100, 0, -110, 0, 100, 0, 10000, 125, 30, 0, 2000, 4},
        {100, 0, 85, 0, 100, 0, -120, 0, 100, 0, 10000, 125, 30, 0, 2000, 5},
        {100, 87, 20, 80, 29, -400, -140, 0, 40, 0, 10000, 125, 30, 0, 2000, 6},
        {100, 12, 41, 99, 62, 0, -180, 0, 61, 0, 10000, 125, 30, 0, 2000, 7},
    };
    return rows[mode];
}

// Settings that make the wet path easy to reason about: no filtering (colour at 100 is a pass-through at
// rates up to 28 kHz), unity wet, no dry, no pre-delay.
inline Settings TransparentSettings(int mode) {
    return {100, 0, 50, 0, 50, 0, 0, -600, 100, 0, 10000, 100, 30, 0, 2000, mode};
}

inline double LevelGain(int tenthsDb) { return tenthsDb == -600 ? 0.0 : std::pow(10.0, tenthsDb * 0.005); }

inline void Apply(ReverbEngine& e, int rate, const Settings& s) {
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
}

inline void Start(ReverbEngine& e, int rate, const Settings& s) {
    Apply(e, rate, s);
    e.ResetState();
}

// Interleaved stereo audio.
struct Stereo {
    std::vector<float> samples;
    explicit Stereo(size_t frames = 0) : samples(2 * frames, 0.0f) {}
    size_t frames() const { return samples.size() / 2; }
    float& left(size_t i) { return samples[2 * i]; }
    float& right(size_t i) { return samples[2 * i + 1]; }
    float left(size_t i) const { return samples[2 * i]; }
    float right(size_t i) const { return samples[2 * i + 1]; }
};

// Runs in through the engine in blocks of blockFrames; returns the output.
inline Stereo Render(ReverbEngine& e, const Stereo& in, int blockFrames = 512) {
    Stereo out(in.frames());
    for (size_t at = 0; at < in.frames(); at += blockFrames) {
        const int n = static_cast<int>(std::min<size_t>(blockFrames, in.frames() - at));
        const float* src = in.samples.data() + 2 * at;
        float* dst = out.samples.data() + 2 * at;
        e.ProcessBlock(dst, dst + 1, src, src + 1, n, 2, 0, 0);
    }
    return out;
}

// The end-of-stream drain: silent blocks with the flush flag until a block returns fewer frames than asked.
struct DrainResult {
    bool ended = false;
    long blocks = 0;
    int lastReturned = 0;
    bool finite = true;
    float firstPeak = 0.0f;  // peak of the first drain block
    float lastPeak = 0.0f;   // peak of the returned part of the final block
    bool trimmedTailSilent = true;  // frames past the returned count are all within -313 dB
};

inline DrainResult Drain(ReverbEngine& e, long maxBlocks, int blockFrames = 512) {
    DrainResult r;
    std::vector<float> in(2 * blockFrames, 0.0f), out(2 * blockFrames);
    for (r.blocks = 1; r.blocks <= maxBlocks; ++r.blocks) {
        const int got = e.ProcessBlock(out.data(), out.data() + 1, in.data(), in.data() + 1, blockFrames, 2, 0, 1);
        float peak = 0.0f;
        for (int i = 0; i < 2 * blockFrames; ++i) {
            if (!std::isfinite(out[i])) r.finite = false;
            if (i < 2 * got) peak = std::max(peak, std::fabs(out[i]));
            else if (std::fabs(out[i]) > 2.2387211385683394e-16) r.trimmedTailSilent = false;
        }
        if (r.blocks == 1) r.firstPeak = peak;
        r.lastPeak = peak;
        r.lastReturned = got;
        if (!r.finite) return r;
        if (got < blockFrames) {
            r.ended = true;
            return r;
        }
    }
    r.blocks = maxBlocks;
    return r;
}

}  // namespace ulvetta::test
