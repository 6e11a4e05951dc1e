// A second-order direct-form-I filter section with separate left/right state and one coefficient set,
// used for the engine's input low-pass, high-pass and peaking "notch". Design and processing never allocate.
#pragma once

namespace ulvetta {

// Values strictly inside (-kTiny, +kTiny) (-313 dB) are flushed to 0.0 in recirculating state.
constexpr double kTiny = 2.2387211385683394e-16;

inline double flushTiny(double v) { return (v > -kTiny && v < kTiny) ? 0.0 : v; }

struct BiquadSection {
    double x1L = 0.0, x2L = 0.0;
    double x1R = 0.0, x2R = 0.0;
    double y1L = 0.0, y2L = 0.0;
    double y1R = 0.0, y2R = 0.0;
    double a1 = 0.0, a2 = 0.0;
    double b0 = 1.0, b1 = 0.0, b2 = 0.0;

    // b0 = 1, everything else 0: the input passes unchanged.
    void SetBypass();
};

// Low-pass and high-pass at Q 0.5 (no resonant peak) for integer frequency and rate in Hz.
void DesignLowPass(BiquadSection& s, int sampleRate, int frequency);
void DesignHighPass(BiquadSection& s, int sampleRate, int frequency);
// Peaking equaliser; a gain of exactly 1.0 dB writes the bypass set.
void DesignNotch(BiquadSection& s, int sampleRate, int frequency, double q, double gainDb);

// Filters count float samples in place with the left state (double arithmetic; the unrounded output is
// kept as state), then flushes tiny states.
void ProcessMono(BiquadSection& s, float* samples, int count);
// Filters count interleaved (left, right) float frames in place, each channel with its own state.
void ProcessInterleaved(BiquadSection& s, float* frames, int count);

}  // namespace ulvetta
