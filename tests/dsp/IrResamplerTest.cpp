// The response rate converter: its phase and gain at twice the rate, channels converted independently
// on one buffer, rows derived on use equal to the table, and its capacity.
#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "dsp/EngineTestSupport.h"
#include "engine/IrResampler.h"

using namespace ulvetta;

namespace {

std::vector<float> convertChannel(const std::vector<float>& in, int channel, int rate, int64_t tableLimit = 8192) {
    const int frames = static_cast<int>(in.size() / 2);
    IrResampler r;
    r.setTableLimit(tableLimit);
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

TEST(IrResampler, ChannelsConvertIndependentlyOnOneBuffer) {
    const std::vector<float> in = test::Noise(5000, 1.0f, 12345);
    IrResampler left, right;
    left.Setup(48000);
    right.Setup(48000);
    std::vector<float> out(2 * 6000, 0.0f);
    const int nl = left.Run(out.data(), in.data(), 5000, 6000);
    const int nr = right.Run(out.data() + 1, in.data() + 1, 5000, 6000);
    ASSERT_EQ(nl, nr);
    const std::vector<float> l = convertChannel(in, 0, 48000), r = convertChannel(in, 1, 48000);
    for (int i = 0; i < nl; ++i) ASSERT_TRUE(out[2 * i] == l[i] && out[2 * i + 1] == r[i]) << i;
}

TEST(IrResampler, RowsDerivedOnUseEqualTheTable) {
    const std::vector<float> in = test::Noise(3000, 1.0f, 12345);
    for (int rate : {48000, 44101}) {
        const std::vector<float> table = convertChannel(in, 0, rate, 1 << 20);
        const std::vector<float> derived = convertChannel(in, 0, rate, 0);
        ASSERT_EQ(table, derived) << rate;
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
