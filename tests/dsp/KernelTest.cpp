// The delay-network kernels: processing before a network exists, impulse arrival at the early outputs,
// the echo's period and cross-feed, modulated reads in any arrangement,
// the warm plate's stability, and every parameter extreme at every rate.
#include <gtest/gtest.h>

#include <string>
#include <tuple>

#include "dsp/EngineTestSupport.h"

namespace ulvetta {
namespace {

using test::Settings;

std::vector<float> Impulse(size_t frames, float left, float right) {
    std::vector<float> s(2 * frames, 0.0f);
    s[0] = left;
    s[1] = right;
    return s;
}

long FirstNonZero(const std::vector<float>& s, int channel) {
    for (size_t i = channel; i < s.size(); i += 2)
        if (s[i] != 0.0f) return static_cast<long>(i / 2);
    return -1;
}

// Until the mode and the room size are both set there are no lines: every algorithm passes the block dry.
TEST(NetworkSizing, ProcessingBeforeTheNetworkExistsPassesDry) {
    for (int mode : {0, 1, 2, 6, 7}) {
        ReverbEngine e;
        e.SetSampleRate(44100);
        e.SetPreDelay(20);
        e.SetDryLevel(0.5);
        e.SetWetLevel(1.0);
        e.SetMode(mode);  // room size unset
        e.ResetState();
        const std::vector<float> in = test::Noise(700, 0.5f, 2);
        const std::vector<float> out = test::Render(e, in, 256);
        for (size_t i = 0; i < in.size(); ++i) ASSERT_EQ(out[i], in[i] * 0.5f) << mode << " " << i;
    }
}

// At 22050 Hz "Colour" 100 is a pass-through, so an impulse reaches the early lines unchanged, and a long
// pre-delay keeps the tank silent meanwhile: the left path's allpass passes 0.7 of it at once and its delay
// holds it for the delay's length; the right path delays first, then its allpass (second form) passes -0.8.
TEST(PlateKernel, ImpulseReachesEachEarlyOutputAfterItsDelayLine) {
    for (int mode : {0, 1, 2, 6}) {
        ReverbEngine e;
        Settings s = test::Transparent(mode);
        s.preDelay = 500;
        test::Start(e, 22050, s);
        const std::vector<float> out = test::Render(e, Impulse(3000, 0.5f, 0.5f), 256);
        const int n2 = EngineProbe(e).earlyLine(2).length, n3 = EngineProbe(e).earlyLine(3).length;
        EXPECT_EQ(FirstNonZero(out, 0), n2) << mode;
        EXPECT_EQ(FirstNonZero(out, 1), n3) << mode;
        EXPECT_EQ(out[2 * n2], static_cast<float>(0.699999988079071 * 0.5)) << mode;
        EXPECT_EQ(out[2 * n3 + 1], static_cast<float>(-0.800000011920929 * 0.5)) << mode;
    }
}

// The echo memory holds n frames (n = pre-delay x rate): a left impulse comes back after n frames on the
// left only, then every n frames scaled by the feedback, with 0.4 of the other channel fed across. With
// "Diffusion" 0 the tank is silent and the wet signal is the echo alone.
TEST(EchoKernel, RepeatsEveryPeriodWithCrossFeed) {
    ReverbEngine e;
    Settings s = test::Transparent(7);
    s.diffusion = 0;
    s.preDelay = 20;  // 441 frames at 22050 Hz
    s.decay = 60;     // feedback 60 / 240
    test::Start(e, 22050, s);
    ASSERT_EQ(EngineProbe(e).preDelayLine().length, 2 * 441);
    const int n = 441;
    const double fb = 0.25;
    const std::vector<float> out = test::Render(e, Impulse(3 * n + 10, 1.0f, 0.0f), 100);
    for (int i = 0; i < 3 * n + 10; ++i) {
        double l = 0.0, r = 0.0;
        if (i == n) {
            l = 1.0;
        } else if (i == 2 * n) {
            l = fb;
            r = 0.4 * fb;
        } else if (i == 3 * n) {
            l = fb * (fb + 0.4 * 0.4 * fb);
            r = fb * (0.4 * fb + 0.4 * fb);
        }
        ASSERT_TRUE(std::fabs(out[2 * i] - l) < 1e-7 && std::fabs(out[2 * i + 1] - r) < 1e-7) << "frame " << i;
    }
}

// The kernels run a loop compiled for the modulation their algorithm sets up and a checked loop for any
// other arrangement. A modulator of depth 0 reads exactly like none, so an engine whose lines carry an odd
// mixture of both sounds exactly like one with the usual arrangement.
TEST(BlockFrame, AnyArrangementOfModulatedLinesIsRead) {
    for (int mode : {0, 1, 2, 7}) {
        ReverbEngine usual, odd;
        test::Start(usual, 44100, test::Typical(mode));
        test::Start(odd, 44100, test::Typical(mode));
        for (ReverbEngine* e : {&usual, &odd}) {
            for (int k : {5, 12}) {
                DelayLine& l = EngineProbe::line(*e, k);
                if (!l.configured()) continue;
                if (e == &odd && mode == 1) {
                    l.mod.reset();  // one tank line without a modulator
                } else if (e == &odd || mode == 1) {
                    if (!l.mod) {
                        l.mod.reset(new Modulator);
                        l.mod->SetModSampleRate(44100);
                        l.mod->SetModRate(0.3);
                    }
                    l.mod->SetModDepth(0);
                }
            }
        }
        const std::vector<float> in = test::Noise(20000, 0.5f, 5);
        ASSERT_EQ(test::Render(usual, in), test::Render(odd, in)) << mode;
    }
}

// The warm plate's modulated reads interpolate, never extrapolate: at its most resonant settings the tank
// loses energy at every rate and the tail ends.
TEST(PlateKernel, WarmPlateStaysBoundedAtMostResonantSettings) {
    Settings s = test::Typical(1);
    s.decay = 100;
    s.damping = 0;
    s.roomSize = 20;
    s.wet = 0;
    for (int rate : {8000, 44100, 192000}) {
        test::Started e(rate, s);
        test::Render(e, test::Noise(rate / 5, 1e-6f, 11));  // quiet keeps the drain short; the network is linear
        const std::vector<float> out = test::Render(e, std::vector<float>(4 * rate, 0.0f));
        float early = 0.0f, late = 0.0f;  // peaks of the first and the last quarter second
        for (size_t i = 0; i < static_cast<size_t>(rate / 2); ++i) {
            early = std::max(early, std::fabs(out[i]));
            late = std::max(late, std::fabs(out[out.size() - 1 - i]));
        }
        EXPECT_GT(early, 1e-9f) << rate;
        EXPECT_LT(late, early * 0.1f) << rate;
        EXPECT_TRUE(test::Drain(e, static_cast<long>(rate) * 60 / 512).endedWell) << rate;
    }
}

// Every algorithm at every rate, each sound parameter at its minimum and its maximum (the others typical, in
// a small room so that the tails stay short): full-scale noise gives finite, bounded output, and after a
// quiet burst (-220 dBFS) the drain ends with a trimmed block, which a network that does not lose energy
// never reaches (the tail must still fall by some 90 dB to -313 dB).
class PropertySweep : public ::testing::TestWithParam<std::tuple<int, int>> {};

TEST_P(PropertySweep, EveryParameterExtremeIsFiniteAndDiesAway) {
    const auto [mode, rate] = GetParam();
    int Settings::*const fields[15] = {
        &Settings::diffusion, &Settings::preDelay, &Settings::decay,   &Settings::damping,  &Settings::roomSize,
        &Settings::early,     &Settings::wet,      &Settings::dry,     &Settings::colour,   &Settings::inputGain,
        &Settings::lowPass,   &Settings::highPass, &Settings::notchQ,  &Settings::notchGain, &Settings::notchFreq};
    const int extremes[15][2] = {{0, 100},   {0, 500},   {0, 100}, {0, 99},   {0, 200},
                                 {-600, 0},  {-600, 60}, {-600, 60}, {1, 100}, {-300, 150},
                                 {20, 10000}, {100, 16000}, {1, 50}, {-120, 120}, {20, 16000}};
    for (int param = 0; param < 15; ++param) {
        for (int end : {0, 1}) {
            Settings s = test::Typical(mode);
            s.roomSize = 10;
            s.*fields[param] = extremes[param][end];
            const std::string what = "parameter " + std::to_string(param) + (end ? " max" : " min");
            ReverbEngine loud, quiet;
            test::Start(loud, rate, s);
            for (float v : test::Render(loud, test::Noise(2048, 1.0f, 5))) ASSERT_LT(std::fabs(v), 100.0f) << what;
            test::Start(quiet, rate, s);
            test::Render(quiet, test::Noise(512, 1e-11f, 9));
            ASSERT_TRUE(test::Drain(quiet, static_cast<long>(rate) * 120 / 512).endedWell) << what;
        }
    }
}

INSTANTIATE_TEST_SUITE_P(AllAlgorithmsAndRates, PropertySweep,
                         ::testing::Combine(::testing::Values(0, 1, 2, 6, 7),
                                            ::testing::Values(8000, 22050, 44100, 48000, 96000, 192000)));

}  // namespace
}  // namespace ulvetta
