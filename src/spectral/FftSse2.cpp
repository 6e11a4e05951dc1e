// The FFT kernels for SSE2, present on every x86-64 processor: two complex floats per register.
#include "spectral/FftKernelImpl.h"

namespace ulvetta {
namespace spectral {

namespace {

struct VSse2 {
    static constexpr std::size_t W = 2;
    using R = __m128;
    static R load(const float* p) { return _mm_loadu_ps(p); }
    static void store(float* p, R v) { _mm_storeu_ps(p, v); }
    static R add(R a, R b) { return _mm_add_ps(a, b); }
    static R sub(R a, R b) { return _mm_sub_ps(a, b); }
    static R scale(R a, float s) { return _mm_mul_ps(a, _mm_set1_ps(s)); }
    static R signs(bool re, bool im) {
        return _mm_setr_ps(re ? -0.0f : 0.0f, im ? -0.0f : 0.0f, re ? -0.0f : 0.0f, im ? -0.0f : 0.0f);
    }
    template <bool Conj>
    static R cmul(R a, R w) {
        const R wr = _mm_shuffle_ps(w, w, _MM_SHUFFLE(2, 2, 0, 0));
        const R wi = _mm_shuffle_ps(w, w, _MM_SHUFFLE(3, 3, 1, 1));
        const R as = _mm_shuffle_ps(a, a, _MM_SHUFFLE(2, 3, 0, 1));
        return _mm_add_ps(_mm_mul_ps(a, wr), _mm_xor_ps(_mm_mul_ps(as, wi), signs(!Conj, Conj)));
    }
    static R mulI(R a) { return _mm_xor_ps(_mm_shuffle_ps(a, a, _MM_SHUFFLE(2, 3, 0, 1)), signs(true, false)); }
    static R conj(R a) { return _mm_xor_ps(a, signs(false, true)); }
    static R reverse(R a) { return _mm_shuffle_ps(a, a, _MM_SHUFFLE(1, 0, 3, 2)); }

    // First radix-4 stage: one run of four complex values (residues 0, 2, 1, 3) per iteration.
    template <bool Inv>
    static void firstRadix4(float* x, std::size_t size) {
        const R mask = Inv ? _mm_setr_ps(0.0f, 0.0f, -0.0f, 0.0f) : _mm_setr_ps(0.0f, 0.0f, 0.0f, -0.0f);
        for (std::size_t g = 0; g < size; g += 4) {
            float* p = x + 2 * g;
            const R r0 = _mm_loadu_ps(p);      // a0 a2
            const R r1 = _mm_loadu_ps(p + 4);  // a1 a3
            const R u = _mm_movelh_ps(r0, r1);  // a0 a1
            const R v = _mm_movehl_ps(r1, r0);  // a2 a3
            const R pl = _mm_add_ps(u, v);      // s0 s2
            const R mi = _mm_sub_ps(u, v);      // s1 s3
            const R a = _mm_movelh_ps(pl, mi);  // s0 s1
            R b = _mm_movehl_ps(mi, pl);        // s2 s3
            // s3 -> -i s3 (forward) or i s3 (inverse)
            b = _mm_xor_ps(_mm_shuffle_ps(b, b, _MM_SHUFFLE(2, 3, 1, 0)), mask);
            _mm_storeu_ps(p, _mm_add_ps(a, b));
            _mm_storeu_ps(p + 4, _mm_sub_ps(a, b));
        }
    }
};

void complexFft(const FftTables& t, float* x, bool inverse) {
    if (t.m < 8)
        complexFftT<VScalar>(t, x, inverse);
    else
        complexFftT<VSse2>(t, x, inverse);
}
void splitForward(const FftTables& t, float* x) { splitForwardT<VSse2>(t, x); }
void splitInverse(const FftTables& t, float* x, float scale) { splitInverseT<VSse2>(t, x, scale); }

void multiplyPairs(const float* src, float* dst, std::size_t pairs) {
    const __m128d negRe = _mm_setr_pd(-0.0, 0.0);
    for (std::size_t j = 0; j < pairs; ++j) {
        float* d = dst + 2 * j;
        const __m128d x = _mm_cvtps_pd(_mm_castsi128_ps(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(d))));
        const __m128d y =
            _mm_cvtps_pd(_mm_castsi128_ps(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(src + 2 * j))));
        const __m128d t1 = _mm_mul_pd(x, _mm_unpacklo_pd(y, y));                        // ac, bc
        const __m128d t2 = _mm_mul_pd(_mm_shuffle_pd(x, x, 1), _mm_unpackhi_pd(y, y));  // bd, ad
        const __m128 r = _mm_cvtpd_ps(_mm_add_pd(t1, _mm_xor_pd(t2, negRe)));
        _mm_storel_epi64(reinterpret_cast<__m128i*>(d), _mm_castps_si128(r));
    }
}

const FftKernels kKernels{&complexFft, &splitForward, &splitInverse, &multiplyPairs};

}  // namespace

const FftKernels& sse2Kernels() { return kKernels; }

}  // namespace spectral
}  // namespace ulvetta
