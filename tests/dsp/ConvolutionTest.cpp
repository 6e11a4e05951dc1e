// The convolution reverbs: the prepared response against the stored one (shortening, fade, damping, room
// envelope), the kernel against a direct convolution, workers against inline jobs, the exact tail, settings
// of every algorithm changed while another thread streams, repeated preparation.
#include <gtest/gtest.h>

#include <atomic>

#include "dsp/EngineTestSupport.h"
#include "engine/StoredResponses.h"
#include "filter/ReverbCore.h"
#include "platform/Thread.h"

namespace ulvetta {
namespace {

// Neutral input stage, unity wet, no dry, the given response settings.
test::Settings Convolution(int mode, int decay = 100, int damping = 0, int room = 200) {
    test::Settings s = test::Transparent(mode);
    s.decay = decay;
    s.damping = damping;
    s.roomSize = room;
    return s;
}

// After the 64-sample head, partitions of 32, 32, 64, 64, 128, ... samples tile the response exactly, and
// the response is the stored one followed by zeros up to that grid.
TEST(ImpulsePreparation, PartitionsTileTheStoredResponse) {
    test::Started e(44100, Convolution(5));
    const EngineProbe p(e);
    int32_t covered = 64;
    for (int k = 1; k < p.partitionCount(); ++k) {
        EXPECT_EQ(p.partition(k).size, 32 << ((k - 1) / 2)) << k;
        covered += p.partition(k).size;
    }
    EXPECT_EQ(covered, p.responseLength());
    const StoredResponse s = storedResponse(5);
    for (int i = 0; i < s.count; ++i) ASSERT_EQ(p.responseLeft()[i], s.frames[2 * i]) << i;
    for (int i = s.count; i < p.responseLength(); ++i) ASSERT_EQ(p.responseRight()[i], 0.0f) << i;
}

// Decay 0 keeps a fifth of the response, fading its second half linearly to zero.
TEST(ImpulsePreparation, DecayShortensAndFades) {
    test::Started e(44100, Convolution(5, 0));
    const EngineProbe p(e);
    const StoredResponse s = storedResponse(5);
    const int used = static_cast<int>(std::round(s.count * 0.2)), h = used / 2;
    for (int i = 0; i < h; ++i) ASSERT_EQ(p.responseLeft()[i], s.frames[2 * i]);
    for (int i = h; i < used; i += 97)
        ASSERT_FLOAT_EQ(p.responseLeft()[i], static_cast<float>(s.frames[2 * i] * (1.0 - double(i - h) / h)));
    for (int i = used; i < p.responseLength(); ++i) ASSERT_EQ(p.responseLeft()[i], 0.0f);
}

// The strongest damping low-passes the response from 0.1 s on with a = 140 / 22050 and stays stable at low
// rates; room size 0 scales it by 0.3 with a linear fade over its whole length.
TEST(ImpulsePreparation, DampingAndRoomEnvelope) {
    const StoredResponse s = storedResponse(3);
    test::Started damped(44100, Convolution(3, 100, 1));
    const float a = static_cast<float>(140.0 / 22050);
    float y = s.frames[2 * 4409];
    EXPECT_EQ(EngineProbe(damped).responseLeft()[4409], y);
    for (int i = 4410; i < 4600; ++i) {
        y = y + a * (s.frames[2 * i] - y);
        ASSERT_EQ(EngineProbe(damped).responseLeft()[i], y) << i;
    }
    test::Started room0(44100, Convolution(3, 100, 0, 0));
    for (int i = 0; i < s.count; i += 101)
        ASSERT_FLOAT_EQ(EngineProbe(room0).responseLeft()[i],
                        static_cast<float>(s.frames[2 * i] * (1.0 - double(i) / s.count) * 0.3)) << i;
    test::Started low(8000, Convolution(4, 100, 99));
    const EngineProbe p(low);
    for (int i = 0; i < p.responseLength(); ++i) ASSERT_LT(std::fabs(p.responseLeft()[i]), 1.0f) << i;
}

// Left-only noise gives a direct convolution with the left response, at the wet level, whatever the block
// size and the rate; the right channel stays silent.
TEST(ConvolutionKernel, MatchesDirectConvolutionAcrossBlockSizesAndRates) {
    for (int rate : {22050, 44100, 96000}) {
        test::Started e(rate, Convolution(5, 0));
        e.SetWetLevel(0.5);
        const EngineProbe p(e);
        std::vector<float> in = test::Noise(9000, 0.5f, 7);
        for (size_t i = 1; i < in.size(); i += 2) in[i] = 0.0f;
        for (int block : {1, 333, 4096}) {
            e.ResetState();
            const std::vector<float> out = test::Render(e, in, block);
            for (int n = 0; n < 9000; n += 37) {
                double expected = 0.0, scale = 0.0;
                for (int k = 0; k < p.responseLength() && k <= n; ++k) {
                    expected += 0.5 * p.responseLeft()[k] * in[2 * (n - k)];
                    scale += std::fabs(0.5 * p.responseLeft()[k] * in[2 * (n - k)]);
                }
                ASSERT_NEAR(out[2 * n], expected, 1e-5 * scale + 1e-7) << rate << " block " << block << " at " << n;
                ASSERT_EQ(out[2 * n + 1], 0.0f) << rate << " block " << block << " at " << n;
            }
        }
    }
}

TEST(ConvolutionKernel, WorkersGiveTheSameSamplesAsInlineJobs) {
    test::Started threaded(44100, Convolution(4, 60));
    ReverbEngine inlined;
    EngineProbe::runLargePartitionsInline(inlined);
    test::Start(inlined, 44100, Convolution(4, 60));
    bool anyWorker = false;
    for (int k = 1; k < EngineProbe(threaded).partitionCount(); ++k)
        anyWorker |= EngineProbe(threaded).partition(k).HasWorker();
    EXPECT_TRUE(anyWorker);
    const std::vector<float> in = test::Noise(60000, 0.5f, 11);
    EXPECT_EQ(test::Render(threaded, in), test::Render(inlined, in));
}

// After the last input frame the drain yields exactly the response's length - 1 frames, then nothing.
TEST(ConvolutionKernel, FlushYieldsExactlyTheTail) {
    for (int block : {64, 1000, 4096}) {
        test::Started e(44100, Convolution(3, 10));
        std::vector<float> in(2 * block, 0.1f), out(2 * block);
        e.ProcessBlock(out.data(), out.data() + 1, in.data(), in.data() + 1, block, 2, 0, 0);
        std::fill(in.begin(), in.end(), 0.0f);
        long total = 0;
        for (int n = block; n == block;) {
            n = e.ProcessBlock(out.data(), out.data() + 1, in.data(), in.data() + 1, block, 2, 0, 1);
            total += n;
        }
        EXPECT_EQ(total, EngineProbe(e).responseLength() - 1) << block;
        EXPECT_EQ(e.ProcessBlock(out.data(), out.data() + 1, in.data(), in.data() + 1, block, 2, 0, 1), 0);
    }
}

// Switching algorithms and the response settings while another thread streams.
TEST(ConvolutionKernel, SettingsChangeWhileStreaming) {
    ReverbCore core;
    core.setFormat(22050.0f, 0, 2, 2);
    core.setValue(kAlgorithm, 3);
    core.startStreaming();
    std::atomic<bool> done{false};
    Thread editor;
    ASSERT_TRUE(editor.start([&] {
        const int modes[] = {3, 4, 5, 0, 5, 7, 4};
        for (int i = 0; i < 28; ++i) {
            core.setValue(kAlgorithm, modes[i % 7]);
            core.setValue(kDecay, (i * 37) % 101);
            core.setValue(kDamping, (i * 13) % 100);
            core.setValue(kRoomSize, (i * 29) % 201);
        }
        done = true;
    }, 0));
    std::vector<float> in = test::Noise(256, 0.5f, 3), out(512);
    for (int blocks = 0; !done || blocks < 20; ++blocks) {
        ASSERT_EQ(core.processStereo(in.data(), in.data() + 1, out.data(), out.data() + 1, 256, 2, 0, 0, 0), 256);
        for (float v : out) ASSERT_TRUE(std::isfinite(v));
    }
    editor.join();
}

// Under the address sanitizer this also shows that nothing leaks and no worker outlives its buffers.
TEST(ConvolutionKernel, RepeatedPreparationReleasesEverything) {
    test::Started e(44100, Convolution(3, 20));
    std::vector<float> in = test::Noise(4096, 0.5f, 5), out(2 * 4096);
    for (int i = 0; i < 240; ++i) {
        e.SetMode(3 + i % 3);
        e.SetDecay(i % 31);  // short responses keep the many preparations quick
        e.ProcessBlock(out.data(), out.data() + 1, in.data(), in.data() + 1, 4096, 2, 0, 0);
        if (i % 10 == 9) e.SetMode(i % 20 == 9 ? 0 : 7);
    }
    // After all of it the engine still convolves exactly with what it prepared last.
    e.SetMode(4);
    e.ResetState();
    std::vector<float> impulse(2 * 3000, 0.0f);
    impulse[0] = 1.0f;
    const std::vector<float> response = test::Render(e, impulse, 700);
    for (int n = 0; n < 3000; ++n) ASSERT_NEAR(response[2 * n], EngineProbe(e).responseLeft()[n], 2e-6) << n;
}

}  // namespace
}  // namespace ulvetta
