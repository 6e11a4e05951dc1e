// A stereo audio file being written: gathered into chunks of kChunkFrames and written to a temporary
// file beside the target, which becomes the target only when finish() succeeds.
#pragma once

#include <string>
#include <vector>

#include "SndfileHandle.h"
#include "TempOutput.h"

namespace ulvetta {

class AudioOutput {
public:
    // The libsndfile container that path's extension names: AIFF, CAF, W64, RF64 or AU, WAV otherwise.
    static int containerOf(const std::string& path);

    // Checks before creating anything that path is no folder and that container holds 16-bit PCM (or
    // 32-bit float with asFloat); throws CliError with the bad-input status otherwise, and with the
    // failure status when the temporary file cannot be opened for writing.
    AudioOutput(const std::string& path, int sampleRate, bool asFloat, int container);

    // Appends frames interleaved stereo frames, converted by floatToPcm16 for 16-bit output. Throws
    // CliError when writing fails or the data would outgrow the container's 32-bit size fields.
    void write(const float* interleaved, long long frames);
    // Writes what is gathered, closes the file and moves it to the target. Throws CliError.
    void finish();

private:
    void flush();

    std::string path_;
    SF_INFO info_;
    TempOutput temp_;
    SndfileHandle file_;
    std::vector<float> chunk_;  // gathered interleaved frames
    std::vector<short> pcm_;    // the chunk converted, for 16-bit output
    size_t gathered_ = 0;       // frames in chunk_
    long long maxFrames_;
    long long written_ = 0;     // frames accepted by write()
};

// Converts one float output sample to 16-bit PCM like the filter: x 32768, truncated toward zero,
// clamped to -32768..32767 (NaN gives 0).
short floatToPcm16(float v);

}  // namespace ulvetta
