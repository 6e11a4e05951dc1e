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

    // A 4 x 4 block of complex values: row i (register pair lo, hi) holds row rev(i) of the block.
    struct Block {
        R lo[4], hi[4];
    };
    static Block loadBlock(const float* in, int top, std::size_t b) {
        Block k;
        for (std::size_t i = 0; i < 4; ++i) {
            const float* p = in + 2 * ((kRev2[i] << top) | (b << 2));
            k.lo[i] = _mm_loadu_ps(p);
            k.hi[i] = _mm_loadu_ps(p + 4);
        }
        return k;
    }
    template <bool Inv>
    static void emitBlock(const Block& k, float* out, int top, std::size_t b) {
        R dl[4], dh[4];
        butterfly4<VSse2, Inv>(k.lo, dl);
        butterfly4<VSse2, Inv>(k.hi, dh);
        // Transposed: output row rev(j) holds column j.
        const R rows[4][2] = {
            {_mm_movelh_ps(dl[0], dl[1]), _mm_movelh_ps(dl[2], dl[3])},
            {_mm_movehl_ps(dl[1], dl[0]), _mm_movehl_ps(dl[3], dl[2])},
            {_mm_movelh_ps(dh[0], dh[1]), _mm_movelh_ps(dh[2], dh[3])},
            {_mm_movehl_ps(dh[1], dh[0]), _mm_movehl_ps(dh[3], dh[2])},
        };
        for (std::size_t j = 0; j < 4; ++j) {
            float* p = out + 2 * ((kRev2[j] << top) | (b << 2));
            _mm_storeu_ps(p, rows[j][0]);
            _mm_storeu_ps(p + 4, rows[j][1]);
        }
    }
    template <bool Inv>
    static void bitReverseFirst(const FftTables& t, const float* in, float* out) {
        bitReverseFirstBlocks<VSse2, Inv>(t, in, out);
    }
};

void complexFft(const FftTables& t, const float* in, float* out, bool inverse) {
    if (t.m < 16)
        complexFftT<VScalar>(t, in, out, inverse);
    else
        complexFftT<VSse2>(t, in, out, inverse);
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

double dot8(const float* h, const float* w, std::size_t n) {
    __m128d a0 = _mm_setzero_pd(), a1 = a0, a2 = a0, a3 = a0;  // sums 0-1, 2-3, 4-5, 6-7
    for (std::size_t i = 0; i < n; i += 8) {
        const __m128 h0 = _mm_loadu_ps(h + i), h1 = _mm_loadu_ps(h + i + 4);
        const __m128 w0 = _mm_loadu_ps(w + i), w1 = _mm_loadu_ps(w + i + 4);
        a0 = _mm_add_pd(a0, _mm_mul_pd(_mm_cvtps_pd(h0), _mm_cvtps_pd(w0)));
        a1 = _mm_add_pd(a1, _mm_mul_pd(_mm_cvtps_pd(_mm_movehl_ps(h0, h0)), _mm_cvtps_pd(_mm_movehl_ps(w0, w0))));
        a2 = _mm_add_pd(a2, _mm_mul_pd(_mm_cvtps_pd(h1), _mm_cvtps_pd(w1)));
        a3 = _mm_add_pd(a3, _mm_mul_pd(_mm_cvtps_pd(_mm_movehl_ps(h1, h1)), _mm_cvtps_pd(_mm_movehl_ps(w1, w1))));
    }
    alignas(16) double acc[8];
    _mm_store_pd(acc, a0);
    _mm_store_pd(acc + 2, a1);
    _mm_store_pd(acc + 4, a2);
    _mm_store_pd(acc + 6, a3);
    return combine8(acc);
}

const FftKernels kKernels{&complexFft, &splitForward, &splitInverse, &multiplyPairs, &dot8};

}  // namespace

const FftKernels& sse2Kernels() { return kKernels; }

}  // namespace spectral
}  // namespace ulvetta
