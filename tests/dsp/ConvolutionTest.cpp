#include <gtest/gtest.h>

#include <atomic>
#include <cmath>
#include <vector>

#include "engine/ReverbEngine.h"
#include "engine/StoredResponses.h"
#include "filter/ReverbCore.h"
#include "platform/Thread.h"

using namespace ulvetta;

namespace {

// Neutral input stage (filters off, colour off), the given response settings, mode last.
void setUp(ReverbEngine& e, int rate, int mode, int decay = 100, int damping = 0, int room = 200, int colour = 100) {
    e.SetSampleRate(rate);
    e.SetDiffusion(100);
    e.SetPreDelay(0);
    e.SetDecay(decay);
    e.SetDamping(damping);
    e.SetRoomSize(room);
    e.SetEarlyLevel(1.0);
    e.SetWetLevel(1.0);
    e.SetDryLevel(0.0);
    e.SetColour(colour);
    e.SetInputGain(0);
    e.SetLowPassFreq(10000);
    e.SetHighPassFreq(100);
    e.SetNotchFreq(2000);
    e.SetNotchGain(0.0);
    e.SetNotchQ(3.0);
    e.SetMode(mode);
}

// Runs interleaved input through the engine in blocks; returns the interleaved output.
std::vector<float> run(ReverbEngine& e, const std::vector<float>& in, int block, int flush = 0) {
    std::vector<float> out(in.size(), 0.0f);
    const int frames = static_cast<int>(in.size() / 2);
    for (int at = 0; at < frames; at += block) {
        const int n = std::min(block, frames - at);
        e.ProcessBlock(out.data() + 2 * at, out.data() + 2 * at + 1, in.data() + 2 * at, in.data() + 2 * at + 1, n, 2, 0,
                       flush);
    }
    return out;
}

std::vector<float> noise(int frames, uint32_t seed) {
    std::vector<float> v(2 * frames);
    for (float& x : v) {
        seed = seed * 1664525u + 1013904223u;
        x = static_cast<float>((seed >> 8) / 8388608.0 - 1.0) * 0.5f;
    }
    return v;
}

}  // namespace

TEST(ImpulsePreparation, PartitionGridAndZeroTail) {
    ReverbEngine e;
    setUp(e, 44100, 5);
    EXPECT_EQ(e.partitionCount, 23);
    EXPECT_EQ(e.irLength, 131072);
    EXPECT_EQ(e.partitions[22].size, 32768);
    EXPECT_EQ(e.partitions[21].size, 32768);
    EXPECT_EQ(e.partitions[1].offset, 32);
    EXPECT_EQ(e.partitions[2].offset, 64);
    EXPECT_EQ(e.partitions[3].offset, 64);
    EXPECT_EQ(e.partitions[4].offset, 128);
    const StoredResponse s = storedResponse(5);
    for (int i = 0; i < s.count; ++i) ASSERT_EQ(e.irLeft[i], s.frames[2 * i]) << i;
    for (int i = s.count; i < e.irLength; ++i) ASSERT_EQ(e.irRight[i], 0.0f) << i;
    ReverbEngine large;
    setUp(large, 44100, 4);
    EXPECT_EQ(large.partitionCount, 24);
    EXPECT_EQ(large.irLength, 196608);
    ReverbCore core;
    core.setValue(kAlgorithm, 5);
    core.setValue(kDecay, 100);
    core.applyAll();
    EXPECT_FLOAT_EQ(core.getStatus(kStatusLoad), 0.923f);  // 23 records
}

TEST(ImpulsePreparation, DecayShortensAndFades) {
    ReverbEngine e;
    setUp(e, 44100, 5, 0);
    const StoredResponse s = storedResponse(5);
    const int used = static_cast<int>(std::round(s.count * 0.2));
    const int h = used / 2;
    EXPECT_GE(e.irLength, used);
    for (int i = 0; i < h; ++i) ASSERT_EQ(e.irLeft[i], s.frames[2 * i]);
    for (int i = h; i < used; i += 97)
        ASSERT_FLOAT_EQ(e.irLeft[i], static_cast<float>(s.frames[2 * i] * (1.0 - double(i - h) / h)));
    for (int i = used; i < e.irLength; ++i) ASSERT_EQ(e.irLeft[i], 0.0f);
}

TEST(ImpulsePreparation, DampingAndRoomEnvelope) {
    const StoredResponse s = storedResponse(3);
    ReverbEngine damped;
    setUp(damped, 44100, 3, 100, 1);
    // The strongest low-pass: a = 140 / 22050 from the sample at 0.1 s on.
    const float a = static_cast<float>(140.0 / 22050);
    float y = s.frames[2 * 4409];
    for (int i = 4410; i < 4600; ++i) {
        y = y + a * (s.frames[2 * i] - y);
        ASSERT_EQ(damped.irLeft[i], y) << i;
    }
    EXPECT_EQ(damped.irLeft[4409], s.frames[2 * 4409]);
    ReverbEngine room0;
    setUp(room0, 44100, 3, 100, 0, 0);
    const int used = s.count;
    for (int i = 0; i < used; i += 101)
        ASSERT_FLOAT_EQ(room0.irLeft[i], static_cast<float>(s.frames[2 * i] * (1.0 - double(i) / used) * 0.3)) << i;
}

TEST(ImpulsePreparation, DampingStaysStableAtLowRates) {
    for (int rate : {8000, 11025, 22050}) {
        ReverbEngine e;
        setUp(e, rate, 4, 100, 99);
        for (int i = 0; i < e.irLength; ++i) ASSERT_TRUE(std::isfinite(e.irLeft[i]) && std::fabs(e.irLeft[i]) < 1.0f) << rate;
    }
}

TEST(ImpulsePreparation, ConvertsToTheStreamRateAndRepeatsExactly) {
    ReverbEngine e;
    setUp(e, 48000, 4);
    // About 135168 x 48000 / 44100 = 147120 frames, then the grid boundary above.
    EXPECT_EQ(e.irLength, 196608);
    int last = 0;
    for (int i = 0; i < e.irLength; ++i)
        if (e.irLeft[i] != 0.0f) last = i;
    EXPECT_NEAR(last, 147120 - 5888 * 48000 / 44100, 80);  // the stored zeros stay zeros
    std::vector<float> spectrum(e.partitions[10].spectrumLeft.get(), e.partitions[10].spectrumLeft.get() + 2 * e.partitions[10].size);
    e.SetDecay(100);  // prepares again
    for (size_t i = 0; i < spectrum.size(); ++i) ASSERT_EQ(e.partitions[10].spectrumLeft[i], spectrum[i]);
}

TEST(ConvolutionKernel, ImpulseReturnsTheResponseFromItsOwnFrame) {
    for (int rate : {22050, 44100, 48000, 96000}) {
        SCOPED_TRACE(rate);
        ReverbEngine e;
        setUp(e, rate, 3, 30);
        e.SetWetLevel(0.5);
        e.ResetState();
        const int frames = e.irLength + 1000;
        std::vector<float> in(2 * frames, 0.0f);
        in[2 * 100] = 1.0f;  // left only, at frame 100
        const std::vector<float> out = run(e, in, 512);
        for (int i = 0; i < 100; ++i) ASSERT_EQ(out[2 * i], 0.0f);
        double worst = 0.0;
        for (int i = 0; i < e.irLength; ++i) worst = std::max(worst, std::fabs(out[2 * (100 + i)] - 0.5 * e.irLeft[i]));
        EXPECT_LT(worst, 2e-6);
        for (int i = 0; i < frames; ++i) ASSERT_EQ(out[2 * i + 1], 0.0f) << "right at " << i;
        for (int i = 100 + e.irLength; i < frames; ++i) ASSERT_NEAR(out[2 * i], 0.0f, 1e-6f);
    }
}

TEST(ConvolutionKernel, ColourCarriesTheLeftSampleIntoTheRight) {
    ReverbEngine e;
    setUp(e, 44100, 3, 0, 0, 200, 50);
    e.ResetState();
    std::vector<float> in(2 * 200, 0.0f);
    in[0] = 1.0f;
    const std::vector<float> out = run(e, in, 64);
    double right = 0.0;
    for (int i = 0; i < 200; ++i) right += std::fabs(out[2 * i + 1]);
    EXPECT_GT(right, 0.0);
}

TEST(ConvolutionKernel, MatchesDirectConvolutionAcrossBlockSizes) {
    ReverbEngine e;
    setUp(e, 44100, 5, 0);
    const std::vector<float> in = noise(9000, 7);
    for (int block : {1, 64, 333, 4096}) {
        SCOPED_TRACE(block);
        e.ResetState();
        const std::vector<float> out = run(e, in, block);
        const int L = e.irLength;
        for (int n = 0; n < 9000; n += 37) {
            double expected = 0.0, scale = 0.0;
            for (int k = 0; k < L && k <= n; ++k) {
                expected += double(e.irLeft[k]) * in[2 * (n - k)];
                scale += std::fabs(double(e.irLeft[k]) * in[2 * (n - k)]);
            }
            ASSERT_NEAR(out[2 * n], expected, 1e-5 * scale + 1e-7) << n;
        }
    }
}

TEST(ConvolutionKernel, WorkersGiveTheSameSamplesAsInlineJobs) {
    ReverbEngine threaded, inlined;
    inlined.inlineLargePartitions = true;
    setUp(threaded, 44100, 4, 60);
    setUp(inlined, 44100, 4, 60);
    threaded.ResetState();
    inlined.ResetState();
    bool anyWorker = false;
    for (int k = 1; k < threaded.partitionCount; ++k) anyWorker |= threaded.partitions[k].HasWorker();
    EXPECT_TRUE(anyWorker);
    const std::vector<float> in = noise(60000, 11);
    EXPECT_EQ(run(threaded, in, 512), run(inlined, in, 512));
}

TEST(ConvolutionKernel, FlushYieldsExactlyTheTail) {
    for (int block : {64, 1000, 4096}) {
        ReverbEngine e;
        setUp(e, 44100, 3, 10);
        e.ResetState();
        std::vector<float> in(2 * block, 0.1f), out(2 * block);
        e.ProcessBlock(out.data(), out.data() + 1, in.data(), in.data() + 1, block, 2, 0, 0);
        std::fill(in.begin(), in.end(), 0.0f);
        long total = 0;
        for (int guard = 0; guard < 100000; ++guard) {
            const int n = e.ProcessBlock(out.data(), out.data() + 1, in.data(), in.data() + 1, block, 2, 0, 1);
            total += n;
            if (n < block) break;
        }
        EXPECT_EQ(total, e.irLength - 1) << block;
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
    std::vector<float> in = noise(256, 3), out(512);
    int blocks = 0;
    while (!done || blocks < 20) {
        ASSERT_EQ(core.processStereo(in.data(), in.data() + 1, out.data(), out.data() + 1, 256, 2, 0, 0, 0), 256);
        for (float v : out) ASSERT_TRUE(std::isfinite(v));
        ++blocks;
    }
    editor.join();
}

TEST(ConvolutionKernel, RepeatedPreparationReleasesEverything) {
    // Under the address sanitizer this also proves that nothing leaks and no worker outlives its buffers.
    ReverbEngine e;
    setUp(e, 44100, 3, 20);
    std::vector<float> in = noise(4096, 5), out(2 * 4096);
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
    const std::vector<float> response = run(e, impulse, 700);
    for (int n = 0; n < 3000; ++n) ASSERT_NEAR(response[2 * n], e.irLeft[n], 2e-6) << n;
}
