#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <vector>

#include "ResponseAnalysis.h"
#include "engine/StoredResponses.h"

using namespace ulvetta;

namespace {

std::vector<float> channel(const StoredResponse& s, int c) {
    std::vector<float> v(s.count);
    for (int32_t i = 0; i < s.count; ++i) v[i] = s.frames[2 * i + c];
    return v;
}

// Exponentially decaying noise with a known reverberation time, from a fixed generator.
std::vector<float> decayingNoise(double t60, size_t n, uint32_t seed) {
    std::vector<float> v(n);
    uint32_t s = seed;
    for (size_t i = 0; i < n; ++i) {
        s = s * 1664525u + 1013904223u;
        const double u = (s >> 8) / 8388608.0 - 1.0;
        v[i] = static_cast<float>(u * std::pow(10.0, -3.0 * (i / 44100.0) / t60));
    }
    return v;
}

}  // namespace

TEST(ResponseAnalysis, MeasuresAKnownDecayAndCorrelation) {
    const std::vector<float> a = decayingNoise(1.5, 3 * 44100, 1), b = decayingNoise(1.5, 3 * 44100, 2);
    const ResponseReport r = analyseResponse(a.data(), b.data(), a.size(), 44100.0);
    EXPECT_NEAR(r.t60_1k, 1.5, 0.1);
    EXPECT_NEAR(r.t60_250, 1.5, 0.15);
    EXPECT_NEAR(r.decayDbPerSecond, 40.0, 2.5);
    EXPECT_NEAR(r.tailCorrelation, 0.0, 0.05);
    const ResponseReport same = analyseResponse(a.data(), a.data(), a.size(), 44100.0);
    EXPECT_NEAR(same.tailCorrelation, 1.0, 1e-9);
}

TEST(StoredResponses, LengthsOrderAndBytes) {
    EXPECT_EQ(storedResponseBytes(), (104830u + 135168u + 103898u) * 8u);
    EXPECT_EQ(storedResponse(5).count, 104830);
    EXPECT_EQ(storedResponse(4).count, 135168);
    EXPECT_EQ(storedResponse(3).count, 103898);
    EXPECT_EQ(storedResponse(5).frames, storedResponseAt(0).frames);
    EXPECT_EQ(storedResponse(4).frames, storedResponseAt(0).frames + 2 * 104830);
    EXPECT_EQ(storedResponse(2).frames, nullptr);
}

// They must sound like rooms: a direct arrival and distinct early reflections, a tail whose highs die
// faster than its lows, 22 to 35 dB of decay per second, weakly correlated ears.
TEST(StoredResponses, HaveTheCharacterOfRealRooms) {
    const double peaks[3] = {0.30, 0.064, 0.060};
    for (int i = 0; i < 3; ++i) {
        SCOPED_TRACE(i);
        const StoredResponse s = storedResponseAt(i);
        const std::vector<float> l = channel(s, 0), r = channel(s, 1);
        const ResponseReport rep = analyseResponse(l.data(), r.data(), l.size(), 44100.0);
        EXPECT_NEAR(rep.peak, peaks[i], 1e-6);
        EXPECT_GE(rep.decayDbPerSecond, 22.0);
        EXPECT_LE(rep.decayDbPerSecond, 35.0);
        EXPECT_GT(rep.t60_250, rep.t60_1k);
        EXPECT_GT(rep.t60_1k, rep.t60_4k);
        EXPECT_LT(std::fabs(rep.tailCorrelation), 0.3);
        // Loudness: the gain for a noise-like input, sqrt(sum h^2), stays near unity, so that the factory
        // settings (wet -10 to -12 dB, dry 0 dB) do not drive full-scale material into clipping.
        double energy = 0.0;
        for (float v : l) energy += double(v) * v;
        EXPECT_GT(std::sqrt(energy), 0.4);
        EXPECT_LT(std::sqrt(energy), 1.5);
        // Energy from the very first frame; early reflections stand out of the first 80 ms.
        EXPECT_NE(l[0], 0.0f);
        int spikes = 0;
        for (int n = 100; n < 3528; ++n) {
            double local = 0.0;
            for (int k = n - 50; k < n + 50; ++k) local += std::fabs(l[k]);
            if (std::fabs(l[n]) > 6.0 * local / 100.0) ++spikes;
        }
        EXPECT_GE(spikes, 4);
    }
    // The large room ends in a stretch of exact zeros; the others sound to their last frames.
    const StoredResponse large = storedResponseAt(1);
    int zeros = 0;
    for (int32_t n = large.count - 1; n >= 0 && large.frames[2 * n] == 0.0f && large.frames[2 * n + 1] == 0.0f; --n)
        ++zeros;
    EXPECT_GE(zeros, 1000);
    EXPECT_LT(zeros, 20000);
}
