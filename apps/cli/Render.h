// Renders an audio file through a configured core, the way the filter streams it: blocks of a fixed
// size with the flush flag clear, then zero-filled blocks with the flush flag set until the tail ends.
// Streams from file to file; memory use does not grow with the length of the input.
#pragma once

#include <string>

namespace ulvetta {

class ReverbCore;

constexpr int kDefaultBlockFrames = 512;
constexpr int kMaxBlockFrames = 65536;
// Sample rates the renderer accepts, in Hz.
constexpr int kMinSampleRate = 1000;
constexpr int kMaxSampleRate = 768000;
// A tail longer than this (in seconds) means the network does not decay; the render is abandoned.
constexpr int kMaxTailSeconds = 600;

struct RenderRequest {
    std::string input;
    std::string output;
    int blockFrames = kDefaultBlockFrames;
    bool forceFloat = false;
};

// Renders request.input into request.output. The input is checked before anything is written: it must
// exist, be readable as audio by libsndfile, have one or two channels and a sample rate within
// kMinSampleRate..kMaxSampleRate; 16-bit PCM input gives 16-bit PCM output unless forceFloat, any other
// input 32-bit float. The core must already hold its settings; render sets the
// format (the input's rate, stereo), applies everything, starts streaming and processes. The output is
// written to a temporary file beside it and renamed when complete; on any failure nothing is left
// behind. Throws CliError. progress: draw a progress bar on stderr once the render has run a second.
void render(ReverbCore& core, const RenderRequest& request, bool progress);

// Writes the response that the core's engine has prepared for a convolution algorithm (both channels,
// zero tail included) to path as a stereo 32-bit float WAV at the stream rate, through a temporary file.
// The core must hold its settings; this sets the format to rate, applies everything and exports.
// Throws CliError for a non-convolution algorithm or a bad rate.
void exportResponse(ReverbCore& core, int rate, const std::string& path);

// Converts one float output sample to 16-bit PCM like the filter: x 32768, truncated toward zero,
// clamped to -32768..32767 (NaN gives 0).
short floatToPcm16(float v);

// Set by SIGINT/SIGTERM; a running render stops and removes its temporary file.
void installInterruptHandlers();

}  // namespace ulvetta
