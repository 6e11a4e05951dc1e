#include "engine/IrResampler.h"

#include <algorithm>
#include <cmath>

namespace ulvetta {

namespace {
constexpr double kPi = 3.141592653589793;
constexpr double kTwoPi = 6.283185307179586;
constexpr int kCapacity = 2048;
}  // namespace

IrResampler::IrResampler() : ring_(kCapacity, 0.0), writeIndex_(kCapacity - 1) {}

void IrResampler::Setup(int outputRate) {
    outputRate_ = outputRate;
    // Taps: the span over which the Gaussian factor falls to 10^-0.1, plus one.
    N_ = static_cast<int>(std::round(std::sqrt(std::log(std::pow(10.0, 0.1)) / kPi) / width_ * inputRate_ + 1.0));
    lead_ = 0;
    if (N_ % 4 != 0) {
        const int raised = (N_ / 4 + 1) * 4;
        lead_ = raised - N_;
        N_ = raised;
    }
    lastTap_ = N_ - 1;
    // L / M is the rate ratio in lowest terms: c = lcm(44100, r).
    int64_t c = 44100;
    while (c % outputRate != 0) c += 44100;
    L_ = c / 44100;
    M_ = c / outputRate;
    // The pass band ends below the stored data's own Nyquist frequency even when converting up.
    cutoff_ = 0.5 * std::min<double>(outputRate, 44100.0) - 89.0;
    table_.clear();
    row_.assign(N_, 0.0);
    rowPhase_ = -1;
}

double IrResampler::Kernel(double t) const {
    const double u = std::fmod(kTwoPi * cutoff_ * t, kTwoPi);
    const double arg = kTwoPi * cutoff_ * t;
    const double s = std::fabs(arg) < 1e-50 ? 1.0 : std::sin(u) / arg;
    return 2.0 * cutoff_ * s * std::exp(-4.0 * kPi * width_ * width_ * t * t);
}

void IrResampler::FillRow(int64_t p, double* row) const {
    for (int j = 0; j < lead_; ++j) row[j] = 0.0;
    const double f = std::fmod(static_cast<double>(M_) * static_cast<double>(p) / static_cast<double>(L_), 1.0);
    const double c = std::floor((N_ - lead_) * 0.5) + f;
    for (int j = 0; j < N_ - lead_; ++j) row[lead_ + j] = gain_ * (1.0 / inputRate_) * Kernel((c - j) / inputRate_);
}

const double* IrResampler::Row(int64_t p) {
    if (L_ <= tableLimit_) {
        if (table_.empty()) {
            table_.resize(static_cast<size_t>(L_) * N_);
            for (int64_t q = 0; q < L_; ++q) FillRow(q, &table_[static_cast<size_t>(q) * N_]);
        }
        return &table_[static_cast<size_t>(p) * N_];
    }
    if (rowPhase_ != p) {
        FillRow(p, row_.data());
        rowPhase_ = p;
    }
    return row_.data();
}

int IrResampler::Run(float* out, const float* in, int frames, int maxOut) {
    int written = 0;
    while (written < maxOut) {
        const int64_t need = (M_ * phase_) / L_ + base_;
        while (consumed_ < need) {
            ++writeIndex_;
            ++windowStart_;
            const bool inputsRemain = consumed_ + 1 < frames;
            if (writeIndex_ == kCapacity && inputsRemain) {
                // Keep the newest N - 1 samples at the start of the ring.
                std::copy(ring_.end() - (N_ - 1), ring_.end(), ring_.begin());
                windowStart_ = 0;
                writeIndex_ = N_ - 1;
            }
            if (!inputsRemain) {
                --writeIndex_;
                --windowStart_;
                return written;
            }
            ++consumed_;
            ring_[writeIndex_] = in[2 * consumed_];
        }
        const double* row = Row(phase_);
        double y = 0.0;
        for (int j = 0; j < N_; ++j) y += row[j] * ring_[windowStart_ + j];
        out[2 * static_cast<int64_t>(written)] = static_cast<float>(y);
        ++written;
        if (++phase_ == L_) {
            phase_ = 0;
            base_ += M_;
        }
    }
    return written;
}

}  // namespace ulvetta
