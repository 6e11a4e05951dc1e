#include "engine/IrResampler.h"

#include <algorithm>
#include <cmath>
#include <numeric>

#if defined(__SSE2__) || defined(_M_X64)
#include <immintrin.h>
#define ULVETTA_RESAMPLER_SSE2 1
#else
#define ULVETTA_RESAMPLER_SSE2 0
#endif

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
    if (!fine_) {
        table_.resize(static_cast<size_t>(L_) * N_);
        for (int64_t q = 0; q < L_; ++q) FillRow(Fraction(q), &table_[static_cast<size_t>(q) * N_]);
        return;
    }
    // Fine rows are blended as row q + a x (row q+1 - row q). Both are kept with every tap twice, once
    // for each channel of the interleaved window.
    std::vector<double> rows(static_cast<size_t>(kFineRows + 1) * N_);
    for (int q = 0; q <= kFineRows; ++q) FillRow(static_cast<double>(q) / kFineRows, &rows[static_cast<size_t>(q) * N_]);
    table_.resize(2 * rows.size());
    slopes_.resize(2 * static_cast<size_t>(kFineRows) * N_);
    for (size_t i = 0; i < rows.size(); ++i) {
        table_[2 * i] = table_[2 * i + 1] = rows[i];
        if (i < static_cast<size_t>(kFineRows) * N_) slopes_[2 * i] = slopes_[2 * i + 1] = rows[i + N_] - rows[i];
    }
}

namespace {

// The inner products of a batch of outputs: rows[k] against the window of output k, whose samples are
// interleaved (left, right), summed from the oldest tap to the newest in double precision.
template <int kChannels>
void dotBatch(const double* const* rows, const double* const* windows, int taps, double (*acc)[kBatch]) {
    for (int c = 0; c < kChannels; ++c)
        for (int k = 0; k < kBatch; ++k) acc[c][k] = 0.0;
    for (int j = 0; j < taps; ++j)
        for (int k = 0; k < kBatch; ++k)
            for (int c = 0; c < kChannels; ++c) acc[c][k] += rows[k][j] * windows[k][2 * j + c];
}

#if ULVETTA_RESAMPLER_SSE2
// Both channels in one register: the same products and sums, in the same order, as the plain loop.
template <>
void dotBatch<2>(const double* const* rows, const double* const* windows, int taps, double (*acc)[kBatch]) {
    __m128d sum[kBatch];
    for (int k = 0; k < kBatch; ++k) sum[k] = _mm_setzero_pd();
    for (int j = 0; j < taps; ++j)
        for (int k = 0; k < kBatch; ++k)
            sum[k] = _mm_add_pd(sum[k], _mm_mul_pd(_mm_set1_pd(rows[k][j]), _mm_loadu_pd(windows[k] + 2 * j)));
    for (int k = 0; k < kBatch; ++k) {
        _mm_store_sd(&acc[0][k], sum[k]);
        _mm_storeh_pd(&acc[1][k], sum[k]);
    }
}
#endif

// A batch of outputs from blended fine rows: lo[k] + a[k] x slope[k] (taps doubled) against the window of
// output k. Even and odd taps are summed apart, each from the oldest to the newest, then added: the same
// operations, in the same order, on every instruction set.
struct FineBatch {
    const double* lo[kBatch];
    const double* slope[kBatch];
    double a[kBatch];
    const double* window[kBatch];
};

#if !ULVETTA_RESAMPLER_SSE2
void fineBatchPlain(const FineBatch& b, int taps, double (*acc)[kBatch]) {
    for (int k = 0; k < kBatch; ++k) {
        double sum[4] = {0.0, 0.0, 0.0, 0.0};  // left even, right even, left odd, right odd
        for (int j = 0; j < 2 * taps; j += 4)
            for (int i = 0; i < 4; ++i) sum[i] += (b.lo[k][j + i] + b.a[k] * b.slope[k][j + i]) * b.window[k][j + i];
        acc[0][k] = sum[0] + sum[2];
        acc[1][k] = sum[1] + sum[3];
    }
}
#endif

#if ULVETTA_RESAMPLER_SSE2
void fineBatchSse2(const FineBatch& b, int taps, double (*acc)[kBatch]) {
    __m128d even[kBatch], odd[kBatch], a[kBatch];
    for (int k = 0; k < kBatch; ++k) {
        even[k] = odd[k] = _mm_setzero_pd();
        a[k] = _mm_set1_pd(b.a[k]);
    }
    for (int j = 0; j < 2 * taps; j += 4)
        for (int k = 0; k < kBatch; ++k) {
            const __m128d r0 = _mm_add_pd(_mm_loadu_pd(b.lo[k] + j), _mm_mul_pd(a[k], _mm_loadu_pd(b.slope[k] + j)));
            const __m128d r1 =
                _mm_add_pd(_mm_loadu_pd(b.lo[k] + j + 2), _mm_mul_pd(a[k], _mm_loadu_pd(b.slope[k] + j + 2)));
            even[k] = _mm_add_pd(even[k], _mm_mul_pd(r0, _mm_loadu_pd(b.window[k] + j)));
            odd[k] = _mm_add_pd(odd[k], _mm_mul_pd(r1, _mm_loadu_pd(b.window[k] + j + 2)));
        }
    for (int k = 0; k < kBatch; ++k) {
        double e[2], o[2];
        _mm_storeu_pd(e, even[k]);
        _mm_storeu_pd(o, odd[k]);
        acc[0][k] = e[0] + o[0];
        acc[1][k] = e[1] + o[1];
    }
}
#endif

#if ULVETTA_RESAMPLER_SSE2 && defined(__GNUC__)
#define ULVETTA_RESAMPLER_AVX 1
// Two taps of both channels per register: lanes are left even, right even, left odd, right odd.
__attribute__((target("avx"))) void fineBatchAvx(const FineBatch& b, int taps, double (*acc)[kBatch]) {
    __m256d sum[kBatch], a[kBatch];
    for (int k = 0; k < kBatch; ++k) {
        sum[k] = _mm256_setzero_pd();
        a[k] = _mm256_set1_pd(b.a[k]);
    }
    for (int j = 0; j < 2 * taps; j += 4)
        for (int k = 0; k < kBatch; ++k) {
            const __m256d r =
                _mm256_add_pd(_mm256_loadu_pd(b.lo[k] + j), _mm256_mul_pd(a[k], _mm256_loadu_pd(b.slope[k] + j)));
            sum[k] = _mm256_add_pd(sum[k], _mm256_mul_pd(r, _mm256_loadu_pd(b.window[k] + j)));
        }
    for (int k = 0; k < kBatch; ++k) {
        double s[4];
        _mm256_storeu_pd(s, sum[k]);
        acc[0][k] = s[0] + s[2];
        acc[1][k] = s[1] + s[3];
    }
}

bool hasAvx() {
    __builtin_cpu_init();
    return __builtin_cpu_supports("avx") != 0;
}
#else
#define ULVETTA_RESAMPLER_AVX 0
#endif

void fineBatch(const FineBatch& b, int taps, double (*acc)[kBatch]) {
#if ULVETTA_RESAMPLER_AVX
    static const bool avx = hasAvx();
    if (avx) return fineBatchAvx(b, taps, acc);
#endif
#if ULVETTA_RESAMPLER_SSE2
    fineBatchSse2(b, taps, acc);
#else
    fineBatchPlain(b, taps, acc);
#endif
}

}  // namespace

int IrResampler::Convert(float* out, const float* in, int channels, int frames, int maxOut) {
    if (frames <= 0 || maxOut <= 0) return 0;
    if (table_.empty()) BuildTable();
    // Output n reads the inputs up to floor(n M / L); it exists while that input does.
    const int64_t available = (static_cast<int64_t>(frames) * L_ - 1) / M_ + 1;
    const int count = static_cast<int>(std::min<int64_t>(available, maxOut));

    // The input frames as doubles behind N - 1 zero frames: the window of an output whose newest input is
    // frame k is frames k .. k + N - 1 of padded.
    std::vector<double> padded(2 * (static_cast<size_t>(N_ - 1) + frames), 0.0);
    for (int i = 0; i < frames; ++i)
        for (int c = 0; c < channels; ++c) padded[2 * (static_cast<size_t>(N_ - 1) + i) + c] = in[2 * static_cast<int64_t>(i) + c];

    int64_t phase = 0, base = 0;
    for (int n0 = 0; n0 < count; n0 += kBatch) {
        const int batch = std::min(kBatch, count - n0);
        const double* rows[kBatch];
        FineBatch fine;
        for (int k = 0; k < kBatch; ++k) {
            if (k >= batch) {  // a short last batch repeats its first output, which is not written
                rows[k] = rows[0];
                fine.lo[k] = fine.lo[0];
                fine.slope[k] = fine.slope[0];
                fine.a[k] = fine.a[0];
                fine.window[k] = fine.window[0];
                continue;
            }
            const int64_t newest = (M_ * phase) / L_ + base;
            fine.window[k] = padded.data() + 2 * newest;
            if (!fine_) {
                rows[k] = &table_[static_cast<size_t>(phase) * N_];
            } else {
                // The fractional position from the exact remainder of M x phase / L.
                const double x = static_cast<double>((M_ * phase) % L_) / static_cast<double>(L_) * kFineRows;
                const int q = std::min(static_cast<int>(x), kFineRows - 1);
                fine.lo[k] = &table_[2 * static_cast<size_t>(q) * N_];
                fine.slope[k] = &slopes_[2 * static_cast<size_t>(q) * N_];
                fine.a[k] = x - q;
            }
            if (++phase == L_) {
                phase = 0;
                base += M_;
            }
        }
        double acc[2][kBatch];
        if (fine_)
            fineBatch(fine, N_, acc);
        else if (channels == 2)
            dotBatch<2>(rows, fine.window, N_, acc);
        else
            dotBatch<1>(rows, fine.window, N_, acc);
        for (int k = 0; k < batch; ++k)
            for (int c = 0; c < channels; ++c) out[2 * static_cast<int64_t>(n0 + k) + c] = static_cast<float>(acc[c][k]);
    }
    return count;
}

}  // namespace ulvetta
