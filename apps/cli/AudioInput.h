// An audio file opened for rendering: checked when opened, then read as interleaved stereo float in
// chunks of kChunkFrames, however few frames each read asks for. libsndfile's own notes never reach
// stderr (see QuietStderr).
#pragma once

#include <string>
#include <vector>

#include "SndfileHandle.h"

namespace ulvetta {

// Sample rates the renderer accepts, in Hz.
constexpr int kMinSampleRate = 1000;
constexpr int kMaxSampleRate = 768000;
// A file whose header states no frames but which is larger than this (in bytes) holds audio that its
// header fails to describe: the header and metadata of an empty file are far smaller.
constexpr long long kMaxEmptyFileBytes = 4096;

class AudioInput {
public:
    // Opens path. It must be an existing regular file that libsndfile reads as audio, with one or two
    // channels, a sample rate within kMinSampleRate..kMaxSampleRate, and at least one frame when it is
    // larger than kMaxEmptyFileBytes. Throws CliError.
    explicit AudioInput(const std::string& path);
    ~AudioInput();
    AudioInput(const AudioInput&) = delete;
    AudioInput& operator=(const AudioInput&) = delete;

    int sampleRate() const { return info_.samplerate; }
    // The length the file's header states, in frames.
    long long frames() const { return info_.frames; }
    bool isPcm16() const { return (info_.format & SF_FORMAT_SUBMASK) == SF_FORMAT_PCM_16; }

    // Copies the next frames frames into stereo (interleaved left, right): 16-bit PCM x 1/32768 like
    // the filter, a mono channel on both sides. Returns the frames copied, fewer only at the end: the
    // frames the header stated when the file was opened, even if it has grown since. Throws CliError
    // when reading fails or the file ends early because it became shorter while being read.
    int read(float* stereo, int frames);

private:
    void refill();

    std::string path_;
    int fd_ = -1;               // the open file, closed after file_
    long long openedBytes_ = 0; // the file's size when it was opened
    SF_INFO info_{};
    SndfileHandle file_;
    long long framesRead_ = 0;  // frames delivered by libsndfile so far
    std::vector<short> pcm_;     // one chunk as read, for 16-bit input
    std::vector<float> chunk_;   // one chunk as float, with the file's channels interleaved
    int chunkFrames_ = 0;        // frames held in chunk_
    int position_ = 0;           // the next frame of chunk_ to hand out
};

}  // namespace ulvetta
