// IrResampler: converts a stored impulse response from 44100 Hz to the stream's rate with a rational
// polyphase FIR interpolator (a Gaussian-windowed sinc). Runs while a response is prepared, never on the
// audio path; converts one channel of an interleaved stereo buffer, or both at once.
//
// The kernel's cutoff stays below the stored data's own Nyquist frequency at every output rate, so
// converting up adds no spectral images. Up to kExactRows phase rows (every usual rate needs at most
// 5120) each row is tabulated exactly. A rate whose ratio needs more rows (44101 Hz needs 44101) reads its
// rows from a fine table of kFineRows + 1 evenly spaced phases, blended linearly between the two nearest;
// the blend departs from the exact row by less than 1e-7 of full scale on the output.
#pragma once

#include <cstdint>
#include <vector>

namespace ulvetta {

class IrResampler {
public:
    static constexpr int64_t kExactRows = 8192;
    static constexpr int kFineRows = 2048;

    IrResampler() = default;

    // Derives the filter for an output rate in Hz; rates below 1 are taken as 1.
    void Setup(int outputRate);
    // Reads frames input samples from in[0], in[2], ... and writes output samples to out[0], out[2], ...,
    // at most maxOut of them. Returns the number written. Allocates (the padded input and the table).
    int Run(float* out, const float* in, int frames, int maxOut) { return Convert(out, in, 1, frames, maxOut); }
    // The same for both channels of an interleaved stereo buffer at once; returns the frames written.
    int RunStereo(float* out, const float* in, int frames, int maxOut) { return Convert(out, in, 2, frames, maxOut); }

    int taps() const { return N_; }
    int64_t upFactor() const { return L_; }
    int64_t downFactor() const { return M_; }
    double cutoff() const { return cutoff_; }
    // Phase rows tabulated exactly at most; beyond it rows come from the fine table. For tests.
    void setExactLimit(int64_t rows) { exactLimit_ = rows; }

private:
    double Kernel(double t) const;
    // The row of fractional position f (0 <= f <= 1) between input samples.
    void FillRow(double f, double* row) const;
    // The fractional position of phase row p.
    double Fraction(int64_t p) const;
    void BuildTable();
    int Convert(float* out, const float* in, int channels, int frames, int maxOut);

    double gain_ = 0.9;
    int N_ = 0;
    int lead_ = 0;
    int64_t L_ = 1;
    int64_t M_ = 1;
    bool fine_ = false;           // rows blended from the fine table
    std::vector<double> table_;   // L exact rows of N, or kFineRows + 1 fine rows
    std::vector<double> slopes_;  // fine rows only: row q + 1 - row q, for q below kFineRows
    int64_t exactLimit_ = kExactRows;
    double inputRate_ = 44100.0;
    double cutoff_ = 0.0;
    double width_ = 205.0;
};

}  // namespace ulvetta
