// A bad day for the renderer: odd and damaged inputs, a full disk, an unwritable folder, an input that
// changes while it is read, an interrupted run. Each gives a correct file or one sentence, and never a
// partial output or a changed existing one.
#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <spawn.h>
#include <sys/inotify.h>
#include <sys/stat.h>

#include <cmath>

#include "AudioInput.h"
#include "CliHarness.h"
#include "CliSetup.h"

extern char** environ;

namespace ulvetta::testing {
namespace {

std::vector<std::string> dryOnly(std::vector<std::string> args) {
    return sets(std::move(args), {"Output Level Wet=-Inf.", "Output Level Dry=0"});
}

std::string be32(uint32_t v) { return {char(v >> 24), char(v >> 16), char(v >> 8), char(v)}; }

// Root passes every permission check; the same run without the capabilities that allow that does not.
std::string withoutOverride() {
    return ::geteuid() == 0 ? "setpriv --bounding-set=-dac_override,-dac_read_search" : "";
}

class RenderFailures : public CliTest {
protected:
    void SetUp() override {
        CliTest::SetUp();
        std::ofstream(dir_ / "keep.wav") << "previous output";
    }
    // The folder holds what it held before the run, and the existing output is untouched.
    void expectNoTrace(const std::vector<std::string>& before) const {
        EXPECT_EQ(listing(), before);
        EXPECT_EQ(slurp(dir_ / "keep.wav"), "previous output");
    }
};

TEST_F(RenderFailures, EdgeInputsGiveACorrectFileOrOneSentence) {
    const std::vector<float> spiky = {0.5f, -0.25f, NAN, 0.125f, INFINITY, -INFINITY, 0.75f, -0.5f};
    write("spiky.wav", 44100, 2, spiky);
    write("empty.wav", 44100, 2, std::vector<float>());
    write("one.wav", 44100, 1, std::vector<float>{0.5f});
    write("fast.wav", 768000, 2, std::vector<float>(2000, 0.25f));
    write("slow.wav", 1, 2, std::vector<float>(20, 0.25f));
    write("three.wav", 44100, 3, std::vector<short>(30, 1000));
    write("eight.wav", 44100, 8, std::vector<short>(80, 1000));
    // An AU header whose data size (0xFFFFFFF0) the file cannot hold: libsndfile reads zero frames.
    const std::string au = ".snd" + be32(24) + be32(0xFFFFFFF0) + be32(3) + be32(44100) + be32(2);
    std::ofstream(dir_ / "damaged.au", std::ios::binary) << au + std::string(8800 - au.size(), '\x11');
    // An MPEG frame sync followed by noise: the MPEG decoder's notes on it must not reach stderr.
    std::string mpeg = "\xff\xfb\x90";
    std::mt19937 gen(2);
    while (mpeg.size() < 8000) mpeg += static_cast<char>(gen());
    std::ofstream(dir_ / "noise.mp3", std::ios::binary) << mpeg;
    fs::copy_file(dir_ / "one.wav", dir_ / "locked.wav");
    fs::permissions(dir_ / "locked.wav", fs::perms::none);
    ASSERT_EQ(::mkfifo((dir_ / "pipe.wav").c_str(), 0600), 0);  // opening it for reading would block

    // Rendered through the dry path, the output is the input (non-finite samples as silence), then silence.
    const std::pair<const char*, std::vector<float>> good[] = {
        {"spiky.wav", {0.5f, -0.25f, 0.0f, 0.125f, 0.0f, 0.0f, 0.75f, -0.5f}},
        {"empty.wav", {}},
        {"one.wav", {0.5f, 0.5f}},
        {"fast.wav", std::vector<float>(2000, 0.25f)}};
    for (const auto& [in, expected] : good) {
        const RunResult r = run(dryOnly({"render", in, "out.wav"}));
        ASSERT_TRUE(r.status == 0 && r.err.empty()) << in << ": " << r.err;
        const Audio out = read("out.wav");
        EXPECT_EQ(out.rate, std::string(in) == "fast.wav" ? 768000 : 44100) << in;
        ASSERT_GE(out.floats.size(), expected.size()) << in;
        EXPECT_TRUE(std::equal(expected.begin(), expected.end(), out.floats.begin())) << in;
        EXPECT_TRUE(std::all_of(out.floats.begin() + static_cast<long>(expected.size()), out.floats.end(),
                                [](float v) { return v == 0.0f; })) << in;
        EXPECT_TRUE(!expected.empty() || out.frames() == 0) << "an empty input gives an empty output";
        fs::remove(dir_ / "out.wav");
    }

    const std::vector<std::string> before = listing();
    for (const char* in : {"slow.wav", "three.wav", "eight.wav", "damaged.au", "noise.mp3", "locked.wav", "pipe.wav"}) {
        SCOPED_TRACE(in);
        const RunResult r = run({"render", in, "keep.wav"}, withoutOverride());
        expectOneSentence(r, 2);
        EXPECT_EQ(r.err.find("not exist"), std::string::npos);
        expectNoTrace(before);
    }
}

// A full disk is a real small tmpfs where this user may mount one (in a namespace of its own), and a
// file-size limit otherwise; with SIGXFSZ ignored, writes past the limit fail as on a full disk.
TEST_F(RenderFailures, FullDiskAndUnwritableFolderLeaveNothing) {
    write("in.wav", 44100, 2, noise16(2 * 100000, 7));  // 400 KB of output before the tail
    const std::vector<std::string> before = listing();
    const RunResult limited = run({"render", "in.wav", "keep.wav"}, "trap '' XFSZ; ulimit -f 64;");
    expectOneSentence(limited, 1);
    expectNoTrace(before);

    if (std::system("unshare -rm true >/dev/null 2>&1") == 0) {
        fs::create_directory(dir_ / "disk");
        // Inside the namespace: mount, render onto the small disk, then show what is left on it.
        const RunResult full = run({"render", "in.wav", "disk/keep.wav"},
                                   "unshare -rm sh -c 'mount -t tmpfs -o size=128k tmpfs disk && echo old"
                                   " >disk/keep.wav && \"$0\" \"$@\"; s=$?; ls -A disk; cat disk/keep.wav; exit $s'");
        expectOneSentence(full, 1);
        EXPECT_EQ(full.out, "keep.wav\nold\n");
        fs::remove(dir_ / "disk");
    } else {
        std::printf("note: no tmpfs can be mounted here; the file-size limit stood in for a full disk\n");
    }

    fs::create_directory(dir_ / "locked");
    fs::permissions(dir_ / "locked", fs::perms::owner_read | fs::perms::owner_exec);
    expectOneSentence(run({"render", "in.wav", "locked/out.wav"}, withoutOverride()), 2);
    EXPECT_TRUE(fs::is_empty(dir_ / "locked"));
    fs::permissions(dir_ / "locked", fs::perms::owner_all);
}

// SIGINT or SIGTERM once the render has created its temporary output: exit 130, nothing left behind.
TEST_F(RenderFailures, InterruptedRenderLeavesNothing) {
    // Half an hour of stereo at 8 kHz (sparse, so nothing is stored): the render cannot end first. A
    // one-frame file from libsndfile with its data size raised and its length to match.
    const uint32_t frames = 8000 * 1800, bytes = 4 * frames;
    write("long.wav", 8000, 2, std::vector<short>(2));
    std::string wav = slurp(dir_ / "long.wav");
    ASSERT_TRUE(wav.size() == 48 && wav.compare(36, 4, "data") == 0);
    wav.replace(40, 4, std::string{char(bytes), char(bytes >> 8), char(bytes >> 16), char(bytes >> 24)});
    std::ofstream(dir_ / "long.wav", std::ios::binary) << wav;
    fs::resize_file(dir_ / "long.wav", 44 + uintmax_t(bytes));
    const std::vector<std::string> before = listing();

    for (const int signal : {SIGINT, SIGTERM}) {
        SCOPED_TRACE(signal);
        const int watch = ::inotify_init1(IN_CLOEXEC);
        ASSERT_GE(watch, 0);
        ASSERT_GE(::inotify_add_watch(watch, dir_.c_str(), IN_CREATE), 0);
        const std::string exe = ULVETTA_EXE, in = (dir_ / "long.wav").string(), out = (dir_ / "keep.wav").string();
        const char* argv[] = {exe.c_str(), "render", in.c_str(), out.c_str(), "--preset", "large room", nullptr};
        const std::string err = dir_.string() + ".stderr";
        posix_spawn_file_actions_t actions;
        ::posix_spawn_file_actions_init(&actions);
        ::posix_spawn_file_actions_addopen(&actions, 2, err.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
        pid_t pid = 0;
        ASSERT_EQ(::posix_spawn(&pid, exe.c_str(), &actions, nullptr, const_cast<char**>(argv), environ), 0);
        ::posix_spawn_file_actions_destroy(&actions);
        pollfd p{watch, POLLIN, 0};
        EXPECT_EQ(::poll(&p, 1, 60000), 1) << "the render never created its output";
        ::close(watch);
        ::kill(pid, signal);
        int status = 0;
        ASSERT_EQ(::waitpid(pid, &status, 0), pid);
        expectOneSentence({WIFEXITED(status) ? WEXITSTATUS(status) : -1, "", slurp(err)}, 130);
        fs::remove(err);
        expectNoTrace(before);
    }
}

// The frames the header stated when the file was opened are read, however the file changes later:
// data appended meanwhile is not read, and a file cut short meanwhile is reported.
TEST_F(RenderFailures, InputChangedWhileReadIsReadAsOpenedOrReported) {
    const long long frames = 3 * kChunkFrames + 5;
    write("in.wav", 8000, 2, noise16(2 * static_cast<size_t>(frames), 9));
    std::vector<float> buffer(2 * static_cast<size_t>(frames) + 2 * 1000);
    {
        AudioInput input((dir_ / "in.wav").string());
        ASSERT_EQ(input.read(buffer.data(), 1000), 1000);
        std::ofstream(dir_ / "in.wav", std::ios::binary | std::ios::app) << std::string(1 << 20, '\x7f');
        EXPECT_EQ(input.read(buffer.data(), static_cast<int>(buffer.size() / 2)), frames - 1000);
    }
    AudioInput input((dir_ / "in.wav").string());
    ASSERT_EQ(input.read(buffer.data(), 1000), 1000);
    fs::resize_file(dir_ / "in.wav", 44 + 4 * 10000);
    EXPECT_THROW(input.read(buffer.data(), static_cast<int>(buffer.size() / 2)), CliError);
}

}  // namespace
}  // namespace ulvetta::testing
