#include <gtest/gtest.h>

#include <utility>
#include <vector>

#include "filter/ReverbCore.h"
#include "support/AllocationCounter.h"

using namespace ulvetta;

// After start-up, streaming blocks, meter reads, parameter reads and the settings that rebuild nothing
// allocate nothing, in every algorithm. Allowed before counting starts: start-up itself and the mono
// scratch's first growth, made by a first block at the largest size used. Left out of the settings:
// Algorithm and Room Size (they rebuild the networks), Pre Delay (it re-creates its delay line), and
// the settings that re-prepare a network or response in some algorithms: Diffusion and Decay in the
// echo (7), Decay and Damping in the convolutions (3, 4, 5).
TEST(AudioPath, AllocatesNothingAfterStartUp) {
    constexpr int kLarge = 1024, kSmall = 64;
    std::vector<float> in(2 * kLarge), out(2 * kLarge);
    for (size_t i = 0; i < in.size(); ++i) in[i] = (i % 97) * 0.01f - 0.5f;
    char text[ReverbCore::kTextCapacity];
    for (int algorithm = 0; algorithm < kAlgorithmCount; ++algorithm) {
        const bool convolution = algorithm >= 3 && algorithm <= 5, echo = algorithm == 7;
        std::vector<std::pair<int32_t, int32_t>> settings = {
            {kEarlyReflections, -123}, {kOutputLevelWet, -50}, {kOutputLevelDry, -600}, {kColour, 20},
            {kInputGain, -35},         {kLowPassFreq, 3000},   {kHighPassFreq, 400},    {kNotchFreq, 900},
            {kNotchGain, 60},          {kNotchQ, 12},          {kMeterSource, 2}};
        if (!convolution) settings.push_back({kDamping, 60});
        if (!convolution && !echo) settings.push_back({kDecay, 70});
        if (!echo) settings.push_back({kDiffusion, 40});
        ReverbCore core;
        core.setFormat(48000.0f, 0, 2, 2);
        core.setValue(kAlgorithm, algorithm);
        core.applyAll();
        core.startStreaming();
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
            for (int32_t id = 0; id < kParamCount; ++id)
                core.getValueText(id, text, core.getValue(id) + core.getNormalized(id) > 0.0f);
            for (const auto& [id, value] : settings) core.setValue(id, value + round);
            core.setNormalized(kOutputLevelWet, 0.25f * round);
        }
        EXPECT_EQ(counter.count(), 0) << "algorithm " << algorithm;
    }
}
