#include "platform/Mutex.h"

#include <windows.h>

namespace ulvetta {

// A critical section is re-entrant for its owning thread.
struct Mutex::Impl {
    CRITICAL_SECTION cs;
};

Mutex::Mutex() : impl_(new Impl) { InitializeCriticalSection(&impl_->cs); }
Mutex::~Mutex() { DeleteCriticalSection(&impl_->cs); }

void Mutex::lock() { EnterCriticalSection(&impl_->cs); }
void Mutex::unlock() { LeaveCriticalSection(&impl_->cs); }
bool Mutex::tryLock() { return TryEnterCriticalSection(&impl_->cs) != 0; }

}  // namespace ulvetta
