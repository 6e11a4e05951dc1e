#include "platform/Mutex.h"

#include <pthread.h>

namespace ulvetta {

struct Mutex::Impl {
    pthread_mutex_t m;
};

Mutex::Mutex() : impl_(new Impl) {
    pthread_mutexattr_t attr;
    pthread_mutexattr_init(&attr);
    pthread_mutexattr_settype(&attr, PTHREAD_MUTEX_RECURSIVE);
    pthread_mutex_init(&impl_->m, &attr);
    pthread_mutexattr_destroy(&attr);
}

Mutex::~Mutex() { pthread_mutex_destroy(&impl_->m); }

void Mutex::lock() { pthread_mutex_lock(&impl_->m); }
void Mutex::unlock() { pthread_mutex_unlock(&impl_->m); }
bool Mutex::tryLock() { return pthread_mutex_trylock(&impl_->m) == 0; }

}  // namespace ulvetta
