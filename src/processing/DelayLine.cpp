#include "processing/DelayLine.h"

#include <algorithm>
#include <cmath>

namespace ulvetta {

namespace {

// Length scale for rate r and room size R: r / 29761 / 50.
double scaleFactor(int r) { return (1.0 + (r - 29761) * 3.360102147105272e-05) * 0.02; }

bool isPrime(int32_t n) {
    if (n < 2) return false;
    for (int32_t d = 2; static_cast<int64_t>(d) * d <= n; ++d)
        if (n % d == 0) return false;
    return true;
}

}  // namespace

void Modulator::SetModSampleRate(int32_t r) {
    sampleRate = r;
    Update();
}

void Modulator::SetModRate(double f) {
    rate = f;
    Update();
}

void Modulator::Update() {
    if (rate == -1.0 || sampleRate == -1) return;
    // Bounded so that a zero rate (an unmodulated line's table entry) cannot overflow the period.
    const double r = std::min(sampleRate / rate, 1e9);
    // The nearest integer to r + 0.5 with ties to even: a fractional period is rounded up.
    period = static_cast<int32_t>(r > -0.5 ? std::nearbyint(r + 0.5) : std::nearbyint(r - 0.5));
    // A rate that is not set up yet (0 Hz sample rate) must not give an empty period: the phase would
    // leave its range and the excursion would be undefined.
    period = std::max<int32_t>(period, 1);
    periodLength = period;
    phase = std::min(phase, period - 1);
    rotation_.stepSin = std::sin(3.141592653589793 / periodLength);
    rotation_.stepCos = std::cos(3.141592653589793 / periodLength);
    untilResync_ = 0;
}

void Modulator::Resync() {
    constexpr double kPi = 3.141592653589793;
    const double angle = kPi * phase / periodLength;
    rotation_.sine = std::sin(angle);
    rotation_.cosine = std::cos(angle);
    // Restart exactly at every wrap to phase 0, and at least every kResyncInterval samples.
    untilResync_ = std::min(kResyncInterval, period - phase);
}

void DelayLine::ConfigureLine(int sampleRate, int roomSize, int baseLength, double g, int depth, double rate,
                              bool isNetworkLine) {
    gain = g;
    const double k = scaleFactor(sampleRate);
    int32_t n = static_cast<int32_t>(std::round(baseLength * static_cast<double>(roomSize) * k));
    if (n <= 0) n = 1;
    if (isNetworkLine) {
        n = std::max<int32_t>(n, 220);
    } else {
        n = std::max<int32_t>(n, 3);
        while (!isPrime(n)) ++n;
    }
    if (depth != 0) {
        depth = static_cast<int>(std::round(depth * static_cast<double>(roomSize) * k));
        depth = std::max(depth, 1);
    }
    mod.reset();
    if (depth > 0) {
        mod.reset(new Modulator);
        mod->SetModSampleRate(sampleRate);
        mod->SetModRate(rate);
        mod->SetModDepth(depth);
    }
    writeIndex = 0;
    length = n;
    samples.reset();
    samples.reset(new double[n]);
    std::fill(samples.get(), samples.get() + n, 0.0);
}

void DelayLine::Zero() {
    if (samples) std::fill(samples.get(), samples.get() + length, 0.0);
}

}  // namespace ulvetta
