// The FFT kernels for AVX2, chosen at run time: four complex floats per register. This file alone is
// compiled with -mavx2 (never with FMA, so every product is rounded before it is added, as on SSE2).
#include "spectral/FftKernelImpl.h"

namespace ulvetta {
namespace spectral {

namespace {

struct VAvx2 {
    static constexpr std::size_t W = 4;
    using R = __m256;
    static R load(const float* p) { return _mm256_loadu_ps(p); }
    static void store(float* p, R v) { _mm256_storeu_ps(p, v); }
    static R add(R a, R b) { return _mm256_add_ps(a, b); }
    static R sub(R a, R b) { return _mm256_sub_ps(a, b); }
    static R scale(R a, float s) { return _mm256_mul_ps(a, _mm256_set1_ps(s)); }
    static R signs(bool re, bool im) {
        const float r = re ? -0.0f : 0.0f, i = im ? -0.0f : 0.0f;
        return _mm256_setr_ps(r, i, r, i, r, i, r, i);
    }
    template <bool Conj>
    static R cmul(R a, R w) {
        const R wr = _mm256_moveldup_ps(w);
        const R wi = _mm256_movehdup_ps(w);
        const R as = _mm256_permute_ps(a, _MM_SHUFFLE(2, 3, 0, 1));
        if (Conj) return _mm256_add_ps(_mm256_mul_ps(a, wr), _mm256_xor_ps(_mm256_mul_ps(as, wi), signs(false, true)));
        return _mm256_addsub_ps(_mm256_mul_ps(a, wr), _mm256_mul_ps(as, wi));
    }
    static R mulI(R a) {
        return _mm256_xor_ps(_mm256_permute_ps(a, _MM_SHUFFLE(2, 3, 0, 1)), signs(true, false));
    }
    static R conj(R a) { return _mm256_xor_ps(a, signs(false, true)); }
    static R reverse(R a) {
        return _mm256_permute_ps(_mm256_permute2f128_ps(a, a, 1), _MM_SHUFFLE(1, 0, 3, 2));
    }

    // First radix-4 stage: two runs of four complex values (residues 0, 2, 1, 3) per iteration, the same
    // operations as the SSE2 version in each 128-bit half.
    template <bool Inv>
    static void firstRadix4(float* x, std::size_t size) {
        const R mask = Inv ? _mm256_setr_ps(0.0f, 0.0f, -0.0f, 0.0f, 0.0f, 0.0f, -0.0f, 0.0f)
                           : _mm256_setr_ps(0.0f, 0.0f, 0.0f, -0.0f, 0.0f, 0.0f, 0.0f, -0.0f);
        for (std::size_t g = 0; g < size; g += 8) {
            float* p = x + 2 * g;
            const R q0 = _mm256_loadu_ps(p);      // a0 a2 a1 a3 of run 0
            const R q1 = _mm256_loadu_ps(p + 8);  // the same of run 1
            const __m256d r0 = _mm256_castps_pd(_mm256_permute2f128_ps(q0, q1, 0x20));  // a0 a2 | a0' a2'
            const __m256d r1 = _mm256_castps_pd(_mm256_permute2f128_ps(q0, q1, 0x31));  // a1 a3 | a1' a3'
            const R u = _mm256_castpd_ps(_mm256_unpacklo_pd(r0, r1));  // a0 a1
            const R v = _mm256_castpd_ps(_mm256_unpackhi_pd(r0, r1));  // a2 a3
            const __m256d pl = _mm256_castps_pd(_mm256_add_ps(u, v));  // s0 s2
            const __m256d mi = _mm256_castps_pd(_mm256_sub_ps(u, v));  // s1 s3
            const R a = _mm256_castpd_ps(_mm256_unpacklo_pd(pl, mi));  // s0 s1
            R b = _mm256_castpd_ps(_mm256_unpackhi_pd(pl, mi));        // s2 s3
            b = _mm256_xor_ps(_mm256_permute_ps(b, _MM_SHUFFLE(2, 3, 1, 0)), mask);
            const R lo = _mm256_add_ps(a, b);  // X0 X1 | X0' X1'
            const R hi = _mm256_sub_ps(a, b);  // X2 X3 | X2' X3'
            _mm256_storeu_ps(p, _mm256_permute2f128_ps(lo, hi, 0x20));
            _mm256_storeu_ps(p + 8, _mm256_permute2f128_ps(lo, hi, 0x31));
        }
    }
};

void complexFft(const FftTables& t, float* x, bool inverse) {
    if (t.m < 8)
        complexFftT<VScalar>(t, x, inverse);
    else
        complexFftT<VAvx2>(t, x, inverse);
}
void splitForward(const FftTables& t, float* x) { splitForwardT<VAvx2>(t, x); }
void splitInverse(const FftTables& t, float* x, float scale) { splitInverseT<VAvx2>(t, x, scale); }

void multiplyPairs(const float* src, float* dst, std::size_t pairs) {
    std::size_t j = 0;
    for (; j + 2 <= pairs; j += 2) {
        float* d = dst + 2 * j;
        const __m256d x = _mm256_cvtps_pd(_mm_loadu_ps(d));
        const __m256d y = _mm256_cvtps_pd(_mm_loadu_ps(src + 2 * j));
        const __m256d t1 = _mm256_mul_pd(x, _mm256_movedup_pd(y));                               // ac, bc
        const __m256d t2 = _mm256_mul_pd(_mm256_permute_pd(x, 0x5), _mm256_permute_pd(y, 0xF));  // bd, ad
        _mm_storeu_ps(d, _mm256_cvtpd_ps(_mm256_addsub_pd(t1, t2)));
    }
    for (; j < pairs; ++j) multiplyPairScalar(src + 2 * j, dst + 2 * j);
}

const FftKernels kKernels{&complexFft, &splitForward, &splitInverse, &multiplyPairs};

}  // namespace

const FftKernels& avx2Kernels() { return kKernels; }

}  // namespace spectral
}  // namespace ulvetta
