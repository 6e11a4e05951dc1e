#include "engine/IrResampler.h"

#include <algorithm>
#include <cmath>
#include <numeric>

namespace ulvetta {

namespace {
constexpr double kPi = 3.141592653589793;
constexpr double kTwoPi = 6.283185307179586;
// Output samples computed together: their sums are independent, so the processor overlaps them.
constexpr int kBatch = 4;
}  // namespace

void IrResampler::Setup(int outputRate) {
    const int64_t r = std::max(outputRate, 1);
    // Taps: the span over which the Gaussian factor falls to 10^-0.1, plus one.
    N_ = static_cast<int>(std::round(std::sqrt(std::log(std::pow(10.0, 0.1)) / kPi) / width_ * inputRate_ + 1.0));
    lead_ = 0;
    if (N_ % 4 != 0) {
        const int raised = (N_ / 4 + 1) * 4;
        lead_ = raised - N_;
        N_ = raised;
    }
    // L / M is the rate ratio in lowest terms.
    const int64_t g = std::gcd<int64_t, int64_t>(44100, r);
    L_ = r / g;
    M_ = 44100 / g;
    // The pass band ends below the stored data's own Nyquist frequency even when converting up; at rates
    // too low for the transition band it is a quarter of the rate.
    cutoff_ = 0.5 * static_cast<double>(std::min<int64_t>(r, 44100)) - 89.0;
    if (cutoff_ <= 0.0) cutoff_ = 0.25 * static_cast<double>(r);
    fine_ = L_ > exactLimit_;
    table_.clear();
}

double IrResampler::Kernel(double t) const {
    const double u = std::fmod(kTwoPi * cutoff_ * t, kTwoPi);
    const double arg = kTwoPi * cutoff_ * t;
    const double s = std::fabs(arg) < 1e-50 ? 1.0 : std::sin(u) / arg;
    return 2.0 * cutoff_ * s * std::exp(-4.0 * kPi * width_ * width_ * t * t);
}

double IrResampler::Fraction(int64_t p) const {
    return std::fmod(static_cast<double>(M_) * static_cast<double>(p) / static_cast<double>(L_), 1.0);
}

void IrResampler::FillRow(double f, double* row) const {
    for (int j = 0; j < lead_; ++j) row[j] = 0.0;
    const double c = std::floor((N_ - lead_) * 0.5) + f;
    for (int j = 0; j < N_ - lead_; ++j) row[lead_ + j] = gain_ * (1.0 / inputRate_) * Kernel((c - j) / inputRate_);
}

void IrResampler::BuildTable() {
    const int64_t rows = fine_ ? kFineRows + 1 : L_;
    table_.resize(static_cast<size_t>(rows) * N_);
    for (int64_t q = 0; q < rows; ++q)
        FillRow(fine_ ? static_cast<double>(q) / kFineRows : Fraction(q), &table_[static_cast<size_t>(q) * N_]);
}

namespace {

// The inner products of a batch of outputs: rows[k] against the window of each channel, summed from the
// oldest tap to the newest in double precision.
template <int kChannels>
void dotBatch(const double* const* rows, const double* const (*windows)[kBatch], int taps, double (*acc)[kBatch]) {
    for (int c = 0; c < kChannels; ++c)
        for (int k = 0; k < kBatch; ++k) acc[c][k] = 0.0;
    for (int j = 0; j < taps; ++j)
        for (int k = 0; k < kBatch; ++k)
            for (int c = 0; c < kChannels; ++c) acc[c][k] += rows[k][j] * windows[c][k][j];
}

}  // namespace

int IrResampler::Convert(float* out, const float* in, int channels, int frames, int maxOut) {
    if (frames <= 0 || maxOut <= 0) return 0;
    if (table_.empty()) BuildTable();
    // Output n reads the inputs up to floor(n M / L); it exists while that input does.
    const int64_t available = (static_cast<int64_t>(frames) * L_ - 1) / M_ + 1;
    const int count = static_cast<int>(std::min<int64_t>(available, maxOut));

    // Each channel as doubles behind N - 1 zeros: the window of an output whose newest input is k is
    // padded[k .. k + N - 1].
    std::vector<double> padded[2];
    for (int c = 0; c < channels; ++c) {
        padded[c].assign(static_cast<size_t>(N_ - 1) + frames, 0.0);
        for (int i = 0; i < frames; ++i) padded[c][N_ - 1 + i] = in[2 * static_cast<int64_t>(i) + c];
    }
    std::vector<double> blended(fine_ ? static_cast<size_t>(kBatch) * N_ : 0);

    int64_t phase = 0, base = 0;
    for (int n0 = 0; n0 < count; n0 += kBatch) {
        const int batch = std::min(kBatch, count - n0);
        const double* rows[kBatch];
        const double* windows[2][kBatch];
        for (int k = 0; k < kBatch; ++k) {
            if (k >= batch) {  // a short last batch repeats its first output, which is not written
                rows[k] = rows[0];
                for (int c = 0; c < channels; ++c) windows[c][k] = windows[c][0];
                continue;
            }
            const int64_t newest = (M_ * phase) / L_ + base;
            if (!fine_) {
                rows[k] = &table_[static_cast<size_t>(phase) * N_];
            } else {
                const double x = Fraction(phase) * kFineRows;
                const int q = std::min(static_cast<int>(x), kFineRows - 1);
                const double a = x - q;
                const double* lo = &table_[static_cast<size_t>(q) * N_];
                const double* hi = lo + N_;
                double* row = &blended[static_cast<size_t>(k) * N_];
                for (int j = 0; j < N_; ++j) row[j] = lo[j] + a * (hi[j] - lo[j]);
                rows[k] = row;
            }
            for (int c = 0; c < channels; ++c) windows[c][k] = padded[c].data() + newest;
            if (++phase == L_) {
                phase = 0;
                base += M_;
            }
        }
        double acc[2][kBatch];
        if (channels == 2)
            dotBatch<2>(rows, windows, N_, acc);
        else
            dotBatch<1>(rows, windows, N_, acc);
        for (int k = 0; k < batch; ++k)
            for (int c = 0; c < channels; ++c) out[2 * static_cast<int64_t>(n0 + k) + c] = static_cast<float>(acc[c][k]);
    }
    return count;
}

}  // namespace ulvetta
