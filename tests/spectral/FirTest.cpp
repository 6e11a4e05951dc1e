// The FIR filter against direct convolution, across the moves of its window back into the buffer.
#include <vector>

#include "SpectralTestSupport.h"

using namespace ulvetta;
using namespace spectral_test;

namespace {

// Runs input through a filter initialised with h and past inputs `past` (oldest first) and checks every
// output against y[n] = sum_k h[k] x[n - k] computed in long double.
void expectDirectConvolution(const std::vector<float>& h, const std::vector<float>& past,
                             const std::vector<float>& input) {
    FirState s;
    ASSERT_NE(nspsFirInit(h.data(), int(h.size()), past.empty() ? nullptr : past.data(), &s), 0);
    std::vector<float> history(past);
    if (history.empty()) history.assign(h.size() - 1, 0.0f);
    history.insert(history.end(), input.begin(), input.end());
    const std::size_t offset = h.size() - 1;
    for (std::size_t n = 0; n < input.size(); ++n) {
        long double ref = 0.0L, mag = 0.0L;
        for (std::size_t k = 0; k < h.size(); ++k) {
            const long double p = (long double)h[k] * history[offset + n - k];
            ref += p;
            mag += p < 0 ? -p : p;
        }
        const float y = nspsFir(&s, input[n]);
        // Double accumulation then one rounding to float.
        ASSERT_LE(std::fabs((long double)y - ref), kEps * std::fabs(double(ref)) + 1e-14 * double(mag))
            << "taps " << h.size() << ", sample " << n;
    }
    nspFirFree(&s);
    EXPECT_EQ(s.initMarker, nullptr);
}

}  // namespace

TEST(Fir, MatchesDirectConvolutionAcrossWindowMoves) {
    // 64 taps: the window moves back every 128 samples; 200 taps: every 200. 1000 samples cross several.
    for (int len : {1, 7, 8, 9, 64, 200}) {
        const std::vector<float> h = randomFloats(len, seed(1300 + len));
        const std::vector<float> input = randomFloats(1000, seed(1400 + len), -2.0f, 2.0f);
        expectDirectConvolution(h, {}, input);
        expectDirectConvolution(h, randomFloats(len - 1, seed(1500 + len)), input);
    }
}

TEST(Fir, UnitTapPassesInputAndImpulseGivesTheTaps) {
    std::vector<float> h(64, 0.0f);
    h[0] = 1.0f;
    FirState s;
    ASSERT_NE(nspsFirInit(h.data(), 64, nullptr, &s), 0);
    EXPECT_EQ(s.tapsLen, 64);
    EXPECT_EQ(s.dlyLen, 63);
    EXPECT_EQ(s.spare, 128);
    EXPECT_EQ(s.upFactor, 1);
    EXPECT_EQ(s.downFactor, 1);
    EXPECT_EQ(reinterpret_cast<std::uintptr_t>(s.taps) % 32, 0u);
    EXPECT_EQ(reinterpret_cast<std::uintptr_t>(s.buffer) % 32, 0u);
    const std::vector<float> x = randomFloats(400, seed(1600));
    for (std::size_t n = 0; n < x.size(); ++n) ASSERT_EQ(nspsFir(&s, x[n]), x[n]) << n;

    const std::vector<float> r = randomFloats(64, seed(1700));
    nspsFirSetTaps(r.data(), &s);
    nspsFirSetDlyl(nullptr, &s);  // silence the memory; the taps stay
    for (int n = 0; n < 300; ++n) {
        const float y = nspsFir(&s, n == 0 ? 1.0f : 0.0f);
        ASSERT_EQ(y, n < 64 ? r[n] : 0.0f) << n;
    }
    // 63 explicit zeros silence it just as well, after a stretch of noise.
    for (float v : x) nspsFir(&s, v);
    const std::vector<float> zeros(63, 0.0f);
    nspsFirSetDlyl(zeros.data(), &s);
    for (int n = 0; n < 70; ++n) ASSERT_EQ(nspsFir(&s, n == 0 ? 1.0f : 0.0f), n < 64 ? r[n] : 0.0f) << n;
    // Null taps: all zero.
    nspsFirSetTaps(nullptr, &s);
    for (float v : x) ASSERT_EQ(nspsFir(&s, v), 0.0f);
    nspFirFree(&s);
}

TEST(Fir, ReinitialisingReleasesTheOldBuffers) {
    CaptureErrors cap;
    FirState s;
    const std::vector<float> a = randomFloats(64, seed(1800)), b = randomFloats(5, seed(1900));
    ASSERT_NE(nspsFirInit(a.data(), 64, nullptr, &s), 0);
    for (int n = 0; n < 100; ++n) nspsFir(&s, 1.0f);
    ASSERT_NE(nspsFirInit(b.data(), 5, nullptr, &s), 0);  // the sanitizer build reports a leak if not freed
    EXPECT_EQ(s.tapsLen, 5);
    for (int n = 0; n < 5; ++n) ASSERT_EQ(nspsFir(&s, n == 0 ? 1.0f : 0.0f), b[n]);
    nspFirFree(&s);
    EXPECT_EQ(cap.take().calls, 0);
}

TEST(Fir, EveryInstructionSetGivesTheSameBits) {
    std::vector<float> h(64), x(700);
    for (std::size_t i = 0; i < h.size(); ++i) h[i] = float(std::sin(0.37 * double(i)) * 0.3);
    for (std::size_t i = 0; i < x.size(); ++i) x[i] = float(std::cos(1.3 * double(i)) + 0.25 * std::sin(0.11 * double(i)));
    std::vector<std::vector<float>> results;
    for (spectral::Isa isa : availableIsas()) {
        IsaScope scope(isa);
        FirState s;
        ASSERT_NE(nspsFirInit(h.data(), int(h.size()), nullptr, &s), 0);
        std::vector<float> y;
        for (float v : x) y.push_back(nspsFir(&s, v));
        nspFirFree(&s);
        results.push_back(y);
    }
    ASSERT_FALSE(results.empty());
    for (const auto& r : results) EXPECT_EQ(r, results.front());
}
