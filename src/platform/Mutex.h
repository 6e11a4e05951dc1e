// Re-entrant mutual exclusion: the thread that holds it may take it again, and must release it as often.
// Lock and unlock never allocate; construction does, once.
#pragma once

#include <memory>

namespace ulvetta {

class Mutex {
public:
    Mutex();
    ~Mutex();
    Mutex(const Mutex&) = delete;
    Mutex& operator=(const Mutex&) = delete;

    void lock();
    void unlock();
    bool tryLock();

private:
    struct Impl;
    std::unique_ptr<Impl> impl_;
};

// Holds a Mutex for the lifetime of the guard.
class MutexLock {
public:
    explicit MutexLock(Mutex& m) : m_(m) { m_.lock(); }
    ~MutexLock() { m_.unlock(); }
    MutexLock(const MutexLock&) = delete;
    MutexLock& operator=(const MutexLock&) = delete;

private:
    Mutex& m_;
};

}  // namespace ulvetta
