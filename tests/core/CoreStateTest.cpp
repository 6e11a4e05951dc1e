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
    std::vector<uint8_t> expected = {88,   0,    0,    0,    0x24, 0xa5, 0x18, 0x38, 0x15, 0x3f,
                                     0xd5, 0x11, 0x9e, 0xda, 0x00, 0x10, 0xb5, 0x07, 0x1e, 0x57};
    const int32_t values[17] = {100, 32, 47, 30, 46, 0, -180, 0, 56, 0, 10000, 125, 30, 0, 2000, 2, 1};
    for (uint32_t v : values)
        for (int shift = 0; shift < 32; shift += 8) expected.push_back(static_cast<uint8_t>(v >> shift));
    EXPECT_EQ(saved(c), expected);
}

TEST(CoreStateBytes, RoundTripSwitchesAlgorithmFirstAndClamps) {
    ReverbCore a;
    a.setValue(kAlgorithm, 6);
    for (auto [id, v] : {std::pair{kNotchQ, 12}, {kNotchFreq, 555}, {kNotchGain, -33}, {kMeterSource, 0}})
        a.setValue(id, v);
    std::vector<uint8_t> blob = saved(a);
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
    std::vector<uint8_t> good = saved(c), badGuid = good, badSize = good;
    good.push_back(0);
    badGuid[10] ^= 1;
    putLe32(badSize.data(), 92);  // size field disagrees with the length
    c.setValue(kDecay, 3);
    for (const auto& [record, size] : {std::pair{badGuid.data(), 88}, {badSize.data(), 88}, {good.data(), 89},
                                       {good.data(), 87}, {static_cast<uint8_t*>(nullptr), 88}})
        EXPECT_FALSE(c.loadState(record, size)) << size;
    EXPECT_TRUE(c.validateState(good.data(), 88));
    EXPECT_EQ(c.getValue(kDecay), 3);
}
