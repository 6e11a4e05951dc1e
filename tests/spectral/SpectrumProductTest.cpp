// The product of two RCPerm spectra: bin by bin against exact complex multiplication, and as the
// spectrum of a circular convolution.
#include <vector>

#include "SpectralTestSupport.h"

using namespace ulvetta;
using namespace spectral_test;
using spectral::Isa;

TEST(SpectrumProduct, MultipliesDcAndNyquistAsRealsAndTheBinsBetweenAsComplex) {
    for (int order = 0; order <= 12; ++order) {
        const std::size_t n = std::size_t(1) << order;
        const std::vector<float> a = randomFloats(n, seed(800 + order), -4.0f, 4.0f);
        const std::vector<float> b = randomFloats(n, seed(900 + order), -4.0f, 4.0f);
        for (Isa isa : availableIsas()) {
            IsaScope scope(isa);
            SCOPED_TRACE(testing::Message() << "order " << order << ", " << isaName(isa));
            std::vector<float> p(a);
            nspsMpyRCPerm2(b.data(), p.data(), order);
            // Exact product of the two floats, rounded once: the float product.
            ASSERT_EQ(p[0], a[0] * b[0]);
            if (order >= 1) {
                ASSERT_EQ(p[1], a[1] * b[1]);
            }
            // Complex bins: long double holds ac and bd exactly; the result may differ from the exact value
            // by one rounding to float of the result and one of the double sum.
            for (std::size_t j = 2; j + 1 < n; j += 2) {
                const long double ar = a[j], ai = a[j + 1], br = b[j], bi = b[j + 1];
                const long double re = ar * br - ai * bi, im = ar * bi + ai * br;
                const double scaleRe = std::fabs(double(ar * br)) + std::fabs(double(ai * bi));
                const double scaleIm = std::fabs(double(ar * bi)) + std::fabs(double(ai * br));
                ASSERT_LE(std::fabs(double(p[j] - re)), kEps * std::fabs(double(re)) + 1e-15 * scaleRe) << j;
                ASSERT_LE(std::fabs(double(p[j + 1] - im)), kEps * std::fabs(double(im)) + 1e-15 * scaleIm) << j;
            }
            // Squaring in place (src and srcDst the same array) gives the same as two copies.
            std::vector<float> sq(a), copy(a);
            nspsMpyRCPerm2(sq.data(), sq.data(), order);
            nspsMpyRCPerm2(a.data(), copy.data(), order);
            ASSERT_EQ(sq, copy);
        }
    }
}

TEST(SpectrumProduct, InverseOfProductIsTheCircularConvolution) {
    for (int order : {2, 6, 10}) {
        const std::size_t n = std::size_t(1) << order;
        const std::vector<float> x = randomFloats(n, seed(1000 + order));
        const std::vector<float> h = randomFloats(n, seed(1100 + order));
        std::vector<float> fx(x), fh(h);
        nspsRealFftl(fx.data(), order, FlagForward | FlagOutPerm);
        nspsRealFftl(fh.data(), order, FlagForward | FlagOutPerm);
        nspsMpyRCPerm2(fh.data(), fx.data(), order);
        nspsCcsFftl(fx.data(), order, FlagInverse | FlagInPerm);
        double worst = 0.0, energy = 0.0;
        for (std::size_t i = 0; i < n; ++i) {
            double y = 0.0;
            for (std::size_t k = 0; k < n; ++k) y += double(h[k]) * x[(i + n - k) % n];
            worst = std::max(worst, std::fabs(fx[i] - y));
            energy += y * y;
        }
        // Three transforms and a product, each within a few rounding units per stage.
        EXPECT_LE(worst, 8.0 * kEps * (order + 1) * std::sqrt(double(n)) * std::sqrt(energy / double(n)))
            << "order " << order;
    }
}
