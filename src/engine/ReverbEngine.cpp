#include "engine/ReverbEngine.h"

#include <algorithm>
#include <cmath>
#include <initializer_list>
#include <iterator>
#include <new>

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
    response_.reset();
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
    // No host gives a rate outside 1..768000 Hz; the lengths and designs derived from one would not be
    // meaningful (or not finite), so such a rate is ignored.
    if (rate < 1 || rate > kMaxSampleRate) return;
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

bool ReverbEngine::PreparedResponse(std::vector<float>& left, std::vector<float>& right) const {
    if (!IsConvolution(mode) || !response_) return false;
    left.assign(response_->irLeft.get(), response_->irLeft.get() + response_->irLength);
    right.assign(response_->irRight.get(), response_->irRight.get() + response_->irLength);
    return true;
}

void ReverbEngine::ClearEndOfStream() {
    flushLatched = false;
    tailTrimArmed = false;
}

void ReverbEngine::ResetState() {
    // The convolution restarts with the response for the settings, ready before this returns: a stream
    // begins with the sound it was set up for.
    if (IsConvolution(mode) && roomSize != -1)
        CommitResponse(false);
    else
        Recalculate();
    tailTrimArmed = false;
    flushLatched = false;
    convCounter = 0;
    std::fill(std::begin(smoothState), std::end(smoothState), 0.0f);
    for (DelayLine& l : delayLines) l.Zero();
    for (DelayLine& l : earlyLines) l.Zero();
    if (response_) response_->Clear();
    nspsFirSetDlyl(nullptr, &firLeft);
    nspsFirSetDlyl(nullptr, &firRight);
    headLeft = headRight = 0.0f;
}

void ReverbEngine::EndChanges() {
    if (batchDepth_ > 0 && --batchDepth_ == 0 && responseStale_) {
        // Called as the core's lock guard goes, so nothing may escape: a preparation that cannot allocate
        // leaves the response as it was, and the next change of its settings or stream start prepares again.
        try {
            CommitResponse(true);
        } catch (const std::bad_alloc&) {
        }
    }
}

void ReverbEngine::CommitResponse(bool mayDefer) {
    responseStale_ = false;
    if (!IsConvolution(mode) || roomSize == -1) return;
    const ResponseKey wanted = WantedResponse();
    if (response_ && response_->key == wanted) {
        preparer_.Drop();  // anything on its way was made for settings that no longer hold
        return;
    }
    ++rebuildCount;
    if (mayDefer && asyncPreparation_ && preparer_.Request(wanted, !inlineLargePartitions)) return;
    InstallResponse(preparer_.Prepare(wanted, !inlineLargePartitions));
}

void ReverbEngine::InstallResponse(std::unique_ptr<ConvolutionResponse> r) {
    std::swap(response_, r);
    preparer_.Discard(std::move(r));
    StartResponse();
}

void ReverbEngine::StartResponse() {
    nspsFirSetDlyl(nullptr, &firLeft);
    nspsFirSetDlyl(nullptr, &firRight);
    nspsFirSetTaps(response_->irLeft.get(), &firLeft);
    nspsFirSetTaps(response_->irRight.get(), &firRight);
    headLeft = headRight = 0.0f;
    convCounter = 0;
}

void ReverbEngine::DropResponse() {
    preparer_.Drop();
    preparer_.Discard(std::move(response_));
}

void ReverbEngine::SilenceNetworks() {
    for (DelayLine& l : delayLines) l.Zero();
    for (DelayLine& l : earlyLines) l.Zero();
    if (preDelayLine.samples) std::fill(preDelayLine.samples.get(), preDelayLine.samples.get() + preDelayLine.length, 0.0);
    for (BiquadSection& s : filterSections) s.x1L = s.x2L = s.y1L = s.y2L = s.x1R = s.x2R = s.y1R = s.y2R = 0.0;
    colourState = colourState2 = dampingStateLeft = dampingStateRight = 0.0;
    std::fill(std::begin(smoothState), std::end(smoothState), 0.0f);
    if (response_) response_->Clear();
    nspsFirSetDlyl(nullptr, &firLeft);
    nspsFirSetDlyl(nullptr, &firRight);
    headLeft = headRight = 0.0f;
    std::fill(std::begin(partSumLeft), std::end(partSumLeft), 0.0);
    std::fill(std::begin(partSumRight), std::end(partSumRight), 0.0);
}

}  // namespace ulvetta
