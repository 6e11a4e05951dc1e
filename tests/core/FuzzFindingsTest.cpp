// Regression cases for inputs the fuzz targets (tests/fuzz) found mishandled; under the asan preset an
// overflow in any of them fails the case.
#include <gtest/gtest.h>

#include <climits>
#include <vector>

#include "filter/Automation.h"
#include "filter/MediaFormat.h"

using namespace ulvetta;

TEST(FuzzFindings, ReferenceTimesOfAnySizeGiveOrderedBoundedPositions) {
    EXPECT_EQ(refTimeToSamples(10'000'000, 44100), 44100);  // 1 s
    EXPECT_EQ(refTimeToSamples(-19'999, 1000), -1);         // -1.9999 ms: truncated at each division
    // (time / 10000) * rate overflowed for times beyond about 139 days at 768 kHz; such times now give
    // INT64_MAX / 1000 with their sign, and the order of times is kept across the boundary.
    const int64_t top = INT64_MAX / 1000;
    const int64_t lastMs = INT64_MAX / 768000;
    EXPECT_EQ(refTimeToSamples(lastMs * 10000, 768000), lastMs * 768000 / 1000);
    EXPECT_EQ(refTimeToSamples((lastMs + 1) * 10000, 768000), top);
    EXPECT_EQ(refTimeToSamples(INT64_MAX, 768000), top);
    EXPECT_EQ(refTimeToSamples(INT64_MIN, 768000), -top);
    EXPECT_LT(lastMs * 768000 / 1000, top);

    // A segment over the whole time line is active for a block at its far end.
    Automation automation;
    automation.setSampleRate(768000);
    const EnvelopeSegment all{0, refTimeToSamples(INT64_MIN, 768000), refTimeToSamples(INT64_MAX, 768000),
                              0.0f, 1.0f, false};
    automation.add(kDecay, kDecay, &all, 1);
    EXPECT_TRUE(automation.beginBlock(top - 100, 8192));
}

TEST(FuzzFindings, TheStereoCopyOfA17ByteFormatBlockStaysInsideIt) {
    // Mono 16-bit PCM at 44100 Hz with one byte of the extension's size: the copy offered downstream wrote
    // two bytes there.
    std::vector<uint8_t> block = {1, 0, 1, 0, 0x44, 0xac, 0, 0, 0x88, 0x58, 1, 0, 2, 0, 16, 0, 0x7f};
    makeStereoBlock(block.data(), block.size());
    // Two channels, 176400 bytes a second, 4-byte frames, the byte of the extension's size cleared.
    const std::vector<uint8_t> stereo = {1, 0, 2, 0, 0x44, 0xac, 0, 0, 0x10, 0xb1, 2, 0, 4, 0, 16, 0, 0};
    EXPECT_EQ(block, stereo);
}
