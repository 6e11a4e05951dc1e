#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include "filter/CoreState.h"
#include "filter/ReverbCore.h"

using namespace ulvetta;

namespace {

void put(std::vector<uint8_t>& b, int offset, int32_t v) { putLe32(b.data() + offset, static_cast<uint32_t>(v)); }

}  // namespace

TEST(CoreStateBytes, DefaultRecordByteForByte) {
    ReverbCore c;
    EXPECT_EQ(c.stateSize(), 88);
    std::vector<uint8_t> b(88, 0xEE);
    ASSERT_TRUE(c.saveState(b.data()));
    // Hand-written: size, GUID, then the defaults in table-position order.
    const uint8_t head[20] = {88, 0, 0, 0, 0x24, 0xa5, 0x18, 0x38, 0x15, 0x3f, 0xd5, 0x11, 0x9e, 0xda, 0x00, 0x10,
                              0xb5, 0x07, 0x1e, 0x57};
    EXPECT_EQ(std::memcmp(b.data(), head, 20), 0);
    const int32_t values[17] = {100, 32, 47, 30, 46, 0, -180, 0, 56, 0, 10000, 125, 30, 0, 2000, 2, 1};
    for (int i = 0; i < 17; ++i) {
        const uint8_t* p = b.data() + 20 + 4 * i;
        const int32_t v = static_cast<int32_t>(p[0] | p[1] << 8 | p[2] << 16 | static_cast<uint32_t>(p[3]) << 24);
        EXPECT_EQ(v, values[i]) << "offset " << 20 + 4 * i;
    }
    // -180 little-endian two's complement.
    EXPECT_EQ(b[44], 0x4c);
    EXPECT_EQ(b[47], 0xff);
}

TEST(CoreStateBytes, RoundTripIntoAFreshCore) {
    ReverbCore a;
    a.setValue(kAlgorithm, 6);
    a.setValue(kNotchQ, 12);
    a.setValue(kNotchFreq, 555);
    a.setValue(kNotchGain, -33);
    a.setValue(kMeterSource, 0);
    a.setValue(kInputGain, -77);
    std::vector<uint8_t> blob(88);
    a.saveState(blob.data());
    EXPECT_EQ(getLe32(blob.data() + 68), 12u);   // Notch Q
    EXPECT_EQ(getLe32(blob.data() + 76), 555u);  // Notch Freq
    ReverbCore b;
    ASSERT_TRUE(b.loadState(blob.data(), 88));
    for (int32_t id = 0; id < kParamCount; ++id) EXPECT_EQ(b.getValue(id), a.getValue(id)) << id;
    std::vector<uint8_t> again(88);
    b.saveState(again.data());
    EXPECT_EQ(blob, again);
}

TEST(CoreStateBytes, LoadingClampsAndSwitchesAlgorithmFirst) {
    ReverbCore c;
    c.setValue(kDecay, 12);  // edited while algorithm 2 is current
    std::vector<uint8_t> blob(88);
    c.saveState(blob.data());
    put(blob, 32, 140);  // Damping above its range
    put(blob, 80, 5);    // Algorithm 5
    ReverbCore d;
    d.setValue(kDecay, 61);
    ASSERT_TRUE(d.loadState(blob.data(), 88));
    EXPECT_EQ(d.getValue(kDamping), 99);
    EXPECT_EQ(d.getValue(kAlgorithm), 5);
    EXPECT_EQ(d.getValue(kDecay), 12);  // the file's values win over row 5
    d.setValue(kAlgorithm, 2);
    EXPECT_EQ(d.getValue(kDecay), 61);  // algorithm 2's row holds what was current before the load
}

TEST(CoreStateBytes, InvalidRecordsChangeNothing) {
    ReverbCore c;
    std::vector<uint8_t> good(89);
    c.saveState(good.data());
    ReverbCore d;
    d.setValue(kDecay, 3);
    std::vector<uint8_t> badGuid = good;
    badGuid[10] ^= 1;
    std::vector<uint8_t> badSize = good;
    put(badSize, 0, 92);
    EXPECT_FALSE(d.validateState(badGuid.data(), 88));
    EXPECT_FALSE(d.loadState(badGuid.data(), 88));
    EXPECT_FALSE(d.loadState(badSize.data(), 88));  // size field disagrees with the length
    EXPECT_FALSE(d.loadState(good.data(), 89));     // one byte more
    EXPECT_FALSE(d.loadState(good.data(), 87));
    EXPECT_FALSE(d.loadState(nullptr, 88));
    put(badSize, 0, 16);
    EXPECT_FALSE(d.loadState(badSize.data(), 16));
    EXPECT_TRUE(d.validateState(good.data(), 88));
    EXPECT_EQ(d.getValue(kDecay), 3);
}
