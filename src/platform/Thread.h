// A joinable thread started with a requested stack size. The owner must join it before destroying
// whatever the thread uses; the destructor joins a thread that is still running.
#pragma once

#include <cstddef>
#include <functional>
#include <memory>

namespace ulvetta {

class Thread {
public:
    Thread();
    ~Thread();
    Thread(const Thread&) = delete;
    Thread& operator=(const Thread&) = delete;

    // Starts body on a new thread with at least stackBytes of stack (0: the platform default).
    // Returns false when the thread could not be created or one is already running.
    bool start(std::function<void()> body, std::size_t stackBytes);
    // Waits for the thread to end; does nothing when none runs.
    void join();
    bool running() const;

private:
    struct Impl;
    std::unique_ptr<Impl> impl_;
};

}  // namespace ulvetta
