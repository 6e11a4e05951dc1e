#include "ProgressBar.h"

#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <string>

namespace ulvetta {

ProgressBar::ProgressBar(bool enabled, long long totalFrames, int sampleRate)
    : enabled_(enabled && ::isatty(STDERR_FILENO) == 1),
      total_(totalFrames),
      rate_(sampleRate),
      start_(std::chrono::steady_clock::now()) {}

ProgressBar::~ProgressBar() {
    if (drawn_) std::fputs("\r\033[K", stderr);
}

void ProgressBar::update(long long done, bool tail) {
    if (!enabled_) return;
    const auto now = std::chrono::steady_clock::now();
    if (now - start_ < std::chrono::seconds(1) || now - last_ < std::chrono::milliseconds(100)) return;
    last_ = now;
    drawn_ = true;
    if (tail) {
        std::fprintf(stderr, "\r\033[Kulvetta: rendering the tail, %.1f s", static_cast<double>(done) / rate_);
    } else if (total_ > 0) {
        const double part = std::min(1.0, static_cast<double>(done) / static_cast<double>(total_));
        const int width = 30, filled = static_cast<int>(part * width);
        std::string bar(static_cast<size_t>(filled), '#');
        bar.append(static_cast<size_t>(width - filled), '-');
        std::fprintf(stderr, "\r\033[Kulvetta: rendering [%s] %3d%%", bar.c_str(), static_cast<int>(part * 100));
    } else {
        std::fprintf(stderr, "\r\033[Kulvetta: rendering, %.1f s", static_cast<double>(done) / rate_);
    }
    std::fflush(stderr);
}

}  // namespace ulvetta
