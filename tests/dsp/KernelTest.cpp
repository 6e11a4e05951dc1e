// The delay-network kernels inside the block frame: impulse arrival at the early outputs, no recirculation
// without decay, the echo's period and cross-feed, the warm plate's stability at its most resonant
// settings, the end-of-stream drain, and a sweep of every parameter extreme at every rate.
#include <gtest/gtest.h>

#include <cmath>
#include <random>
#include <string>
#include <tuple>
#include <vector>

#include "dsp/NetworkTestSupport.h"

#if defined(__SSE2__)
#include <xmmintrin.h>
#endif

namespace ulvetta {
namespace {

using test::Settings;
using test::Stereo;

constexpr double kTiny = 2.2387211385683394e-16;

Stereo Impulse(size_t frames, float left, float right) {
    Stereo s(frames);
    s.left(0) = left;
    s.right(0) = right;
    return s;
}

Stereo Noise(size_t frames, float amplitude, unsigned seed) {
    Stereo s(frames);
    std::mt19937 rng(seed);
    std::uniform_real_distribution<float> u(-amplitude, amplitude);
    for (float& v : s.samples) v = u(rng);
    return s;
}

long FirstNonZero(const Stereo& s, bool left) {
    for (size_t i = 0; i < s.frames(); ++i)
        if ((left ? s.left(i) : s.right(i)) != 0.0f) return static_cast<long>(i);
    return -1;
}

// At 22050 Hz "Colour" 100 is a pass-through, so an impulse reaches the early lines unchanged. A long
// pre-delay keeps the tank silent while the early reflections arrive: the left path's allpass passes 0.7 of
// the impulse at once and its delay holds it for the delay's length; the right path delays first, then its
// allpass (second form) passes -0.8.
TEST(PlateKernel, ImpulseReachesEachEarlyOutputAfterItsDelayLine) {
    for (int mode : {0, 1, 2, 6}) {
        ReverbEngine e;
        Settings s = test::TransparentSettings(mode);
        s.preDelay = 500;
        test::Start(e, 22050, s);
        const Stereo out = test::Render(e, Impulse(3000, 0.5f, 0.5f), 256);
        const int n2 = e.earlyLines[2].length, n3 = e.earlyLines[3].length;
        EXPECT_EQ(FirstNonZero(out, true), n2) << "mode " << mode;
        EXPECT_EQ(FirstNonZero(out, false), n3) << "mode " << mode;
        EXPECT_EQ(out.left(n2), static_cast<float>(0.699999988079071 * 0.5)) << "mode " << mode;
        EXPECT_EQ(out.right(n3), static_cast<float>(-0.800000011920929 * 0.5)) << "mode " << mode;
    }
}

// Without decay the tank's second halves receive nothing, so their lines hold only zeros and nothing
// recirculates through the figure of eight; with decay they carry the signal round.
TEST(PlateKernel, DecayZeroDoesNotRecirculate) {
    for (int mode : {0, 1, 2, 6}) {
        for (int decay : {0, 50}) {
            ReverbEngine e;
            Settings s = test::TransparentSettings(mode);
            s.decay = decay;
            test::Start(e, 22050, s);
            const Stereo out = test::Render(e, Impulse(20000, 0.5f, 0.5f));
            bool tankCarries = false;
            for (int line : {6, 7, 10, 11})
                for (int i = 0; i < e.delayLines[line].length; ++i)
                    tankCarries |= e.delayLines[line].samples[i] != 0.0;
            EXPECT_EQ(tankCarries, decay != 0) << "mode " << mode << " decay " << decay;
            // The single pass through lines 5 and 9 still reaches the taps.
            float peak = 0.0f;
            for (size_t i = 400; i < out.frames(); ++i) peak = std::max(peak, std::fabs(out.left(i)));
            EXPECT_GT(peak, 1e-3f) << "mode " << mode;
        }
    }
}

// The echo memory holds n frames (n = pre-delay x rate): a left impulse comes back after n frames on the
// left only, then every n frames scaled by the feedback, with 0.4 of the other channel fed across. With
// "Diffusion" 0 the tank is silent and the wet signal is the coloured echo alone.
TEST(EchoKernel, RepeatsEveryPeriodWithCrossFeed) {
    ReverbEngine e;
    Settings s = test::TransparentSettings(7);
    s.diffusion = 0;
    s.preDelay = 20;  // 441 frames at 22050 Hz
    s.decay = 60;     // feedback 60 / 240
    test::Start(e, 22050, s);
    ASSERT_EQ(e.preDelayLine.length, 2 * 441);
    const int n = 441;
    const double fb = 0.25;
    const Stereo out = test::Render(e, Impulse(4 * n + 10, 1.0f, 0.0f), 100);
    for (size_t i = 0; i < out.frames(); ++i) {
        double l = 0.0, r = 0.0;
        if (i == static_cast<size_t>(n)) {
            l = 1.0;
        } else if (i == static_cast<size_t>(2 * n)) {
            l = fb;
            r = 0.4 * fb;
        } else if (i == static_cast<size_t>(3 * n)) {
            l = fb * (fb + 0.4 * 0.4 * fb);
            r = fb * (0.4 * fb + 0.4 * 1.0 * fb);
        } else if (i == static_cast<size_t>(4 * n)) {
            continue;
        }
        ASSERT_NEAR(out.left(i), l, 1e-7) << "frame " << i;
        ASSERT_NEAR(out.right(i), r, 1e-7) << "frame " << i;
    }
}

// With diffusion the sum of both echo channels also drives the tank, so a left-only input reaches the right
// output long before the first cross-fed repeat.
TEST(EchoKernel, DiffusionFeedsTheTank) {
    ReverbEngine e;
    Settings s = test::TransparentSettings(7);
    s.preDelay = 20;
    s.decay = 0;
    test::Start(e, 22050, s);
    const Stereo out = test::Render(e, Impulse(4000, 1.0f, 0.0f));
    long firstRight = FirstNonZero(out, false);
    EXPECT_GT(firstRight, 441);
    EXPECT_LT(firstRight, 2 * 441);
}

// Modes 2 and 6 run one network and differ only in how the taps are weighted: after the same input every
// line holds the same samples, while the outputs differ.
TEST(ExtendedPlateKernel, ModesTwoAndSixShareTheNetwork) {
    ReverbEngine two, six;
    Settings s = test::FactorySettings(2);
    test::Start(two, 44100, s);
    s.mode = 6;
    test::Start(six, 44100, s);
    const Stereo in = Noise(30000, 0.5f, 21);
    const Stereo a = test::Render(two, in), b = test::Render(six, in);
    for (int line = 0; line < 20; ++line) {
        ASSERT_EQ(two.delayLines[line].length, six.delayLines[line].length);
        for (int i = 0; i < two.delayLines[line].length; ++i)
            ASSERT_EQ(two.delayLines[line].samples[i], six.delayLines[line].samples[i]) << "line " << line;
    }
    double difference = 0.0;
    for (size_t i = 0; i < a.samples.size(); ++i) difference += std::fabs(a.samples[i] - b.samples[i]);
    EXPECT_GT(difference, 1.0);
}

// A filter section set to pass-through is skipped, but its history must end where filtering would have
// left it, so that a later redesign of the section starts from the right state.
TEST(BlockFrame, PassThroughSectionKeepsTheHistoryFilteringWouldLeave) {
    for (int frames : {1, 2, 300}) {
        ReverbEngine e;
        test::Start(e, 44100, test::FactorySettings(0));  // low pass "Off", notch at 0 dB: pass-through
        BiquadSection lowPass = e.filterSections[0];
        BiquadSection notch = e.filterSections[2];
        ASSERT_EQ(lowPass.b0, 1.0);
        ASSERT_EQ(notch.b0, 1.0);
        const Stereo in = Noise(frames, 0.5f, 4);
        std::vector<float> mono(frames);
        for (int i = 0; i < frames; ++i) mono[i] = (in.left(i) + in.right(i)) * 0.5f * 1.0f;
        ProcessMono(lowPass, mono.data(), frames);
        test::Render(e, in);
        EXPECT_EQ(e.filterSections[0].x1L, lowPass.x1L) << frames;
        EXPECT_EQ(e.filterSections[0].x2L, lowPass.x2L) << frames;
        EXPECT_EQ(e.filterSections[0].y1L, lowPass.y1L) << frames;
        EXPECT_EQ(e.filterSections[0].y2L, lowPass.y2L) << frames;
    }
}

// The kernels keep their state between blocks (line positions, taps, modulator phases, filter states), so
// the output does not depend on how the stream is cut into blocks.
TEST(BlockFrame, OutputDoesNotDependOnTheBlockSize) {
    for (int mode : {0, 1, 2, 6, 7}) {
        const Stereo in = Noise(20000, 0.5f, 31);
        ReverbEngine reference;
        test::Start(reference, 48000, test::FactorySettings(mode));
        const Stereo expected = test::Render(reference, in, 512);
        for (int block : {1, 37, 4096}) {
            ReverbEngine e;
            test::Start(e, 48000, test::FactorySettings(mode));
            const Stereo out = test::Render(e, in, block);
            for (size_t i = 0; i < in.samples.size(); ++i)
                ASSERT_EQ(out.samples[i], expected.samples[i]) << "mode " << mode << " block " << block << " at " << i;
        }
    }
}

// The output meter reads the smoothed peak of the output as stored, so of the sum when a block is added
// into the buffer; the wet meter reads the wet signal alone, which with the dry level off and nothing added
// is the output again. Each is checked against the meter's smoother run over the block afterwards.
TEST(BlockFrame, MetersReadTheSmoothedPeakOfTheirSignal) {
    for (int mode : {0, 3, 7}) {
        for (int source : {1, 2}) {
            for (int accumulate : {0, 1}) {
                if (source == 2 && accumulate) continue;
                ReverbEngine e;
                LevelOwner owner;
                e.owner = &owner;
                Settings s = test::FactorySettings(mode);
                if (source == 2) s.dry = -600;
                test::Start(e, 44100, s);
                e.meterSource = source;
                const Stereo in = Noise(4096, 0.5f, 9);
                Stereo out = Noise(4096, 0.25f, 10);  // what a block is added to
                float loudest = 0.0f;
                for (size_t at = 0; at < in.frames(); at += 512) {
                    owner.level = 0.0f;  // stays 0 through the meter's decay, so the level is the block's peak
                    float state[4];
                    std::copy(e.smoothState, e.smoothState + 4, state);
                    const float* src = in.samples.data() + 2 * at;
                    e.ProcessBlock(&out.left(at), &out.right(at), src, src + 1, 512, 2, accumulate, 0);
                    const float* c = e.smoothCoefs;
                    float peak = 0.0f;
                    for (size_t i = at; i < at + 512; ++i) {
                        const float v = std::max(std::fabs(out.left(i)), std::fabs(out.right(i)));
                        const float y =
                            c[0] * v + c[1] * state[0] + c[2] * state[1] - c[3] * state[2] - c[4] * state[3];
                        state[1] = state[0];
                        state[0] = v;
                        state[3] = state[2];
                        state[2] = y;
                        peak = std::max(peak, y);
                    }
                    loudest = std::max(loudest, peak);
                    ASSERT_EQ(owner.level, peak) << "mode " << mode << " source " << source << " at " << at;
                }
                EXPECT_GT(loudest, 1e-3f) << "mode " << mode << " source " << source;
            }
        }
    }
}

// Lines holding a tail at the bottom of the double range decay to exact zeros without ever storing a
// denormal (every operation on one is many times slower), and each block leaves the caller's
// floating-point mode as it found it.
TEST(BlockFrame, NetworksDecayToExactZerosNeverDenormals) {
    for (int mode : {0, 1, 2, 6, 7}) {
        ReverbEngine e;
        test::Start(e, 8000, test::FactorySettings(mode));
        const int lineCount = (mode == 2 || mode == 6) ? 20 : 12;
        std::vector<DelayLine*> lines;
        for (int k = 0; k < lineCount; ++k)
            if (!((mode == 2 || mode == 6) && (k == 16 || k == 18))) lines.push_back(&e.delayLines[k]);  // unused
        if (mode != 7)
            for (int k : {0, 2, 3, 5}) lines.push_back(&e.earlyLines[k]);  // the two early paths
        for (DelayLine* l : lines) {
            ASSERT_TRUE(l->configured()) << mode;
            for (int i = 0; i < l->length; ++i) l->samples[i] = (i % 2) ? 1e-305 : -3e-306;
        }
        Stereo silence(512), out(512);
        for (int b = 0; b < 400; ++b) {
#if defined(__SSE2__)
            const unsigned mode0 = _mm_getcsr();
#endif
            e.ProcessBlock(out.samples.data(), out.samples.data() + 1, silence.samples.data(),
                           silence.samples.data() + 1, 512, 2, 0, 0);
#if defined(__SSE2__)
            ASSERT_EQ(_mm_getcsr(), mode0);
#endif
            for (const DelayLine* l : lines)
                for (int i = 0; i < l->length; ++i)
                    ASSERT_NE(std::fpclassify(l->samples[i]), FP_SUBNORMAL) << "mode " << mode << " block " << b;
        }
        for (const DelayLine* l : lines)
            for (int i = 0; i < l->length; ++i) ASSERT_EQ(l->samples[i], 0.0) << "mode " << mode;
    }
}

// The kernels run a loop compiled for the modulation their algorithm sets up, and a checked loop for any
// other arrangement. A modulator of depth 0 reads exactly like no modulator, so an engine whose lines carry
// an odd mixture of both (checked loop) sounds exactly like one with the usual arrangement.
TEST(BlockFrame, AnyArrangementOfModulatedLinesIsRead) {
    for (int mode : {0, 1, 2, 7}) {
        ReverbEngine usual, odd;
        test::Start(usual, 44100, test::FactorySettings(mode));
        test::Start(odd, 44100, test::FactorySettings(mode));
        for (ReverbEngine* e : {&usual, &odd}) {
            for (int line : {5, 12}) {
                DelayLine& l = e->delayLines[line];
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
        const Stereo in = Noise(20000, 0.5f, 5);
        const Stereo a = test::Render(usual, in), b = test::Render(odd, in);
        for (size_t i = 0; i < a.samples.size(); ++i)
            ASSERT_EQ(a.samples[i], b.samples[i]) << "mode " << mode << " at " << i;
    }
}

// The drain trims: once flushing, a block returns the index + 1 of its last frame above -313 dB, and the
// frames past that are silent.
TEST(BlockFrame, DrainEndsAndTrimsTheTail) {
    for (int mode : {0, 1, 2, 6, 7}) {
        ReverbEngine e;
        test::Start(e, 44100, test::FactorySettings(mode));
        test::Render(e, Noise(22050, 0.5f, 7));
        const test::DrainResult d = test::Drain(e, 44100 * 60 / 512);
        EXPECT_TRUE(d.finite) << mode;
        ASSERT_TRUE(d.ended) << mode;
        EXPECT_TRUE(d.trimmedTailSilent) << mode;
        EXPECT_GT(d.blocks, 20) << mode;  // a tail of well over 0.2 s
        EXPECT_GT(d.firstPeak, 1e-3f) << mode;
        // A zero-frame block returns 0.
        float none[2] = {0, 0};
        EXPECT_EQ(e.ProcessBlock(none, none + 1, none, none + 1, 0, 2, 0, 1), 0);
    }
}

// Signal left behind in a pre-delay line that has been switched out of the path never leaves it; it must
// not hold the end of the stream open.
TEST(BlockFrame, PreDelaySwitchedOutDoesNotHoldTheTail) {
    ReverbEngine e;
    Settings s = test::FactorySettings(0);
    s.preDelay = 50;
    test::Start(e, 44100, s);
    test::Render(e, Noise(8000, 0.5f, 3));
    e.SetPreDelay(0);
    const test::DrainResult d = test::Drain(e, 44100 * 60 / 512);
    EXPECT_TRUE(d.ended);
}

// The warm plate's modulated reads interpolate, never extrapolate: at its most resonant settings the tank
// loses energy at every rate and the tail ends.
TEST(PlateKernel, WarmPlateStaysBoundedAtMostResonantSettings) {
    for (int rate : {8000, 22050, 44100, 48000, 96000, 192000}) {
        for (int room : {20, 41}) {
            ReverbEngine e;
            Settings s = test::FactorySettings(1);
            s.decay = 100;
            s.damping = 0;
            s.roomSize = room;
            s.wet = 0;
            test::Start(e, rate, s);
            // A quiet burst (-120 dBFS) keeps the final drain short; the network is linear, so a runaway
            // shows at any level.
            test::Render(e, Noise(rate / 5, 1e-6f, 11));
            // Two seconds of silence: the last quarter second is at least 20 dB below the first.
            const Stereo out = test::Render(e, Stereo(2 * rate));
            const size_t window = rate / 4;
            float early = 0.0f, late = 0.0f;
            for (size_t i = 0; i < out.frames(); ++i) {
                ASSERT_TRUE(std::isfinite(out.left(i)) && std::isfinite(out.right(i))) << rate;
                const float v = std::max(std::fabs(out.left(i)), std::fabs(out.right(i)));
                if (i < window) early = std::max(early, v);
                if (i >= out.frames() - window) late = std::max(late, v);
            }
            EXPECT_GT(early, 1e-9f) << rate;
            EXPECT_LT(late, early * 0.1f) << "rate " << rate << " room " << room;
            const test::DrainResult d = test::Drain(e, static_cast<long>(rate) * 60 / 512);
            EXPECT_TRUE(d.finite && d.ended) << "rate " << rate << " room " << room;
        }
    }
}

// Property sweep: every algorithm at every rate, each sound parameter at its minimum and at its maximum
// (the others at the algorithm's factory settings in a small room, Room Size 10, so that each of the 900
// tails stays short), gives finite, bounded output; its tail dies away and the end-of-stream drain ends with
// a trimmed block. The drain follows a quiet burst (-220 dBFS): the tail still has to fall by some 70 dB to
// the -313 dB threshold, which a network that does not lose energy never does.
struct ParamRange {
    const char* name;
    int min, max;
};

const ParamRange kParams[15] = {
    {"Diffusion", 0, 100},       {"Pre Delay", 0, 500},        {"Decay", 0, 100},
    {"Damping", 0, 99},          {"Room Size", 0, 200},        {"Early Reflections", -600, 0},
    {"Output Level Wet", -600, 60}, {"Output Level Dry", -600, 60}, {"Colour", 1, 100},
    {"Input Gain", -300, 150},   {"Low Pass Freq", 20, 10000}, {"High Pass Freq", 100, 16000},
    {"Notch Q", 1, 50},          {"Notch Gain", -120, 120},    {"Notch Freq", 20, 16000},
};

int& Field(Settings& s, int param) {
    int* fields[15] = {&s.diffusion, &s.preDelay, &s.decay,    &s.damping,  &s.roomSize,
                       &s.early,     &s.wet,      &s.dry,      &s.colour,   &s.inputGain,
                       &s.lowPass,   &s.highPass, &s.notchQ,   &s.notchGain, &s.notchFreq};
    return *fields[param];
}

class PropertySweep : public ::testing::TestWithParam<std::tuple<int, int>> {};

TEST_P(PropertySweep, EveryParameterExtremeIsFiniteAndDiesAway) {
    const int mode = std::get<0>(GetParam());
    const int rate = std::get<1>(GetParam());
    for (int param = 0; param < 15; ++param) {
        for (bool atMax : {false, true}) {
            Settings s = test::FactorySettings(mode);
            s.roomSize = 10;
            Field(s, param) = atMax ? kParams[param].max : kParams[param].min;
            const std::string what = std::string(kParams[param].name) + (atMax ? " max" : " min");

            // Full-scale noise: finite and bounded (input gain +15 dB, wet +6 dB and the weighted taps
            // together stay far below this bound).
            ReverbEngine loud;
            test::Start(loud, rate, s);
            const Stereo out = test::Render(loud, Noise(2048, 1.0f, 5));
            float peak = 0.0f;
            for (float v : out.samples) {
                ASSERT_TRUE(std::isfinite(v)) << what;
                peak = std::max(peak, std::fabs(v));
            }
            EXPECT_LT(peak, 100.0f) << what;

            // A quiet burst, then the drain.
            ReverbEngine quiet;
            test::Start(quiet, rate, s);
            test::Render(quiet, Noise(512, 1e-11f, 9));
            const test::DrainResult d = test::Drain(quiet, static_cast<long>(rate) * 120 / 512);
            ASSERT_TRUE(d.finite) << what;
            ASSERT_TRUE(d.ended) << what << ": the drain did not end";
            EXPECT_LT(d.lastReturned, 512) << what;
            EXPECT_TRUE(d.trimmedTailSilent) << what;
        }
    }
}

INSTANTIATE_TEST_SUITE_P(AllAlgorithmsAndRates, PropertySweep,
                         ::testing::Combine(::testing::Values(0, 1, 2, 6, 7),
                                            ::testing::Values(8000, 22050, 44100, 48000, 96000, 192000)),
                         [](const ::testing::TestParamInfo<std::tuple<int, int>>& info) {
                             return "mode" + std::to_string(std::get<0>(info.param)) + "_" +
                                    std::to_string(std::get<1>(info.param)) + "Hz";
                         });

}  // namespace
}  // namespace ulvetta
