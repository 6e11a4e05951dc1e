#include "processing/BiquadSection.h"

#include <cmath>
#include <initializer_list>

namespace ulvetta {

namespace {
constexpr double kTwoPi = 6.283185307179586;
}

void BiquadSection::SetBypass() {
    b0 = 1.0;
    b1 = b2 = a1 = a2 = 0.0;
}

void DesignLowPass(BiquadSection& s, int sampleRate, int frequency) {
    const double w = kTwoPi * frequency / sampleRate;
    const double sn = std::sin(w), c = std::cos(w);
    const double alpha = sn;  // Q = 0.5: alpha = sin(w) / (2 Q)
    const double k = 1.0 / (1.0 + alpha);
    s.b0 = s.b2 = 0.5 * (1.0 - c) * k;
    s.b1 = (1.0 - c) * k;
    s.a1 = -2.0 * c * k;
    s.a2 = (1.0 - alpha) * k;
}

void DesignHighPass(BiquadSection& s, int sampleRate, int frequency) {
    const double w = kTwoPi * frequency / sampleRate;
    const double sn = std::sin(w), c = std::cos(w);
    const double alpha = sn;
    const double k = 1.0 / (1.0 + alpha);
    s.b0 = s.b2 = 0.5 * (1.0 + c) * k;
    s.b1 = (-1.0 - c) * k;
    s.a1 = -2.0 * c * k;
    s.a2 = (1.0 - alpha) * k;
}

void DesignNotch(BiquadSection& s, int sampleRate, int frequency, double q, double gainDb) {
    if (gainDb == 1.0) {
        s.SetBypass();
        return;
    }
    const double w = kTwoPi * frequency / sampleRate;
    const double sn = std::sin(w), c = std::cos(w);
    const double A = std::sqrt(std::pow(10.0, gainDb * 0.05));
    const double alpha = sn / (2.0 * q);
    const double k = 1.0 / (1.0 + alpha / A);
    s.b0 = (1.0 + alpha * A) * k;
    s.b1 = s.a1 = -2.0 * c * k;
    s.b2 = (1.0 - alpha * A) * k;
    s.a2 = (1.0 - alpha / A) * k;
}

void ProcessMono(BiquadSection& s, float* samples, int count) {
    double x1 = s.x1L, x2 = s.x2L, y1 = s.y1L, y2 = s.y2L;
    for (int i = 0; i < count; ++i) {
        const double x = samples[i];
        const double y = s.b0 * x + s.b1 * x1 + s.b2 * x2 - s.a1 * y1 - s.a2 * y2;
        x2 = x1;
        x1 = x;
        y2 = y1;
        y1 = y;
        samples[i] = static_cast<float>(y);
    }
    s.x1L = flushTiny(x1);
    s.x2L = flushTiny(x2);
    s.y1L = flushTiny(y1);
    s.y2L = flushTiny(y2);
}

void ProcessInterleaved(BiquadSection& s, float* frames, int count) {
    for (int i = 0; i < count; ++i) {
        const double xl = frames[2 * i];
        const double yl = s.b0 * xl + s.b1 * s.x1L + s.b2 * s.x2L - s.a1 * s.y1L - s.a2 * s.y2L;
        s.x2L = s.x1L;
        s.x1L = xl;
        s.y2L = s.y1L;
        s.y1L = yl;
        frames[2 * i] = static_cast<float>(yl);

        const double xr = frames[2 * i + 1];
        const double yr = s.b0 * xr + s.b1 * s.x1R + s.b2 * s.x2R - s.a1 * s.y1R - s.a2 * s.y2R;
        s.x2R = s.x1R;
        s.x1R = xr;
        s.y2R = s.y1R;
        s.y1R = yr;
        frames[2 * i + 1] = static_cast<float>(yr);
    }
    for (double* v : {&s.x1L, &s.x2L, &s.y1L, &s.y2L, &s.x1R, &s.x2R, &s.y1R, &s.y2R}) *v = flushTiny(*v);
}

}  // namespace ulvetta
