// Convolution responses as the core prepares them: once per change outside a stream, off the streaming
// thread during one, switched in at a block without allocation and playing exactly as a response prepared
// at stream start; the latest of a burst of changes wins.
#include <gtest/gtest.h>

#include <vector>

#include "engine/EngineProbe.h"
#include "filter/ReverbCore.h"
#include "support/AllocationCounter.h"

using namespace ulvetta;

namespace {

// Colour, filters and notch out of the path, unity wet, no dry: the output is the convolution alone.
void transparent(ReverbCore& c, float rate, int algorithm, int decay) {
    c.setFormat(rate, 0, 2, 2);
    c.setValue(kAlgorithm, algorithm);
    for (auto [id, v] : {std::pair<int32_t, int32_t>{kColour, 100}, {kLowPassFreq, 10000}, {kHighPassFreq, 100},
                         {kNotchGain, 0}, {kOutputLevelWet, 0}, {kOutputLevelDry, -600}, {kInputGain, 0},
                         {kDecay, decay}})
        c.setValue(id, v);
    c.applyAll();
}

const ConvolutionResponse* playing(ReverbCore& c) { return EngineProbe(c.engineForInspection()).response(); }

void process(ReverbCore& c, const std::vector<float>& in, std::vector<float>& out) {
    c.processStereo(in.data(), in.data() + 1, out.data(), out.data() + 1, static_cast<int>(in.size() / 2), 2, 0, 0,
                    0);
}

std::vector<float> process(ReverbCore& c, const std::vector<float>& in) {
    std::vector<float> out(in.size());
    process(c, in, out);
    return out;
}

std::vector<float> noise(int frames, unsigned seed) {
    std::vector<float> v(2 * static_cast<size_t>(frames));
    for (float& x : v) x = static_cast<float>((seed = seed * 1664525u + 1013904223u) >> 9) / 8388608.0f - 0.5f;
    return v;
}

}  // namespace

// Outside a stream a change prepares at once, and only a change: applying everything again, or Decay at
// the value it has, keeps the response; an algorithm switch (which also loads Decay, Damping and Room
// Size) prepares one.
TEST(ResponsePreparation, OncePerChange) {
    ReverbCore c;
    transparent(c, 48000.0f, 4, 60);
    const ConvolutionResponse* first = playing(c);
    ASSERT_NE(first, nullptr);
    const int32_t builds = EngineProbe(c.engineForInspection()).rebuildCount();
    c.applyAll();
    c.setValue(kDecay, 60);
    EXPECT_EQ(playing(c), first);
    c.setValue(kAlgorithm, 5);
    EXPECT_EQ(EngineProbe(c.engineForInspection()).rebuildCount(), builds + 1);
    c.setValue(kDecay, 61);
    EXPECT_EQ(EngineProbe(c.engineForInspection()).rebuildCount(), builds + 2);
    EXPECT_EQ(playing(c)->key, (ResponseKey{5, 48000, 61, c.getValue(kDamping), c.getValue(kRoomSize)}));
}

// While streaming a change returns before the response is prepared; a later block switches it in without
// allocating, and from there the output is exactly that of a stream started with the new settings.
TEST(ResponsePreparation, StreamingChangeIsSwitchedInAtABlock) {
    ReverbCore live, fresh;
    transparent(live, 44100.0f, 3, 30);
    transparent(fresh, 44100.0f, 3, 70);
    live.startStreaming();
    fresh.startStreaming();
    process(live, noise(1000, 1));
    const ConvolutionResponse* before = playing(live);
    live.setValue(kDecay, 70);
    EXPECT_EQ(playing(live), before);  // still the old one: nothing was prepared on this thread
    live.waitForPreparation();
    const std::vector<float> in = noise(4096, 2);
    std::vector<float> switched(in.size());
    {
        AllocationCounter counter;
        process(live, in, switched);
        EXPECT_EQ(counter.count(), 0);
    }
    ASSERT_NE(playing(live), before);
    EXPECT_EQ(playing(live)->key.decay, 70);
    EXPECT_EQ(switched, process(fresh, in));
    EXPECT_EQ(process(live, in), process(fresh, in));
}

// A burst of changes while streaming ends with the response of the last one.
TEST(ResponsePreparation, LatestOfABurstWins) {
    ReverbCore c;
    transparent(c, 22050.0f, 5, 50);
    c.startStreaming();
    const std::vector<float> in = noise(256, 3);
    for (int i = 0; i < 40; ++i) {
        c.setValue(kDecay, i * 2);
        c.setValue(kAlgorithm, i % 3 == 2 ? 4 : 5);
        process(c, in);
    }
    c.setValue(kRoomSize, 150);
    c.waitForPreparation();
    process(c, in);
    EXPECT_EQ(playing(c)->key, (ResponseKey{5, 22050, c.getValue(kDecay), c.getValue(kDamping), 150}));
}
