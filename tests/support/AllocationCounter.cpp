#include "support/AllocationCounter.h"

#include <atomic>
#include <cstddef>
#include <cstdlib>
#include <new>
#if defined(_WIN32)
#include <malloc.h>
#endif

namespace {

std::atomic<bool> counting{false};
std::atomic<long> allocations{0};

void* allocate(std::size_t size, std::size_t align) noexcept {
    if (counting.load(std::memory_order_relaxed)) allocations.fetch_add(1, std::memory_order_relaxed);
    if (size == 0) size = 1;
    if (align <= alignof(std::max_align_t)) return std::malloc(size);
#if defined(_WIN32)
    return _aligned_malloc(size, align);
#else
    void* p = nullptr;
    return posix_memalign(&p, align, size) == 0 ? p : nullptr;
#endif
}

void* allocateOrThrow(std::size_t size, std::size_t align) {
    if (void* p = allocate(size, align)) return p;
    throw std::bad_alloc();
}

void release(void* p, std::size_t align) noexcept {
#if defined(_WIN32)
    if (align > alignof(std::max_align_t)) return _aligned_free(p);
#endif
    (void)align;
    std::free(p);
}

constexpr std::size_t kPlain = 0;

}  // namespace

// Every form, so that no allocation bypasses the count and every block returns to the allocator that made
// it (a sanitizer supplies its own forms for any left out).
void* operator new(std::size_t n) { return allocateOrThrow(n, kPlain); }
void* operator new[](std::size_t n) { return allocateOrThrow(n, kPlain); }
void* operator new(std::size_t n, const std::nothrow_t&) noexcept { return allocate(n, kPlain); }
void* operator new[](std::size_t n, const std::nothrow_t&) noexcept { return allocate(n, kPlain); }
void* operator new(std::size_t n, std::align_val_t a) { return allocateOrThrow(n, std::size_t(a)); }
void* operator new[](std::size_t n, std::align_val_t a) { return allocateOrThrow(n, std::size_t(a)); }
void* operator new(std::size_t n, std::align_val_t a, const std::nothrow_t&) noexcept {
    return allocate(n, std::size_t(a));
}
void* operator new[](std::size_t n, std::align_val_t a, const std::nothrow_t&) noexcept {
    return allocate(n, std::size_t(a));
}
void operator delete(void* p) noexcept { release(p, kPlain); }
void operator delete[](void* p) noexcept { release(p, kPlain); }
void operator delete(void* p, std::size_t) noexcept { release(p, kPlain); }
void operator delete[](void* p, std::size_t) noexcept { release(p, kPlain); }
void operator delete(void* p, const std::nothrow_t&) noexcept { release(p, kPlain); }
void operator delete[](void* p, const std::nothrow_t&) noexcept { release(p, kPlain); }
void operator delete(void* p, std::align_val_t a) noexcept { release(p, std::size_t(a)); }
void operator delete[](void* p, std::align_val_t a) noexcept { release(p, std::size_t(a)); }
void operator delete(void* p, std::size_t, std::align_val_t a) noexcept { release(p, std::size_t(a)); }
void operator delete[](void* p, std::size_t, std::align_val_t a) noexcept { release(p, std::size_t(a)); }
void operator delete(void* p, std::align_val_t a, const std::nothrow_t&) noexcept { release(p, std::size_t(a)); }
void operator delete[](void* p, std::align_val_t a, const std::nothrow_t&) noexcept { release(p, std::size_t(a)); }

namespace ulvetta {

AllocationCounter::AllocationCounter() {
    allocations = 0;
    counting = true;
}

AllocationCounter::~AllocationCounter() { counting = false; }

long AllocationCounter::count() const { return allocations.load(); }

}  // namespace ulvetta
