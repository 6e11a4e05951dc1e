// Network sizing: line lengths for rate and room size (values worked out by hand from the reference lengths
// at 29761 Hz and room size 50), early lines raised to primes, modulators, taps and the diffused delay's own
// echo line; and processing before any network exists.
#include <gtest/gtest.h>

#include <vector>

#include "dsp/NetworkTestSupport.h"

namespace ulvetta {
namespace {

using test::Settings;

bool IsPrime(int n) {
    if (n < 2) return false;
    for (int d = 2; d < n; ++d)
        if (n % d == 0) return false;
    return true;
}

std::vector<int> NetworkLengths(const ReverbEngine& e, int count) {
    std::vector<int> v;
    for (int i = 0; i < count; ++i) v.push_back(e.delayLines[i].length);
    return v;
}

std::vector<int> EarlyLengths(const ReverbEngine& e) {
    std::vector<int> v;
    for (const DelayLine& l : e.earlyLines) v.push_back(l.length);
    return v;
}

void Build(ReverbEngine& e, int rate, int mode, int roomSize) {
    Settings s = test::FactorySettings(mode);
    s.roomSize = roomSize;
    test::Start(e, rate, s);
}

const int kTapLine[20] = {9, 9, 10, 11, 5, 6, 7, 5, 5, 6, 7, 9, 10, 11, 12, 14, 13, 15, 19, 17};
const int kTapPosition[20] = {266, 2974, 1913, 1996, 1990, 187, 1066, 353, 3627, 1228,
                              2673, 2111, 335, 121, 897, 359, 375, 729, 527, 698};

void ExpectTapsWrapped(const ReverbEngine& e, int count) {
    for (int i = 0; i < count; ++i) {
        const int length = e.delayLines[kTapLine[i]].length;
        EXPECT_EQ(e.outputTaps[i].length, length) << "tap " << i;
        EXPECT_EQ(e.outputTaps[i].index, kTapPosition[i] % length) << "tap " << i;
    }
}

TEST(NetworkSizing, ReferenceRateKeepsBaseLengthsAndRaisesEarlyLinesToPrimes) {
    ReverbEngine e;
    Build(e, 29761, 2, 50);
    EXPECT_EQ(NetworkLengths(e, 20),
              (std::vector<int>{220, 220, 379, 277, 672, 4453, 1800, 3720, 908, 4217, 2656, 3163, 2763, 3567, 7027,
                                3497, 9173, 5211, 4689, 6713}));
    EXPECT_EQ(EarlyLengths(e), (std::vector<int>{347, 619, 59, 41, 521, 379}));
}

TEST(NetworkSizing, LengthsScaleWithRateAndRoomSize) {
    ReverbEngine e;
    Build(e, 44100, 2, 50);
    EXPECT_EQ(NetworkLengths(e, 20),
              (std::vector<int>{220, 220, 562, 410, 996, 6598, 2667, 5512, 1345, 6249, 3936, 4687, 4094, 5286, 10413,
                                5182, 13593, 7722, 6948, 9947}));
    EXPECT_EQ(EarlyLengths(e), (std::vector<int>{509, 919, 89, 59, 769, 563}));
    ExpectTapsWrapped(e, 20);

    Build(e, 44100, 2, 200);
    EXPECT_EQ(NetworkLengths(e, 20),
              (std::vector<int>{842, 634, 2246, 1642, 3983, 26394, 10669, 22049, 5382, 24995, 15743, 18748, 16377,
                                21142, 41651, 20727, 54370, 30887, 27793, 39789}));
    EXPECT_EQ(EarlyLengths(e), (std::vector<int>{2027, 3671, 353, 233, 3079, 2251}));
    ExpectTapsWrapped(e, 20);
}

TEST(NetworkSizing, RoomSizeZeroGivesMinimumLinesAndWrapsTheTaps) {
    for (int rate : {8000, 44100, 192000}) {
        ReverbEngine e;
        Build(e, rate, 6, 0);
        EXPECT_EQ(NetworkLengths(e, 20), std::vector<int>(20, 220)) << rate;
        EXPECT_EQ(EarlyLengths(e), std::vector<int>(6, 3)) << rate;
        ExpectTapsWrapped(e, 20);
        EXPECT_EQ(e.outputTaps[8].index, 3627 % 220);
    }
}

TEST(NetworkSizing, EarlyLinesArePrimeAtEveryRateAndRoomSize) {
    for (int rate : {8000, 22050, 44100, 48000, 96000, 192000}) {
        for (int room : {0, 1, 7, 46, 113, 200}) {
            ReverbEngine e;
            Build(e, rate, 0, room);
            for (int i = 0; i < 6; ++i) {
                EXPECT_TRUE(IsPrime(e.earlyLines[i].length)) << rate << " " << room << " line " << i;
                EXPECT_GE(e.earlyLines[i].length, 3);
            }
            for (int i = 0; i < 16; ++i) EXPECT_GE(e.delayLines[i].length, 220);
        }
    }
}

TEST(NetworkSizing, WarmPlateModulatesTheTankLinesOnly) {
    ReverbEngine e;
    Build(e, 44100, 1, 41);
    const int depths[12] = {0, 0, 0, 0, 2, 6, 9, 11, 4, 9, 9, 5};
    const double gains[12] = {0.75, 0.75, 0.625, 0.625, 0.7, 0, 0.5, 0, 0.7, 0, 0.5, 0};
    // Period = rate / modulation rate, a fractional result rounded up.
    const int periods[12] = {0, 0, 0, 0, 88200, 147000, 63000, 441000, 147000, 163334, 210000, 551250};
    for (int i = 0; i < 12; ++i) {
        EXPECT_EQ(e.delayLines[i].gain, gains[i]) << i;
        if (depths[i] == 0) {
            EXPECT_EQ(e.delayLines[i].mod, nullptr) << i;
            continue;
        }
        ASSERT_NE(e.delayLines[i].mod, nullptr) << i;
        EXPECT_EQ(e.delayLines[i].mod->depth, depths[i]) << i;
        EXPECT_NEAR(e.delayLines[i].mod->period, periods[i], 1) << i;
    }
    // The smallest room at the lowest rate still swings every tank line by at least one sample.
    Build(e, 8000, 1, 20);
    for (int i = 4; i < 12; ++i) EXPECT_EQ(e.delayLines[i].mod->depth, 1) << i;
    // The unmodulated plates carry no modulators, even after the warm plate.
    Build(e, 8000, 0, 20);
    for (int i = 0; i < 16; ++i) EXPECT_EQ(e.delayLines[i].mod, nullptr) << i;
}

TEST(NetworkSizing, DiffusedDelayGetsItsOwnEchoLineAndCoefficients) {
    ReverbEngine e;
    Settings s = test::FactorySettings(0);
    s.roomSize = 62;  // the room size of the diffused delay below, so that only the mode switch differs
    test::Start(e, 44100, s);
    const std::vector<int> early = EarlyLengths(e);
    const std::vector<int> plateLines = NetworkLengths(e, 16);

    // Only lines 0..11 are rebuilt (re-created, so silenced); the early lines and lines 12..15 keep what
    // the plate gave them.
    e.delayLines[5].samples[0] = 1.0;
    e.delayLines[12].samples[0] = 1.0;
    e.earlyLines[0].samples[0] = 1.0;
    e.SetMode(7);
    EXPECT_EQ(e.delayLines[5].samples[0], 0.0);
    EXPECT_EQ(e.delayLines[12].samples[0], 1.0);
    EXPECT_EQ(e.earlyLines[0].samples[0], 1.0);
    EXPECT_EQ(EarlyLengths(e), early);
    EXPECT_EQ(NetworkLengths(e, 16), plateLines);
    ExpectTapsWrapped(e, 14);

    s = test::FactorySettings(7);
    s.preDelay = 12;
    s.roomSize = 62;
    test::Start(e, 44100, s);
    EXPECT_EQ(e.preDelayLine.length, 2 * 529);  // 12 ms at 44100 Hz = 529.2 frames
    EXPECT_EQ(e.diffusionCoef, 100 * 0.005);
    EXPECT_DOUBLE_EQ(e.echoFeedback, 41.0 / 240.0);

    for (int ms : {0, 1}) {
        e.SetPreDelay(ms);
        EXPECT_EQ(e.preDelayLine.length, 2 * 44) << ms;  // 44.1 frames
    }
    e.SetSampleRate(22050);
    e.SetPreDelay(500);
    EXPECT_EQ(e.preDelayLine.length, 2 * 11025);
}

// Until the mode and room size are both set there are no lines: every algorithm passes the block dry
// (input times the dry gain) without touching line storage.
TEST(NetworkSizing, ProcessingBeforeTheNetworkExistsPassesDry) {
    for (int mode : {0, 1, 2, 6, 7}) {
        for (bool roomUnset : {true, false}) {
            ReverbEngine e;
            Settings s = test::TransparentSettings(mode);
            s.dry = -60;  // gain 10^-0.3
            s.preDelay = 20;
            e.SetSampleRate(44100);
            e.SetDiffusion(s.diffusion);
            e.SetPreDelay(s.preDelay);
            e.SetDecay(s.decay);
            e.SetDamping(s.damping);
            if (!roomUnset) e.SetRoomSize(s.roomSize);
            e.SetEarlyLevel(1.0);
            e.SetWetLevel(1.0);
            e.SetDryLevel(test::LevelGain(s.dry));
            e.SetColour(s.colour);
            e.SetInputGain(0);
            e.SetLowPassFreq(10000);
            e.SetHighPassFreq(100);
            if (roomUnset) e.SetMode(mode);  // else the mode stays unset
            e.ResetState();
            ASSERT_EQ(e.delayLines[0].samples, nullptr);

            test::Stereo in(700);
            for (size_t i = 0; i < in.frames(); ++i) {
                in.left(i) = 0.5f * std::sin(0.1f * i);
                in.right(i) = -0.25f;
            }
            const test::Stereo out = test::Render(e, in, 256);
            for (size_t i = 0; i < in.frames(); ++i) {
                ASSERT_EQ(out.left(i), static_cast<float>(in.left(i) * test::LevelGain(-60))) << mode << " " << i;
                ASSERT_EQ(out.right(i), static_cast<float>(in.right(i) * test::LevelGain(-60))) << mode << " " << i;
            }
        }
    }
}

}  // namespace
}  // namespace ulvetta
