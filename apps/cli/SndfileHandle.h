// Ownership of an open libsndfile handle, and libsndfile's error text shaped for our messages.
#pragma once

#include <sndfile.h>

#include <memory>
#include <string>

namespace ulvetta {

struct SndfileCloser {
    void operator()(SNDFILE* f) const { sf_close(f); }
};
// Closes the file when dropped; release() it to close it by hand and see whether closing succeeded.
using SndfileHandle = std::unique_ptr<SNDFILE, SndfileCloser>;

// libsndfile's message for f (nullptr: the last failed open) without its "System error : " prefix and
// final full stop, since ours wrap it in a sentence of their own.
inline std::string sndfileMessage(SNDFILE* f) {
    std::string m = sf_strerror(f);
    const std::string system = "System error : ";
    if (m.compare(0, system.size(), system) == 0) m.erase(0, system.size());
    while (!m.empty() && (m.back() == '.' || m.back() == '\n' || m.back() == ' ')) m.pop_back();
    return m;
}

// Frames moved per libsndfile call, whatever block size the core is driven with: one call per
// 64 Ki frames keeps the system calls far below the cost of the processing.
constexpr int kChunkFrames = 65536;

}  // namespace ulvetta
