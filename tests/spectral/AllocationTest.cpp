// The transforms, the spectrum product and the FIR filter allocate nothing once their tables and buffers
// exist. Every global operator new of this test binary is replaced by one that counts while asked to.
#include <atomic>
#include <cstdlib>
#include <new>
#include <vector>

#include "SpectralTestSupport.h"

#if !defined(_WIN32)

namespace {

std::atomic<bool> gCounting{false};
std::atomic<int> gAllocations{0};

void* allocate(std::size_t n, std::size_t align) noexcept {
    if (gCounting.load()) gAllocations.fetch_add(1);
    void* p = nullptr;
    if (align <= alignof(std::max_align_t)) return std::malloc(n ? n : 1);
    return posix_memalign(&p, align, n ? n : 1) == 0 ? p : nullptr;
}

void* allocateOrThrow(std::size_t n, std::size_t align) {
    if (void* p = allocate(n, align)) return p;
    throw std::bad_alloc();
}

}  // namespace

// Every form, so that no allocation bypasses the count (a sanitizer supplies its own defaults).
void* operator new(std::size_t n) { return allocateOrThrow(n, 0); }
void* operator new[](std::size_t n) { return allocateOrThrow(n, 0); }
void* operator new(std::size_t n, const std::nothrow_t&) noexcept { return allocate(n, 0); }
void* operator new[](std::size_t n, const std::nothrow_t&) noexcept { return allocate(n, 0); }
void* operator new(std::size_t n, std::align_val_t a) { return allocateOrThrow(n, std::size_t(a)); }
void* operator new[](std::size_t n, std::align_val_t a) { return allocateOrThrow(n, std::size_t(a)); }
void* operator new(std::size_t n, std::align_val_t a, const std::nothrow_t&) noexcept {
    return allocate(n, std::size_t(a));
}
void* operator new[](std::size_t n, std::align_val_t a, const std::nothrow_t&) noexcept {
    return allocate(n, std::size_t(a));
}
void operator delete(void* p) noexcept { std::free(p); }
void operator delete[](void* p) noexcept { std::free(p); }
void operator delete(void* p, std::size_t) noexcept { std::free(p); }
void operator delete[](void* p, std::size_t) noexcept { std::free(p); }
void operator delete(void* p, const std::nothrow_t&) noexcept { std::free(p); }
void operator delete[](void* p, const std::nothrow_t&) noexcept { std::free(p); }
void operator delete(void* p, std::align_val_t) noexcept { std::free(p); }
void operator delete[](void* p, std::align_val_t) noexcept { std::free(p); }
void operator delete(void* p, std::size_t, std::align_val_t) noexcept { std::free(p); }
void operator delete[](void* p, std::size_t, std::align_val_t) noexcept { std::free(p); }
void operator delete(void* p, std::align_val_t, const std::nothrow_t&) noexcept { std::free(p); }
void operator delete[](void* p, std::align_val_t, const std::nothrow_t&) noexcept { std::free(p); }

using namespace ulvetta;
using namespace spectral_test;

namespace {

// Counts the allocations made by body.
template <class F>
int allocationsIn(F body) {
    gAllocations.store(0);
    gCounting.store(true);
    body();
    gCounting.store(false);
    return gAllocations.load();
}

}  // namespace

TEST(SpectralAllocation, NothingIsAllocatedOnceTablesAndBuffersExist) {
    const int first = 6, last = 17;
    // Building the tables of an order does allocate: the counter sees the library's allocations.
    nspsRealFftl(nullptr, 12, FlagRelease);
    EXPECT_GT(allocationsIn([] { nspsRealFftl(nullptr, 12, FlagInitOnly); }), 0);
    std::vector<std::vector<float>> data, spare;
    for (int order = first; order <= last; ++order) {
        nspsRealFftl(nullptr, order, FlagInitOnly);
        data.push_back(randomFloats(std::size_t(1) << order, seed(2000 + order)));
        spare.push_back(data.back());
    }
    FirState fir;
    const std::vector<float> taps = randomFloats(64, seed(2100));
    ASSERT_NE(nspsFirInit(taps.data(), 64, nullptr, &fir), 0);
    float sink = 0.0f;
    for (spectral::Isa isa : availableIsas()) {
        IsaScope scope(isa);
        EXPECT_EQ(allocationsIn([&] {
                      for (int order = first; order <= last; ++order) {
                          std::vector<float>& x = data[order - first];
                          std::vector<float>& y = spare[order - first];
                          nspsRealFftl(x.data(), order, FlagForward | FlagOutPerm);
                          nspsRealFftlNip(x.data(), y.data(), order, FlagForward | FlagOutPack);
                          nspsMpyRCPerm2(x.data(), x.data(), order);
                          nspsCcsFftl(x.data(), order, FlagInverse | FlagInPerm);
                          nspsCcsFftl(y.data(), order, FlagInverse | FlagInPack | FlagNoScale);
                      }
                      for (int n = 0; n < 300; ++n) sink += nspsFir(&fir, float(n % 5));  // crosses window moves
                      nspsFirSetTaps(taps.data(), &fir);
                      nspsFirSetDlyl(nullptr, &fir);
                  }),
                  0)
            << "instruction set " << int(isa);
    }
    nspFirFree(&fir);
    EXPECT_TRUE(std::isfinite(sink));
}

#endif
