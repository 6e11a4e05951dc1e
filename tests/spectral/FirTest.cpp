// The FIR filter against direct convolution on every instruction set, across the moves of its window back into
// the buffer.
#include <vector>

#include "SpectralTestSupport.h"

using namespace ulvetta;
using namespace spectral_test;

namespace {

// Runs input through a filter initialised with h and past inputs `past` (oldest first) on every instruction set,
// checks every output against y[n] = sum_k h[k] x[n - k] computed in long double, and the sets against each
// other bit for bit.
void expectDirectConvolution(const std::vector<float>& h, const std::vector<float>& past,
                             const std::vector<float>& input) {
    std::vector<float> history(past), first;
    if (history.empty()) history.assign(h.size() - 1, 0.0f);
    history.insert(history.end(), input.begin(), input.end());
    const std::size_t offset = h.size() - 1;
    for (spectral::Isa isa : availableIsas()) {
        IsaScope scope(isa);
        FirState s;
        ASSERT_NE(nspsFirInit(h.data(), int(h.size()), past.empty() ? nullptr : past.data(), &s), 0);
        std::vector<float> out;
        for (std::size_t n = 0; n < input.size(); ++n) {
            long double ref = 0.0L, mag = 0.0L;
            for (std::size_t k = 0; k < h.size(); ++k) {
                const long double p = (long double)h[k] * history[offset + n - k];
                ref += p;
                mag += p < 0 ? -p : p;
            }
            out.push_back(nspsFir(&s, input[n]));
            // Double accumulation then one rounding to float.
            ASSERT_LE(std::fabs((long double)out.back() - ref), kEps * std::fabs(double(ref)) + 1e-14 * double(mag))
                << "taps " << h.size() << ", sample " << n << ", instruction set " << int(isa);
        }
        nspFirFree(&s);
        EXPECT_EQ(s.initMarker, nullptr);
        if (first.empty()) first = out;
        ASSERT_EQ(out, first) << "taps " << h.size() << ", instruction set " << int(isa);
    }
}

}  // namespace

TEST(Fir, MatchesDirectConvolutionAcrossWindowMovesOnEveryInstructionSet) {
    // 64 taps: the window moves back every 128 samples; 200 taps: every 200. 1000 samples cross several.
    for (int len : {1, 7, 8, 9, 64, 200}) {
        const std::vector<float> h = randomFloats(len, seed(1300 + len));
        const std::vector<float> input = randomFloats(1000, seed(1400 + len), -2.0f, 2.0f);
        expectDirectConvolution(h, {}, input);
        expectDirectConvolution(h, randomFloats(len - 1, seed(1500 + len)), input);
    }
}

// Initialising again releases the old buffers (the sanitizer build reports a leak otherwise); an impulse
// returns the taps; clearing the delay line (with null or with zeros) silences the memory and keeps the
// taps; null taps give silence.
TEST(Fir, ReinitialisedFilterReturnsItsTapsAndClearingTheLineSilencesIt) {
    const std::vector<float> r = randomFloats(64, seed(1700)), noise = randomFloats(400, seed(1600));
    const std::vector<float> zeros(63, 0.0f);
    FirState s;
    ASSERT_NE(nspsFirInit(noise.data(), 5, nullptr, &s), 0);
    for (float v : noise) nspsFir(&s, v);
    ASSERT_NE(nspsFirInit(r.data(), 64, nullptr, &s), 0);
    for (const float* clear : {zeros.data(), static_cast<const float*>(nullptr), zeros.data()}) {
        for (int n = 0; n < 300; ++n) ASSERT_EQ(nspsFir(&s, n == 0 ? 1.0f : 0.0f), n < 64 ? r[n] : 0.0f) << n;
        for (float v : noise) nspsFir(&s, v);
        nspsFirSetDlyl(clear, &s);
    }
    nspsFirSetTaps(nullptr, &s);
    for (float v : noise) ASSERT_EQ(nspsFir(&s, v), 0.0f);
    nspFirFree(&s);
}
