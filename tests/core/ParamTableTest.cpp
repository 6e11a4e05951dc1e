#include <gtest/gtest.h>

#include <cmath>
#include <string>

#include "filter/ParamTable.h"

using namespace ulvetta;

namespace {

std::string text(int32_t id, int32_t value, bool full = false) {
    char buffer[kValueTextCapacity];
    return formatValue(*findParam(id), value, full, buffer, sizeof buffer);
}

}  // namespace

TEST(ParamText, SpecialTextsDecimalsAndWidth) {
    EXPECT_EQ(text(kEarlyReflections, -600) + " " + text(kEarlyReflections, -599, true), "-Inf. -59.9");
    EXPECT_EQ(text(kLowPassFreq, 10000) + text(kHighPassFreq, 100), "OffOff");
    EXPECT_EQ(text(kNotchFreq, 20) + " " + text(kNotchFreq, 16000), "20 16000");
    EXPECT_EQ(text(kOutputLevelWet, -175) + " " + text(kOutputLevelWet, -175, true), "-17 -17.5");
    EXPECT_EQ(text(kOutputLevelWet, -180) + " " + text(kOutputLevelWet, 60), "-18 6");
    EXPECT_EQ(text(kOutputLevelWet, -5) + " " + text(kInputGain, -123), "-0.5 -12");  // "-12." cut, dot removed
    char small[4] = {'x', 'x', 'x', 'x'};
    EXPECT_STREQ(formatValue(*findParam(kNotchFreq), 16000, true, small, 3), "16");  // within the buffer
    EXPECT_EQ(small[3], 'x');
}

TEST(ParamPosition, EndsAndTaper) {
    for (const ParamDesc& d : kParamTable) {
        EXPECT_EQ(valueAtPosition(d, 0.0f), d.minimum) << d.id;
        EXPECT_EQ(valueAtPosition(d, 1.0f), d.maximum) << d.id;
        EXPECT_DOUBLE_EQ(positionOf(d, d.maximum), 1.0) << d.id;
        EXPECT_EQ(valueAtPosition(d, 1.5f), d.maximum) << d.id;
        EXPECT_EQ(valueAtPosition(d, -0.2f), d.minimum) << d.id;
        EXPECT_EQ(valueAtPosition(d, std::nanf("")), d.minimum) << d.id;
    }
    EXPECT_EQ(valueAtPosition(*findParam(kPreDelay), 0.5f), std::lround(500 * (std::sqrt(10.0) - 1) / 9));
    EXPECT_NEAR(positionOf(*findParam(kNotchFreq), 20 + (16000 - 20) / 2), std::log10(1 + 999 * 0.5) / 3.0, 1e-12);
}

TEST(ParamPosition, EveryValueSurvivesTheRoundTripThroughItsPosition) {
    for (const ParamDesc& d : kParamTable)
        for (int32_t v = d.minimum; v <= d.maximum; ++v)
            ASSERT_EQ(valueAtPosition(d, static_cast<float>(positionOf(d, v))), v) << d.name;
}

TEST(ParamParse, TypedValuesInShownUnits) {
    auto parse = [](int32_t id, const char* t) { return parseValueText(*findParam(id), t); };
    EXPECT_EQ(parse(kNotchQ, "2.5"), 25);
    EXPECT_EQ(parse(kInputGain, "-7"), -70);
    EXPECT_EQ(parse(kOutputLevelWet, "-17.3"), -173);  // whole steps survive the scaling
    EXPECT_EQ(parse(kInputGain, "-12.56"), -125);  // between steps: truncated toward zero
    EXPECT_EQ(parse(kPreDelay, "40 ms"), 40);
    EXPECT_EQ(parse(kPreDelay, "abc") + parse(kPreDelay, "nan"), 0);
    EXPECT_EQ(parse(kPreDelay, "1e300"), INT32_MAX);
    EXPECT_EQ(parse(kPreDelay, "-inf"), INT32_MIN);
}

TEST(ParamLookup, DefaultsAreRowTwoAndUnknownIdsHaveNoDescription) {
    const ProgramMemory m;
    for (int pos = 0; pos < kSoundParamCount; ++pos)
        EXPECT_EQ(m.rows[2][pos], findParam(kParamAtPosition[pos])->defaultValue) << pos;
    EXPECT_TRUE(findParam(kParamCount) == nullptr && findParam(-1) == nullptr);
}
