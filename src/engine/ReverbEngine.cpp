#include "engine/ReverbEngine.h"

#include <algorithm>
#include <cmath>
#include <initializer_list>
#include <iterator>

namespace ulvetta {

namespace {
// Single-precision constants of the setters, held as doubles.
constexpr double kMilli = 0.0010000000474974513;      // 0.001f
constexpr double kDecayScale = 0.00800000037997961;   // 0.008f
constexpr double kDampingScale = 0.009999999776482582;  // 0.01f

int roundHalfAway(double v) { return static_cast<int>(std::round(v)); }
}  // namespace

ReverbEngine::ReverbEngine() {
    // The convolution's direct head: 64 taps, all zero until a response is prepared.
    nspsFirInit(nullptr, 64, nullptr, &firLeft);
    nspsFirInit(nullptr, 64, nullptr, &firRight);
}

ReverbEngine::~ReverbEngine() {
    // Workers are joined before any buffer they use goes.
    StopWorkers();
    partitions.reset();
    nspFirFree(&firLeft);
    nspFirFree(&firRight);
}

void ReverbEngine::SetDiffusion(int v) {
    if (v == diffusion) return;
    diffusion = v;
    diffusionCoef = (v * 0.01 + 1.0) * 0.5;
    if (mode == 7) Recalculate();
}

void ReverbEngine::SetPreDelay(int ms) {
    if (ms == preDelay) return;
    preDelay = ms;
    if (mode == 7) {
        Recalculate();
        return;
    }
    const int n = roundHalfAway(static_cast<double>(ms * sampleRate) * kMilli);
    if (n == 0) {
        preDelayOn = false;
        return;
    }
    preDelayOn = true;
    preDelayLine.Create(n);
}

void ReverbEngine::SetDecay(int v) {
    decay = v;
    decayCoef = v * kDecayScale;
    if (mode == 3 || mode == 4 || mode == 5 || mode == 7) Recalculate();
}

void ReverbEngine::SetDamping(int v) {
    damping = v;
    dampingCoef = v * kDampingScale;
    if (mode == 3 || mode == 4 || mode == 5) Recalculate();
}

void ReverbEngine::SetRoomSize(int v) {
    if (v == roomSize) return;
    roomSize = (mode == 1) ? std::max(v, 20) : v;
    Recalculate();
}

void ReverbEngine::SetEarlyLevel(double g) { earlyLevel = earlyGain = g; }
void ReverbEngine::SetWetLevel(double g) { wetLevel = wetGain = g; }
void ReverbEngine::SetDryLevel(double g) { dryLevel = dryGain = g; }

void ReverbEngine::SetColour(int v) {
    colour = v;
    colourCutoff = std::min((v * 139.0 + 100.0) / (sampleRate * 0.5), 1.0);
}

void ReverbEngine::SetInputGain(int tenthsDb) {
    inputGain = (tenthsDb == 0) ? 1.0 : std::pow(10.0, tenthsDb * 0.005);
}

int ReverbEngine::designLimit(int hz) const {
    const int limit = static_cast<int>(static_cast<int64_t>(sampleRate) * 49 / 100);
    return std::min(hz, limit);
}

void ReverbEngine::SetLowPassFreq(int hz) {
    lowPassFreq = hz;
    for (int s : {0, 3}) {
        if (hz == 10000)
            filterSections[s].SetBypass();
        else
            DesignLowPass(filterSections[s], sampleRate, designLimit(hz));
    }
}

void ReverbEngine::SetHighPassFreq(int hz) {
    highPassFreq = hz;
    for (int s : {1, 4}) {
        if (hz == 100)
            filterSections[s].SetBypass();
        else
            DesignHighPass(filterSections[s], sampleRate, designLimit(hz));
    }
}

void ReverbEngine::SetNotchFreq(int hz) {
    if (hz == notchFreq) return;
    notchFreq = hz;
    UpdateNotch();
}

void ReverbEngine::SetNotchGain(double db) {
    if (db == notchGain) return;
    notchGain = db;
    UpdateNotch();
}

void ReverbEngine::SetNotchQ(double q) {
    if (q == notchQ) return;
    notchQ = q;
    UpdateNotch();
}

void ReverbEngine::SetMode(int m) {
    if (m == mode) return;
    mode = m;
    Recalculate();
}

void ReverbEngine::UpdateNotch() {
    if (notchQ == -1.0 || notchGain == -100000.0 || notchFreq == -1) return;
    for (int s : {2, 5}) {
        if (notchGain != 0.0)
            DesignNotch(filterSections[s], sampleRate, designLimit(notchFreq), notchQ, notchGain);
        else
            filterSections[s].SetBypass();
    }
}

void ReverbEngine::SetSampleRate(int rate) {
    if (rate != sampleRate) {
        // Lengths and designs made for the old rate must be derived again by the setters that follow.
        preDelay = -1;
        notchFreq = -1;
    }
    sampleRate = rate;
    // Meter smoother: second-order low-pass at 2.1 Hz, Q 0.62.
    const double w = 13.194689145077131 / rate;
    const double alpha = std::sin(w) * 0.8064516129032259;
    const double n = 1.0 / (1.0 + alpha);
    const double c = std::cos(w);
    smoothCoefs[0] = static_cast<float>(0.5 * (1.0 - c) * n);
    smoothCoefs[1] = static_cast<float>((1.0 - c) * n);
    smoothCoefs[2] = smoothCoefs[0];
    smoothCoefs[3] = static_cast<float>(-2.0 * c * n);
    smoothCoefs[4] = static_cast<float>((1.0 - alpha) * n);
}

void ReverbEngine::ClearEndOfStream() {
    flushLatched = false;
    tailTrimArmed = false;
}

void ReverbEngine::ResetState() {
    Recalculate();
    tailTrimArmed = false;
    flushLatched = false;
    convCounter = 0;
    std::fill(std::begin(smoothState), std::end(smoothState), 0.0f);
    for (DelayLine& l : delayLines) l.Zero();
    for (DelayLine& l : earlyLines) l.Zero();
    historyLeft.Zero();
    historyRight.Zero();
    for (int32_t i = 1; i < partitionCount && partitions; ++i) {
        ConvPartition& p = partitions[i];
        std::fill(p.inputLeft.get(), p.inputLeft.get() + 2 * p.size, 0.0f);
        std::fill(p.inputRight.get(), p.inputRight.get() + 2 * p.size, 0.0f);
    }
    nspsFirSetDlyl(nullptr, &firLeft);
    nspsFirSetDlyl(nullptr, &firRight);
}

}  // namespace ulvetta
