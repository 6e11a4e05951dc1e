#include "platform/Thread.h"

#include <windows.h>

namespace ulvetta {

struct Thread::Impl {
    HANDLE handle = nullptr;
    std::function<void()> body;
};

namespace {
DWORD WINAPI threadEntry(LPVOID arg) {
    (*static_cast<std::function<void()>*>(arg))();
    return 0;
}
}  // namespace

Thread::Thread() : impl_(new Impl) {}

Thread::~Thread() { join(); }

bool Thread::start(std::function<void()> body, std::size_t stackBytes) {
    if (impl_->handle != nullptr || !body) return false;
    impl_->body = std::move(body);
    // The stack size is a reservation, not a commitment, so large requests cost only address space.
    impl_->handle = CreateThread(nullptr, stackBytes, threadEntry, &impl_->body,
                                 stackBytes ? STACK_SIZE_PARAM_IS_A_RESERVATION : 0, nullptr);
    if (impl_->handle == nullptr) impl_->body = nullptr;
    return impl_->handle != nullptr;
}

void Thread::join() {
    if (impl_->handle == nullptr) return;
    WaitForSingleObject(impl_->handle, INFINITE);
    CloseHandle(impl_->handle);
    impl_->handle = nullptr;
    impl_->body = nullptr;
}

bool Thread::running() const { return impl_->handle != nullptr; }

}  // namespace ulvetta
