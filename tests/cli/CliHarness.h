// Runs the built ulvetta program in a scratch folder and reads and writes the audio files it works on.
#pragma once

#include <gtest/gtest.h>
#include <sndfile.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>
#include <string>
#include <vector>

namespace ulvetta::testing {

namespace fs = std::filesystem;

struct RunResult {
    int status = -1;
    std::string out, err;
};

struct Audio {
    int rate = 0, channels = 0, format = 0;  // format: libsndfile container | subtype
    std::vector<float> floats;              // libsndfile's view: 16-bit PCM as sample / 32768, exactly
    long long frames() const { return channels ? static_cast<long long>(floats.size()) / channels : 0; }
};

// args followed by --set TEXT for each of texts.
inline std::vector<std::string> sets(std::vector<std::string> args, std::initializer_list<const char*> texts) {
    for (const char* t : texts) args.insert(args.end(), {"--set", t});
    return args;
}

class CliTest : public ::testing::Test {
protected:
    void SetUp() override {
        dir_ = fs::temp_directory_path() / ("ulvetta-cli-" + std::to_string(::getpid()));
        fs::create_directories(dir_);
    }
    void TearDown() override { fs::remove_all(dir_); }

    static std::string shellQuote(const std::string& s) {
        std::string q = "'";
        for (char c : s) q += c == '\'' ? std::string("'\\''") : std::string(1, c);
        return q + "'";
    }
    static std::string slurp(const fs::path& p) {
        std::ifstream in(p, std::ios::binary);
        return {std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
    }

    // Runs ulvetta with args in the scratch folder, stdin from /dev/null; env is prepended as is.
    RunResult run(const std::vector<std::string>& args, const std::string& env = "") const {
        std::string cmd = "cd " + shellQuote(dir_.string()) + " && " + env + " " + shellQuote(ULVETTA_EXE);
        for (const std::string& a : args) cmd += " " + shellQuote(a);
        const std::string out = dir_.string() + ".stdout", err = dir_.string() + ".stderr";
        const int raw = std::system((cmd + " </dev/null >" + shellQuote(out) + " 2>" + shellQuote(err)).c_str());
        RunResult r{WIFEXITED(raw) ? WEXITSTATUS(raw) : -1, slurp(out), slurp(err)};
        fs::remove(out);
        fs::remove(err);
        return r;
    }

    // The names in a folder of the scratch folder, sorted.
    std::vector<std::string> listing(const fs::path& sub = {}) const {
        std::vector<std::string> names;
        for (const auto& e : fs::directory_iterator(dir_ / sub)) names.push_back(e.path().filename().string());
        std::sort(names.begin(), names.end());
        return names;
    }

    // Writes interleaved samples (short: 16-bit PCM, float: 32-bit float) as a WAV file.
    template <typename Sample>
    void write(const std::string& name, int rate, int channels, const std::vector<Sample>& samples) const {
        constexpr bool pcm = std::is_same<Sample, short>::value;
        SF_INFO info{0, rate, channels, SF_FORMAT_WAV | (pcm ? SF_FORMAT_PCM_16 : SF_FORMAT_FLOAT), 0, 0};
        SNDFILE* f = sf_open((dir_ / name).c_str(), SFM_WRITE, &info);
        ASSERT_NE(f, nullptr) << sf_strerror(nullptr);
        const auto n = static_cast<sf_count_t>(samples.size());
        if constexpr (pcm) ASSERT_EQ(sf_write_short(f, samples.data(), n), n);
        else ASSERT_EQ(sf_write_float(f, samples.data(), n), n);
        sf_close(f);
    }
    Audio read(const std::string& name) const {
        SF_INFO info{};
        SNDFILE* f = sf_open((dir_ / name).c_str(), SFM_READ, &info);
        EXPECT_NE(f, nullptr) << name << ": " << sf_strerror(nullptr);
        if (f == nullptr) return {};
        Audio a{info.samplerate, info.channels, info.format, std::vector<float>(info.frames * info.channels)};
        sf_read_float(f, a.floats.data(), static_cast<sf_count_t>(a.floats.size()));
        sf_close(f);
        return a;
    }

    static std::vector<short> noise16(size_t count, unsigned seed) {
        std::mt19937 gen(seed);
        std::vector<short> v(count);
        for (short& s : v) s = static_cast<short>(gen() >> 16);  // every 16-bit value equally likely
        return v;
    }

    // A failed command: the given status, one line on stderr that names the tool and ends a sentence.
    static void expectOneSentence(const RunResult& r, int status) {
        EXPECT_EQ(r.status, status) << r.err;
        EXPECT_TRUE(r.err.rfind("ulvetta: ", 0) == 0 && r.err.find('\n') + 1 == r.err.size() && r.err.end()[-2] == '.')
            << r.err;
    }

    fs::path dir_;
};

}  // namespace ulvetta::testing
