// Builds, caches and releases the per-order FFT tables; the bit-reversal permutations; the choice of
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
    const int midBits = log2m >= 6 ? log2m - 6 : 0;

    std::size_t pairCount = 0;
    if (log2m >= 6) {
        for (std::uint32_t b = 0; b < (1u << midBits); ++b)
            if (b <= reverseBits(b, midBits)) ++pairCount;
    }

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
    const std::size_t pairFloats = roundUp8(pairCount * 2);  // uint32 and float have the same size
    total += radix2Floats + 2 * splitFloats + pairFloats;

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
    if (pairCount) {
        auto* pairs = reinterpret_cast<std::uint32_t*>(p);
        std::size_t i = 0;
        for (std::uint32_t b = 0; b < (1u << midBits); ++b) {
            const std::uint32_t r = reverseBits(b, midBits);
            if (b <= r) {
                pairs[i++] = b;
                pairs[i++] = r;
            }
        }
        t->revPairs = pairs;
        t->revPairCount = pairCount;
    }
    return t;
}

void destroyTables(FftTables* t) {
    if (!t) return;
    void* block = t->block;
    t->~FftTables();
    alignedFree(block);
}

inline void copy64(float* dst, const float* src) { std::memcpy(dst, src, 8); }

inline void swap64(float* a, float* b) {
    float t[2];
    std::memcpy(t, a, 8);
    std::memcpy(a, b, 8);
    std::memcpy(b, t, 8);
}

constexpr std::uint32_t kRev3[8] = {0, 4, 2, 6, 1, 5, 3, 7};

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

void bitReverseInPlace(const FftTables& t, float* data) {
    const int bits = t.log2m;
    if (bits < 6) {
        for (std::uint32_t j = 0; j < t.m; ++j) {
            const std::uint32_t r = reverseBits(j, bits);
            if (j < r) swap64(data + 2 * j, data + 2 * std::size_t(r));
        }
        return;
    }
    // Index = (a: top 3 bits, b: middle, c: low 3 bits); its reverse = (rev c, rev b, rev a). One pair of
    // middle fields touches 16 cache lines, which stay in the first-level cache.
    const int top = bits - 3;
    for (std::size_t p = 0; p < t.revPairCount; ++p) {
        const std::size_t b = t.revPairs[2 * p], rb = t.revPairs[2 * p + 1];
        for (std::uint32_t a = 0; a < 8; ++a) {
            for (std::uint32_t c = 0; c < 8; ++c) {
                const std::size_t i = (std::size_t(a) << top) | (b << 3) | c;
                const std::size_t j = (std::size_t(kRev3[c]) << top) | (rb << 3) | kRev3[a];
                if (b != rb || i < j) swap64(data + 2 * i, data + 2 * j);
            }
        }
    }
}

void bitReverseCopy(const FftTables& t, const float* in, float* out) {
    const int bits = t.log2m;
    if (bits < 6) {
        for (std::uint32_t j = 0; j < t.m; ++j) copy64(out + 2 * std::size_t(reverseBits(j, bits)), in + 2 * j);
        return;
    }
    const int top = bits - 3;
    for (std::size_t p = 0; p < t.revPairCount; ++p) {
        const std::size_t b = t.revPairs[2 * p], rb = t.revPairs[2 * p + 1];
        for (int twice = 0; twice < (b != rb ? 2 : 1); ++twice) {
            const std::size_t from = twice ? rb : b, to = twice ? b : rb;
            for (std::uint32_t c = 0; c < 8; ++c) {
                for (std::uint32_t a = 0; a < 8; ++a) {
                    const std::size_t i = (std::size_t(a) << top) | (from << 3) | c;
                    const std::size_t j = (std::size_t(kRev3[c]) << top) | (to << 3) | kRev3[a];
                    copy64(out + 2 * j, in + 2 * i);
                }
            }
        }
    }
}

namespace {

bool isaAvailable(Isa isa) {
    switch (isa) {
    case Isa::Scalar: return true;
#if defined(ULVETTA_SPECTRAL_X86)
    case Isa::Sse2: return true;
    case Isa::Avx2: return __builtin_cpu_supports("avx2");
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
