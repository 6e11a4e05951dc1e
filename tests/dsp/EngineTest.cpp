// The engine's state and its block frame: rebuild guards, pre-delay and filter set-up, the meter, the
// end-of-stream trimming, the input guards, denormal hygiene and block-size independence.
#include <gtest/gtest.h>

#include <complex>
#include <cstring>
#include <limits>

#include "dsp/EngineTestSupport.h"

#if defined(__SSE2__)
#include <xmmintrin.h>
#endif

namespace ulvetta {
namespace {

using test::Settings;

bool IsBypass(const BiquadSection& s) {
    return s.b0 == 1.0 && s.b1 == 0.0 && s.b2 == 0.0 && s.a1 == 0.0 && s.a2 == 0.0;
}

// The processor's floating-point mode (MXCSR), or 0 where it has none.
unsigned ProcessorMode() {
#if defined(__SSE2__)
    return _mm_getcsr();
#else
    return 0;
#endif
}

int Block(ReverbEngine& e, std::vector<float>& in, std::vector<float>& out, int frames, int flush) {
    return e.ProcessBlock(out.data(), out.data() + 1, in.data(), in.data() + 1, frames, 2, 0, flush);
}

// The setters build the network once, when the algorithm arrives after every value it depends on; the
// stream-start reset builds it again.
TEST(EngineState, RebuildsOnceAndOnlyWhenANetworkValueChanges) {
    for (int mode : {0, 1, 2, 6, 7}) {
        test::Started e(44100, test::Typical(mode));
        EXPECT_EQ(EngineProbe(e).rebuildCount(), 2) << mode;
    }
    test::Started e(44100, test::Typical(0));
    e.SetRoomSize(50);
    e.SetMode(0);
    e.SetDecay(47);  // the plate reads decay per block
    EXPECT_EQ(EngineProbe(e).rebuildCount(), 2);
    e.SetMode(7);
    e.SetDecay(47);  // the echo's feedback is part of its network
    EXPECT_EQ(EngineProbe(e).rebuildCount(), 4);
    e.SetSampleRate(96000);  // the rate alone redesigns only the meter
    EXPECT_EQ(EngineProbe(e).rebuildCount(), 4);
}

// Low pass at 10000 Hz and high pass at 100 Hz are "Off"; the notch is designed once all three of its values
// are set, and bypassed at 0 dB.
TEST(EngineState, FilterSectionsBypassAtTheirLimitsAndTheNotchWaitsForAllThreeValues) {
    ReverbEngine e;
    const EngineProbe p(e);
    for (int step : {0, 1}) {
        e.SetSampleRate(44100);
        e.SetLowPassFreq(10000 - step);
        e.SetHighPassFreq(100 + step);
        EXPECT_EQ(IsBypass(p.section(0)) && IsBypass(p.section(1)), step == 0);
    }
    EngineProbe::section(e, 2).b0 = 7.0;  // a marker only a design or a bypass overwrites
    e.SetNotchFreq(1000);
    e.SetNotchGain(-12.0);
    EXPECT_EQ(p.section(2).b0, 7.0);
    e.SetNotchQ(2.0);
    EXPECT_FALSE(IsBypass(p.section(2)) || p.section(2).b0 == 7.0);
    e.SetNotchGain(0.0);
    EXPECT_TRUE(IsBypass(p.section(2)));
}

// The meter smoother is a 2.1 Hz low-pass with Q 0.62: -3 dB at 2.1 x 0.8623 = 1.811 Hz (where
// (1 - x^2)^2 + x^2 / Q^2 = 2); its unity DC gain shows in MetersReadTheirSource. Its single-precision
// coefficients hold that design at low rates only; the check runs where they do.
TEST(EngineState, MeterSmootherHasItsCorner) {
    for (int rate : {8000, 11025}) {
        test::Started e(rate, test::Typical(0));
        const float* f = EngineProbe(e).meterSmoother();
        const double c[5] = {f[0], f[1], f[2], f[3], f[4]};
        auto gain = [&](double f) {
            const std::complex<double> z = std::polar(1.0, -2.0 * M_PI * f / rate);
            return std::abs((c[0] + c[1] * z + c[2] * z * z) / (1.0 + c[3] * z + c[4] * z * z));
        };
        EXPECT_GT(gain(1.78), gain(0.0) / std::sqrt(2.0)) << rate;
        EXPECT_LT(gain(1.84), gain(0.0) / std::sqrt(2.0)) << rate;
    }
}

TEST(BlockProcessor, EmptyBlockChangesOnlyTheFlushStateAndShortBlocksDoNotDecayTheMeter) {
    ReverbEngine e;
    LevelOwner owner;
    e.SetOwner(&owner);
    e.SetMeterSource(1);
    test::Start(e, 44100, test::Typical(0));
    std::vector<float> in(2 * 44100, 0.0f), out(2 * 44100);
    owner.level = 0.5f;
    EXPECT_EQ(Block(e, in, out, 0, 1), 0);
    EXPECT_TRUE(EngineProbe(e).flushLatched());
    e.ResetState();
    EXPECT_EQ(Block(e, in, out, 44, 0), 44);  // under 1 ms, and silence raises nothing
    EXPECT_EQ(owner.level, 0.5f);
    Block(e, in, out, 44100, 0);
    EXPECT_FLOAT_EQ(owner.level, 0.5f * static_cast<float>(std::pow(0.9993910013652971, 1000)));
}

// A steady 0.5 on both channels at +6 dB input gain, only the dry path on: the input meter reads the gained
// input, the output meter the output (each at the smoother's unity DC gain, plus the small overshoot of a
// Q above 0.5), the wet meter nothing.
TEST(BlockProcessor, MetersReadTheirSource) {
    const float expected[3] = {static_cast<float>(0.5 * std::pow(10.0, 0.3)), 0.5f, 0.0f};
    for (int source : {0, 1, 2}) {
        ReverbEngine e;
        LevelOwner owner;
        e.SetOwner(&owner);
        e.SetMeterSource(source);
        Settings s = test::Transparent(0);
        s.inputGain = 60;
        s.wet = -600;
        s.dry = 0;
        test::Start(e, 8000, s);
        std::vector<float> in(2 * 8000, 0.5f), out(2 * 8000);
        for (int i = 0; i < 10; ++i) Block(e, in, out, 8000, 0);
        EXPECT_NEAR(owner.level, expected[source], 0.02) << source;
    }
}

TEST(BlockProcessor, FlushTrimsAtTheLastAudibleFrameUntilASeekOrReset) {
    ReverbEngine e;
    Settings s = test::Typical(0);
    s.preDelay = 0;  // the first flush block arms the trim
    s.wet = -600;    // the dry path alone shows where the block is cut
    test::Start(e, 44100, s);
    std::vector<float> in(200, 0.0f), out(200);
    in[2 * 40 + 1] = 0.25f;  // right channel, frame 40
    in[2 * 10] = 1e-17f;     // below -313 dB: does not count
    EXPECT_EQ(Block(e, in, out, 100, 0), 100);
    EXPECT_EQ(Block(e, in, out, 100, 1), 41);
    std::fill(in.begin(), in.end(), 0.0f);
    EXPECT_EQ(Block(e, in, out, 100, 0), 0);  // once latched, every later block is trimmed
    e.ClearEndOfStream();
    EXPECT_EQ(Block(e, in, out, 100, 0), 100);
    EXPECT_EQ(Block(e, in, out, 100, 1), 0);
    e.ResetState();
    EXPECT_FALSE(EngineProbe(e).tailTrimArmed());
    EXPECT_EQ(Block(e, in, out, 100, 0), 100);
}

// The pre-delay line: 20 ms long, derived again for a new rate; signal still in it holds the end of the
// stream open while it is in the path; switched out it is kept, never empties and must not hold the tail.
TEST(BlockProcessor, PreDelayLineFollowsRateAndHoldsTheTailOnlyWhileInThePath) {
    test::Started e(44100, test::Typical(0));
    std::vector<float> in(128, 0.0f), out(128);
    EXPECT_EQ(EngineProbe(e).preDelayLine().length, 882);
    EngineProbe::preDelayLine(e).samples[3] = 0.5;
    EXPECT_EQ(Block(e, in, out, 64, 1), 64);
    EXPECT_FALSE(EngineProbe(e).tailTrimArmed());
    EngineProbe::preDelayLine(e).samples[3] = 0.0;
    EXPECT_EQ(Block(e, in, out, 64, 0), 0);

    test::Started f(96000, test::Typical(0));
    test::Start(f, 44100, test::Typical(0));
    test::Render(f, test::Noise(8000, 0.5f, 3));
    f.SetPreDelay(0);
    EXPECT_TRUE(!EngineProbe(f).preDelayOn() && EngineProbe(f).preDelayLine().length == 882);
    EXPECT_TRUE(test::Drain(f, 44100 * 60 / 512).endedWell);
}

// Nothing poisons the reverb for good, in any algorithm. Input far beyond full scale (one sample of 3e38,
// float data read with the wrong byte order, infinities, NaN) leaves the output finite and a tail that
// ends, with no reset of the network (its tail goes on after the block). A network whose state is no
// longer finite silences itself within a block and then plays on. Wet signal only.
TEST(BlockProcessor, NothingPoisonsTheReverbForGood) {
    const float nan = std::numeric_limits<float>::quiet_NaN(), inf = std::numeric_limits<float>::infinity();
    for (int mode = 0; mode < 8; ++mode) {
        Settings s = test::Typical(mode);
        s.decay = 0;
        s.roomSize = 10;
        s.dry = -600;
        test::Started e(44100, s);
        std::vector<float> in = test::Noise(1024, 0.5f, 4), out(in.size());
        in[100] = in[101] = 3e38f;
        in[301] = -3e38f;
        in[500] = nan;
        in[501] = inf;
        in[700] = -inf;
        for (size_t i = 800; i < in.size(); ++i) {
            uint32_t bits;
            std::memcpy(&bits, &in[i], sizeof bits);
            bits = (bits >> 24) | ((bits >> 8) & 0xff00u) | ((bits << 8) & 0xff0000u) | (bits << 24);
            std::memcpy(&in[i], &bits, sizeof bits);
        }
        int got = Block(e, in, out, 1024, 0);
        for (long blocks = 0; got == 1024 && blocks < 44100 * 60 / 1024; ++blocks) {
            for (float v : out) ASSERT_TRUE(std::isfinite(v)) << mode;
            std::fill(in.begin(), in.end(), 0.0f);
            got = Block(e, in, out, 1024, 1);
            if (blocks == 0) {
                float peak = 0.0f;
                for (float v : out) peak = std::max(peak, std::fabs(v));
                EXPECT_GT(peak, 0.0f) << mode << ": the network was reset";
            }
        }
        ASSERT_LT(got, 1024) << mode << ": the tail did not end";

        e.ResetState();
        test::Render(e, test::Noise(2000, 0.5f, 5));
        if (ConvolutionResponse* r = EngineProbe::response(e)) {
            std::fill(r->historyLeft.start, r->historyLeft.end, nan);
        } else {
            for (int i = 0; i < ReverbEngine::kNetworkLines; ++i) {
                DelayLine& l = EngineProbe::line(e, i);
                std::fill(l.samples.get(), l.samples.get() + l.length, inf);
            }
            PreDelayLine& p = EngineProbe::preDelayLine(e);
            std::fill(p.samples.get(), p.samples.get() + p.length, nan);
        }
        const std::vector<float> silent = test::Render(e, std::vector<float>(2 * 2048, 0.0f));
        for (size_t i = 0; i < silent.size(); ++i) {
            ASSERT_TRUE(std::isfinite(silent[i])) << mode;
            ASSERT_TRUE(i < 1024 || silent[i] == 0.0f) << mode << " at " << i;  // silenced after one block
        }
        std::vector<float> impulse(2 * 8192, 0.0f);
        impulse[0] = impulse[1] = 1.0f;
        float peak = 0.0f;
        for (float v : test::Render(e, impulse)) peak = std::max(peak, std::fabs(v));
        EXPECT_TRUE(peak > 1e-3f && std::isfinite(peak)) << mode;
    }
}

// A tail decaying through the smallest floats leaves exact zeros at the output, never denormal floats.
TEST(BlockProcessor, DecayingTailsNeverOutputDenormalFloats) {
    for (int mode : {0, 1, 2, 6, 7, 3}) {
        ReverbEngine e;
        Settings s = test::Typical(mode);
        s.decay = 5;
        s.wet = 60;
        s.dry = -600;
        e.SetMeterSource(2);
        test::Start(e, 22050, s);
        std::vector<float> in(1024), out(1024);
        for (int i = 0; i < 1024; ++i) in[i] = (i % 3 == 0) ? 0.9f : -0.4f;
        Block(e, in, out, 512, 0);
        std::fill(in.begin(), in.end(), 0.0f);
        bool sawTiny = false;
        for (int b = 0; b < 1500; ++b) {
            Block(e, in, out, 512, 0);
            for (float v : out) {
                ASSERT_NE(std::fpclassify(v), FP_SUBNORMAL) << "mode " << mode << " block " << b;
                sawTiny |= (v != 0.0f && std::fabs(v) < 1e-30f);
            }
        }
        EXPECT_TRUE(sawTiny || mode == 3) << mode;  // the tail did pass through the smallest floats
    }
}

// Lines holding a tail at the bottom of the double range decay to exact zeros without storing a denormal,
// and every block leaves the caller's floating-point mode as it found it.
TEST(BlockProcessor, NetworksDecayToExactZerosAndRestoreTheCallersMode) {
    for (int mode : {0, 1, 2, 6, 7}) {
        test::Started e(8000, test::Typical(mode));
        std::vector<int> lines;
        for (int k = 0; k < ((mode == 2 || mode == 6) ? 20 : 12); ++k)
            if (!((mode == 2 || mode == 6) && (k == 16 || k == 18))) lines.push_back(k);  // 16 and 18 unused
        for (int k : lines) {
            DelayLine& l = EngineProbe::line(e, k);
            for (int i = 0; i < l.length; ++i) l.samples[i] = (i % 2) ? 1e-305 : -3e-306;
        }
        std::vector<float> silence(1024, 0.0f), out(1024);
        for (int b = 0; b <= 400; ++b) {
            const unsigned csr = ProcessorMode();
            Block(e, silence, out, 512, 0);
            ASSERT_EQ(ProcessorMode(), csr);
            for (int k : lines) {
                const DelayLine& l = EngineProbe(e).line(k);
                for (int i = 0; i < l.length; ++i)
                    ASSERT_TRUE(b < 400 ? std::fpclassify(l.samples[i]) != FP_SUBNORMAL : l.samples[i] == 0.0)
                        << "mode " << mode << " line " << k << " block " << b;
            }
        }
    }
}

// Every kernel keeps its state between blocks, so the output does not depend on how the stream is cut.
TEST(BlockProcessor, OutputDoesNotDependOnTheBlockSize) {
    const std::vector<float> in = test::Noise(20000, 0.5f, 31);
    for (int mode : {0, 1, 2, 6, 7, 4}) {
        test::Started reference(48000, test::Typical(mode));
        const std::vector<float> expected = test::Render(reference, in, 512);
        for (int block : {1, 37, 4096}) {
            test::Started e(48000, test::Typical(mode));
            ASSERT_EQ(test::Render(e, in, block), expected) << "mode " << mode << " block " << block;
        }
    }
}

// The drain trims: a flushing block returns the index + 1 of its last frame above -313 dB and the frames
// past it are silent; silence long after a tail, without the flush, still yields every frame.
TEST(BlockProcessor, DrainEndsAndTrimsTheTail) {
    for (int mode : {0, 1, 2, 6, 7}) {
        ReverbEngine silent, e;
        test::Start(silent, 44100, test::Typical(mode));
        std::vector<float> silence(1024, 0.0f), out(1024);
        for (int i = 0; i < 1000; ++i) ASSERT_EQ(Block(silent, silence, out, 512, 0), 512);
        test::Start(e, 44100, test::Typical(mode));
        test::Render(e, test::Noise(22050, 0.5f, 7));
        const test::DrainResult d = test::Drain(e, 44100 * 60 / 512);
        EXPECT_TRUE(d.endedWell) << mode;
        EXPECT_GT(d.firstPeak, 1e-3f) << mode;
    }
}

}  // namespace
}  // namespace ulvetta
