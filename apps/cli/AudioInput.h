// An audio file opened for rendering: checked when opened, then read as interleaved stereo float in
// chunks of kChunkFrames, however few frames each read asks for.
#pragma once

#include <string>
#include <vector>

#include "SndfileHandle.h"

namespace ulvetta {

// Sample rates the renderer accepts, in Hz.
constexpr int kMinSampleRate = 1000;
constexpr int kMaxSampleRate = 768000;

class AudioInput {
public:
    // Opens path. It must exist, be readable as audio by libsndfile, have one or two channels and a
    // sample rate within kMinSampleRate..kMaxSampleRate. Throws CliError.
    explicit AudioInput(const std::string& path);

    int sampleRate() const { return info_.samplerate; }
    // The length the file's header states, in frames.
    long long frames() const { return info_.frames; }
    bool isPcm16() const { return (info_.format & SF_FORMAT_SUBMASK) == SF_FORMAT_PCM_16; }

    // Copies the next frames frames into stereo (interleaved left, right): 16-bit PCM x 1/32768 like
    // the filter, a mono channel on both sides. Returns the frames copied, fewer only at the end.
    // Throws CliError when reading fails.
    int read(float* stereo, int frames);

private:
    void refill();

    std::string path_;
    SF_INFO info_{};
    SndfileHandle file_;
    std::vector<short> pcm_;     // one chunk as read, for 16-bit input
    std::vector<float> chunk_;   // one chunk as float, with the file's channels interleaved
    int chunkFrames_ = 0;        // frames held in chunk_
    int position_ = 0;           // the next frame of chunk_ to hand out
};

}  // namespace ulvetta
