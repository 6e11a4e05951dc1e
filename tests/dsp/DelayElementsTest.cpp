// The per-sample delay elements: exact integer delays, the allpass forms from their difference equations,
// the modulator's offsets and period, the modulated read's interpolation, taps and the denormal flush.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
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

TEST(DelayElements, DelayReturnsItsInputExactlyLengthSamplesLater) {
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
            if (i == 0) {
                EXPECT_DOUBLE_EQ(ya, g);
                EXPECT_DOUBLE_EQ(yb, -g);
            } else if (i == n) {
                EXPECT_DOUBLE_EQ(ya, 1.0 - g * g);
                EXPECT_DOUBLE_EQ(yb, 1.0 - g * g);
            } else if (i % n != 0) {
                ASSERT_EQ(ya, 0.0);
                ASSERT_EQ(yb, 0.0);
            }
            energyA += ya * ya;
            energyB += yb * yb;
        }
        EXPECT_NEAR(energyA, 1.0, 1e-9) << g;
        EXPECT_NEAR(energyB, 1.0, 1e-9) << g;
    }
}

TEST(DelayElements, WriteOnlyCombWriteAndOldest) {
    DelayLine lw = MakeLine(227, 0.0), lc = MakeLine(227, 0.5);
    LineView w = ViewOf(lw), c = ViewOf(lc);
    for (int i = 0; i < 3 * 227; ++i) {
        const double x = (i == 0) ? 1.0 : 0.0;
        // Oldest is the sample stored a full length ago, i.e. the one about to be overwritten.
        const double expectedOldest = (i > 0 && i % 227 == 0 && i / 227 == 1) ? 1.0 : 0.0;
        ASSERT_EQ(Oldest(w), expectedOldest) << i;
        // The comb recirculates at its gain once per length.
        const double expectedComb = (i > 0 && i % 227 == 0) ? std::pow(0.5, i / 227 - 1) : 0.0;
        ASSERT_EQ(Oldest(c), expectedComb) << i;
        WriteOnly(w, x);
        CombWrite(c, x);
    }
}

TEST(DelayElements, PreDelayReturnsItsInputLengthSamplesLater) {
    PreDelayLine line;
    line.Create(44);
    PreDelayView p = ViewOf(line);
    for (int i = 0; i < 200; ++i) {
        const double y = PreDelayStep(p, i + 1.0);
        ASSERT_EQ(y, i < 44 ? 0.0 : i + 1.0 - 44) << i;
    }
}

// A tap at position P in a line of length N reads the sample written (P - 1) mod N samples before the
// latest, so a position past the end of a short line wraps around. The line and its tap advance in runs
// as in the kernels, over blocks of odd sizes that cut runs short, and the positions are stored back
// between blocks. Oldest after the write reads the sample written N - 1 samples before the latest.
TEST(DelayElements, TapsReadAFixedDelayAndWrapInShortLines) {
    const int n = 220;
    for (int position : {0, 1, 121, 219, 266, 1996, 3627}) {
        DelayLine line = MakeLine(n, 0.0);
        OutputTap tap{position % n, n};
        const int tapLine = 0;
        const int delay = ((position - 1) % n + n) % n;
        int i = 0;
        for (int block : {1, 7, 220, 219, 64, 333, 5}) {
            LineRuns runs;
            runs.Load(&line, 1, &tap, &tapLine, 1);
            for (int done = 0; done < block;) {
                const int run = runs.Begin(block - done);
                ASSERT_GE(run, 1);
                for (int j = 0; j < run; ++j, ++i, ++done) {
                    WriteOnly(At(runs.lines[0], j), i + 1.0);
                    ASSERT_EQ(runs.Tap(0, j), i >= delay ? i + 1.0 - delay : 0.0)
                        << "position " << position << " at " << i;
                    ASSERT_EQ(OldestAfterWrite(runs.lines[0], j), i >= n - 1 ? i + 2.0 - n : 0.0) << i;
                }
                runs.End(run);
            }
            runs.Store(&line, &tap);
            ASSERT_GE(tap.index, 0);
            ASSERT_LT(tap.index, n);
        }
    }
}

TEST(DelayElements, ModulatorPeriodRoundsUpAndOffsetsSweepAHalfSine) {
    Modulator m;
    m.SetModSampleRate(48000);
    m.SetModRate(0.27);  // 177777.8 samples
    EXPECT_EQ(m.period, 177778);
    m.SetModRate(0.5);  // exactly 96000
    EXPECT_EQ(m.period, 96000);
    m.SetModDepth(7);
    const int p = m.period;
    for (int i = 0; i < 2 * p; ++i) {
        const double offset = m.Tick();
        const int phase = i % p;
        if (phase == 0) {
            ASSERT_EQ(offset, 0.0);
        } else if (phase == p / 2) {
            ASSERT_NEAR(offset, 7.0, 1e-12);
        } else if (phase == p / 4) {
            ASSERT_NEAR(offset, 7.0 * std::sqrt(0.5), 1e-9);
        }
        ASSERT_GE(offset, 0.0);
        ASSERT_LE(offset, 7.0);
    }
    // A later rate change keeps the phase, clamped into the new period.
    for (int i = 0; i < 5000; ++i) m.Tick();
    m.SetModSampleRate(8000);  // period 16000
    EXPECT_EQ(m.phase, 5000);
    m.SetModRate(4000.0);  // period 2 (2.0 + 0.5 ties to even)
    EXPECT_EQ(m.period, 2);
    EXPECT_EQ(m.phase, 1);
}

TEST(DelayElements, ModulatedLineWithZeroDepthIsAPlainLine) {
    DelayLine plainLine = MakeLine(331, 0.6), modulatedLine = MakeLine(331, 0.6);
    modulatedLine.mod.reset(new Modulator);
    modulatedLine.mod->SetModSampleRate(44100);
    modulatedLine.mod->SetModRate(0.7);
    modulatedLine.mod->SetModDepth(0);
    LineView plain = ViewOf(plainLine), modulated = ViewOf(modulatedLine);
    for (int i = 0; i < 2000; ++i) {
        const double x = std::sin(0.05 * i);
        ASSERT_EQ(AllpassB(modulated, x), AllpassB(plain, x)) << i;
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

// A recirculating tail decays through the denormal range; no line ever stores a denormal value: it becomes
// an exact zero, for every element that writes.
TEST(DelayElements, NoElementStoresADenormal) {
    const int n = 227;
    DelayLine lc = MakeLine(n, 0.5), la = MakeLine(n, 0.5), lb = MakeLine(n, 0.5), ld = MakeLine(n, 0.0),
              lw = MakeLine(n, 0.0);
    LineView comb = ViewOf(lc), a = ViewOf(la), b = ViewOf(lb), d = ViewOf(ld), w = ViewOf(lw);
    bool reachedZero = false;
    for (int i = 0; i < 1200 * n; ++i) {
        const double x = (i == 0) ? 1e-300 : 0.0;
        CombWrite(comb, x);
        // The delay and write-only lines carry the comb's decaying output.
        const double z = Oldest(comb);
        Delay(d, z * 0.9);
        WriteOnly(w, z * 0.9);
        AllpassA(a, x);
        AllpassB(b, x);
        for (const LineView* l : {&comb, &a, &b, &d, &w}) {
            int32_t k = l->writeIndex + 1;
            if (k == l->length) k = 0;
            const double v = l->samples[k];
            ASSERT_TRUE(v == 0.0 || std::fabs(v) >= std::numeric_limits<double>::min()) << "sample " << i;
        }
        if (i > n && Oldest(comb) == 0.0) reachedZero = true;
    }
    EXPECT_TRUE(reachedZero);
    for (int i = 0; i < n; ++i) {
        ASSERT_EQ(lc.samples[i], 0.0);
        ASSERT_EQ(la.samples[i], 0.0);
        ASSERT_EQ(lb.samples[i], 0.0);
    }
}

}  // namespace
}  // namespace ulvetta
