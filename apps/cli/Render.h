// Renders an audio file through a configured core, the way the filter streams it: blocks of a fixed
// size with the flush flag clear, then zero-filled blocks with the flush flag set until the tail ends.
// Streams from file to file; memory use does not grow with the length of the input.
#pragma once

#include <optional>
#include <string>

namespace ulvetta {

class ReverbCore;

constexpr int kDefaultBlockFrames = 512;
constexpr int kMaxBlockFrames = 65536;
// A tail longer than this (in seconds) means the network does not decay; the render is abandoned.
constexpr int kMaxTailSeconds = 600;

struct RenderRequest {
    std::string input;
    std::string output;
    int blockFrames = kDefaultBlockFrames;  // 1..kMaxBlockFrames: how the core is called, not how files are read
    bool forceFloat = false;
    // dBFS, finite and at most 0: the tail ends once the output has stayed below it for a second.
    std::optional<double> tailDb;
};

// Renders request.input into request.output. The input is checked (see AudioInput) before anything is
// written; 16-bit PCM input gives 16-bit PCM output unless forceFloat, any other input 32-bit float, in
// the container the output's extension names. The core must already hold its settings; render sets
// the format (the input's rate, stereo), applies everything, starts streaming and processes. Nothing
// appears at the output until it is complete (see AudioOutput). Throws CliError. progress: draw a
// progress bar on stderr once the render has run a second.
void render(ReverbCore& core, const RenderRequest& request, bool progress);

// Reads a --tail-db argument: a plain decimal number of dBFS, finite and at most 0. Throws CliError.
double parseTailDb(const std::string& text);

// Set by SIGINT/SIGTERM; a running render stops and removes its temporary file.
void installInterruptHandlers();

}  // namespace ulvetta
