// The `ulvetta ir` report: length, peak, reverberation times and channel correlation of each stored
// impulse response.
#pragma once

#include <string>

namespace ulvetta {

std::string storedResponsesReport();

}  // namespace ulvetta
