// IrResampler: converts a stored impulse response from 44100 Hz to the stream's rate with a rational
// polyphase FIR interpolator (a Gaussian-windowed sinc). Runs once per channel over an interleaved stereo
// buffer while a response is prepared, never on the audio path.
//
// The kernel's cutoff stays below the stored data's own Nyquist frequency at every output rate, so
// converting up adds no spectral images. When the rate ratio needs very many phases (a rate such as
// 44101 Hz has 44101), each phase row is derived as it is needed instead of being tabulated; the results
// are the same either way.
#pragma once

#include <cstdint>
#include <memory>
#include <vector>

namespace ulvetta {

class IrResampler {
public:
    IrResampler();

    // Derives the filter for an output rate in Hz (1 or more).
    void Setup(int outputRate);
    // Reads frames input samples from in[0], in[2], ... and writes output samples to out[0], out[2], ...,
    // at most maxOut of them. Returns the number written.
    int Run(float* out, const float* in, int frames, int maxOut);

    int taps() const { return N_; }
    int64_t upFactor() const { return L_; }
    int64_t downFactor() const { return M_; }
    double cutoff() const { return cutoff_; }
    // Phase rows kept in a table at most; beyond it rows are derived on use. For tests.
    void setTableLimit(int64_t rows) { tableLimit_ = rows; }

private:
    double Kernel(double t) const;
    void FillRow(int64_t p, double* row) const;
    const double* Row(int64_t p);

    double gain_ = 0.9;
    int N_ = 0;
    int lastTap_ = 0;
    int64_t L_ = 1;
    int64_t M_ = 1;
    int lead_ = 0;
    std::vector<double> table_;  // L rows of N, when tabulated
    int64_t tableLimit_ = 8192;
    std::vector<double> row_;    // the current row, when derived on use
    int64_t rowPhase_ = -1;
    double inputRate_ = 44100.0;
    double outputRate_ = 44100.0;
    double cutoff_ = 0.0;
    double width_ = 205.0;
    int64_t base_ = 0;
    int64_t phase_ = 0;
    std::vector<double> ring_;
    int windowStart_ = 0;
    int writeIndex_ = 0;
    int64_t consumed_ = -1;
};

}  // namespace ulvetta
