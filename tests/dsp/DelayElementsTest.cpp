// The per-sample delay elements: exact integer delays, the allpass forms from their difference equations,
// the modulator's offsets and period, the modulated read's interpolation.
#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "processing/DelayElements.h"

namespace ulvetta {
namespace {

DelayLine MakeLine(int length, double gain) {
    DelayLine l;
    // 29761 Hz at room size 50 keeps the base length; lines shorter than 220 need the early-line form,
    // which raises to a prime, so use prime lengths there.
    l.ConfigureLine(29761, 50, length, gain, 0, 0.0, length >= 220);
    EXPECT_EQ(l.length, length);
    return l;
}

TEST(DelayElements, DelayAndPreDelayReturnTheirInputExactlyLengthSamplesLater) {
    PreDelayLine pre;
    pre.Create(44);
    PreDelayView p = ViewOf(pre);
    for (int i = 0; i < 200; ++i) ASSERT_EQ(PreDelayStep(p, i + 1.0), i < 44 ? 0.0 : i + 1.0 - 44) << i;
    for (int n : {220, 257, 1009}) {
        DelayLine line = MakeLine(n, 0.0);
        LineView l = ViewOf(line);
        std::vector<double> in(3 * n);
        for (size_t i = 0; i < in.size(); ++i) in[i] = std::sin(0.37 * i) + 0.001 * i;
        for (size_t i = 0; i < in.size(); ++i) {
            const double y = Delay(l, in[i]);
            ASSERT_EQ(y, i < static_cast<size_t>(n) ? 0.0 : in[i - n]) << "length " << n << " sample " << i;
        }
    }
}

// Impulse response of y = g v + z, v = x - g z (A) and y = z - g v, v = x + g z (B) over a delay of N:
// first g (A) or -g (B), then 1 - g^2 at N, and unit energy overall. With g = 0 both are plain delays of N.
TEST(DelayElements, AllpassImpulseResponsesFollowTheirDifferenceEquations) {
    const int n = 229;
    for (double g : {0.81, 0.5, -0.65, 0.0}) {
        DelayLine la = MakeLine(n, g), lb = MakeLine(n, g);
        LineView a = ViewOf(la), b = ViewOf(lb);
        double energyA = 0.0, energyB = 0.0;
        for (int i = 0; i < 200 * n; ++i) {
            const double x = (i == 0) ? 1.0 : 0.0;
            const double ya = AllpassA(a, x), yb = AllpassB(b, x);
            if (i == 0 || i == n) {
                EXPECT_DOUBLE_EQ(ya, i == 0 ? g : 1.0 - g * g);
                EXPECT_DOUBLE_EQ(yb, i == 0 ? -g : 1.0 - g * g);
            } else if (i % n != 0) {
                ASSERT_TRUE(ya == 0.0 && yb == 0.0) << i;
            }
            energyA += ya * ya;
            energyB += yb * yb;
        }
        EXPECT_NEAR(energyA, 1.0, 1e-9) << g;
        EXPECT_NEAR(energyB, 1.0, 1e-9) << g;
    }
}

TEST(DelayElements, ModulatorPeriodRoundsUpAndOffsetsSweepAHalfSine) {
    Modulator m;
    m.SetModSampleRate(48000);
    m.SetModRate(0.27);  // 177777.8 samples, rounded up
    EXPECT_EQ(m.period, 177778);
    m.SetModRate(0.5);  // 96000: a quarter period is a whole number of samples
    EXPECT_EQ(m.period, 96000);
    m.SetModDepth(7);
    const int p = m.period;
    for (int i = 0; i < 2 * p; ++i) {
        const double offset = m.Tick();
        const int phase = i % p;
        if (phase == 0 || phase == p / 4 || phase == p / 2) {
            const double expected = phase == 0 ? 0.0 : phase == p / 2 ? 7.0 : 7.0 * std::sqrt(0.5);
            ASSERT_NEAR(offset, expected, phase == p / 4 ? 1e-9 : phase == p / 2 ? 1e-12 : 0.0) << i;
        }
        ASSERT_TRUE(offset >= 0.0 && offset <= 7.0) << i;
    }
}

// A modulated read returns the signal at a delay of length - offset samples, interpolated between the two
// stored neighbours: exact on a ramp, and never louder than the signal on an alternating (Nyquist) input,
// where extrapolating past a neighbour would approach twice the amplitude.
TEST(DelayElements, ModulatedReadInterpolatesBetweenNeighbours) {
    const int n = 401, depth = 9, rate = 1000;
    DelayLine rampLine = MakeLine(n, 0.0), nyquistLine = MakeLine(n, 0.0);
    for (DelayLine* l : {&rampLine, &nyquistLine}) {
        l->mod.reset(new Modulator);
        l->mod->SetModSampleRate(rate);
        l->mod->SetModRate(3.0);  // 334-sample period: every fractional offset in both halves occurs
        l->mod->SetModDepth(depth);
    }
    LineView ramp = ViewOf(rampLine), nyquist = ViewOf(nyquistLine);
    Modulator reference = *rampLine.mod;
    bool sawNegativeFraction = false, sawPositiveFraction = false;
    for (int i = 0; i < 4 * n; ++i) {
        const double offset = reference.Tick();
        const double f = offset - std::nearbyint(offset);
        sawNegativeFraction |= f < -0.1;
        sawPositiveFraction |= f > 0.1;
        const double x = i;
        const double y = Delay(ramp, x);
        const double alternating = Delay(nyquist, (i % 2) ? -1.0 : 1.0);
        if (i >= n) {
            ASSERT_NEAR(y, x - (n - offset), 1e-9) << "sample " << i << " offset " << offset;
            ASSERT_LE(std::fabs(alternating), 1.0 + 1e-12) << "sample " << i << " offset " << offset;
            ASSERT_NEAR(std::fabs(alternating), std::fabs(1.0 - 2.0 * std::fabs(f)), 1e-9) << i;
        }
    }
    EXPECT_TRUE(sawNegativeFraction);
    EXPECT_TRUE(sawPositiveFraction);
}

}  // namespace
}  // namespace ulvetta
