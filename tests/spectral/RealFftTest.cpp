// The real FFT against a direct transform in double precision for every order and instruction set, out-of-place
// use, the vector sets against each other bit for bit, and the table cache under concurrent first use.
#include <atomic>
#include <cstring>

#include "SpectralTestSupport.h"
#include "platform/Thread.h"

using namespace ulvetta;
using namespace spectral_test;
using spectral::Isa;

namespace {

constexpr int kMaxOrder = 17;

// The bins (forward) or samples (inverse) checked directly: all of them up to order 11, above that every
// 997th, so that the direct O(N) sums stay cheap.
std::vector<std::size_t> checked(std::size_t count) {
    std::vector<std::size_t> idx;
    for (std::size_t k = 0; k < count; k += count > 2049 ? 997 : 1) idx.push_back(k);
    idx.push_back(count - 1);
    return idx;
}

// Error allowed per value: a few float rounding units per stage, relative to the rms of the exact output.
double bound(int order, double rmsOut) { return 2.0 * kEps * (order + 1) * rmsOut; }

std::vector<float> forwardOf(const std::vector<float>& x, int order, int layout) {
    std::vector<float> spectrum(x);
    nspsRealFftl(spectrum.data(), order, FlagForward | layout);
    return spectrum;
}

}  // namespace

// Forward: every checked bin of the perm and pack layouts against a direct DFT of random data. Inverse: a
// random RCPerm spectrum (DC and Nyquist real by layout), and the same in RCPack, scaled and unscaled,
// against the direct inverse sum.
TEST(RealFft, ForwardAndInverseMatchDirectTransformsForEveryOrderAndInstructionSet) {
    for (int order = 0; order <= kMaxOrder; ++order) {
        const std::size_t n = std::size_t(1) << order;
        const UnitCircle u(n);
        const std::vector<float> x = randomFloats(n, seed(100 + order)), spectrum = randomFloats(n, seed(200 + order));
        const std::vector<std::size_t> bins = checked(n / 2 + 1), points = checked(n);
        double energy = 0.0, spectrumEnergy = n == 1 ? double(spectrum[0]) * spectrum[0] : 0.0;
        for (float v : x) energy += double(v) * v;
        for (std::size_t k = 0; n > 1 && k <= n / 2; ++k) {
            const double re = permRe(spectrum.data(), n, k), im = permIm(spectrum.data(), n, k);
            spectrumEnergy += (k == 0 || k == n / 2 ? 1.0 : 2.0) * (re * re + im * im);  // over all N bins
        }
        const double tolForward = bound(order, std::sqrt(energy));  // rms of |X[k]| over all N bins is ||x||
        const double tolInverse = bound(order, std::sqrt(spectrumEnergy) / double(n));  // Parseval
        std::vector<double> re(bins.size()), im(bins.size()), ref(points.size());
        for (std::size_t b = 0; b < bins.size(); ++b)
            for (std::size_t j = 0; j < n; ++j) {
                re[b] += double(x[j]) * u.c[(j * bins[b]) % n];
                im[b] -= double(x[j]) * u.s[(j * bins[b]) % n];
            }
        for (std::size_t p = 0; p < points.size(); ++p) {
            const std::size_t j = points[p];
            double sum = spectrum[0] + (n > 1 ? (j % 2 ? -1.0 : 1.0) * spectrum[1] : 0.0);
            for (std::size_t k = 1; k < n / 2; ++k)
                sum += 2.0 * (spectrum[2 * k] * u.c[(j * k) % n] - spectrum[2 * k + 1] * u.s[(j * k) % n]);
            ref[p] = sum / double(n);
        }
        std::vector<float> pack(n);  // the same spectrum in RCPack: R[0], R[1], I[1], ..., R[N/2]
        pack[0] = spectrum[0];
        if (n > 1) {
            std::memcpy(pack.data() + 1, spectrum.data() + 2, (n - 2) * sizeof(float));
            pack[n - 1] = spectrum[1];
        }
        std::vector<float> vectorResults;  // forward, inverse and product of the first vector set, end to end
        for (Isa isa : availableIsas()) {
            IsaScope scope(isa);
            SCOPED_TRACE(testing::Message() << "order " << order << ", instruction set " << int(isa));
            const std::vector<float> perm = forwardOf(x, order, FlagOutPerm), packed = forwardOf(x, order, FlagOutPack);
            std::vector<float> in(x), outOfPlace(n, -7.0f);  // the input stays, the result is the in-place one
            nspsRealFftlNip(in.data(), outOfPlace.data(), order, FlagForward | FlagOutPerm);
            ASSERT_TRUE(in == x && outOfPlace == perm);
            for (std::size_t b = 0; b < bins.size(); ++b) {
                const std::size_t k = bins[b];
                const float packRe = (k == 0) ? packed[0] : (k == n / 2 ? packed[n - 1] : packed[2 * k - 1]);
                const float packIm = (k == 0 || k == n / 2) ? 0.0f : packed[2 * k];
                ASSERT_LE(std::hypot(permRe(perm.data(), n, k) - re[b], permIm(perm.data(), n, k) - im[b]), tolForward)
                    << "bin " << k;
                ASSERT_LE(std::hypot(packRe - re[b], packIm - im[b]), tolForward) << "packed bin " << k;
            }
            std::vector<float> y(spectrum), yPack(pack), yRaw(spectrum);
            nspsCcsFftl(y.data(), order, FlagInverse | FlagInPerm);
            nspsCcsFftl(yPack.data(), order, FlagInverse | FlagInPack);
            nspsCcsFftl(yRaw.data(), order, FlagInverse | FlagInPerm | FlagNoScale);
            for (std::size_t p = 0; p < points.size(); ++p) {
                const std::size_t j = points[p];
                ASSERT_LE(std::fabs(y[j] - ref[p]), tolInverse) << "sample " << j;
                ASSERT_LE(std::fabs(yPack[j] - ref[p]), tolInverse) << "sample " << j << " from RCPack";
                ASSERT_LE(std::fabs(yRaw[j] - ref[p] * double(n)), tolInverse * double(n)) << "unscaled " << j;
            }
            // The vector sets agree bit for bit, so that every processor gives the same sound.
            std::vector<float> results(perm);
            nspsMpyRCPerm2(x.data(), results.data(), order);
            results.insert(results.end(), perm.begin(), perm.end());
            results.insert(results.end(), y.begin(), y.end());
            if (isa != Isa::Scalar && vectorResults.empty()) vectorResults = results;
            ASSERT_TRUE(isa == Isa::Scalar || results == vectorResults);
        }
    }
    EXPECT_EQ(nspGetErrStatus(), NspStsOk);
}

// Several threads use an order for the first time at once; each must get the result of a transform whose
// tables were built once and completely.
TEST(RealFft, FirstUseOfOneOrderFromSeveralThreads) {
    constexpr int kThreads = 4;
    for (int order : {9, 14, 16}) {
        const std::vector<float> x = randomFloats(std::size_t(1) << order, seed(700 + order));
        const std::vector<float> expected = forwardOf(x, order, FlagOutPerm);
        for (int round = 0; round < 3; ++round) {
            nspsRealFftl(nullptr, order, FlagRelease);
            std::atomic<int> ready{0};
            std::vector<std::vector<float>> out(kThreads, x);
            Thread threads[kThreads];
            for (int t = 0; t < kThreads; ++t)
                ASSERT_TRUE(threads[t].start(
                    [&, t] {
                        ready.fetch_add(1);
                        while (ready.load() < kThreads) {
                        }
                        nspsRealFftl(out[t].data(), order, FlagForward | FlagOutPerm);
                    },
                    0));
            for (auto& th : threads) th.join();
            for (int t = 0; t < kThreads; ++t) ASSERT_EQ(out[t], expected) << "thread " << t << ", order " << order;
        }
    }
}
