// The response rate converter: its phase and gain at twice the rate, both channels at once equal to one at
// a time, the fine table within a millionth of the exact rows on a stored response, and its capacity.
#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "dsp/EngineTestSupport.h"
#include "engine/IrResampler.h"
#include "engine/StoredResponses.h"

using namespace ulvetta;

namespace {

std::vector<float> convertChannel(const std::vector<float>& in, int channel, int rate,
                                  int64_t exactLimit = IrResampler::kExactRows) {
    const int frames = static_cast<int>(in.size() / 2);
    IrResampler r;
    r.setExactLimit(exactLimit);
    r.Setup(rate);
    const int capacity = static_cast<int>(static_cast<int64_t>(frames) * rate / 44100 + 64);
    std::vector<float> out(2 * capacity, 0.0f);
    const int n = r.Run(out.data() + channel, in.data() + channel, frames, capacity);
    std::vector<float> mono(n);
    for (int i = 0; i < n; ++i) mono[i] = out[2 * i + channel];
    return mono;
}

}  // namespace

TEST(IrResampler, HalfwayPhaseAt88200) {
    // L = 2, M = 1: output 2k lands on input k - 29 (the kernel's centre), output 2k + 1 halfway between
    // inputs k - 29 and k - 28; both at the converter's gain of 0.9.
    const double w = 2.0 * 3.141592653589793 * 1000.0 / 44100.0;
    std::vector<float> in(2 * 600, 0.0f);
    for (int i = 0; i < 600; ++i) in[2 * i] = static_cast<float>(std::sin(w * i));
    const std::vector<float> out = convertChannel(in, 0, 88200);
    for (int k = 100; k < 500; ++k) {
        EXPECT_NEAR(out[2 * k], 0.9 * std::sin(w * (k - 29)), 0.01) << k;
        EXPECT_NEAR(out[2 * k + 1], 0.9 * std::sin(w * (k - 28.5)), 0.01) << k;
    }
}

TEST(IrResampler, BothChannelsAtOnceEqualOneAtATime) {
    const std::vector<float> in = test::Noise(5000, 1.0f, 12345);
    for (int rate : {48000, 44101}) {
        IrResampler stereo;
        stereo.Setup(rate);
        std::vector<float> out(2 * 6000, 0.0f);
        const int n = stereo.RunStereo(out.data(), in.data(), 5000, 6000);
        const std::vector<float> l = convertChannel(in, 0, rate), r = convertChannel(in, 1, rate);
        ASSERT_EQ(static_cast<size_t>(n), l.size());
        for (int i = 0; i < n; ++i) ASSERT_TRUE(out[2 * i] == l[i] && out[2 * i + 1] == r[i]) << rate << " at " << i;
    }
}

// Rates a few hertz off the usual ones need tens of thousands of phase rows; their blended rows give a
// converted stored response within 1e-6 of the exact rows'.
TEST(IrResampler, FineTableStaysWithinAMillionth) {
    const StoredResponse s = storedResponse(5);
    const std::vector<float> in(s.frames, s.frames + 2 * 30000);
    for (int rate : {44101, 96001}) {
        IrResampler check;
        check.Setup(rate);
        ASSERT_GT(check.upFactor(), IrResampler::kExactRows) << rate;
        const std::vector<float> exact = convertChannel(in, 0, rate, int64_t{1} << 40);
        const std::vector<float> fine = convertChannel(in, 0, rate);
        ASSERT_EQ(exact.size(), fine.size());
        float worst = 0.0f;
        for (size_t i = 0; i < exact.size(); ++i) worst = std::max(worst, std::fabs(exact[i] - fine[i]));
        EXPECT_LT(worst, 1e-6f) << rate;
        EXPECT_GT(worst, 0.0f) << rate;  // the two paths really differ
    }
}

TEST(IrResampler, NeverWritesPastItsCapacity) {
    const std::vector<float> in = test::Noise(1000, 1.0f, 12345);
    IrResampler r;
    r.Setup(96000);
    std::vector<float> out(2 * 100 + 2, 7.0f);
    EXPECT_EQ(r.Run(out.data(), in.data(), 1000, 100), 100);
    EXPECT_EQ(out[200], 7.0f);
}
