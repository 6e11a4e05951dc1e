// A render's progress on stderr, drawn only on a terminal and only once the render has run a second.
#pragma once

#include <chrono>

namespace ulvetta {

class ProgressBar {
public:
    // totalFrames: the input's length, 0 when unknown; sampleRate in Hz for the tail's seconds.
    ProgressBar(bool enabled, long long totalFrames, int sampleRate);
    // Clears the line it drew.
    ~ProgressBar();
    ProgressBar(const ProgressBar&) = delete;
    ProgressBar& operator=(const ProgressBar&) = delete;

    // done: frames of input processed, or with tail, frames of tail; redraws at most every 100 ms.
    void update(long long done, bool tail);

private:
    bool enabled_;
    long long total_;
    int rate_;
    std::chrono::steady_clock::time_point start_;
    std::chrono::steady_clock::time_point last_{};
    bool drawn_ = false;
};

}  // namespace ulvetta
