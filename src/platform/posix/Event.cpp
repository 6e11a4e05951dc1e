#include "platform/Event.h"

#include <chrono>
#include <condition_variable>
#include <mutex>

namespace ulvetta {

struct Event::Impl {
    std::mutex m;
    std::condition_variable cv;
    bool signalled = false;
};

Event::Event() : impl_(new Impl) {}
Event::~Event() = default;

void Event::set() {
    {
        std::lock_guard<std::mutex> g(impl_->m);
        impl_->signalled = true;
    }
    impl_->cv.notify_one();
}

void Event::wait() {
    std::unique_lock<std::mutex> g(impl_->m);
    impl_->cv.wait(g, [this] { return impl_->signalled; });
    impl_->signalled = false;
}

bool Event::waitFor(uint32_t timeoutMs) {
    std::unique_lock<std::mutex> g(impl_->m);
    if (!impl_->cv.wait_for(g, std::chrono::milliseconds(timeoutMs), [this] { return impl_->signalled; }))
        return false;
    impl_->signalled = false;
    return true;
}

}  // namespace ulvetta
