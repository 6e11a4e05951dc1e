#include <gtest/gtest.h>

#include <utility>
#include <vector>

#include "filter/ReverbCore.h"
#include "support/AllocationCounter.h"

using namespace ulvetta;

namespace {

// Settings whose engine setters only recompute coefficients or gains in this algorithm. Left out on
// purpose: Algorithm and Room Size (they rebuild the networks), Pre Delay (it re-creates its delay
// line), Diffusion in the echo (7), Decay in the echo and the convolutions (3, 4, 5), Damping in the
// convolutions: those re-prepare networks or responses and may allocate.
std::vector<std::pair<int32_t, int32_t>> settingsWithoutRebuild(int algorithm) {
    std::vector<std::pair<int32_t, int32_t>> s = {
        {kEarlyReflections, -123}, {kOutputLevelWet, -50}, {kOutputLevelDry, -600}, {kColour, 20},
        {kInputGain, -35},         {kLowPassFreq, 3000},   {kHighPassFreq, 400},    {kNotchFreq, 900},
        {kNotchGain, 60},          {kNotchQ, 12},          {kMeterSource, 2}};
    const bool convolution = algorithm >= 3 && algorithm <= 5;
    if (!convolution) s.push_back({kDamping, 60});
    if (!convolution && algorithm != 7) s.push_back({kDecay, 70});
    if (algorithm != 7) s.push_back({kDiffusion, 40});
    return s;
}

}  // namespace

// After start-up the streaming calls, the meter and parameter reads and the settings above allocate
// nothing. Allowed before counting starts: start-up itself and the mono scratch's first growth, made by
// the first block at the largest size used.
TEST(AudioPath, AllocatesNothingAfterStartUp) {
    constexpr int kLarge = 1024, kSmall = 64;
    std::vector<float> in(2 * kLarge), out(2 * kLarge);
    for (size_t i = 0; i < in.size(); ++i) in[i] = (i % 97) * 0.01f - 0.5f;
    char text[ReverbCore::kTextCapacity];
    for (int algorithm = 0; algorithm < kAlgorithmCount; ++algorithm) {
        ReverbCore core;
        core.setFormat(48000.0f, 0, 2, 2);
        core.setValue(kAlgorithm, algorithm);
        core.applyAll();
        core.startStreaming();
        const auto settings = settingsWithoutRebuild(algorithm);
        auto block = [&](int frames) {
            core.trackLevel(in.data(), nullptr, frames, 2, 0, 0);
            core.processStereo(in.data(), in.data() + 1, out.data(), out.data() + 1, frames, 2, 0, 0, 0);
        };
        block(kLarge);
        AllocationCounter counter;
        for (int round = 0; round < 3; ++round) {
            for (int frames : {kLarge, kSmall, kSmall}) block(frames);
            core.getStatus(kStatusLevel);
            core.getStatus(kStatusLoad);
            for (int32_t id = 0; id < kParamCount; ++id) {
                core.getValue(id);
                core.getNormalized(id);
                core.getValueText(id, text, round % 2 == 0);
            }
            for (const auto& [id, value] : settings) core.setValue(id, value + round);
            core.setNormalized(kOutputLevelWet, 0.25f * round);
        }
        const long allocations = counter.count();
        EXPECT_EQ(allocations, 0) << "algorithm " << algorithm;
    }
}
