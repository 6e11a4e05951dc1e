#include <gtest/gtest.h>

#include <cmath>
#include <string>

#include "filter/ParamTable.h"

using namespace ulvetta;

namespace {

std::string text(const ParamDesc& d, int32_t value, bool full) {
    char buffer[kValueTextCapacity];
    return formatValue(d, value, full, buffer, sizeof buffer);
}

std::string text(int32_t id, int32_t value, bool full = false) { return text(*findParam(id), value, full); }

}  // namespace

TEST(ParamText, SpecialTextsDecimalsAndWidth) {
    EXPECT_EQ(text(kEarlyReflections, -600), "-Inf.");
    EXPECT_EQ(text(kEarlyReflections, -599, true), "-59.9");
    EXPECT_EQ(text(kEarlyReflections, -599), "-59");
    EXPECT_EQ(text(kLowPassFreq, 10000), "Off");
    EXPECT_EQ(text(kLowPassFreq, 9999), "9999");
    EXPECT_EQ(text(kHighPassFreq, 100), "Off");
    EXPECT_EQ(text(kNotchFreq, 20), "20");
    EXPECT_EQ(text(kNotchFreq, 16000), "16000");
    EXPECT_EQ(text(kOutputLevelWet, -175), "-17");
    EXPECT_EQ(text(kOutputLevelWet, -175, true), "-17.5");
    EXPECT_EQ(text(kOutputLevelWet, -180), "-18");
    EXPECT_EQ(text(kOutputLevelWet, 60), "6");
    EXPECT_EQ(text(kOutputLevelWet, -5), "-0.5");
    EXPECT_EQ(text(kInputGain, -123), "-12");  // "-12." cut to 4, dot removed
    EXPECT_EQ(text(kNotchQ, 25), "2.5");
    const ParamDesc wide = makeParam("x", 0, 1, 9, -2000000000, 2000000000, nullptr, nullptr, 0, Curve::Linear, 0);
    EXPECT_EQ(text(wide, 1000000000, true), "-");  // a whole part of 100000000 or more
    EXPECT_EQ(text(wide, 999999999, true), "99999999.9");
    const ParamDesc two = makeParam("y", 0, 2, 9, -10000, 10000, nullptr, nullptr, 0, Curve::Linear, 0);
    EXPECT_EQ(text(two, 1205, true), "12.05");
    EXPECT_EQ(text(two, -1230, true), "-12.30");  // every fraction digit is written
    char small[4] = {'x', 'x', 'x', 'x'};
    EXPECT_STREQ(formatValue(wide, 999999999, true, small, 3), "99");  // never beyond the caller's buffer
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
    EXPECT_DOUBLE_EQ(positionOf(*findParam(kDiffusion), 25), 0.25);
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
    EXPECT_EQ(parse(kNotchQ, "0.7"), 7);
    EXPECT_EQ(parse(kInputGain, "-12.56"), -125);  // between steps: truncated toward zero
    EXPECT_EQ(parse(kPreDelay, "40 ms"), 40);
    EXPECT_EQ(parse(kPreDelay, "abc"), 0);
    EXPECT_EQ(parse(kPreDelay, "nan"), 0);
    EXPECT_EQ(parse(kPreDelay, "1e300"), INT32_MAX);
    EXPECT_EQ(parse(kPreDelay, "-inf"), INT32_MIN);
}

TEST(ParamLookup, DefaultsAreRowTwoAndUnknownIdsHaveNoDescription) {
    const ProgramMemory m;
    for (int pos = 0; pos < kSoundParamCount; ++pos)
        EXPECT_EQ(m.rows[2][pos], findParam(kParamAtPosition[pos])->defaultValue) << pos;
    EXPECT_EQ(kParamPosition[kNotchQ], 12);
    EXPECT_EQ(findParam(kParamCount), nullptr);
    EXPECT_EQ(findParam(-1), nullptr);
    EXPECT_EQ(findParam(kDecay), &kParamTable[kDecay]);  // a view into the one table, not a copy
}
