#include "AudioOutput.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <filesystem>

#include "CliSetup.h"

namespace ulvetta {

namespace fs = std::filesystem;

namespace {

// WAV, AIFF and AU describe their sizes in 32 bits; the data must leave room for the header.
constexpr long long kMaxSmallFileData = 0xFFFFFFFFLL - 4096;

SF_INFO checkedInfo(const std::string& path, int sampleRate, bool asFloat, int container) {
    std::error_code ec;
    if (fs::is_directory(path, ec)) throw CliError("the output " + inQuotes(path) + " is a folder");
    SF_INFO info{};
    info.samplerate = sampleRate;
    info.channels = 2;
    info.format = container | (asFloat ? SF_FORMAT_FLOAT : SF_FORMAT_PCM_16);
    if (!sf_format_check(&info)) throw CliError("the output " + inQuotes(path) + " cannot hold this sample format");
    return info;
}

}  // namespace

int AudioOutput::containerOf(const std::string& path) {
    const std::string ext = lower(fs::path(path).extension().string());
    if (ext == ".aif" || ext == ".aiff" || ext == ".aifc") return SF_FORMAT_AIFF;
    if (ext == ".caf") return SF_FORMAT_CAF;
    if (ext == ".w64") return SF_FORMAT_W64;
    if (ext == ".rf64") return SF_FORMAT_RF64;
    if (ext == ".au" || ext == ".snd") return SF_FORMAT_AU;
    return SF_FORMAT_WAV;
}

AudioOutput::AudioOutput(const std::string& path, int sampleRate, bool asFloat, int container)
    : path_(path),
      info_(checkedInfo(path, sampleRate, asFloat, container)),
      temp_(fs::path(path)),
      file_(sf_open_fd(temp_.release(), SFM_WRITE, &info_, SF_TRUE)),
      chunk_(2 * static_cast<size_t>(kChunkFrames)),
      pcm_(asFloat ? 0 : chunk_.size()),
      maxFrames_(container == SF_FORMAT_WAV || container == SF_FORMAT_AIFF || container == SF_FORMAT_AU
                     ? kMaxSmallFileData / (asFloat ? 8 : 4)
                     : INT64_MAX) {
    if (!file_)
        throw CliError("cannot write the output " + inQuotes(path) + " (" + sndfileMessage(nullptr) + ")", kExitFailure);
}

void AudioOutput::write(const float* interleaved, long long frames) {
    if (frames <= 0) return;
    written_ += frames;
    if (written_ > maxFrames_)
        throw CliError("the output " + inQuotes(path_) +
                           " would outgrow the 4 GiB that its format can describe; name it .w64, .rf64 or .caf",
                       kExitFailure);
    while (frames > 0) {
        const size_t n = std::min(static_cast<size_t>(frames), static_cast<size_t>(kChunkFrames) - gathered_);
        std::memcpy(chunk_.data() + 2 * gathered_, interleaved, 2 * n * sizeof(float));
        gathered_ += n;
        interleaved += 2 * n;
        frames -= static_cast<long long>(n);
        if (gathered_ == static_cast<size_t>(kChunkFrames)) flush();
    }
}

void AudioOutput::flush() {
    if (gathered_ == 0) return;
    const sf_count_t frames = static_cast<sf_count_t>(gathered_);
    sf_count_t written;
    if (pcm_.empty()) {
        written = sf_writef_float(file_.get(), chunk_.data(), frames);
    } else {
        for (size_t i = 0; i < 2 * gathered_; ++i) pcm_[i] = floatToPcm16(chunk_[i]);
        written = sf_writef_short(file_.get(), pcm_.data(), frames);
    }
    if (written != frames)
        throw CliError("writing the output " + inQuotes(path_) + " failed (" + sndfileMessage(file_.get()) + ")",
                       kExitFailure);
    gathered_ = 0;
}

void AudioOutput::finish() {
    flush();
    if (sf_close(file_.release()) != 0)
        throw CliError("finishing the output " + inQuotes(path_) + " failed", kExitFailure);
    temp_.commit();
}

short floatToPcm16(float v) {
    const float scaled = v * 32768.0f;
    if (std::isnan(scaled)) return 0;
    if (scaled >= 32767.0f) return 32767;
    if (scaled <= -32768.0f) return -32768;
    return static_cast<short>(scaled);  // truncation toward zero
}

}  // namespace ulvetta
