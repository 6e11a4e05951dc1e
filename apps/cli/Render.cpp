#include "Render.h"

#include <fcntl.h>
#include <sndfile.h>
#include <unistd.h>

#include <chrono>
#include <cmath>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <memory>
#include <random>
#include <vector>

#include "CliSetup.h"
#include "filter/ReverbCore.h"

namespace ulvetta {

namespace fs = std::filesystem;

namespace {

volatile std::sig_atomic_t gInterrupted = 0;

void onInterrupt(int) { gInterrupted = 1; }

void checkInterrupted() {
    if (gInterrupted) throw CliError("interrupted; no output was written", 130);
}

std::string inQuotes(const std::string& s) { return "\"" + s + "\""; }

// libsndfile's messages end with a full stop; ours add their own context.
std::string sndfileMessage(SNDFILE* f) {
    std::string m = sf_strerror(f);
    while (!m.empty() && (m.back() == '.' || m.back() == '\n' || m.back() == ' ')) m.pop_back();
    return m;
}

struct SndfileCloser {
    void operator()(SNDFILE* f) const { sf_close(f); }
};
using SndfilePtr = std::unique_ptr<SNDFILE, SndfileCloser>;

SndfilePtr openInput(const std::string& path, SF_INFO& info) {
    std::error_code ec;
    const fs::file_status st = fs::status(path, ec);
    if (st.type() == fs::file_type::not_found) throw CliError("the input file " + inQuotes(path) + " does not exist");
    if (fs::is_directory(st)) throw CliError("the input " + inQuotes(path) + " is a folder, not an audio file");
    info = SF_INFO{};
    SNDFILE* f = sf_open(path.c_str(), SFM_READ, &info);
    if (f == nullptr)
        throw CliError("the input " + inQuotes(path) + " cannot be read as audio (" + sndfileMessage(nullptr) + ")");
    SndfilePtr file(f);
    if (info.channels < 1 || info.channels > 2)
        throw CliError("the input " + inQuotes(path) + " has " + std::to_string(info.channels) +
                       " channels, and only mono or stereo input can be rendered");
    if (info.samplerate < kMinSampleRate || info.samplerate > kMaxSampleRate)
        throw CliError("the input " + inQuotes(path) + " has a sample rate of " + std::to_string(info.samplerate) +
                       " Hz, outside the " + std::to_string(kMinSampleRate) + " to " +
                       std::to_string(kMaxSampleRate) + " Hz that can be rendered");
    return file;
}

// The container of the output, by its extension; WAV unless it names another that holds both 16-bit
// PCM and 32-bit float.
int outputContainer(const fs::path& out) {
    std::string ext = out.extension().string();
    for (char& c : ext) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    if (ext == ".aif" || ext == ".aiff" || ext == ".aifc") return SF_FORMAT_AIFF;
    if (ext == ".caf") return SF_FORMAT_CAF;
    if (ext == ".w64") return SF_FORMAT_W64;
    if (ext == ".rf64") return SF_FORMAT_RF64;
    if (ext == ".au" || ext == ".snd") return SF_FORMAT_AU;
    return SF_FORMAT_WAV;
}

// WAV, AIFF and AU describe their sizes in 32 bits; the data must leave room for the header.
constexpr long long kMaxSmallFileData = 0xFFFFFFFFLL - 4096;
bool hasSmallSizeFields(int container) {
    return container == SF_FORMAT_WAV || container == SF_FORMAT_AIFF || container == SF_FORMAT_AU;
}

// A new file beside the output that becomes the output by a rename; removed unless committed.
class TempOutput {
public:
    explicit TempOutput(const fs::path& target) : target_(target) {
        const fs::path dir = target.has_parent_path() ? target.parent_path() : fs::path(".");
        std::random_device rd;
        for (int attempt = 0; attempt < 16 && fd_ < 0; ++attempt) {
            char suffix[40];
            std::snprintf(suffix, sizeof suffix, ".%08x%08x.part", rd(), rd());
            path_ = dir / ("." + target.filename().string() + suffix);
            fd_ = ::open(path_.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0666);
            if (fd_ < 0 && errno != EEXIST) break;
        }
        if (fd_ < 0)
            throw CliError("cannot create the output " + inQuotes(target.string()) + " (" + std::strerror(errno) + ")");
    }
    ~TempOutput() {
        if (fd_ >= 0) ::close(fd_);
        if (!committed_) {
            std::error_code ec;
            fs::remove(path_, ec);
        }
    }
    TempOutput(const TempOutput&) = delete;
    TempOutput& operator=(const TempOutput&) = delete;

    // Hands the descriptor to libsndfile, which closes it from then on.
    int release() {
        const int fd = fd_;
        fd_ = -1;
        return fd;
    }
    void commit() {
        std::error_code ec;
        fs::rename(path_, target_, ec);
        if (ec) throw CliError("cannot move the finished output to " + inQuotes(target_.string()) + " (" + ec.message() + ")", kExitFailure);
        committed_ = true;
    }

private:
    fs::path target_;
    fs::path path_;
    int fd_ = -1;
    bool committed_ = false;
};

// A progress bar on stderr, drawn only on a terminal and only once the render has run for a second.
class Progress {
public:
    Progress(bool enabled, long long totalFrames, int sampleRate)
        : enabled_(enabled && ::isatty(STDERR_FILENO) == 1),
          total_(totalFrames),
          rate_(sampleRate),
          start_(std::chrono::steady_clock::now()) {}
    ~Progress() {
        if (drawn_) std::fputs("\r\033[K", stderr);
    }
    void update(long long done, bool tail) {
        if (!enabled_) return;
        const auto now = std::chrono::steady_clock::now();
        if (now - start_ < std::chrono::seconds(1) || now - last_ < std::chrono::milliseconds(100)) return;
        last_ = now;
        drawn_ = true;
        if (tail) {
            std::fprintf(stderr, "\r\033[Kulvetta: rendering the tail, %.1f s", static_cast<double>(done) / rate_);
        } else if (total_ > 0) {
            const double part = std::min(1.0, static_cast<double>(done) / static_cast<double>(total_));
            const int width = 30, filled = static_cast<int>(part * width);
            std::string bar(static_cast<size_t>(filled), '#');
            bar.append(static_cast<size_t>(width - filled), '-');
            std::fprintf(stderr, "\r\033[Kulvetta: rendering [%s] %3d%%", bar.c_str(), static_cast<int>(part * 100));
        } else {
            std::fprintf(stderr, "\r\033[Kulvetta: rendering, %.1f s", static_cast<double>(done) / rate_);
        }
        std::fflush(stderr);
    }

private:
    bool enabled_;
    long long total_;
    int rate_;
    std::chrono::steady_clock::time_point start_;
    std::chrono::steady_clock::time_point last_{};
    bool drawn_ = false;
};

class OutputWriter {
public:
    OutputWriter(SNDFILE* file, bool asFloat, const std::string& name, int blockFrames, bool smallSizeFields)
        : file_(file),
          asFloat_(asFloat),
          name_(name),
          pcm_(asFloat ? 0 : 2 * static_cast<size_t>(blockFrames)),
          maxFrames_(smallSizeFields ? kMaxSmallFileData / (asFloat ? 8 : 4) : INT64_MAX) {}
    void write(const float* interleaved, int frames) {
        if (frames <= 0) return;
        written_ += frames;
        if (written_ > maxFrames_)
            throw CliError("the output " + inQuotes(name_) +
                               " would outgrow the 4 GiB that its format can describe; name it .w64, .rf64 or .caf",
                           kExitFailure);
        sf_count_t written;
        if (asFloat_) {
            written = sf_writef_float(file_, interleaved, frames);
        } else {
            for (int i = 0; i < 2 * frames; ++i) pcm_[i] = floatToPcm16(interleaved[i]);
            written = sf_writef_short(file_, pcm_.data(), frames);
        }
        if (written != frames)
            throw CliError("writing the output " + inQuotes(name_) + " failed (" + sndfileMessage(file_) + ")", kExitFailure);
    }

private:
    SNDFILE* file_;
    bool asFloat_;
    std::string name_;
    std::vector<short> pcm_;
    long long maxFrames_;
    long long written_ = 0;
};

// Reads up to frames frames into an interleaved stereo float buffer, converting 16-bit PCM like the
// filter (x 1/32768) and doubling a mono channel. Returns the frames read; 0 at the end.
class InputReader {
public:
    InputReader(SNDFILE* file, const SF_INFO& info, const std::string& name, int blockFrames)
        : file_(file),
          channels_(info.channels),
          pcm16_((info.format & SF_FORMAT_SUBMASK) == SF_FORMAT_PCM_16),
          name_(name),
          pcm_(pcm16_ ? static_cast<size_t>(blockFrames) * info.channels : 0),
          floats_(static_cast<size_t>(blockFrames) * info.channels) {}

    int read(float* stereo, int frames) {
        sf_count_t got;
        if (pcm16_) {
            got = sf_readf_short(file_, pcm_.data(), frames);
            for (sf_count_t i = 0; i < got * channels_; ++i) floats_[i] = pcm_[i] * (1.0f / 32768.0f);
        } else {
            got = sf_readf_float(file_, floats_.data(), frames);
        }
        if (got < frames && sf_error(file_) != SF_ERR_NO_ERROR)
            throw CliError("reading the input " + inQuotes(name_) + " failed (" + sndfileMessage(file_) + ")");
        const float* src = floats_.data();
        for (sf_count_t i = 0; i < got; ++i) {
            stereo[2 * i] = src[i * channels_];
            stereo[2 * i + 1] = src[i * channels_ + channels_ - 1];
        }
        return static_cast<int>(got);
    }

private:
    SNDFILE* file_;
    int channels_;
    bool pcm16_;
    std::string name_;
    std::vector<short> pcm_;
    std::vector<float> floats_;
};

}  // namespace

short floatToPcm16(float v) {
    const float scaled = v * 32768.0f;
    if (std::isnan(scaled)) return 0;
    if (scaled >= 32767.0f) return 32767;
    if (scaled <= -32768.0f) return -32768;
    return static_cast<short>(scaled);  // truncation toward zero
}

void installInterruptHandlers() {
    std::signal(SIGINT, onInterrupt);
    std::signal(SIGTERM, onInterrupt);
}

void render(ReverbCore& core, const RenderRequest& request, bool progress) {
    if (request.blockFrames < 1 || request.blockFrames > kMaxBlockFrames)
        throw CliError("the block size must be 1 to " + std::to_string(kMaxBlockFrames) + " frames");
    SF_INFO inInfo;
    SndfilePtr input = openInput(request.input, inInfo);
    const fs::path outPath(request.output);
    std::error_code ec;
    if (fs::is_directory(outPath, ec)) throw CliError("the output " + inQuotes(request.output) + " is a folder");

    const bool asFloat = request.forceFloat || (inInfo.format & SF_FORMAT_SUBMASK) != SF_FORMAT_PCM_16;
    const int container = outputContainer(outPath);
    SF_INFO outInfo{};
    outInfo.samplerate = inInfo.samplerate;
    outInfo.channels = 2;
    outInfo.format = container | (asFloat ? SF_FORMAT_FLOAT : SF_FORMAT_PCM_16);
    if (!sf_format_check(&outInfo))
        throw CliError("the output " + inQuotes(request.output) + " cannot hold this sample format");

    TempOutput temp(outPath);
    SNDFILE* out = sf_open_fd(temp.release(), SFM_WRITE, &outInfo, SF_TRUE);
    if (out == nullptr)
        throw CliError("cannot write the output " + inQuotes(request.output) + " (" + sndfileMessage(nullptr) + ")", kExitFailure);
    SndfilePtr output(out);

    core.setFormat(static_cast<float>(inInfo.samplerate), 0, 2, 2);
    core.applyAll();
    core.startStreaming();

    const int block = request.blockFrames;
    std::vector<float> in(2 * static_cast<size_t>(block), 0.0f), result(2 * static_cast<size_t>(block), 0.0f);
    InputReader reader(input.get(), inInfo, request.input, block);
    OutputWriter writer(output.get(), asFloat, request.output, block, hasSmallSizeFields(container));
    Progress bar(progress, inInfo.frames, inInfo.samplerate);

    long long done = 0;
    for (;;) {
        checkInterrupted();
        const int frames = reader.read(in.data(), block);
        if (frames == 0) break;
        const int produced = core.processStereo(in.data(), in.data() + 1, result.data(), result.data() + 1, frames, 2, 0, 0, 0);
        writer.write(result.data(), std::max(0, std::min(produced, frames)));
        done += frames;
        bar.update(done, false);
    }

    // The tail: silence with the flush flag until a block comes back short.
    std::fill(in.begin(), in.end(), 0.0f);
    const long long maxTail = static_cast<long long>(kMaxTailSeconds) * inInfo.samplerate;
    long long tail = 0;
    for (;;) {
        checkInterrupted();
        const int produced = core.processStereo(in.data(), in.data() + 1, result.data(), result.data() + 1, block, 2, 0, 1, 0);
        writer.write(result.data(), std::max(0, std::min(produced, block)));
        tail += produced;
        bar.update(tail, true);
        if (produced < block) break;
        if (tail > maxTail)
            throw CliError("the reverb tail did not end within " + std::to_string(kMaxTailSeconds) +
                           " seconds, so no output was written", kExitFailure);
    }
    core.stopStreaming();

    if (sf_close(output.release()) != 0)
        throw CliError("finishing the output " + inQuotes(request.output) + " failed", kExitFailure);
    temp.commit();
}

void exportResponse(ReverbCore& core, int rate, const std::string& path) {
    if (rate < kMinSampleRate || rate > kMaxSampleRate)
        throw CliError("--rate takes a sample rate from " + std::to_string(kMinSampleRate) + " to " +
                       std::to_string(kMaxSampleRate) + " Hz");
    const int algorithm = core.getValue(kAlgorithm);
    if (algorithm < 3 || algorithm > 5)
        throw CliError("algorithm " + std::to_string(algorithm) + " (" + kAlgorithmNames[algorithm] +
                       ") is not a convolution reverb; choose 3, 4 or 5");
    core.setFormat(static_cast<float>(rate), 0, 2, 2);
    core.applyAll();
    const ReverbEngine& engine = core.engineForInspection();
    SF_INFO info{};
    info.samplerate = rate;
    info.channels = 2;
    info.format = SF_FORMAT_WAV | SF_FORMAT_FLOAT;
    TempOutput temp{fs::path(path)};
    SndfilePtr out(sf_open_fd(temp.release(), SFM_WRITE, &info, SF_TRUE));
    if (!out) throw CliError("cannot write " + inQuotes(path) + " (" + sndfileMessage(nullptr) + ")", kExitFailure);
    std::vector<float> frames(2 * static_cast<size_t>(engine.irLength));
    for (int32_t i = 0; i < engine.irLength; ++i) {
        frames[2 * i] = engine.irLeft[i];
        frames[2 * i + 1] = engine.irRight[i];
    }
    if (sf_writef_float(out.get(), frames.data(), engine.irLength) != engine.irLength)
        throw CliError("writing " + inQuotes(path) + " failed", kExitFailure);
    if (sf_close(out.release()) != 0) throw CliError("finishing " + inQuotes(path) + " failed", kExitFailure);
    temp.commit();
}

}  // namespace ulvetta
