// The product of two RCPerm spectra is the spectrum of the circular convolution, also in place.
#include "SpectralTestSupport.h"

using namespace ulvetta;
using namespace spectral_test;

TEST(SpectrumProduct, InverseOfProductIsTheCircularConvolution) {
    for (int order : {0, 1, 2, 6, 10}) {
        const std::size_t n = std::size_t(1) << order;
        const std::vector<float> x = randomFloats(n, seed(1000 + order)), h = randomFloats(n, seed(1100 + order));
        std::vector<float> fx(x), fh(h);
        nspsRealFftl(fx.data(), order, FlagForward | FlagOutPerm);
        nspsRealFftl(fh.data(), order, FlagForward | FlagOutPerm);
        std::vector<float> square(fh), copy(fh);
        nspsMpyRCPerm2(square.data(), square.data(), order);  // source and destination the same array
        nspsMpyRCPerm2(fh.data(), copy.data(), order);
        EXPECT_EQ(square, copy) << order;
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
