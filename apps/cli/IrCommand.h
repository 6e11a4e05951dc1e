// What `ulvetta ir` does: describe the stored impulse responses, or export the response a convolution
// algorithm prepares.
#pragma once

#include <string>

namespace ulvetta {

class ReverbCore;

// Length, peak, reverberation times and channel correlation of each stored impulse response.
std::string storedResponsesReport();

// Writes the response that the core's engine has prepared for a convolution algorithm (both channels,
// zero tail included) to path as a stereo 32-bit float WAV at the stream rate, through a temporary file.
// The core must hold its settings; this sets the format to rate, applies everything and exports.
// Throws CliError for a non-convolution algorithm or a bad rate.
void exportResponse(ReverbCore& core, int rate, const std::string& path);

}  // namespace ulvetta
