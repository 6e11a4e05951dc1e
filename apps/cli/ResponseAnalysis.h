// Measurements of a stereo impulse response: peak, reverberation time per octave band (T30 from
// Schroeder's backward integration) and the correlation of the two channels' tails.
#pragma once

#include <cstddef>

namespace ulvetta {

struct ResponseReport {
    double peak = 0.0;
    // Reverberation time (60 dB, extrapolated from the -5..-35 dB range) in the octaves around 250 Hz,
    // 1 kHz and 4 kHz; 0 when the band never falls 35 dB.
    double t60_250 = 0.0, t60_1k = 0.0, t60_4k = 0.0;
    // Broadband decay in dB per second over the same range.
    double decayDbPerSecond = 0.0;
    // Pearson correlation of left and right after the first 80 ms.
    double tailCorrelation = 0.0;
};

// left and right hold frames samples each, at rate Hz.
ResponseReport analyseResponse(const float* left, const float* right, size_t frames, double rate);

}  // namespace ulvetta
