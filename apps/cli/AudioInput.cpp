#include "AudioInput.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>

#include "CliSetup.h"
#include "QuietStderr.h"

namespace ulvetta {

namespace fs = std::filesystem;

AudioInput::AudioInput(const std::string& path) : path_(path) {
    const std::string q = inQuotes(path);
    std::error_code ec;
    const fs::file_status st = fs::status(path, ec);
    if (st.type() == fs::file_type::not_found) throw CliError("the input file " + q + " does not exist");
    if (fs::is_directory(st)) throw CliError("the input " + q + " is a folder, not an audio file");
    // A pipe or device could block the open or never end; O_NONBLOCK keeps one that replaces the file
    // meanwhile from blocking, and fstat below refuses it.
    if (!ec && !fs::is_regular_file(st)) throw CliError("the input " + q + " is not a regular file");
    fd_ = ::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK);
    if (fd_ < 0) throw CliError("the input " + q + " cannot be opened (" + std::strerror(errno) + ")");
    struct stat opened {};
    if (::fstat(fd_, &opened) != 0 || !S_ISREG(opened.st_mode)) {
        ::close(fd_);
        throw CliError("the input " + q + " is not a regular file");
    }
    openedBytes_ = static_cast<long long>(opened.st_size);
    {
        QuietStderr quiet;
        file_.reset(sf_open_fd(fd_, SFM_READ, &info_, SF_FALSE));
    }
    if (!file_) {
        ::close(fd_);
        // Other codes' texts can claim that the file does not exist, which it does.
        const int code = sf_error(nullptr);
        const bool described = code == SF_ERR_UNRECOGNISED_FORMAT || code == SF_ERR_MALFORMED_FILE ||
                               code == SF_ERR_UNSUPPORTED_ENCODING;
        throw CliError("the input " + q + " cannot be read as audio (" +
                       (described ? sndfileMessage(nullptr) : "its format is not recognised or it is damaged") + ")");
    }
    if (info_.channels < 1 || info_.channels > 2)
        throw CliError("the input " + q + " has " + std::to_string(info_.channels) +
                       " channels, and only mono or stereo input can be rendered");
    if (info_.samplerate < kMinSampleRate || info_.samplerate > kMaxSampleRate)
        throw CliError("the input " + q + " has a sample rate of " + std::to_string(info_.samplerate) +
                       " Hz, outside the " + std::to_string(kMinSampleRate) + " to " +
                       std::to_string(kMaxSampleRate) + " Hz that can be rendered");
    if (info_.frames == 0 && openedBytes_ > kMaxEmptyFileBytes)
        throw CliError("the input " + q + " holds " + std::to_string(openedBytes_) +
                       " bytes but its header states that it has no audio frames, so it looks damaged");
    chunk_.resize(static_cast<size_t>(kChunkFrames) * info_.channels);
    if (isPcm16()) pcm_.resize(chunk_.size());
}

AudioInput::~AudioInput() {
    file_.reset();
    if (fd_ >= 0) ::close(fd_);
}

void AudioInput::refill() {
    sf_count_t got;
    {
        QuietStderr quiet;
        if (isPcm16()) {
            got = sf_readf_short(file_.get(), pcm_.data(), kChunkFrames);
            for (sf_count_t i = 0; i < got * info_.channels; ++i) chunk_[i] = pcm_[i] * (1.0f / 32768.0f);
        } else {
            got = sf_readf_float(file_.get(), chunk_.data(), kChunkFrames);
        }
    }
    framesRead_ += got;
    if (got < kChunkFrames && sf_error(file_.get()) != SF_ERR_NO_ERROR)
        throw CliError("reading the input " + inQuotes(path_) + " failed (" + sndfileMessage(file_.get()) + ")");
    struct stat now {};
    if (got < kChunkFrames && framesRead_ < info_.frames && ::fstat(fd_, &now) == 0 && now.st_size < openedBytes_)
        throw CliError("the input " + inQuotes(path_) + " became shorter while it was being read");
    chunkFrames_ = static_cast<int>(got);
    position_ = 0;
}

int AudioInput::read(float* stereo, int frames) {
    const int channels = info_.channels;
    int done = 0;
    while (done < frames) {
        if (position_ == chunkFrames_) {
            refill();
            if (chunkFrames_ == 0) break;
        }
        const int n = std::min(frames - done, chunkFrames_ - position_);
        const float* src = chunk_.data() + static_cast<size_t>(position_) * channels;
        float* dst = stereo + 2 * static_cast<size_t>(done);
        for (int i = 0; i < n; ++i) {
            dst[2 * i] = src[i * channels];
            dst[2 * i + 1] = src[i * channels + channels - 1];
        }
        position_ += n;
        done += n;
    }
    return done;
}

}  // namespace ulvetta
