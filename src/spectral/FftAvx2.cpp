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

    // A 4 x 4 block of complex values: register i holds row rev(i) of the block.
    struct Block {
        R r[4];
    };
    static Block loadBlock(const float* in, int top, std::size_t b) {
        Block k;
        for (std::size_t i = 0; i < 4; ++i) k.r[i] = _mm256_loadu_ps(in + 2 * ((kRev2[i] << top) | (b << 2)));
        return k;
    }
    template <bool Inv>
    static void emitBlock(const Block& k, float* out, int top, std::size_t b) {
        R d[4];
        butterfly4<VAvx2, Inv>(k.r, d);
        const __m256d t0 = _mm256_unpacklo_pd(_mm256_castps_pd(d[0]), _mm256_castps_pd(d[1]));
        const __m256d t1 = _mm256_unpackhi_pd(_mm256_castps_pd(d[0]), _mm256_castps_pd(d[1]));
        const __m256d t2 = _mm256_unpacklo_pd(_mm256_castps_pd(d[2]), _mm256_castps_pd(d[3]));
        const __m256d t3 = _mm256_unpackhi_pd(_mm256_castps_pd(d[2]), _mm256_castps_pd(d[3]));
        // Transposed: output row rev(j) holds column j.
        const R cols[4] = {
            _mm256_castpd_ps(_mm256_permute2f128_pd(t0, t2, 0x20)),
            _mm256_castpd_ps(_mm256_permute2f128_pd(t1, t3, 0x20)),
            _mm256_castpd_ps(_mm256_permute2f128_pd(t0, t2, 0x31)),
            _mm256_castpd_ps(_mm256_permute2f128_pd(t1, t3, 0x31)),
        };
        for (std::size_t j = 0; j < 4; ++j) _mm256_storeu_ps(out + 2 * ((kRev2[j] << top) | (b << 2)), cols[j]);
    }
    template <bool Inv>
    static void bitReverseFirst(const FftTables& t, const float* in, float* out) {
        bitReverseFirstBlocks<VAvx2, Inv>(t, in, out);
    }
};

void complexFft(const FftTables& t, const float* in, float* out, bool inverse) {
    if (t.m < 16)
        complexFftT<VScalar>(t, in, out, inverse);
    else
        complexFftT<VAvx2>(t, in, out, inverse);
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

double dot8(const float* h, const float* w, std::size_t n) {
    __m256d a0 = _mm256_setzero_pd(), a1 = a0;  // sums 0-3 and 4-7
    for (std::size_t i = 0; i < n; i += 8) {
        const __m256 hv = _mm256_loadu_ps(h + i), wv = _mm256_loadu_ps(w + i);
        a0 = _mm256_add_pd(a0, _mm256_mul_pd(_mm256_cvtps_pd(_mm256_castps256_ps128(hv)),
                                             _mm256_cvtps_pd(_mm256_castps256_ps128(wv))));
        a1 = _mm256_add_pd(a1, _mm256_mul_pd(_mm256_cvtps_pd(_mm256_extractf128_ps(hv, 1)),
                                             _mm256_cvtps_pd(_mm256_extractf128_ps(wv, 1))));
    }
    double acc[8];
    _mm256_storeu_pd(acc, a0);
    _mm256_storeu_pd(acc + 4, a1);
    return combine8(acc);
}

const FftKernels kKernels{&complexFft, &splitForward, &splitInverse, &multiplyPairs, &dot8};

}  // namespace

const FftKernels& avx2Kernels() { return kKernels; }

}  // namespace spectral
}  // namespace ulvetta
