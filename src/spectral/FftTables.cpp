// Builds, caches and releases the per-order FFT tables; the plain bit-reversal permutation; the choice of
// instruction set.
#include "spectral/FftTables.h"

#include <atomic>
#include <cmath>
#include <cstring>
#include <new>

#include "platform/Mutex.h"
#include "spectral/NspContext.h"

namespace ulvetta {
namespace spectral {

namespace {

constexpr int kMaxOrder = 31;

std::atomic<FftTables*> gSlots[kMaxOrder + 1];

Mutex& cacheLock() {
    static Mutex m;
    return m;
}

std::uint32_t reverseBits(std::uint32_t v, int bits) {
    std::uint32_t r = 0;
    for (int i = 0; i < bits; ++i) {
        r = (r << 1) | (v & 1u);
        v >>= 1;
    }
    return r;
}

// e^(-2 pi i e / k), computed in extended precision and rounded to float.
void twiddle(float* out, std::size_t e, std::size_t k) {
    const long double pi = 3.141592653589793238462643383279502884L;
    const long double a = 2.0L * pi * static_cast<long double>(e % k) / static_cast<long double>(k);
    out[0] = static_cast<float>(std::cos(a));
    out[1] = static_cast<float>(-std::sin(a));
}

std::size_t roundUp8(std::size_t floats) { return (floats + 7) & ~std::size_t(7); }

FftTables* buildTables(int order) {
    const int log2m = order - 1;
    const std::size_t m = std::size_t(1) << log2m;
    const std::size_t n = m * 2;
    const int stages = log2m / 2;
    const bool radix2 = (log2m & 1) != 0;
    // Sizes in floats of each array, each rounded up to keep the next one 32-byte aligned.
    std::size_t stageFloats[16] = {};
    std::size_t total = 0;
    for (int s = 0; s < stages; ++s) {
        const std::size_t span = std::size_t(1) << (2 * s);
        stageFloats[s] = 24 * ((span + 3) / 4);
        total += stageFloats[s];
    }
    const std::size_t radix2Floats = radix2 ? roundUp8(m) : 0;
    const std::size_t splitFloats = roundUp8(m + 2);
    const std::size_t revFloats = roundUp8(m / 4);  // uint32 and float have the same size
    total += radix2Floats + 2 * splitFloats + revFloats;

    // The record itself heads the block; the arrays follow, 32-byte aligned.
    const std::size_t headFloats = roundUp8((sizeof(FftTables) + sizeof(float) - 1) / sizeof(float));
    void* block = alignedAlloc((headFloats + total) * sizeof(float));
    if (!block) return nullptr;
    auto* t = new (block) FftTables;
    float* mem = static_cast<float*>(block) + headFloats;
    t->block = block;
    t->order = order;
    t->m = m;
    t->log2m = log2m;
    t->radix4Stages = stages;

    float* p = mem;
    for (int s = 0; s < stages; ++s) {
        const std::size_t span = std::size_t(1) << (2 * s);
        std::memset(p, 0, stageFloats[s] * sizeof(float));
        for (std::size_t j = 0; j < span; ++j) {
            float* run = p + (j / 4) * 24 + (j % 4) * 2;
            twiddle(run, j, 4 * span);
            twiddle(run + 8, 2 * j, 4 * span);
            twiddle(run + 16, 3 * j, 4 * span);
        }
        t->radix4Tw[s] = p;
        p += stageFloats[s];
    }
    if (radix2) {
        for (std::size_t j = 0; j < m / 2; ++j) twiddle(p + 2 * j, j, m);
        t->radix2Tw = p;
        p += radix2Floats;
    }
    float* fwd = p;
    float* inv = p + splitFloats;
    for (std::size_t k = 0; k <= m / 2; ++k) {
        float w[2];
        twiddle(w, k, n);  // w = cos - i sin
        // 0.5 i w = 0.5 sin + 0.5 i cos ;  i conj(w) = -sin + i cos
        fwd[2 * k] = 0.5f * -w[1];
        fwd[2 * k + 1] = 0.5f * w[0];
        inv[2 * k] = w[1];
        inv[2 * k + 1] = w[0];
    }
    t->splitFwd = fwd;
    t->splitInv = inv;
    p += 2 * splitFloats;
    auto* rev = reinterpret_cast<std::uint32_t*>(p);
    for (std::uint32_t j = 0; j < m / 4; ++j) rev[j] = reverseBits(j, log2m - 2);
    t->revQuarter = rev;
    return t;
}

void destroyTables(FftTables* t) {
    if (!t) return;
    void* block = t->block;
    t->~FftTables();
    alignedFree(block);
}

// Frees the cached tables when the module is unloaded: a plug-in host may load and unload the module many
// times, and each load would otherwise leave its tables behind. Every user of the tables (the engines and
// their workers) is gone by then, so no lock is taken.
struct CacheRelease {
    ~CacheRelease() {
        for (auto& slot : gSlots) destroyTables(slot.exchange(nullptr, std::memory_order_acq_rel));
    }
};
CacheRelease gCacheRelease;

}  // namespace

const FftTables* acquireTables(int order) {
    if (order < 2 || order > kMaxOrder) return nullptr;
    FftTables* t = gSlots[order].load(std::memory_order_acquire);
    if (t) return t;
    MutexLock hold(cacheLock());
    t = gSlots[order].load(std::memory_order_relaxed);
    if (!t) {
        t = buildTables(order);
        if (t) gSlots[order].store(t, std::memory_order_release);
    }
    return t;
}

void releaseTables(int order) {
    if (order < 0 || order > kMaxOrder) return;
    MutexLock hold(cacheLock());
    destroyTables(gSlots[order].exchange(nullptr, std::memory_order_acq_rel));
}

void bitReverse(const FftTables& t, const float* in, float* out) {
    const int bits = t.log2m;
    if (bits < 2) {
        if (in != out) std::memcpy(out, in, 2 * t.m * sizeof(float));
        return;
    }
    static constexpr std::uint32_t rev2[4] = {0, 2, 1, 3};
    for (std::uint32_t j = 0; j < t.m; ++j) {
        const std::size_t r = (std::size_t(rev2[j & 3]) << (bits - 2)) | t.revQuarter[j >> 2];
        if (in != out) {
            std::memcpy(out + 2 * r, in + 2 * std::size_t(j), 8);
        } else if (j < r) {
            float tmp[2];
            std::memcpy(tmp, out + 2 * std::size_t(j), 8);
            std::memcpy(out + 2 * std::size_t(j), out + 2 * r, 8);
            std::memcpy(out + 2 * r, tmp, 8);
        }
    }
}

namespace {

bool isaAvailable(Isa isa) {
    switch (isa) {
    case Isa::Scalar: return true;
#if defined(ULVETTA_SPECTRAL_X86)
    case Isa::Sse2: return true;
    case Isa::Avx2:
        __builtin_cpu_init();  // may run before the runtime's own initialisation
        return __builtin_cpu_supports("avx2") != 0;
#endif
    default: return false;
    }
}

const FftKernels& kernelsOf(Isa isa) {
    switch (isa) {
#if defined(ULVETTA_SPECTRAL_X86)
    case Isa::Sse2: return sse2Kernels();
    case Isa::Avx2: return avx2Kernels();
#endif
    default: return scalarKernels();
    }
}

Isa bestIsa() {
    if (isaAvailable(Isa::Avx2)) return Isa::Avx2;
    if (isaAvailable(Isa::Sse2)) return Isa::Sse2;
    return Isa::Scalar;
}

std::atomic<Isa>& activeIsaSlot() {
    static std::atomic<Isa> slot{bestIsa()};
    return slot;
}

}  // namespace

const FftKernels& activeKernels() { return kernelsOf(activeIsaSlot().load(std::memory_order_relaxed)); }

Isa activeIsa() { return activeIsaSlot().load(std::memory_order_relaxed); }

bool selectIsa(Isa isa) {
    if (!isaAvailable(isa)) return false;
    activeIsaSlot().store(isa, std::memory_order_relaxed);
    return true;
}

}  // namespace spectral
}  // namespace ulvetta
