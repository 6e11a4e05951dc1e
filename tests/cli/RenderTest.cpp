#include <cmath>

#include "CliHarness.h"
#include "AudioOutput.h"

namespace ulvetta::testing {
namespace {

const std::vector<std::string> kDryOnly = {"--set", "Output Level Wet=-Inf.", "--set", "Output Level Dry=0"};

std::vector<std::string> with(std::vector<std::string> args, const std::vector<std::string>& more) {
    args.insert(args.end(), more.begin(), more.end());
    return args;
}

TEST_F(CliTest, SixteenBitInputGivesSixteenBitOutputWithTheTailAfterIt) {
    const size_t frames = 10007;
    writePcm16("in.wav", 48000, 2, noise16(frames * 2, 1));
    const RunResult r = run({"render", "in.wav", "out.wav", "--block", "256"});
    ASSERT_EQ(r.status, 0) << r.err;
    EXPECT_EQ(r.err, "") << "quiet when stderr is not a terminal";
    const Audio out = read("out.wav");
    EXPECT_EQ(out.format, SF_FORMAT_WAV | SF_FORMAT_PCM_16);
    EXPECT_EQ(out.rate, 48000);
    EXPECT_EQ(out.channels, 2);
    // Every input frame comes out, followed by the drained tail: whole blocks, then a shorter last one.
    EXPECT_GE(out.frames(), static_cast<long long>(frames));
    EXPECT_LT(out.frames(), static_cast<long long>(frames) + 60LL * 48000);
    EXPECT_EQ(listing(), (std::vector<std::string>{"in.wav", "out.wav"}));
}

TEST_F(CliTest, DryPathReproducesSixteenBitInputExactly) {
    // Full-scale extremes and small values, a length that is no multiple of the block size.
    std::vector<short> in = noise16(2 * 3001, 2);
    in[0] = -32768, in[1] = 32767, in[2] = -1, in[3] = 1, in[4] = 0, in[5] = -32767;
    writePcm16("in.wav", 44100, 2, in);
    const RunResult r = run(with({"render", "in.wav", "out.wav", "--block", "100"}, kDryOnly));
    ASSERT_EQ(r.status, 0) << r.err;
    const Audio out = read("out.wav");
    ASSERT_GE(out.pcm.size(), in.size());
    EXPECT_TRUE(std::equal(in.begin(), in.end(), out.pcm.begin()));
    // The tail of a dry-only render is silence.
    EXPECT_TRUE(std::all_of(out.pcm.begin() + static_cast<long>(in.size()), out.pcm.end(), [](short s) { return s == 0; }));
}

TEST_F(CliTest, FloatInputGivesFloatOutputAndForcedFloatKeepsTheSamples) {
    std::vector<float> in(2 * 1500);
    for (size_t i = 0; i < in.size(); ++i) in[i] = static_cast<float>(std::sin(0.01 * static_cast<double>(i)) * 1.5);
    writeFloat("in.wav", 22050, 2, in);
    RunResult r = run(with({"render", "in.wav", "out.wav"}, kDryOnly));
    ASSERT_EQ(r.status, 0) << r.err;
    Audio out = read("out.wav");
    EXPECT_EQ(out.format, SF_FORMAT_WAV | SF_FORMAT_FLOAT);
    ASSERT_GE(out.floats.size(), in.size());
    EXPECT_TRUE(std::equal(in.begin(), in.end(), out.floats.begin())) << "float samples above full scale pass unclipped";

    const std::vector<short> pcm = noise16(2 * 700, 3);
    writePcm16("pcm.wav", 44100, 2, pcm);
    r = run(with({"render", "pcm.wav", "f.wav", "--float"}, kDryOnly));
    ASSERT_EQ(r.status, 0) << r.err;
    out = read("f.wav");
    EXPECT_EQ(out.format, SF_FORMAT_WAV | SF_FORMAT_FLOAT);
    for (size_t i = 0; i < pcm.size(); ++i) ASSERT_EQ(out.floats[i], pcm[i] / 32768.0f) << i;
}

TEST_F(CliTest, MonoInputBecomesTwoEqualChannels) {
    const std::vector<short> in = noise16(4000, 4);
    writePcm16("mono.wav", 44100, 1, in);
    const RunResult r = run(with({"render", "mono.wav", "out.wav", "--block", "333"}, kDryOnly));
    ASSERT_EQ(r.status, 0) << r.err;
    const Audio out = read("out.wav");
    ASSERT_EQ(out.channels, 2);
    ASSERT_GE(out.frames(), 4000);
    for (size_t i = 0; i < in.size(); ++i) {
        ASSERT_EQ(out.pcm[2 * i], in[i]) << i;
        ASSERT_EQ(out.pcm[2 * i + 1], in[i]) << i;
    }
}

TEST_F(CliTest, SixteenBitOutputTruncatesTowardZeroAndClamps) {
    // At +6 dB of dry gain every sample roughly doubles: large ones must clamp, negative ones must
    // truncate toward zero (-3 x 1.995 = -5.98 gives -5, not -6).
    const std::vector<short> in = {-3, 3, 30000, -30000, -32768, 32767, 1000, -1000};
    writePcm16("in.wav", 44100, 2, in);
    const RunResult r =
        run({"render", "in.wav", "out.wav", "--set", "Output Level Wet=-Inf.", "--set", "Output Level Dry=6"});
    ASSERT_EQ(r.status, 0) << r.err;
    const Audio out = read("out.wav");
    const double gain = std::pow(10.0, 6.0 / 20.0);
    for (size_t i = 0; i < in.size(); ++i) {
        const float y = static_cast<float>(in[i] / 32768.0f * gain) * 32768.0f;
        const double expected = std::max(-32768.0, std::min(32767.0, std::trunc(static_cast<double>(y))));
        EXPECT_EQ(out.pcm[i], static_cast<short>(expected)) << "sample " << in[i];
    }
    EXPECT_EQ(out.pcm[0], -5);
    EXPECT_EQ(out.pcm[2], 32767);
    EXPECT_EQ(out.pcm[3], -32768);
}

TEST(FloatToPcm16, MatchesTheFilterConversion) {
    EXPECT_EQ(floatToPcm16(0.0f), 0);
    EXPECT_EQ(floatToPcm16(1.0f), 32767);
    EXPECT_EQ(floatToPcm16(-1.0f), -32768);
    EXPECT_EQ(floatToPcm16(-1.5f), -32768);
    EXPECT_EQ(floatToPcm16(1.5f / 32768.0f), 1);
    EXPECT_EQ(floatToPcm16(-1.5f / 32768.0f), -1);
    EXPECT_EQ(floatToPcm16(32766.9f / 32768.0f), 32766);
    EXPECT_EQ(floatToPcm16(INFINITY), 32767);
    EXPECT_EQ(floatToPcm16(-INFINITY), -32768);
    EXPECT_EQ(floatToPcm16(NAN), 0);
}

TEST_F(CliTest, BadInputExitsTwoAndLeavesNoOutput) {
    writePcm16("in.wav", 44100, 2, noise16(2 * 500, 5));
    writePcm16("three.wav", 44100, 3, noise16(3 * 500, 6));
    {
        std::ofstream f(dir_ / "text.wav");
        f << "this is not audio\n";
    }
    // A WAV header that claims a sample rate of 0.
    std::string zeroRate = slurp(dir_ / "in.wav");
    zeroRate.replace(24, 8, std::string(8, '\0'));
    std::ofstream(dir_ / "rate0.wav", std::ios::binary) << zeroRate;
    std::ofstream(dir_ / "short.stp", std::ios::binary) << std::string(87, '\0');
    // A sparse 4 GiB settings file: judged by its size, never read.
    std::ofstream(dir_ / "huge.stp", std::ios::binary) << std::string(88, '\0');
    fs::resize_file(dir_ / "huge.stp", uintmax_t(4) << 30);
    std::string wrongGuid(88, '\0');
    wrongGuid[0] = 88;
    std::ofstream(dir_ / "guid.stp", std::ios::binary) << wrongGuid;
    // An existing output must survive a failed render unchanged.
    std::ofstream(dir_ / "keep.wav", std::ios::binary) << "previous output";
    const std::vector<std::string> before = listing();

    const std::vector<std::vector<std::string>> cases = {
        {"render", "missing.wav", "out.wav"},
        {"render", "text.wav", "out.wav"},
        {"render", "three.wav", "out.wav"},
        {"render", "rate0.wav", "out.wav"},
        {"render", ".", "out.wav"},
        {"render", "in.wav", "out.wav", "--set", "Reverb Amount=3"},
        {"render", "in.wav", "out.wav", "--set", "Pre Delay=forty"},
        {"render", "in.wav", "out.wav", "--set", "Pre Delay=0x10"},
        {"render", "in.wav", "out.wav", "--set", "Pre Delay"},
        {"render", "in.wav", "out.wav", "--set-raw", "1=2.5"},
        {"render", "in.wav", "out.wav", "--set-raw", "17=2"},
        {"render", "in.wav", "out.wav", "--set", "Algorithm=huge hall"},
        {"render", "in.wav", "out.wav", "--algorithm", "8"},
        {"render", "in.wav", "out.wav", "--algorithm", "two"},
        {"render", "in.wav", "out.wav", "--preset", "huge hall"},
        {"render", "in.wav", "out.wav", "--state", "short.stp"},
        {"render", "in.wav", "out.wav", "--state", "guid.stp"},
        {"render", "in.wav", "out.wav", "--state", "none.stp"},
        {"render", "in.wav", "out.wav", "--state", "huge.stp"},
        {"render", "in.wav", "out.wav", "--block", "0"},
        {"render", "in.wav", "out.wav", "--block=-64"},
        {"render", "in.wav", "out.wav", "--block", "100000000"},
        {"render", "in.wav", "out.wav", "--block", "12x"},
        {"render", "in.wav", "missing-folder/out.wav"},
        {"render", "in.wav", "keep.wav", "--set", "Decay=loud"},
        {"render", "in.wav"},
    };
    for (const auto& args : cases) {
        std::string shown;
        for (const auto& a : args) shown += a + " ";
        SCOPED_TRACE(shown);
        expectOneSentence(run(args), 2);
        EXPECT_EQ(listing(), before);
    }
    EXPECT_EQ(slurp(dir_ / "keep.wav"), "previous output");
}

TEST_F(CliTest, BundledDrySampleRendersThroughAFactoryPreset) {
    fs::copy_file(ULVETTA_DRY_WAV, dir_ / "dry.wav");
    EXPECT_LT(fs::file_size(dir_ / "dry.wav"), 1u << 20);
    const Audio in = read("dry.wav");
    EXPECT_EQ(in.rate, 44100);
    EXPECT_EQ(in.format & SF_FORMAT_SUBMASK, SF_FORMAT_PCM_16);
    EXPECT_GE(in.frames(), 4 * 44100);
    EXPECT_LE(in.frames(), 6 * 44100);
    const RunResult r = run({"render", "dry.wav", "out.wav", "--preset", "LARGE ROOM *****", "--block", "1024"});
    ASSERT_EQ(r.status, 0) << r.err;
    const Audio out = read("out.wav");
    EXPECT_EQ(out.channels, 2);
    EXPECT_GE(out.frames(), in.frames());
    EXPECT_TRUE(std::all_of(out.floats.begin(), out.floats.end(), [](float v) { return std::isfinite(v); }));
}

TEST_F(CliTest, RenderReplacesAnExistingOutputOnlyWhenComplete) {
    writePcm16("in.wav", 44100, 2, noise16(2 * 300, 7));
    std::ofstream(dir_ / "out.wav", std::ios::binary) << "previous output";
    const RunResult r = run(with({"render", "in.wav", "out.wav"}, kDryOnly));
    ASSERT_EQ(r.status, 0) << r.err;
    const Audio out = read("out.wav");
    EXPECT_GE(out.frames(), 300);
    EXPECT_EQ(out.channels, 2);
    EXPECT_EQ(listing(), (std::vector<std::string>{"in.wav", "out.wav"}));
}

}  // namespace
}  // namespace ulvetta::testing
