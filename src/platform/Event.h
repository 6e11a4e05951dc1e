// Auto-reset event: set() releases exactly one waiter (or the next one to wait) and the event then
// returns to the unset state by itself. Several set() calls with no waiter in between count once.
#pragma once

#include <cstdint>
#include <memory>

namespace ulvetta {

class Event {
public:
    Event();
    ~Event();
    Event(const Event&) = delete;
    Event& operator=(const Event&) = delete;

    void set();
    // Waits until the event is set, then resets it.
    void wait();
    // As wait(), giving up after timeoutMs milliseconds; returns false on time-out.
    bool waitFor(uint32_t timeoutMs);

private:
    struct Impl;
    std::unique_ptr<Impl> impl_;
};

}  // namespace ulvetta
