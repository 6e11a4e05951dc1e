// Runs the built ulvetta program in a scratch folder and reads and writes the WAV files it works on.
#pragma once

#include <gtest/gtest.h>
#include <sndfile.h>
#include <sys/wait.h>

#include <algorithm>
#include <cstdlib>
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
    std::string out;
    std::string err;
};

struct Audio {
    int rate = 0;
    int channels = 0;
    int format = 0;  // libsndfile format, container | subtype
    std::vector<short> pcm;     // filled for 16-bit PCM files
    std::vector<float> floats;  // filled for every file (libsndfile's normalised view)
    long long frames() const { return channels ? static_cast<long long>(floats.size()) / channels : 0; }
};

class CliTest : public ::testing::Test {
protected:
    void SetUp() override {
        std::random_device rd;
        dir_ = fs::temp_directory_path() / ("ulvetta-cli-" + std::to_string(rd()) + std::to_string(rd()));
        fs::create_directories(dir_);
    }
    void TearDown() override {
        std::error_code ec;
        fs::remove_all(dir_, ec);
    }

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
        const fs::path outFile = dir_.parent_path() / (dir_.filename().string() + ".stdout");
        const fs::path errFile = dir_.parent_path() / (dir_.filename().string() + ".stderr");
        cmd += " </dev/null >" + shellQuote(outFile.string()) + " 2>" + shellQuote(errFile.string());
        RunResult r;
        const int raw = std::system(cmd.c_str());
        r.status = WIFEXITED(raw) ? WEXITSTATUS(raw) : -1;
        r.out = slurp(outFile);
        r.err = slurp(errFile);
        fs::remove(outFile);
        fs::remove(errFile);
        return r;
    }

    // The names in the scratch folder, sorted.
    std::vector<std::string> listing() const {
        std::vector<std::string> names;
        for (const auto& e : fs::directory_iterator(dir_)) names.push_back(e.path().filename().string());
        std::sort(names.begin(), names.end());
        return names;
    }

    void writePcm16(const std::string& name, int rate, int channels, const std::vector<short>& samples) const {
        SF_INFO info{};
        info.samplerate = rate;
        info.channels = channels;
        info.format = SF_FORMAT_WAV | SF_FORMAT_PCM_16;
        SNDFILE* f = sf_open((dir_ / name).c_str(), SFM_WRITE, &info);
        ASSERT_NE(f, nullptr) << sf_strerror(nullptr);
        ASSERT_EQ(sf_write_short(f, samples.data(), static_cast<sf_count_t>(samples.size())),
                  static_cast<sf_count_t>(samples.size()));
        sf_close(f);
    }
    void writeFloat(const std::string& name, int rate, int channels, const std::vector<float>& samples) const {
        SF_INFO info{};
        info.samplerate = rate;
        info.channels = channels;
        info.format = SF_FORMAT_WAV | SF_FORMAT_FLOAT;
        SNDFILE* f = sf_open((dir_ / name).c_str(), SFM_WRITE, &info);
        ASSERT_NE(f, nullptr) << sf_strerror(nullptr);
        ASSERT_EQ(sf_write_float(f, samples.data(), static_cast<sf_count_t>(samples.size())),
                  static_cast<sf_count_t>(samples.size()));
        sf_close(f);
    }
    Audio read(const std::string& name) const {
        Audio a;
        SF_INFO info{};
        SNDFILE* f = sf_open((dir_ / name).c_str(), SFM_READ, &info);
        EXPECT_NE(f, nullptr) << name << ": " << sf_strerror(nullptr);
        if (f == nullptr) return a;
        a.rate = info.samplerate;
        a.channels = info.channels;
        a.format = info.format;
        const size_t n = static_cast<size_t>(info.frames) * info.channels;
        if ((info.format & SF_FORMAT_SUBMASK) == SF_FORMAT_PCM_16) {
            a.pcm.resize(n);
            sf_read_short(f, a.pcm.data(), static_cast<sf_count_t>(n));
            sf_seek(f, 0, SEEK_SET);
        }
        a.floats.resize(n);
        sf_read_float(f, a.floats.data(), static_cast<sf_count_t>(n));
        sf_close(f);
        return a;
    }

    static std::vector<short> noise16(size_t count, unsigned seed) {
        std::mt19937 gen(seed);
        std::uniform_int_distribution<int> d(-32768, 32767);
        std::vector<short> v(count);
        for (short& s : v) s = static_cast<short>(d(gen));
        return v;
    }

    // A failed command: the given status, one line on stderr that names the tool and ends a sentence.
    static void expectOneSentence(const RunResult& r, int status) {
        EXPECT_EQ(r.status, status) << r.err;
        ASSERT_FALSE(r.err.empty());
        EXPECT_EQ(r.err.rfind("ulvetta: ", 0), 0u) << r.err;
        EXPECT_EQ(r.err.find('\n'), r.err.size() - 1) << r.err;
        EXPECT_EQ(r.err.substr(r.err.size() - 2), ".\n") << r.err;
    }

    fs::path dir_;
};

}  // namespace ulvetta::testing
