#include "platform/Event.h"

#include <windows.h>

namespace ulvetta {

struct Event::Impl {
    HANDLE handle = nullptr;
};

Event::Event() : impl_(new Impl) { impl_->handle = CreateEventW(nullptr, FALSE, FALSE, nullptr); }

Event::~Event() {
    if (impl_->handle) CloseHandle(impl_->handle);
}

void Event::set() { SetEvent(impl_->handle); }

void Event::wait() { WaitForSingleObject(impl_->handle, INFINITE); }

bool Event::waitFor(uint32_t timeoutMs) { return WaitForSingleObject(impl_->handle, timeoutMs) == WAIT_OBJECT_0; }

}  // namespace ulvetta
