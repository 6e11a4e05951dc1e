#include <cmath>

#include "AudioOutput.h"
#include "CliHarness.h"

namespace ulvetta::testing {
namespace {

std::vector<std::string> dryOnly(const std::vector<std::string>& args) {
    return sets(args, {"Output Level Wet=-Inf.", "Output Level Dry=0"});
}

// The sample format follows the input (16-bit stays 16-bit unless --float, anything else is float), the
// container the output's extension. The bundled sample goes through a factory preset to finite output.
TEST_F(CliTest, OutputFormatFollowsTheInputAndTheExtension) {
    fs::copy_file(ULVETTA_DRY_WAV, dir_ / "pcm.wav");
    write("float.wav", 22050, 1, std::vector<float>(300, 0.25f));
    const std::pair<std::vector<std::string>, int> cases[] = {
        {{"render", "pcm.wav", "a.wav", "--preset", "LARGE ROOM *****"}, SF_FORMAT_WAV | SF_FORMAT_PCM_16},
        {{"render", "pcm.wav", "b.wav", "--float", "--algorithm", "7"}, SF_FORMAT_WAV | SF_FORMAT_FLOAT},
        {{"render", "pcm.wav", "c.AIFF", "--algorithm", "0"}, SF_FORMAT_AIFF | SF_FORMAT_PCM_16},
        {{"render", "float.wav", "d.wav"}, SF_FORMAT_WAV | SF_FORMAT_FLOAT},
        {{"render", "float.wav", "e.caf"}, SF_FORMAT_CAF | SF_FORMAT_FLOAT},
        {{"render", "float.wav", "f.w64"}, SF_FORMAT_W64 | SF_FORMAT_FLOAT},
        {{"render", "float.wav", "g.out"}, SF_FORMAT_WAV | SF_FORMAT_FLOAT}};
    for (const auto& [args, format] : cases) {
        const RunResult r = run(args);
        EXPECT_TRUE(r.status == 0 && r.err.empty()) << r.err << " (quiet when stderr is not a terminal)";
        const Audio out = read(args[2]);
        EXPECT_EQ(out.format, format) << args[2];
        EXPECT_TRUE(out.channels == 2 && out.rate == (args[1] == "pcm.wav" ? 44100 : 22050)) << args[2];
        EXPECT_TRUE(std::all_of(out.floats.begin(), out.floats.end(), [](float v) { return std::isfinite(v); }));
    }
}

// Through the dry path alone the input comes back exactly (16-bit extremes, float beyond full scale, a
// mono channel on both sides, then silence), at block sizes that cut across the 64 Ki-frame file chunks.
// At +6 dB 16-bit samples roughly double: large ones clamp, others truncate toward zero (-3 gives -5).
TEST_F(CliTest, DryPathReproducesTheInputExactly) {
    std::vector<short> pcm = noise16(2 * 150001, 2), mono = noise16(70001, 3), twice(2 * mono.size());
    pcm[0] = -32768, pcm[1] = 32767;
    for (size_t i = 0; i < twice.size(); ++i) twice[i] = mono[i / 2];
    std::vector<float> fl(2 * 70001);
    for (size_t i = 0; i < fl.size(); ++i) fl[i] = static_cast<float>(std::sin(0.01 * static_cast<double>(i)) * 1.5);
    write("pcm.wav", 44100, 2, pcm);
    write("mono.wav", 8000, 1, mono);
    write("float.wav", 8000, 2, fl);
    const auto same = [](short s, float f) { return f * 32768.0f == s; };
    for (const char* block : {"4097", "100", "65536"}) {
        SCOPED_TRACE(block);
        for (const char* in : {"pcm.wav", "mono.wav", "float.wav"})
            ASSERT_EQ(run(dryOnly({"render", in, std::string("out-") + in, "--block", block})).status, 0);
        const Audio a = read("out-pcm.wav"), b = read("out-mono.wav"), c = read("out-float.wav");
        ASSERT_TRUE(a.floats.size() > pcm.size() && b.floats.size() > twice.size() && c.floats.size() > fl.size());
        EXPECT_TRUE(std::equal(pcm.begin(), pcm.end(), a.floats.begin(), same));
        EXPECT_TRUE(std::all_of(a.floats.begin() + static_cast<long>(pcm.size()), a.floats.end(), [](float v) { return !v; }));
        EXPECT_TRUE(std::equal(twice.begin(), twice.end(), b.floats.begin(), same));
        EXPECT_TRUE(std::equal(fl.begin(), fl.end(), c.floats.begin()));
    }
    const std::vector<short> loud = {-3, 3, 30000, -30000, -32768, 32767, 1000, -1000};
    write("loud.wav", 44100, 2, loud);
    ASSERT_EQ(run(sets({"render", "loud.wav", "out.wav"}, {"Output Level Wet=-Inf.", "Output Level Dry=6"})).status, 0);
    const Audio out = read("out.wav");
    for (size_t i = 0; i < loud.size(); ++i) {
        const double y = static_cast<float>(loud[i] / 32768.0f * std::pow(10.0, 6.0 / 20.0)) * 32768.0f;
        EXPECT_EQ(out.floats[i] * 32768.0f, std::max(-32768.0, std::min(32767.0, std::trunc(y)))) << loud[i];
    }
    EXPECT_TRUE(out.floats[0] * 32768.0f == -5.0f && floatToPcm16(NAN) == 0 && floatToPcm16(-INFINITY) == -32768);
}

// Every refusal exits 2 with one sentence and writes nothing; an existing output stays as it was.
TEST_F(CliTest, RefusalsExitTwoAndWriteNothing) {
    write("in.wav", 44100, 2, noise16(2 * 500, 5));
    std::string zeroRate = slurp(dir_ / "in.wav");  // a WAV header that claims a sample rate of 0
    zeroRate.replace(24, 8, std::string(8, '\0'));
    const std::string wrongGuid = std::string(1, 88) + std::string(87, '\0');
    for (const auto& [name, bytes] : {std::pair<const char*, std::string>{"text.wav", "this is not audio\n"},
                                      {"rate0.wav", zeroRate}, {"short.stp", std::string(87, '\0')},
                                      {"guid.stp", wrongGuid}, {"huge.stp", std::string(88, '\0')},
                                      {"keep.wav", "previous output"}})
        std::ofstream(dir_ / name, std::ios::binary) << bytes;
    fs::resize_file(dir_ / "huge.stp", uintmax_t(4) << 30);  // sparse: judged by its size, never read
    const std::vector<std::string> before = listing();

    const std::vector<std::vector<std::string>> renders = {
        {"missing.wav", "out.wav"}, {"text.wav", "out.wav"}, {"rate0.wav", "out.wav"},
        {".", "out.wav"}, {"in.wav", "."}, {"in.wav", "missing-folder/out.wav"},
        {"in.wav"}, {"--set", "Reverb Amount=3"}, {"--set", "Pre Delay=0x10"}, {"--set-raw", "17=2"},
        {"--algorithm", "8"}, {"--algorithm", "1", "--preset", "large room"}, {"--preset", "huge hall"},
        {"--state", "short.stp"}, {"--state", "guid.stp"}, {"--state", "none.stp"}, {"--state", "huge.stp"},
        {"--block", "0"}, {"--block=-64"}, {"--block", "65537"}, {"--block", "12x"}, {"--tail-db", "3"},
        {"--tail-db", "-inf"}, {"--tail-db", ""}, {"--tail-db"}, {"--set", "Decay=loud"}};
    std::vector<std::vector<std::string>> cases = {{}, {"mix"}, {"presets"}, {"ir", "--algorithm", "1", "x.wav"},
                                                   {"ir", "--algorithm", "3", "--rate", "0", "x.wav"},
                                                   {"ir", "--algorithm", "3", "--rate", "fast", "x.wav"}};
    for (std::vector<std::string> args : renders) {
        if (args.size() > 0 && args[0].rfind("--", 0) == 0) args.insert(args.begin(), {"in.wav", "keep.wav"});
        args.insert(args.begin(), "render");
        cases.push_back(args);
    }
    for (const auto& args : cases) {
        SCOPED_TRACE(args.empty() ? "" : args.back());
        expectOneSentence(run(args), 2);
        EXPECT_EQ(listing(), before);
    }
    EXPECT_EQ(slurp(dir_ / "keep.wav"), "previous output");
    ASSERT_EQ(run(dryOnly({"render", "in.wav", "keep.wav"})).status, 0);
    EXPECT_GE(read("keep.wav").frames(), 500) << "a complete render replaces it";
    EXPECT_EQ(listing(), before);
}

// An impulse through the diffused echo, wet only, half a second of pre-delay: the output is quiet for
// that half second after the input, then decays. With --tail-db the output must end right after its last
// frame at or above the level, or at the input's end if that is later; the samples are those of the full
// render at the same block size, and where it ends does not depend on the block size.
TEST_F(CliTest, TailDbEndsAfterTheLastLoudFrameButNeverBeforeTheInput) {
    const int rate = 22050;
    const double threshold = std::pow(10.0, -60.0 / 20.0);
    auto render = [&](const std::string& in, const char* block, const char* db) {
        std::vector<std::string> args = {"render", in, "out.wav", "--block", block, "--algorithm", "7"};
        if (db) args.insert(args.end(), {"--tail-db", db});
        EXPECT_EQ(run(sets(args, {"Pre Delay=500", "Output Level Wet=0", "Output Level Dry=-Inf."})).status, 0);
        return read("out.wav");
    };
    std::vector<float> impulse(2 * 64, 0.0f);
    impulse[0] = impulse[1] = 1.0f;
    write("short.wav", rate, 2, impulse);
    long long lastLoud = -1;
    for (const char* block : {"64", "1000", "4096"}) {
        SCOPED_TRACE(block);
        const Audio full = render("short.wav", block, nullptr);
        long long previous = lastLoud, firstLoud = -1;
        for (long long i = 0; i < full.frames(); ++i)
            if (std::fabs(full.floats[2 * i]) >= threshold || std::fabs(full.floats[2 * i + 1]) >= threshold)
                lastLoud = i, firstLoud = firstLoud < 0 ? i : firstLoud;
        ASSERT_TRUE(firstLoud >= 64 + rate / 4 && full.frames() - (lastLoud + 1) > rate)
            << "the echoes must start after a quiet stretch and end a quiet second before the tail";
        EXPECT_TRUE(previous < 0 || lastLoud == previous) << lastLoud << " after " << previous;
        // Inputs that end before the echoes, while they sound (over a second in), and after them.
        const long long midInput = firstLoud + rate, longInput = lastLoud + rate / 2;
        ASSERT_GT(lastLoud, midInput);
        for (const auto& [frames, expected] : {std::pair<long long, long long>{64, lastLoud + 1},
                                               {midInput, lastLoud + 1}, {longInput, longInput}}) {
            impulse.resize(2 * static_cast<size_t>(frames), 0.0f);
            write("in.wav", rate, 2, impulse);
            const Audio cut = render("in.wav", block, "-60");
            ASSERT_EQ(cut.frames(), expected) << frames;
            EXPECT_TRUE(std::equal(cut.floats.begin(), cut.floats.end(), full.floats.begin())) << frames;
        }
        impulse.resize(2 * 64);
    }
}

}  // namespace
}  // namespace ulvetta::testing
