#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <vector>

#include "engine/ReverbEngine.h"

using namespace ulvetta;

namespace {

double gainOf(int tenthsDb) { return std::pow(10.0, tenthsDb * 0.005); }

// Applies a full parameter set in id order at rate r, the algorithm last, as the core does.
void applyDefaults(ReverbEngine& e, int rate, int mode) {
    e.SetSampleRate(rate);
    e.SetDiffusion(100);
    e.SetPreDelay(32);
    e.SetDecay(47);
    e.SetDamping(30);
    e.SetRoomSize(46);
    e.SetEarlyLevel(1.0);
    e.SetWetLevel(gainOf(-180));
    e.SetDryLevel(1.0);
    e.SetColour(56);
    e.SetInputGain(0);
    e.SetLowPassFreq(10000);
    e.SetHighPassFreq(125);
    e.SetNotchFreq(2000);
    e.SetNotchGain(0.0);
    e.SetNotchQ(3.0);
    e.SetMode(mode);
}

struct Stereo {
    std::vector<float> in, out;
    explicit Stereo(int frames) : in(2 * frames, 0.0f), out(2 * frames, 0.0f) {}
    int run(ReverbEngine& e, int frames, int flush) {
        return e.ProcessBlock(out.data(), out.data() + 1, in.data(), in.data() + 1, frames, 2, 0, flush);
    }
};

bool isBypass(const BiquadSection& s) { return s.b0 == 1.0 && s.b1 == 0.0 && s.b2 == 0.0 && s.a1 == 0.0 && s.a2 == 0.0; }

}  // namespace

TEST(EngineState, StartsWithEveryValueUnset) {
    ReverbEngine e;
    EXPECT_EQ(e.mode, -1);
    EXPECT_EQ(e.diffusion, -1);
    EXPECT_EQ(e.preDelay, -1);
    EXPECT_EQ(e.roomSize, -1);
    EXPECT_EQ(e.earlyLevel, -100000.0);
    EXPECT_EQ(e.notchQ, -1.0);
    EXPECT_EQ(e.notchGain, -100000.0);
    EXPECT_EQ(e.inputGain, 1.0);
    EXPECT_FALSE(e.preDelayOn);
    EXPECT_EQ(e.monoBuffer, nullptr);
    EXPECT_EQ(e.meterSource, 0);
}

TEST(EngineState, FirstApplicationBuildsTheNetworkOnce) {
    for (int mode : {0, 1, 2, 6, 7}) {
        ReverbEngine e;
        applyDefaults(e, 44100, mode);
        EXPECT_EQ(e.rebuildCount, 1) << "mode " << mode;
    }
}

TEST(EngineState, UnchangedValuesDoNotRebuildButDecayDoesInTheEcho) {
    ReverbEngine e;
    applyDefaults(e, 44100, 0);
    const int before = e.rebuildCount;
    e.SetDiffusion(100);
    e.SetPreDelay(32);
    e.SetRoomSize(46);
    e.SetMode(0);
    e.SetNotchFreq(2000);
    e.SetDecay(47);  // mode 0: decay never rebuilds
    EXPECT_EQ(e.rebuildCount, before);
    e.SetMode(7);
    const int echo = e.rebuildCount;
    e.SetDecay(47);
    EXPECT_EQ(e.rebuildCount, echo + 1);
}

TEST(EngineState, PreDelayLengthAndSwitchingOut) {
    ReverbEngine e;
    e.SetSampleRate(44100);
    e.SetMode(0);
    e.SetPreDelay(1);
    EXPECT_TRUE(e.preDelayOn);
    EXPECT_EQ(e.preDelayLine.length, 44);
    e.SetPreDelay(0);
    EXPECT_FALSE(e.preDelayOn);
    EXPECT_EQ(e.preDelayLine.length, 44);  // kept, only switched out
    EXPECT_NE(e.preDelayLine.samples, nullptr);
    e.SetPreDelay(500);
    EXPECT_EQ(e.preDelayLine.length, 22050);
}

TEST(EngineState, ColourCutoffIsLimitedToNyquist) {
    ReverbEngine e;
    e.SetSampleRate(22050);
    e.SetColour(100);
    EXPECT_EQ(e.colourCutoff, 1.0);
    e.SetSampleRate(44100);
    e.SetColour(1);
    EXPECT_DOUBLE_EQ(e.colourCutoff, 239.0 / 22050.0);
}

TEST(EngineState, DerivedCoefficientsUseSinglePrecisionConstants) {
    ReverbEngine e;
    e.SetDecay(100);
    e.SetDamping(99);
    EXPECT_EQ(e.decayCoef, 100 * static_cast<double>(0.008f));
    EXPECT_EQ(e.dampingCoef, 99 * static_cast<double>(0.01f));
    e.SetInputGain(0);
    EXPECT_EQ(e.inputGain, 1.0);
    e.SetInputGain(-60);
    EXPECT_DOUBLE_EQ(e.inputGain, std::pow(10.0, -0.3));
    e.SetDiffusion(40);
    EXPECT_DOUBLE_EQ(e.diffusionCoef, 0.7);
}

TEST(EngineState, FilterBypassRules) {
    ReverbEngine e;
    e.SetSampleRate(44100);
    e.SetLowPassFreq(10000);
    e.SetHighPassFreq(100);
    EXPECT_TRUE(isBypass(e.filterSections[0]) && isBypass(e.filterSections[3]));
    EXPECT_TRUE(isBypass(e.filterSections[1]) && isBypass(e.filterSections[4]));
    e.SetLowPassFreq(9999);
    e.SetHighPassFreq(101);
    EXPECT_FALSE(isBypass(e.filterSections[0]));
    EXPECT_FALSE(isBypass(e.filterSections[1]));
    EXPECT_EQ(e.filterSections[0].b0, e.filterSections[3].b0);
    EXPECT_EQ(e.filterSections[1].a1, e.filterSections[4].a1);
}

TEST(EngineState, NotchWaitsForAllThreeValuesAndZeroGainBypasses) {
    ReverbEngine e;
    e.SetSampleRate(44100);
    e.filterSections[2].b0 = 7.0;  // a marker that only a design or bypass would overwrite
    e.SetNotchFreq(1000);
    e.SetNotchGain(-12.0);
    EXPECT_EQ(e.filterSections[2].b0, 7.0);
    e.SetNotchQ(2.0);
    EXPECT_NE(e.filterSections[2].b0, 7.0);
    EXPECT_FALSE(isBypass(e.filterSections[2]));
    e.SetNotchGain(0.0);
    EXPECT_TRUE(isBypass(e.filterSections[2]) && isBypass(e.filterSections[5]));
}

TEST(EngineState, RoomSizeFloorInTheWarmPlate) {
    ReverbEngine e;
    e.SetSampleRate(44100);
    e.SetMode(1);
    e.SetRoomSize(5);
    EXPECT_EQ(e.roomSize, 20);
    e.SetMode(0);
    EXPECT_EQ(e.roomSize, 20);  // kept until Room Size changes again
    e.SetRoomSize(10);
    EXPECT_EQ(e.roomSize, 10);
    e.SetMode(1);
    EXPECT_EQ(e.roomSize, 10);  // switching to mode 1 does not raise it
}

TEST(EngineState, RateChangeAloneTouchesOnlyTheMeterSmoother) {
    ReverbEngine e;
    applyDefaults(e, 44100, 0);
    const int rebuilds = e.rebuildCount;
    const float b0 = e.smoothCoefs[0];
    const int lineLength = e.delayLines[5].length;
    e.SetSampleRate(96000);
    EXPECT_NE(e.smoothCoefs[0], b0);
    EXPECT_EQ(e.rebuildCount, rebuilds);
    EXPECT_EQ(e.delayLines[5].length, lineLength);
}

TEST(EngineState, MeterSmootherIsTheDesigned2HzLowPass) {
    ReverbEngine e;
    e.SetSampleRate(44100);
    const float* c = e.smoothCoefs;
    // Low-pass at 2.1 Hz, Q 0.62, derived by hand from the bilinear design.
    const double w = 2.0 * M_PI * 2.1 / 44100.0;
    const double alpha = std::sin(w) / (2.0 * 0.62);
    const double a0 = 1.0 + alpha;
    EXPECT_FLOAT_EQ(c[0], static_cast<float>((1.0 - std::cos(w)) / 2.0 / a0));
    EXPECT_FLOAT_EQ(c[1], static_cast<float>((1.0 - std::cos(w)) / a0));
    EXPECT_EQ(c[0], c[2]);
    EXPECT_FLOAT_EQ(c[3], static_cast<float>(-2.0 * std::cos(w) / a0));
    EXPECT_FLOAT_EQ(c[4], static_cast<float>((1.0 - alpha) / a0));
}

// After the stream's rate changes, values whose setters ignore unchanged input are derived again.
TEST(EngineState, PreDelayAndNotchFollowANewRate) {
    ReverbEngine e;
    applyDefaults(e, 44100, 0);
    EXPECT_EQ(e.preDelayLine.length, 1411);  // 32 ms at 44100 Hz
    const double notchB1 = e.filterSections[2].b1;
    e.SetNotchGain(-6.0);
    const double cutB1 = e.filterSections[2].b1;
    EXPECT_NE(cutB1, notchB1);
    applyDefaults(e, 96000, 0);
    e.SetNotchGain(-6.0);
    EXPECT_EQ(e.preDelayLine.length, 3072);  // 32 ms at 96000 Hz
    BiquadSection expected;
    DesignNotch(expected, 96000, 2000, 3.0, -6.0);
    EXPECT_EQ(e.filterSections[2].b1, expected.b1);
}

TEST(BlockProcessor, EmptyBlockChangesOnlyTheFlushState) {
    ReverbEngine e;
    LevelOwner owner;
    owner.level = 0.5f;
    e.owner = &owner;
    applyDefaults(e, 44100, 0);
    e.ResetState();
    Stereo s(1);
    EXPECT_EQ(s.run(e, 0, 1), 0);
    EXPECT_TRUE(e.flushLatched);
    EXPECT_EQ(owner.level, 0.5f);
}

TEST(BlockProcessor, MeterDecaysPerWholeMillisecond) {
    ReverbEngine e;
    LevelOwner owner;
    e.owner = &owner;
    applyDefaults(e, 44100, 0);
    e.meterSource = 1;
    e.ResetState();
    Stereo shortBlock(44);
    owner.level = 0.5f;
    shortBlock.run(e, 44, 0);  // under 1 ms: no decay, and silence raises nothing
    EXPECT_EQ(owner.level, 0.5f);
    Stereo second(44100);
    second.run(e, 44100, 0);
    EXPECT_FLOAT_EQ(owner.level, 0.5f * static_cast<float>(std::pow(0.9993910013652971, 1000)));
}

TEST(BlockProcessor, MetersFollowTheirSource) {
    for (int source : {0, 1, 2}) {
        ReverbEngine e;
        LevelOwner owner;
        e.owner = &owner;
        applyDefaults(e, 44100, 0);
        e.SetDryLevel(0.0);
        e.SetWetLevel(0.0);
        e.SetInputGain(60);  // +6 dB
        e.meterSource = source;
        e.ResetState();
        Stereo s(44100);
        for (int i = 0; i < 44100; ++i) s.in[2 * i] = s.in[2 * i + 1] = 0.5f;
        s.run(e, 44100, 0);
        if (source == 0)
            EXPECT_NEAR(owner.level, 0.5 * std::pow(10.0, 0.3), 0.02);  // input after the input gain
        else
            EXPECT_EQ(owner.level, 0.0f);  // the output is silent (dry and wet off)
    }
}

TEST(BlockProcessor, DryPathPassesInputWithGains) {
    ReverbEngine e;
    applyDefaults(e, 44100, 0);
    e.SetDryLevel(gainOf(-60));
    e.SetWetLevel(0.0);
    e.ResetState();
    Stereo s(64);
    for (int i = 0; i < 128; ++i) s.in[i] = static_cast<float>(std::sin(i * 0.1));
    EXPECT_EQ(s.run(e, 64, 0), 64);
    for (int i = 0; i < 128; ++i) EXPECT_EQ(s.out[i], static_cast<float>(s.in[i] * gainOf(-60)));
}

TEST(BlockProcessor, SilenceLongAfterTheTailStillYieldsEveryFrame) {
    ReverbEngine e;
    applyDefaults(e, 44100, 1);
    e.ResetState();
    Stereo s(512);
    for (int i = 0; i < 1000; ++i) ASSERT_EQ(s.run(e, 512, 0), 512);
}

TEST(BlockProcessor, FlushTrimsAtTheLastAudibleFrame) {
    ReverbEngine e;
    applyDefaults(e, 44100, 0);
    e.SetPreDelay(0);  // no pre-delay: the trim is armed by the first flush block
    e.SetWetLevel(0.0);  // the dry path alone shows where the block is cut
    e.ResetState();
    Stereo s(100);
    s.in[2 * 40 + 1] = 0.25f;  // right channel, frame 40
    s.in[2 * 10] = 1e-17f;     // below -313 dB: does not count
    EXPECT_EQ(s.run(e, 100, 0), 100);
    EXPECT_FALSE(e.tailTrimArmed);
    EXPECT_EQ(s.run(e, 100, 1), 41);
    EXPECT_TRUE(e.tailTrimArmed);
    std::fill(s.in.begin(), s.in.end(), 0.0f);
    EXPECT_EQ(s.run(e, 100, 0), 0);  // once latched, every later block is trimmed
    e.ClearEndOfStream();  // a seek after the end: blocks are whole again
    EXPECT_EQ(s.run(e, 100, 0), 100);
    EXPECT_EQ(s.run(e, 100, 1), 0);
    e.ResetState();
    EXPECT_FALSE(e.flushLatched);
    EXPECT_EQ(s.run(e, 100, 0), 100);
}

TEST(BlockProcessor, FlushWaitsForThePreDelayLineToFallSilent) {
    ReverbEngine e;
    applyDefaults(e, 44100, 0);
    e.ResetState();
    e.preDelayLine.samples[3] = 0.5;  // pending signal in the pre-delay line
    Stereo s(64);
    EXPECT_EQ(s.run(e, 64, 1), 64);
    EXPECT_TRUE(e.flushLatched);
    EXPECT_FALSE(e.tailTrimArmed);
    e.preDelayLine.samples[3] = 0.0;
    EXPECT_EQ(s.run(e, 64, 0), 0);
    EXPECT_TRUE(e.tailTrimArmed);
}

TEST(BlockProcessor, NonFiniteInputIsTakenAsSilence) {
    ReverbEngine e;
    applyDefaults(e, 44100, 0);
    e.ResetState();
    Stereo s(8);
    s.in = {0.5f, 0.5f, std::numeric_limits<float>::quiet_NaN(), 0.25f, std::numeric_limits<float>::infinity(),
            -std::numeric_limits<float>::infinity(), 0.125f, 0.125f, 0, 0, 0, 0, 0, 0, 0, 0};
    s.run(e, 8, 0);
    EXPECT_EQ(s.out[0], 0.5f);
    EXPECT_EQ(s.out[2], 0.0f);
    EXPECT_EQ(s.out[3], 0.25f);
    EXPECT_EQ(s.out[4], 0.0f);
    EXPECT_EQ(s.out[5], 0.0f);
    for (float v : s.out) EXPECT_TRUE(std::isfinite(v));
    for (const BiquadSection& f : e.filterSections) EXPECT_TRUE(std::isfinite(f.y1L));
}

// Filter frequencies above the rate's limit are designed just under half the rate, so the sections stay
// stable (the user's value is kept).
TEST(BlockProcessor, FilterDesignsStayStableAtLowRates) {
    for (int rate : {8000, 22050, 32000}) {
        ReverbEngine e;
        applyDefaults(e, rate, 0);
        e.SetHighPassFreq(16000);
        e.SetLowPassFreq(9999);
        e.SetNotchQ(0.1);
        e.SetNotchFreq(16000);
        e.SetNotchGain(12.0);
        EXPECT_EQ(e.highPassFreq, 16000);
        e.SetWetLevel(1.0);
        e.ResetState();
        Stereo s(1024);
        for (int i = 0; i < 2048; ++i) s.in[i] = (i % 7 == 0) ? 1.0f : -0.1f;
        for (int b = 0; b < 50; ++b) s.run(e, 1024, 0);
        for (const BiquadSection& f : e.filterSections) {
            EXPECT_TRUE(std::isfinite(f.y1L)) << rate;
            EXPECT_LT(std::fabs(f.y1L), 100.0) << rate;
        }
    }
}

TEST(BlockProcessor, MonoBufferGrowsToTheLargestBlock) {
    ReverbEngine e;
    applyDefaults(e, 44100, 0);
    e.ResetState();
    Stereo s(4096);
    s.run(e, 100, 0);
    EXPECT_EQ(e.monoCapacity, 100);
    s.run(e, 4096, 0);
    EXPECT_EQ(e.monoCapacity, 4096);
    s.run(e, 10, 0);
    EXPECT_EQ(e.monoCapacity, 4096);
}

// A tail decaying through the smallest floats leaves exact zeros at the output, never denormal floats
// (which would make minutes of silence far dearer to process than music).
TEST(BlockProcessor, DecayingTailsNeverOutputDenormalFloats) {
    for (int mode : {0, 1, 2, 6, 7, 3}) {
        SCOPED_TRACE(mode);
        ReverbEngine e;
        applyDefaults(e, 22050, mode);
        e.SetDecay(5);
        e.SetWetLevel(gainOf(60));
        e.SetDryLevel(0.0);
        e.meterSource = 2;
        e.ResetState();
        Stereo s(512);
        for (int i = 0; i < 1024; ++i) s.in[i] = (i % 3 == 0) ? 0.9f : -0.4f;
        s.run(e, 512, 0);
        std::fill(s.in.begin(), s.in.end(), 0.0f);
        bool sawTiny = false;
        for (int b = 0; b < 1500; ++b) {
            s.run(e, 512, 0);
            for (float v : s.out) {
                ASSERT_NE(std::fpclassify(v), FP_SUBNORMAL) << "block " << b;
                sawTiny |= (v != 0.0f && std::fabs(v) < 1e-30f);
            }
        }
        if (mode != 3) {
            EXPECT_TRUE(sawTiny);  // the tail did pass through the smallest floats
        }
    }
}
