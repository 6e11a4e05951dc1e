#include <gtest/gtest.h>

#include <vector>

#include "filter/CoreState.h"
#include "filter/ReverbCore.h"

using namespace ulvetta;

namespace {

std::vector<uint8_t> saved(ReverbCore& c) {
    std::vector<uint8_t> b(kCoreStateSize, 0xEE);
    EXPECT_TRUE(c.saveState(b.data()));
    return b;
}

}  // namespace

TEST(CoreStateBytes, DefaultRecordByteForByte) {
    ReverbCore c;
    // Hand-written: size, GUID, then the defaults in table-position order (Notch Q before Notch Freq).
    const std::vector<uint8_t> head = {88, 0, 0, 0, 0x24, 0xa5, 0x18, 0x38, 0x15, 0x3f,
                                       0xd5, 0x11, 0x9e, 0xda, 0x00, 0x10, 0xb5, 0x07, 0x1e, 0x57};
    const int32_t values[17] = {100, 32, 47, 30, 46, 0, -180, 0, 56, 0, 10000, 125, 30, 0, 2000, 2, 1};
    std::vector<uint8_t> expected = head;
    for (int32_t v : values)
        for (int shift = 0; shift < 32; shift += 8) expected.push_back(static_cast<uint8_t>(static_cast<uint32_t>(v) >> shift));
    EXPECT_EQ(saved(c), expected);
}

TEST(CoreStateBytes, RoundTripSwitchesAlgorithmFirstAndClamps) {
    ReverbCore a;
    a.setValue(kAlgorithm, 6);
    for (auto [id, v] : {std::pair{kNotchQ, 12}, {kNotchFreq, 555}, {kNotchGain, -33}, {kMeterSource, 0}})
        a.setValue(id, v);
    std::vector<uint8_t> blob = saved(a);
    EXPECT_EQ(getLe32(blob.data() + 68), 12u);  // Notch Q
    ReverbCore b;
    b.setValue(kDecay, 61);  // edited while algorithm 2 is current
    ASSERT_TRUE(b.loadState(blob.data(), kCoreStateSize));
    EXPECT_EQ(saved(b), blob);
    b.setValue(kAlgorithm, 2);
    EXPECT_EQ(b.getValue(kDecay), 61);  // algorithm 2's row holds what was current before the load
    putLe32(blob.data() + 32, 140);     // Damping above its range
    ASSERT_TRUE(b.loadState(blob.data(), kCoreStateSize));
    EXPECT_EQ(b.getValue(kDamping), 99);
}

TEST(CoreStateBytes, InvalidRecordsChangeNothing) {
    ReverbCore c;
    std::vector<uint8_t> good = saved(c);
    good.push_back(0);
    ReverbCore d;
    d.setValue(kDecay, 3);
    std::vector<uint8_t> badGuid = good, badSize = good;
    badGuid[10] ^= 1;
    putLe32(badSize.data(), 92);
    EXPECT_FALSE(d.loadState(badGuid.data(), 88));
    EXPECT_FALSE(d.loadState(badSize.data(), 88));  // size field disagrees with the length
    EXPECT_FALSE(d.loadState(good.data(), 89));     // one byte more
    EXPECT_FALSE(d.loadState(good.data(), 87));
    EXPECT_FALSE(d.loadState(nullptr, 88));
    putLe32(badSize.data(), 16);
    EXPECT_FALSE(d.loadState(badSize.data(), 16));
    EXPECT_TRUE(d.validateState(good.data(), 88));
    EXPECT_EQ(d.getValue(kDecay), 3);
}
