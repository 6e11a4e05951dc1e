#include "AudioInput.h"

#include <algorithm>
#include <filesystem>

#include "CliSetup.h"

namespace ulvetta {

namespace fs = std::filesystem;

AudioInput::AudioInput(const std::string& path) : path_(path) {
    std::error_code ec;
    const fs::file_status st = fs::status(path, ec);
    if (st.type() == fs::file_type::not_found) throw CliError("the input file " + inQuotes(path) + " does not exist");
    if (fs::is_directory(st)) throw CliError("the input " + inQuotes(path) + " is a folder, not an audio file");
    file_.reset(sf_open(path.c_str(), SFM_READ, &info_));
    if (!file_)
        throw CliError("the input " + inQuotes(path) + " cannot be read as audio (" + sndfileMessage(nullptr) + ")");
    if (info_.channels < 1 || info_.channels > 2)
        throw CliError("the input " + inQuotes(path) + " has " + std::to_string(info_.channels) +
                       " channels, and only mono or stereo input can be rendered");
    if (info_.samplerate < kMinSampleRate || info_.samplerate > kMaxSampleRate)
        throw CliError("the input " + inQuotes(path) + " has a sample rate of " + std::to_string(info_.samplerate) +
                       " Hz, outside the " + std::to_string(kMinSampleRate) + " to " +
                       std::to_string(kMaxSampleRate) + " Hz that can be rendered");
    chunk_.resize(static_cast<size_t>(kChunkFrames) * info_.channels);
    if (isPcm16()) pcm_.resize(chunk_.size());
}

void AudioInput::refill() {
    sf_count_t got;
    if (isPcm16()) {
        got = sf_readf_short(file_.get(), pcm_.data(), kChunkFrames);
        for (sf_count_t i = 0; i < got * info_.channels; ++i) chunk_[i] = pcm_[i] * (1.0f / 32768.0f);
    } else {
        got = sf_readf_float(file_.get(), chunk_.data(), kChunkFrames);
    }
    if (got < kChunkFrames && sf_error(file_.get()) != SF_ERR_NO_ERROR)
        throw CliError("reading the input " + inQuotes(path_) + " failed (" + sndfileMessage(file_.get()) + ")");
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
