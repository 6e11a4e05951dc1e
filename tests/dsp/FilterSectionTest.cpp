#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <vector>

#include "processing/BiquadSection.h"

using namespace ulvetta;

namespace {

// Magnitude of the section's response at frequency f for rate r, from its coefficients.
double magnitude(const BiquadSection& s, double f, double r) {
    const std::complex<double> z1 = std::polar(1.0, -2.0 * M_PI * f / r);
    const std::complex<double> z2 = z1 * z1;
    return std::abs((s.b0 + s.b1 * z1 + s.b2 * z2) / (1.0 + s.a1 * z1 + s.a2 * z2));
}

// Steady-state gain measured by running a sine through the section.
double measuredGain(BiquadSection s, double f, int r) {
    const int n = r;  // one second
    std::vector<float> x(n);
    for (int i = 0; i < n; ++i) x[i] = static_cast<float>(0.5 * std::sin(2.0 * M_PI * f * i / r));
    ProcessMono(s, x.data(), n);
    double peak = 0.0;
    for (int i = n / 2; i < n; ++i) peak = std::max(peak, std::fabs(static_cast<double>(x[i])));
    return peak / 0.5;
}

}  // namespace

// Low and high pass (Q 0.5) are -6 dB at their corner, without a resonant peak; the notch reaches its gain at
// its frequency and is flat far from it; measured with sines as well as from the coefficients.
TEST(FilterSection, ResponsesFromTheirDesigns) {
    for (int f : {20, 1000, 9999}) {
        BiquadSection s;
        DesignLowPass(s, 44100, f);
        EXPECT_NEAR(magnitude(s, 0.0, 44100), 1.0, 1e-9);
        EXPECT_NEAR(magnitude(s, f, 44100), 0.5, 1e-6);
        for (double g = 1.0; g < 22050.0; g *= 1.05) ASSERT_LE(magnitude(s, g, 44100), 1.0 + 1e-9) << f << " at " << g;
    }
    BiquadSection low, high, cut, boost;
    DesignLowPass(low, 44100, 9999);
    EXPECT_LT(measuredGain(low, 15000.0, 44100), 0.3);
    DesignHighPass(high, 44100, 101);
    EXPECT_NEAR(magnitude(high, 101, 44100), 0.5, 1e-6);
    EXPECT_NEAR(magnitude(high, 22050.0, 44100), 1.0, 1e-9);
    EXPECT_LT(measuredGain(high, 20.0, 44100), 0.1);
    DesignNotch(cut, 48000, 2000, 3.0, -12.0);
    DesignNotch(boost, 48000, 2000, 3.0, 12.0);
    EXPECT_NEAR(20.0 * std::log10(magnitude(boost, 2000, 48000)), 12.0, 1e-6);
    EXPECT_NEAR(measuredGain(cut, 2000, 48000), std::pow(10.0, -0.6), 0.01);
    EXPECT_NEAR(magnitude(cut, 20.0, 48000), 1.0, 1e-3);
}

// The stereo form filters each channel as the mono form does.
TEST(FilterSection, StereoFormMatchesMonoPerChannel) {
    BiquadSection mono, stereo;
    DesignLowPass(mono, 44100, 800);
    DesignLowPass(stereo, 44100, 800);
    std::vector<float> left(256), both(512, 0.0f);
    for (int i = 0; i < 256; ++i) left[i] = both[2 * i] = static_cast<float>(std::sin(i * 0.3));
    ProcessMono(mono, left.data(), 256);
    ProcessInterleaved(stereo, both.data(), 256);
    for (int i = 0; i < 256; ++i) ASSERT_TRUE(both[2 * i] == left[i] && both[2 * i + 1] == 0.0f) << i;
}

TEST(FilterSection, DecaysToExactZerosNeverDenormals) {
    BiquadSection s;
    DesignNotch(s, 44100, 3000, 0.5, 12.0);
    std::vector<float> x(4096, 0.0f);
    for (int i = 0; i < 64; ++i) x[i] = (i % 2) ? 1.0f : -1.0f;
    for (int block = 0; block < 200; ++block) {
        ProcessMono(s, x.data(), 4096);
        std::fill(x.begin(), x.end(), 0.0f);
    }
    EXPECT_TRUE(s.x1L == 0.0 && s.x2L == 0.0 && s.y1L == 0.0 && s.y2L == 0.0);
}
