// The real FFT against a direct transform in double precision, round trips, layouts, the instruction
// sets against each other, and the table cache under concurrent first use.
#include <atomic>
#include <cstring>
#include <vector>

#include "SpectralTestSupport.h"
#include "platform/Thread.h"

using namespace ulvetta;
using namespace spectral_test;
using spectral::Isa;

namespace {

constexpr int kMaxTestedOrder = 17;

// The bins (forward) or samples (inverse) checked directly: all of them up to order 11, above that the
// edges and a seeded random selection, so that the direct O(N) sums stay cheap.
std::vector<std::size_t> checkedIndices(int order, std::size_t count, unsigned s) {
    std::vector<std::size_t> idx;
    if (order <= 11) {
        for (std::size_t k = 0; k < count; ++k) idx.push_back(k);
        return idx;
    }
    idx = {0, 1, 2, count - 2, count - 1, count / 2, count / 4 + 1};
    std::mt19937 gen(s);
    std::uniform_int_distribution<std::size_t> d(0, count - 1);
    for (int i = 0; i < 40; ++i) idx.push_back(d(gen));
    return idx;
}

// Error allowed per value: a few float rounding units per stage, relative to the root-mean-square size
// of the exact output values.
double bound(int order, double rmsOut) { return 2.0 * kEps * (order + 1) * rmsOut; }

std::vector<float> forwardOf(const std::vector<float>& x, int order, int layout) {
    std::vector<float> spectrum(x);
    nspsRealFftl(spectrum.data(), order, FlagForward | layout);
    return spectrum;
}

}  // namespace

TEST(RealFftAccuracy, ForwardMatchesDirectDftForEveryOrderAndInstructionSet) {
    CaptureErrors errors;
    for (int order = 0; order <= kMaxTestedOrder; ++order) {
        const std::size_t n = std::size_t(1) << order;
        const std::vector<float> x = randomFloats(n, seed(100 + order));
        const UnitCircle u(n);
        double energy = 0.0;
        for (float v : x) energy += double(v) * v;
        const double tol = bound(order, std::sqrt(energy));  // rms of |X[k]| over all N bins is ||x||
        const std::vector<std::size_t> bins = checkedIndices(order, n / 2 + 1, 7 * order);
        std::vector<double> refRe(bins.size()), refIm(bins.size());
        for (std::size_t b = 0; b < bins.size(); ++b) dftBin(x, u, bins[b], refRe[b], refIm[b]);

        for (Isa isa : availableIsas()) {
            IsaScope scope(isa);
            SCOPED_TRACE(testing::Message() << "order " << order << ", " << isaName(isa));
            const std::vector<float> perm = forwardOf(x, order, FlagOutPerm);
            std::vector<float> pack(n);
            nspsRealFftlNip(x.data(), pack.data(), order, FlagForward | FlagOutPack);
            for (std::size_t b = 0; b < bins.size(); ++b) {
                const std::size_t k = bins[b];
                const double dr = permRe(perm.data(), n, k) - refRe[b], di = permIm(perm.data(), n, k) - refIm[b];
                ASSERT_LE(std::hypot(dr, di), tol) << "bin " << k;
                // RCPack: R[0], R[1], I[1], ..., R[N/2] at the end.
                const float packRe = (k == 0) ? pack[0] : (k == n / 2 ? pack[n - 1] : pack[2 * k - 1]);
                const float packIm = (k == 0 || k == n / 2) ? 0.0f : pack[2 * k];
                ASSERT_LE(std::hypot(packRe - refRe[b], packIm - refIm[b]), tol) << "packed bin " << k;
            }
        }
    }
    EXPECT_EQ(errors.take().calls, 0);
}

TEST(RealFftAccuracy, InverseMatchesDirectInverseForEveryOrderAndInstructionSet) {
    CaptureErrors errors;
    for (int order = 0; order <= kMaxTestedOrder; ++order) {
        const std::size_t n = std::size_t(1) << order;
        // A random RCPerm spectrum; DC and Nyquist are real by construction of the layout.
        const std::vector<float> spectrum = randomFloats(n, seed(200 + order));
        const UnitCircle u(n);
        double energy = 0.0;  // sum of |X[k]|^2 over all N bins
        for (std::size_t k = 0; k <= n / 2; ++k) {
            const double re = permRe(spectrum.data(), n, k), im = permIm(spectrum.data(), n, k);
            energy += (k == 0 || k == n / 2 ? 1.0 : 2.0) * (re * re + im * im);
        }
        if (n == 1) energy = double(spectrum[0]) * spectrum[0];
        const double rmsX = std::sqrt(energy) / double(n);  // Parseval: rms of x = ||X|| / N
        const double tol = bound(order, rmsX);
        const std::vector<std::size_t> points = checkedIndices(order, n, 11 * order);
        std::vector<double> ref(points.size());
        for (std::size_t p = 0; p < points.size(); ++p) {
            const std::size_t j = points[p];
            double sum = permRe(spectrum.data(), n, 0);
            if (n > 1) sum += (j % 2 ? -1.0 : 1.0) * permRe(spectrum.data(), n, n / 2);
            for (std::size_t k = 1; k < n / 2; ++k) {
                const std::size_t e = (j * k) % n;
                sum += 2.0 * (permRe(spectrum.data(), n, k) * u.c[e] - permIm(spectrum.data(), n, k) * u.s[e]);
            }
            ref[p] = sum / double(n);
        }
        std::vector<float> pack(n);
        pack[0] = spectrum[0];
        if (n > 1) {
            std::memcpy(pack.data() + 1, spectrum.data() + 2, (n - 2) * sizeof(float));
            pack[n - 1] = spectrum[1];
        }

        for (Isa isa : availableIsas()) {
            IsaScope scope(isa);
            SCOPED_TRACE(testing::Message() << "order " << order << ", " << isaName(isa));
            std::vector<float> x(spectrum), xPack(pack), xRaw(spectrum);
            nspsCcsFftl(x.data(), order, FlagInverse | FlagInPerm);
            nspsCcsFftl(xPack.data(), order, FlagInverse | FlagInPack);
            nspsCcsFftl(xRaw.data(), order, FlagInverse | FlagInPerm | FlagNoScale);
            for (std::size_t p = 0; p < points.size(); ++p) {
                const std::size_t j = points[p];
                ASSERT_LE(std::fabs(x[j] - ref[p]), tol) << "sample " << j;
                ASSERT_LE(std::fabs(xPack[j] - ref[p]), tol) << "sample " << j << " from RCPack";
                ASSERT_LE(std::fabs(xRaw[j] - ref[p] * double(n)), tol * double(n)) << "unscaled sample " << j;
            }
        }
    }
    EXPECT_EQ(errors.take().calls, 0);
}

TEST(RealFft, ForwardThenInverseReproducesTheInput) {
    for (int order = 0; order <= kMaxTestedOrder; ++order) {
        const std::size_t n = std::size_t(1) << order;
        const std::vector<float> x = randomFloats(n, seed(300 + order), -100.0f, 100.0f);
        double energy = 0.0;
        for (float v : x) energy += double(v) * v;
        const double tol = 2.0 * bound(order, std::sqrt(energy / double(n)));  // two transforms
        for (Isa isa : availableIsas()) {
            IsaScope scope(isa);
            std::vector<float> y(x);
            nspsRealFftl(y.data(), order, FlagForward | FlagOutPerm);
            nspsCcsFftl(y.data(), order, FlagInverse | FlagInPerm);
            double worst = 0.0;
            for (std::size_t j = 0; j < n; ++j) worst = std::max(worst, double(std::fabs(y[j] - x[j])));
            ASSERT_LE(worst, tol) << "order " << order << ", " << isaName(isa);
        }
    }
}

TEST(RealFft, UnitImpulseHasAFlatSpectrumAndComesBackScaled) {
    for (int order : {1, 2, 3, 6, 10, 13}) {
        const std::size_t n = std::size_t(1) << order;
        std::vector<float> x(n, 0.0f);
        x[0] = 1.0f;
        const std::vector<float> perm = forwardOf(x, order, FlagOutPerm);
        // RCPerm: 1, 1, then (1, 0) for every bin between.
        for (std::size_t j = 0; j < n; ++j) ASSERT_EQ(perm[j], (j < 2 || j % 2 == 0) ? 1.0f : 0.0f) << j;
        const std::vector<float> pack = forwardOf(x, order, FlagOutPack);
        // RCPack: 1, (1, 0) for every bin between, then 1.
        for (std::size_t j = 0; j < n; ++j) ASSERT_EQ(pack[j], (j == 0 || j == n - 1 || j % 2 == 1) ? 1.0f : 0.0f);

        std::vector<float> back(perm);
        nspsCcsFftl(back.data(), order, FlagInverse | FlagInPerm);
        for (std::size_t j = 0; j < n; ++j) ASSERT_NEAR(back[j], j == 0 ? 1.0f : 0.0f, 4 * kEps) << j;
        std::vector<float> raw(pack);
        nspsCcsFftl(raw.data(), order, FlagInverse | FlagInPack | FlagNoScale);
        for (std::size_t j = 0; j < n; ++j) ASSERT_NEAR(raw[j], j == 0 ? float(n) : 0.0f, 4 * kEps * n) << j;
    }
}

TEST(RealFft, OutOfPlaceMatchesInPlaceAndLeavesItsInput) {
    for (int order : {0, 1, 2, 5, 6, 7, 12, 15}) {
        const std::size_t n = std::size_t(1) << order;
        const std::vector<float> x = randomFloats(n, seed(400 + order));
        std::vector<float> in(x), out(n, -7.0f);
        nspsRealFftlNip(in.data(), out.data(), order, FlagForward | FlagOutPerm);
        EXPECT_EQ(in, x) << "input changed, order " << order;
        EXPECT_EQ(out, forwardOf(x, order, FlagOutPerm)) << "order " << order;
        // The same pointer twice is the in-place transform.
        nspsRealFftlNip(in.data(), in.data(), order, FlagForward | FlagOutPack);
        EXPECT_EQ(in, forwardOf(x, order, FlagOutPack)) << "order " << order;
    }
}

TEST(RealFft, InitOnlyBuildsAndReleaseDropsTablesWithoutChangingResults) {
    CaptureErrors errors;
    const int order = 11;
    const std::vector<float> x = randomFloats(std::size_t(1) << order, seed(500));
    const std::vector<float> before = forwardOf(x, order, FlagOutPerm);
    nspsRealFftl(nullptr, order, FlagRelease);
    nspsRealFftl(nullptr, order, FlagInitOnly);  // null data is fine: nothing is transformed
    EXPECT_EQ(forwardOf(x, order, FlagOutPerm), before);
    nspsCcsFftl(nullptr, order, FlagRelease);
    EXPECT_EQ(forwardOf(x, order, FlagOutPerm), before);  // rebuilt on use
    nspsRealFftlNip(nullptr, nullptr, order, FlagRelease);
    nspsCcsFftl(nullptr, order, FlagInitOnly);
    std::vector<float> y(before);
    nspsCcsFftl(y.data(), order, FlagInverse | FlagInPerm);
    for (std::size_t j = 0; j < x.size(); ++j) ASSERT_NEAR(y[j], x[j], 1e-5);
    EXPECT_EQ(errors.take().calls, 0);
}

TEST(RealFft, Sse2AndAvx2GiveIdenticalBits) {
    IsaScope avx(Isa::Avx2);
    if (!avx.ok()) GTEST_SKIP() << "no AVX2 on this processor";
    for (int order = 2; order <= kMaxTestedOrder; ++order) {
        const std::size_t n = std::size_t(1) << order;
        const std::vector<float> x = randomFloats(n, seed(600 + order));
        std::vector<float> f[2], b[2], p[2];
        int i = 0;
        for (Isa isa : {Isa::Sse2, Isa::Avx2}) {
            IsaScope scope(isa);
            f[i] = forwardOf(x, order, FlagOutPerm);
            b[i] = x;  // any data serve as a spectrum
            nspsCcsFftl(b[i].data(), order, FlagInverse | FlagInPerm);
            p[i] = f[i];
            nspsMpyRCPerm2(x.data(), p[i].data(), order);
            ++i;
        }
        ASSERT_EQ(std::memcmp(f[0].data(), f[1].data(), n * sizeof(float)), 0) << "forward, order " << order;
        ASSERT_EQ(std::memcmp(b[0].data(), b[1].data(), n * sizeof(float)), 0) << "inverse, order " << order;
        ASSERT_EQ(std::memcmp(p[0].data(), p[1].data(), n * sizeof(float)), 0) << "product, order " << order;
    }
}

// Several threads use an order for the first time at the same moment; each must get the result of a
// transform whose tables were built once and completely.
TEST(RealFftConcurrency, FirstUseOfOneOrderFromSeveralThreads) {
    constexpr int kThreads = 4;
    for (int order : {9, 14, 16}) {
        const std::size_t n = std::size_t(1) << order;
        const std::vector<float> x = randomFloats(n, seed(700 + order));
        const std::vector<float> expected = forwardOf(x, order, FlagOutPerm);
        std::vector<float> roundTrip(expected);
        nspsCcsFftl(roundTrip.data(), order, FlagInverse | FlagInPerm);
        for (int round = 0; round < 3; ++round) {
            nspsRealFftl(nullptr, order, FlagRelease);
            std::atomic<int> ready{0};
            std::vector<std::vector<float>> fwd(kThreads, x), inv(kThreads);
            Thread threads[kThreads];
            for (int t = 0; t < kThreads; ++t) {
                ASSERT_TRUE(threads[t].start(
                    [&, t] {
                        ready.fetch_add(1);
                        while (ready.load() < kThreads) {
                        }
                        nspsRealFftl(fwd[t].data(), order, FlagForward | FlagOutPerm);
                        inv[t] = fwd[t];
                        nspsCcsFftl(inv[t].data(), order, FlagInverse | FlagInPerm);
                    },
                    0));
            }
            for (auto& th : threads) th.join();
            for (int t = 0; t < kThreads; ++t) {
                ASSERT_EQ(fwd[t], expected) << "thread " << t << ", order " << order;
                ASSERT_EQ(inv[t], roundTrip) << "thread " << t << ", order " << order;
            }
        }
    }
}
