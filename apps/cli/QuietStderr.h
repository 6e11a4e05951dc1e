// Silences stderr while libsndfile works: its MPEG decoder prints notes on damaged data ("Illegal
// Audio-MPEG-Header") straight to stderr, and the user should see only the tool's own sentence.
// Redirects the process's stderr, so it is for the single-threaded tool only.
#pragma once

#include <fcntl.h>
#include <unistd.h>

#include <cstdio>

namespace ulvetta {

class QuietStderr {
public:
    QuietStderr() {
        std::fflush(stderr);
        const int null = ::open("/dev/null", O_WRONLY | O_CLOEXEC);
        if (null < 0) return;
        saved_ = ::dup(STDERR_FILENO);
        if (saved_ >= 0 && ::dup2(null, STDERR_FILENO) < 0) {
            ::close(saved_);
            saved_ = -1;
        }
        ::close(null);
    }
    ~QuietStderr() {
        if (saved_ < 0) return;
        std::fflush(stderr);
        ::dup2(saved_, STDERR_FILENO);
        ::close(saved_);
    }
    QuietStderr(const QuietStderr&) = delete;
    QuietStderr& operator=(const QuietStderr&) = delete;

private:
    int saved_ = -1;  // the real stderr while it is redirected
};

}  // namespace ulvetta
