// The FFT arithmetic, written once over a small "vector of complex floats" type V and compiled once per
// instruction set (FftScalar.cpp, FftSse2.cpp, FftAvx2.cpp). Everything here has internal linkage, so
// that code compiled for AVX2 can never be picked for another translation unit. Only <cstddef>,
// <cstdint> and the intrinsics headers are used, for the same reason.
//
// Every V performs the same floating-point operations on each complex value in the same order, so all
// instruction sets give bit-identical results:
//   add, sub, scale           element-wise
//   cmul<false>(a, w)         (ar wr - ai wi, ai wr + ar wi)
//   cmul<true>(a, w)          a conj(w) = (ar wr + ai wi, ai wr - ar wi)
//   mulI(a)                   i a = (-ai, ar)
//   conj(a), reverse(a)       conjugate; complex lanes in reverse order
#pragma once

#include <cstddef>
#include <cstdint>

#include "spectral/FftTables.h"

#if defined(ULVETTA_SPECTRAL_X86)
#include <immintrin.h>
#endif

namespace ulvetta {
namespace spectral {
namespace {

// One complex value.
struct VScalar {
    static constexpr std::size_t W = 1;
    struct R {
        float re, im;
    };
    static R load(const float* p) { return {p[0], p[1]}; }
    static void store(float* p, R v) {
        p[0] = v.re;
        p[1] = v.im;
    }
    static R add(R a, R b) { return {a.re + b.re, a.im + b.im}; }
    static R sub(R a, R b) { return {a.re - b.re, a.im - b.im}; }
    static R scale(R a, float s) { return {a.re * s, a.im * s}; }
    template <bool Conj>
    static R cmul(R a, R w) {
        if (Conj) return {a.re * w.re + a.im * w.im, a.im * w.re - a.re * w.im};
        return {a.re * w.re - a.im * w.im, a.im * w.re + a.re * w.im};
    }
    static R mulI(R a) { return {-a.im, a.re}; }
    static R conj(R a) { return {a.re, -a.im}; }
    static R reverse(R a) { return a; }
    template <bool Inv>
    static void firstRadix4(float* x, std::size_t size);
    template <bool Inv>
    static void bitReverseFirst(const FftTables& t, const float* in, float* out);
};

// The first radix-4 stage (span 1, no twiddles) on `size` complex values in bit-reversed order: each run
// of four holds the sub-spectra of residues 0, 2, 1, 3.
template <bool Inv>
void VScalar::firstRadix4(float* x, std::size_t size) {
    for (std::size_t g = 0; g < size; g += 4) {
        float* p = x + 2 * g;
        const R a0 = load(p), a2 = load(p + 2), a1 = load(p + 4), a3 = load(p + 6);
        const R s0 = add(a0, a2), s1 = sub(a0, a2), s2 = add(a1, a3), s3 = sub(a1, a3);
        const R r = mulI(s3);
        store(p, add(s0, s2));
        store(p + 4, sub(s0, s2));
        store(p + 2, Inv ? add(s1, r) : sub(s1, r));
        store(p + 6, Inv ? sub(s1, r) : add(s1, r));
    }
}

template <bool Inv>
void bitReverseFirstPlain(const FftTables& t, const float* in, float* out);

template <bool Inv>
void VScalar::bitReverseFirst(const FftTables& t, const float* in, float* out) {
    bitReverseFirstPlain<Inv>(t, in, out);
}

// One radix-4 decimation-in-time stage of span L (L >= V::W) over `size` complex values.
template <class V, bool Inv>
void radix4Stage(float* x, std::size_t size, std::size_t span, const float* tw) {
    using R = typename V::R;
    for (std::size_t g = 0; g < size; g += 4 * span) {
        float* base = x + 2 * g;
        for (std::size_t j = 0; j < span; j += V::W) {
            float* p0 = base + 2 * j;
            float* p1 = p0 + 2 * span;
            float* p2 = p1 + 2 * span;
            float* p3 = p2 + 2 * span;
            const float* w = tw + (j / 4) * 24 + (j % 4) * 2;
            const R a0 = V::load(p0);
            const R a2 = V::template cmul<Inv>(V::load(p1), V::load(w + 8));
            const R a1 = V::template cmul<Inv>(V::load(p2), V::load(w));
            const R a3 = V::template cmul<Inv>(V::load(p3), V::load(w + 16));
            const R s0 = V::add(a0, a2), s1 = V::sub(a0, a2), s2 = V::add(a1, a3), s3 = V::sub(a1, a3);
            const R r = V::mulI(s3);
            V::store(p0, V::add(s0, s2));
            V::store(p2, V::sub(s0, s2));
            V::store(p1, Inv ? V::add(s1, r) : V::sub(s1, r));
            V::store(p3, Inv ? V::sub(s1, r) : V::add(s1, r));
        }
    }
}

// The final radix-2 stage of span M/2 (odd log2 M).
template <class V, bool Inv>
void radix2Stage(float* x, std::size_t m, const float* tw) {
    using R = typename V::R;
    const std::size_t half = m / 2;
    for (std::size_t j = 0; j < half; j += V::W) {
        float* p0 = x + 2 * j;
        float* p1 = p0 + 2 * half;
        const R a = V::load(p0);
        const R b = V::template cmul<Inv>(V::load(p1), V::load(tw + 2 * j));
        V::store(p0, V::add(a, b));
        V::store(p1, V::sub(a, b));
    }
}

// A radix-4 butterfly without twiddles across four registers holding residues 0, 2, 1, 3 (the order of
// a bit-reversed run of four); d receives outputs 0, 1, 2, 3.
template <class V, bool Inv>
void butterfly4(const typename V::R* c, typename V::R* d) {
    using R = typename V::R;
    const R s0 = V::add(c[0], c[1]), s1 = V::sub(c[0], c[1]), s2 = V::add(c[2], c[3]), s3 = V::sub(c[2], c[3]);
    const R r = V::mulI(s3);
    d[0] = V::add(s0, s2);
    d[2] = V::sub(s0, s2);
    d[1] = Inv ? V::add(s1, r) : V::sub(s1, r);
    d[3] = Inv ? V::sub(s1, r) : V::add(s1, r);
}

// The bit-reversal permutation fused with the first radix-4 stage, for log2m >= 4. The index splits
// into (a: top 2 bits, b: middle, c: low 2 bits) and reverses to (rev c, rev b, rev a): the 4 x 4 block
// of middle field b lands, transposed, on block rev b. V::transposeRows(in, b, out, rb) loads the four
// rows of block b in reversed row order (register i = row rev i), and V::emitRows applies the butterfly
// across those registers (the lanes of the output rows) and stores the transposed result.
template <class V, bool Inv>
void bitReverseFirstBlocks(const FftTables& t, const float* in, float* out) {
    const int top = t.log2m - 2;
    const std::size_t blocks = std::size_t(1) << (t.log2m - 4);
    for (std::size_t b = 0; b < blocks; ++b) {
        const std::size_t rb = t.revQuarter[b] >> 2;
        if (rb < b) continue;
        typename V::Block from = V::loadBlock(in, top, b);
        if (rb == b) {
            V::template emitBlock<Inv>(from, out, top, b);
        } else {
            typename V::Block to = V::loadBlock(in, top, rb);  // both read before either is written
            V::template emitBlock<Inv>(from, out, top, rb);
            V::template emitBlock<Inv>(to, out, top, b);
        }
    }
}

constexpr std::size_t kRev2[4] = {0, 2, 1, 3};

// The last radix-4 stage (span M/8) and the radix-2 stage (span M/2) of an odd-log2 transform in one
// pass: the four outputs of each half at j meet their radix-2 partners while still in registers.
template <class V, bool Inv>
void radix4Then2Stage(float* x, std::size_t m, const float* tw4, const float* tw2) {
    using R = typename V::R;
    const std::size_t span = m / 8, half = m / 2;
    for (std::size_t j = 0; j < span; j += V::W) {
        const float* w = tw4 + (j / 4) * 24 + (j % 4) * 2;
        const R w1 = V::load(w), w2 = V::load(w + 8), w3 = V::load(w + 16);
        R y[2][4];
        for (int h = 0; h < 2; ++h) {
            const float* p0 = x + 2 * (h * half + j);
            const R a0 = V::load(p0);
            const R a2 = V::template cmul<Inv>(V::load(p0 + 2 * span), w2);
            const R a1 = V::template cmul<Inv>(V::load(p0 + 4 * span), w1);
            const R a3 = V::template cmul<Inv>(V::load(p0 + 6 * span), w3);
            const R s0 = V::add(a0, a2), s1 = V::sub(a0, a2), s2 = V::add(a1, a3), s3 = V::sub(a1, a3);
            const R r = V::mulI(s3);
            y[h][0] = V::add(s0, s2);
            y[h][2] = V::sub(s0, s2);
            y[h][1] = Inv ? V::add(s1, r) : V::sub(s1, r);
            y[h][3] = Inv ? V::sub(s1, r) : V::add(s1, r);
        }
        for (std::size_t q = 0; q < 4; ++q) {
            const std::size_t pos = j + q * span;
            const R b = V::template cmul<Inv>(y[1][q], V::load(tw2 + 2 * pos));
            V::store(x + 2 * pos, V::add(y[0][q], b));
            V::store(x + 2 * (pos + half), V::sub(y[0][q], b));
        }
    }
}

// Blocks of up to 2^kBlockLog complex values (8 KB) run all their stages while they sit in the
// first-level cache; larger transforms recurse depth-first, so each level also stays cache-resident.
constexpr int kBlockLog = 10;

// Every stage after the first radix-4 one (which the bit-reversal pass has done) over 2^sizeLog values.
template <class V, bool Inv>
void laterStages(const FftTables& t, float* x, int sizeLog) {
    const std::size_t size = std::size_t(1) << sizeLog;
    const int stages = sizeLog / 2;
    const bool odd = (sizeLog & 1) != 0;
    if (sizeLog <= kBlockLog) {
        const int plain = (odd && stages >= 2) ? stages - 1 : stages;
        for (int s = 1; s < plain; ++s) radix4Stage<V, Inv>(x, size, std::size_t(1) << (2 * s), t.radix4Tw[s]);
        if (odd && stages >= 2)
            radix4Then2Stage<V, Inv>(x, size, t.radix4Tw[stages - 1], t.radix2Tw);
        else if (odd)
            radix2Stage<V, Inv>(x, size, t.radix2Tw);
        return;
    }
    if (odd) {
        // Only the whole transform has odd size.
        const std::size_t eighth = size / 8;
        for (int c = 0; c < 8; ++c) laterStages<V, Inv>(t, x + 2 * c * eighth, sizeLog - 3);
        radix4Then2Stage<V, Inv>(x, size, t.radix4Tw[stages - 1], t.radix2Tw);
        return;
    }
    const std::size_t quarter = size / 4;
    for (int c = 0; c < 4; ++c) laterStages<V, Inv>(t, x + 2 * c * quarter, sizeLog - 2);
    radix4Stage<V, Inv>(x, size, quarter, t.radix4Tw[stages - 1]);
}

// Bit reversal with the first radix-4 stage, the plain way.
template <bool Inv>
void bitReverseFirstPlain(const FftTables& t, const float* in, float* out) {
    bitReverse(t, in, out);
    if (t.log2m >= 2) VScalar::firstRadix4<Inv>(out, t.m);
}

template <class V>
void complexFftT(const FftTables& t, const float* in, float* out, bool inverse) {
    if (inverse) {
        V::template bitReverseFirst<true>(t, in, out);
        laterStages<V, true>(t, out, t.log2m);
    } else {
        V::template bitReverseFirst<false>(t, in, out);
        laterStages<V, false>(t, out, t.log2m);
    }
}

// Real split of one pair (k, M-k); a and b are the loaded values Z[k] and Z[M-k] (b's lanes reversed).
template <class V>
void splitForwardT(const FftTables& t, float* x) {
    using R = typename V::R;
    using S = VScalar;
    const std::size_t m = t.m;
    const float re0 = x[0], im0 = x[1];
    x[0] = re0 + im0;  // X[0]
    x[1] = re0 - im0;  // X[N/2]
    const float* hw = t.splitFwd;
    std::size_t k = 1;
    // X[k] = (A + B) / 2 - 0.5 i W^k (A - B), X[M-k] = conj((A + B) / 2 + 0.5 i W^k (A - B)),
    // A = Z[k], B = conj(Z[M-k]).
    for (; 2 * k + 2 * V::W - 2 < m; k += V::W) {
        float* lo = x + 2 * k;
        float* hi = x + 2 * (m - k - V::W + 1);
        const R a = V::load(lo);
        const R b = V::conj(V::reverse(V::load(hi)));
        const R e = V::scale(V::add(a, b), 0.5f);
        const R g = V::template cmul<false>(V::sub(a, b), V::load(hw + 2 * k));
        V::store(lo, V::sub(e, g));
        V::store(hi, V::reverse(V::conj(V::add(e, g))));
    }
    for (; k < m - k; ++k) {
        float* lo = x + 2 * k;
        float* hi = x + 2 * (m - k);
        const S::R a = S::load(lo);
        const S::R b = S::conj(S::load(hi));
        const S::R e = S::scale(S::add(a, b), 0.5f);
        const S::R g = S::cmul<false>(S::sub(a, b), S::load(hw + 2 * k));
        S::store(lo, S::sub(e, g));
        S::store(hi, S::conj(S::add(e, g)));
    }
    x[m + 1] = -x[m + 1];  // X[M/2] = conj(Z[M/2])
}

template <class V>
void splitInverseT(const FftTables& t, float* x, float scale) {
    using R = typename V::R;
    using S = VScalar;
    const std::size_t m = t.m;
    const float r0 = x[0], rn = x[1];
    x[0] = (r0 + rn) * scale;
    x[1] = (r0 - rn) * scale;
    const float* v = t.splitInv;
    std::size_t k = 1;
    // Z[k] = s (A + B) + i conj(W^k) s (A - B), Z[M-k] = conj(s (A + B) - i conj(W^k) s (A - B)),
    // A = X[k], B = conj(X[M-k]); the factor 2 of the half-length transform is kept (unscaled inverse).
    for (; 2 * k + 2 * V::W - 2 < m; k += V::W) {
        float* lo = x + 2 * k;
        float* hi = x + 2 * (m - k - V::W + 1);
        const R a = V::load(lo);
        const R b = V::conj(V::reverse(V::load(hi)));
        const R e = V::scale(V::add(a, b), scale);
        const R g = V::template cmul<false>(V::scale(V::sub(a, b), scale), V::load(v + 2 * k));
        V::store(lo, V::add(e, g));
        V::store(hi, V::reverse(V::conj(V::sub(e, g))));
    }
    for (; k < m - k; ++k) {
        float* lo = x + 2 * k;
        float* hi = x + 2 * (m - k);
        const S::R a = S::load(lo);
        const S::R b = S::conj(S::load(hi));
        const S::R e = S::scale(S::add(a, b), scale);
        const S::R g = S::cmul<false>(S::scale(S::sub(a, b), scale), S::load(v + 2 * k));
        S::store(lo, S::add(e, g));
        S::store(hi, S::conj(S::sub(e, g)));
    }
    const float twice = 2.0f * scale;
    x[m] = x[m] * twice;  // Z[M/2] = 2 s conj(X[M/2])
    x[m + 1] = -x[m + 1] * twice;
}

// dst[j] *= src[j] for one complex value, in double precision.
inline double combine8(const double* a) { return ((a[0] + a[1]) + (a[2] + a[3])) + ((a[4] + a[5]) + (a[6] + a[7])); }

inline double dot8Scalar(const float* h, const float* w, std::size_t n) {
    double acc[8] = {};
    for (std::size_t i = 0; i < n; i += 8)
        for (int k = 0; k < 8; ++k) acc[k] += double(h[i + k]) * w[i + k];
    return combine8(acc);
}

inline void multiplyPairScalar(const float* src, float* dst) {
    const double a = dst[0], b = dst[1], c = src[0], d = src[1];
    dst[0] = static_cast<float>(a * c - b * d);
    dst[1] = static_cast<float>(a * d + b * c);
}

}  // namespace

}  // namespace spectral
}  // namespace ulvetta
