#include "platform/Thread.h"

#include <limits.h>
#include <pthread.h>

namespace ulvetta {

struct Thread::Impl {
    pthread_t handle{};
    bool started = false;
    std::function<void()> body;
};

namespace {
void* threadEntry(void* arg) {
    (*static_cast<std::function<void()>*>(arg))();
    return nullptr;
}
}  // namespace

Thread::Thread() : impl_(new Impl) {}

Thread::~Thread() { join(); }

bool Thread::start(std::function<void()> body, std::size_t stackBytes) {
    if (impl_->started || !body) return false;
    impl_->body = std::move(body);
    pthread_attr_t attr;
    pthread_attr_init(&attr);
    if (stackBytes > 0) {
        if (stackBytes < static_cast<std::size_t>(PTHREAD_STACK_MIN)) stackBytes = PTHREAD_STACK_MIN;
        pthread_attr_setstacksize(&attr, stackBytes);
    }
    int rc = pthread_create(&impl_->handle, &attr, threadEntry, &impl_->body);
    pthread_attr_destroy(&attr);
    impl_->started = (rc == 0);
    if (!impl_->started) impl_->body = nullptr;
    return impl_->started;
}

void Thread::join() {
    if (!impl_->started) return;
    pthread_join(impl_->handle, nullptr);
    impl_->started = false;
    impl_->body = nullptr;
}

bool Thread::running() const { return impl_->started; }

}  // namespace ulvetta
