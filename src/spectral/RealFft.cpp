// The real FFT routines and the product of packed spectra: argument checks, table lookup and the
// order of the passes. The arithmetic lives in the per-instruction-set kernels.
#include <cmath>
#include <cstdint>
#include <cstring>

#include "spectral/FftTables.h"
#include "spectral/Nsp.h"
#include "spectral/NspContext.h"

namespace ulvetta {

namespace {

using spectral::FftTables;
using spectral::report;

constexpr int kMaxOrder = 31;

bool checkOrder(int order, const char* routine) {
    if (order < 0) {
        report(NspStsBadArg, routine, "order<0");
        return false;
    }
    if (order > kMaxOrder) {
        report(NspStsBadArg, routine, "order>31");
        return false;
    }
    return true;
}

// Fetches (building on first use) the tables of order >= 2. A failed build is tried once more before it
// is reported. Tables of other orders are never dropped here: other threads may be using them.
bool fetchTables(int order, const char* routine, const FftTables*& tables) {
    tables = nullptr;
    if (order < 2) return true;
    tables = spectral::acquireTables(order);
    if (!tables) tables = spectral::acquireTables(order);
    if (!tables) {
        report(NspStsNoMem, routine, "No working Twd memory");
        return false;
    }
    return true;
}

bool checkDirection(int flags, int wanted, const char* routine) {
    const bool fwd = (flags & FlagForward) != 0, inv = (flags & FlagInverse) != 0;
    if (fwd && inv) {
        report(NspStsBadArg, routine, "(flags & 1) && (flags & 2)");
        return false;
    }
    if (!fwd && !inv) {
        report(NspStsBadArg, routine, "(flags & 1)==0 && (flags & 2)==0");
        return false;
    }
    if (!(flags & wanted)) {
        report(NspStsUnsupported, routine,
               wanted == FlagForward ? "inverse transform: use nspsCcsFftl" : "forward transform: use nspsRealFftl");
        return false;
    }
    return true;
}

bool checkOutLayout(int flags, const char* routine) {
    const bool pack = (flags & FlagOutPack) != 0, perm = (flags & FlagOutPerm) != 0;
    if (pack && perm) {
        report(NspStsBadArg, routine, "(flags & 256) && (flags & 512)");
        return false;
    }
    if (!pack && !perm) {
        report(NspStsBadArg, routine, "(flags & 256)==0 && (flags & 512)==0");
        return false;
    }
    return true;
}

bool checkInLayout(int flags, const char* routine) {
    const bool pack = (flags & FlagInPack) != 0, perm = (flags & FlagInPerm) != 0;
    if (pack && perm) {
        report(NspStsBadArg, routine, "(flags & 1024) && (flags & 4096)");
        return false;
    }
    if (!pack && !perm) {
        report(NspStsBadArg, routine, "(flags & 1024)==0 && (flags & 4096)==0");
        return false;
    }
    return true;
}

// RCPerm -> RCPack in place: the Nyquist value moves from position 1 to the end.
void permToPack(float* x, std::size_t n) {
    const float nyquist = x[1];
    std::memmove(x + 1, x + 2, (n - 2) * sizeof(float));
    x[n - 1] = nyquist;
}

void packToPerm(float* x, std::size_t n) {
    const float nyquist = x[n - 1];
    std::memmove(x + 2, x + 1, (n - 2) * sizeof(float));
    x[1] = nyquist;
}

// Forward transform of order >= 1 from in to out (in == out: in place).
void forwardBody(const FftTables* t, const float* in, float* out, int order, int flags) {
    if (order == 1) {
        const float x0 = in[0], x1 = in[1];
        out[0] = x0 + x1;
        out[1] = x0 - x1;
        return;
    }
    const spectral::FftKernels& k = spectral::activeKernels();
    k.complexFft(*t, in, out, false);
    k.splitForward(*t, out);
    if (flags & FlagOutPack) permToPack(out, t->m * 2);
}

bool overlaps(const float* a, const float* b, std::size_t n) {
    const auto pa = reinterpret_cast<std::uintptr_t>(a), pb = reinterpret_cast<std::uintptr_t>(b);
    const std::uintptr_t bytes = n * sizeof(float);
    return pa < pb + bytes && pb < pa + bytes;
}

}  // namespace

void nspsRealFftl(float* samps, int order, int flags) {
    const char* fn = "nspsRealFftl";
    if (flags & FlagRelease) {
        spectral::releaseTables(order);
        return;
    }
    if (!checkOrder(order, fn)) return;
    const FftTables* t;
    if (!fetchTables(order, fn, t)) return;
    if (flags & FlagInitOnly) return;
    if (!samps) {
        report(NspStsBadArg, fn, "samps==0");
        return;
    }
    if (!checkDirection(flags, FlagForward, fn) || !checkOutLayout(flags, fn)) return;
    if (order == 0) return;
    forwardBody(t, samps, samps, order, flags);
}

void nspsRealFftlNip(const float* inSamps, float* outSamps, int order, int flags) {
    const char* fn = "nspsRealFftlNip";
    if (flags & FlagRelease) {
        spectral::releaseTables(order);
        return;
    }
    if (!checkOrder(order, fn)) return;
    const FftTables* t;
    if (!fetchTables(order, fn, t)) return;
    if (flags & FlagInitOnly) return;
    if (!inSamps) {
        report(NspStsBadArg, fn, "inSamps==0");
        return;
    }
    if (!outSamps) {
        report(NspStsBadArg, fn, "outSamps==0");
        return;
    }
    if (!checkDirection(flags, FlagForward, fn) || !checkOutLayout(flags, fn)) return;
    const std::size_t n = std::size_t(1) << order;
    if (inSamps != outSamps && overlaps(inSamps, outSamps, n)) {
        report(NspStsBadArg, fn, "inSamps and outSamps overlap");
        return;
    }
    if (order == 0) {
        outSamps[0] = inSamps[0];
        return;
    }
    forwardBody(t, inSamps, outSamps, order, flags);
}

void nspsCcsFftl(float* samps, int order, int flags) {
    const char* fn = "nspsCcsFftl";
    if (flags & FlagRelease) {
        spectral::releaseTables(order);
        return;
    }
    if (!checkOrder(order, fn)) return;
    const FftTables* t;
    if (!fetchTables(order, fn, t)) return;
    if (flags & FlagInitOnly) return;
    if (!samps) {
        report(NspStsBadArg, fn, "samps==0");
        return;
    }
    if (!checkDirection(flags, FlagInverse, fn) || !checkInLayout(flags, fn)) return;
    if (order == 0) return;
    // 1/N is a power of two: applying it before the passes rounds exactly as applying it after.
    const float scale = (flags & FlagNoScale) ? 1.0f : std::ldexp(1.0f, -order);
    if (order == 1) {
        const float r0 = samps[0], r1 = samps[1];
        samps[0] = (r0 + r1) * scale;
        samps[1] = (r0 - r1) * scale;
        return;
    }
    if (flags & FlagInPack) packToPerm(samps, t->m * 2);
    const spectral::FftKernels& k = spectral::activeKernels();
    k.splitInverse(*t, samps, scale);
    k.complexFft(*t, samps, samps, true);
}

void nspsMpyRCPerm2(const float* src, float* srcDst, int order) {
    const char* fn = "nspsMpyRCPerm2";
    if (!checkOrder(order, fn)) return;
    if (!src) {
        report(NspStsBadArg, fn, "src==0");
        return;
    }
    if (!srcDst) {
        report(NspStsBadArg, fn, "dst==0");
        return;
    }
    if (src != srcDst && overlaps(src, srcDst, std::size_t(1) << order)) {
        report(NspStsBadArg, fn, "src and dst overlap");
        return;
    }
    // A product of two floats is exact in double, so rounding it to float is the float product.
    srcDst[0] = static_cast<float>(double(srcDst[0]) * src[0]);
    if (order >= 1) srcDst[1] = static_cast<float>(double(srcDst[1]) * src[1]);
    if (order >= 2) spectral::activeKernels().multiplyPairs(src + 2, srcDst + 2, (std::size_t(1) << (order - 1)) - 1);
}

}  // namespace ulvetta
