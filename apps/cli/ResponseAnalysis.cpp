#include "ResponseAnalysis.h"

#include <algorithm>
#include <cmath>
#include <vector>

namespace ulvetta {

namespace {

constexpr double kPi = 3.141592653589793;

// One-octave band-pass (constant 0 dB peak) at fc, Q sqrt(2).
std::vector<double> octaveBand(const float* x, size_t n, double rate, double fc) {
    const double w = 2.0 * kPi * fc / rate;
    const double alpha = std::sin(w) / (2.0 * std::sqrt(2.0));
    const double a0 = 1.0 + alpha;
    const double b0 = alpha / a0, b2 = -alpha / a0, a1 = -2.0 * std::cos(w) / a0, a2 = (1.0 - alpha) / a0;
    std::vector<double> y(n);
    double x1 = 0, x2 = 0, y1 = 0, y2 = 0;
    for (size_t i = 0; i < n; ++i) {
        const double v = b0 * x[i] + b2 * x2 - a1 * y1 - a2 * y2;
        x2 = x1;
        x1 = x[i];
        y2 = y1;
        y1 = v;
        y[i] = v;
    }
    return y;
}

// Seconds from the start at which the Schroeder curve of the energy sequence first falls to fromDb and
// toDb below its start; false when it never reaches toDb.
bool schroederSpan(const std::vector<double>& energy, double rate, double fromDb, double toDb, double& tFrom,
                   double& tTo) {
    std::vector<double> tail(energy.size() + 1, 0.0);
    for (size_t i = energy.size(); i-- > 0;) tail[i] = tail[i + 1] + energy[i];
    if (tail[0] <= 0.0) return false;
    bool haveFrom = false;
    for (size_t i = 0; i < energy.size(); ++i) {
        const double db = 10.0 * std::log10(tail[i] / tail[0] + 1e-300);
        if (!haveFrom && db <= fromDb) {
            tFrom = i / rate;
            haveFrom = true;
        }
        if (db <= toDb) {
            tTo = i / rate;
            return haveFrom;
        }
    }
    return false;
}

double t60FromEnergy(const std::vector<double>& energy, double rate) {
    double t5 = 0.0, t35 = 0.0;
    if (!schroederSpan(energy, rate, -5.0, -35.0, t5, t35) || t35 <= t5) return 0.0;
    return 2.0 * (t35 - t5);
}

}  // namespace

ResponseReport analyseResponse(const float* left, const float* right, size_t frames, double rate) {
    ResponseReport r;
    for (size_t i = 0; i < frames; ++i) r.peak = std::max({r.peak, std::fabs(double(left[i])), std::fabs(double(right[i]))});
    double* targets[3] = {&r.t60_250, &r.t60_1k, &r.t60_4k};
    const double centres[3] = {250.0, 1000.0, 4000.0};
    for (int b = 0; b < 3; ++b) {
        if (centres[b] >= rate / 2) continue;
        const std::vector<double> l = octaveBand(left, frames, rate, centres[b]);
        const std::vector<double> rr = octaveBand(right, frames, rate, centres[b]);
        std::vector<double> e(frames);
        for (size_t i = 0; i < frames; ++i) e[i] = l[i] * l[i] + rr[i] * rr[i];
        *targets[b] = t60FromEnergy(e, rate);
    }
    std::vector<double> broad(frames);
    for (size_t i = 0; i < frames; ++i) broad[i] = double(left[i]) * left[i] + double(right[i]) * right[i];
    const double t60 = t60FromEnergy(broad, rate);
    r.decayDbPerSecond = t60 > 0.0 ? 60.0 / t60 : 0.0;
    const size_t from = std::min(frames, static_cast<size_t>(0.08 * rate));
    double sl = 0, sr = 0, sll = 0, srr = 0, slr = 0;
    const double n = static_cast<double>(frames - from);
    for (size_t i = from; i < frames; ++i) {
        sl += left[i];
        sr += right[i];
        sll += double(left[i]) * left[i];
        srr += double(right[i]) * right[i];
        slr += double(left[i]) * right[i];
    }
    if (n > 1) {
        const double cov = slr - sl * sr / n, vl = sll - sl * sl / n, vr = srr - sr * sr / n;
        r.tailCorrelation = (vl > 0 && vr > 0) ? cov / std::sqrt(vl * vr) : 0.0;
    }
    return r;
}

}  // namespace ulvetta
