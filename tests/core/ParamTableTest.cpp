#include <gtest/gtest.h>

#include <cmath>

#include "filter/ParamTable.h"

using namespace ulvetta;

namespace {

ParamDesc withValue(int32_t id, int32_t value) {
    ParamTable t;
    ParamDesc p = *t.find(id);
    p.value = value;
    return p;
}

}  // namespace

TEST(ParamText, SpecialTextsAtTheLimits) {
    EXPECT_EQ(withValue(kEarlyReflections, -600).formatValue(false), "-Inf.");
    EXPECT_EQ(withValue(kEarlyReflections, -599).formatValue(true), "-59.9");
    EXPECT_EQ(withValue(kEarlyReflections, -599).formatValue(false), "-59");
    EXPECT_EQ(withValue(kLowPassFreq, 10000).formatValue(false), "Off");
    EXPECT_EQ(withValue(kLowPassFreq, 9999).formatValue(false), "9999");
    EXPECT_EQ(withValue(kHighPassFreq, 100).formatValue(false), "Off");
    EXPECT_EQ(withValue(kNotchFreq, 20).formatValue(false), "20");
    EXPECT_EQ(withValue(kNotchFreq, 16000).formatValue(false), "16000");
}

TEST(ParamText, DecimalsAndWidth) {
    EXPECT_EQ(withValue(kOutputLevelWet, -175).formatValue(false), "-17");
    EXPECT_EQ(withValue(kOutputLevelWet, -175).formatValue(true), "-17.5");
    EXPECT_EQ(withValue(kOutputLevelWet, -180).formatValue(false), "-18");
    EXPECT_EQ(withValue(kOutputLevelWet, 60).formatValue(false), "6");
    EXPECT_EQ(withValue(kOutputLevelWet, 5).formatValue(false), "0.5");
    EXPECT_EQ(withValue(kOutputLevelWet, -5).formatValue(false), "-0.5");
    EXPECT_EQ(withValue(kNotchQ, 30).formatValue(false), "3");
    EXPECT_EQ(withValue(kNotchQ, 25).formatValue(false), "2.5");
    EXPECT_EQ(withValue(kInputGain, -123).formatValue(false), "-12");  // "-12." cut to 4, dot removed
    EXPECT_EQ(withValue(kInputGain, -123).formatValue(true), "-12.3");
    EXPECT_EQ(withValue(kPreDelay, 0).formatValue(false), "0");
    ParamDesc wide("x", "", 0, 1, 9, -2000000000, 2000000000, false, "", false, "", 0, Curve::Linear, 0, 0);
    wide.value = 1000000000;  // a whole part of 100000000 or more is shown as "-"
    EXPECT_EQ(wide.formatValue(true), "-");
    wide.value = 999999999;
    EXPECT_EQ(wide.formatValue(true), "99999999.9");
    ParamDesc two("y", "", 0, 2, 9, -10000, 10000, false, "", false, "", 0, Curve::Linear, 0, 0);
    two.value = 1205;
    EXPECT_EQ(two.formatValue(true), "12.05");
    two.value = -1230;
    EXPECT_EQ(two.formatValue(true), "-12.30");  // every fraction digit is written
}

TEST(ParamPosition, LinearAndLogTaperEnds) {
    ParamTable t;
    for (const ParamDesc& rec : t.records) {
        ParamDesc p = rec;
        p.setNormalized(0.0f);
        EXPECT_EQ(p.value, p.minimum) << p.id;
        p.setNormalized(1.0f);
        EXPECT_EQ(p.value, p.maximum) << p.id;
        EXPECT_DOUBLE_EQ(p.getNormalized(), 1.0);
    }
    ParamDesc pre = *t.find(kPreDelay);
    pre.setNormalized(0.5f);
    EXPECT_EQ(pre.value, std::lround(500 * (std::sqrt(10.0) - 1) / 9));
    EXPECT_EQ(pre.value, 120);
    ParamDesc diff = *t.find(kDiffusion);
    diff.value = 25;
    EXPECT_DOUBLE_EQ(diff.getNormalized(), 0.25);
    ParamDesc notch = *t.find(kNotchFreq);
    notch.value = 20 + (16000 - 20) / 2;
    EXPECT_NEAR(notch.getNormalized(), std::log10(1 + 999 * 0.5) / 3.0, 1e-12);
}

TEST(ParamPosition, OutOfRangePositionsAreClamped) {
    ParamDesc p = withValue(kDecay, 50);
    p.setNormalized(1.5f);
    EXPECT_EQ(p.value, 100);
    p.setNormalized(-0.2f);
    EXPECT_EQ(p.value, 0);
    p.setNormalized(std::nanf(""));
    EXPECT_EQ(p.value, 0);
}

TEST(ParamPosition, EveryValueSurvivesTheRoundTripThroughItsPosition) {
    ParamTable t;
    for (const ParamDesc& rec : t.records) {
        ParamDesc p = rec;
        for (int32_t v = p.minimum; v <= p.maximum; ++v) {
            p.value = v;
            const float pos = static_cast<float>(p.getNormalized());
            ParamDesc q = p;
            q.setNormalized(pos);
            ASSERT_EQ(q.value, v) << p.name << " at position " << pos;
        }
    }
}

TEST(ParamParse, TypedValuesInDisplayUnits) {
    EXPECT_EQ(withValue(kNotchQ, 0).parseText("2.5"), 25);
    EXPECT_EQ(withValue(kInputGain, 0).parseText("-7"), -70);
    // Read in double precision: whole steps survive.
    EXPECT_EQ(withValue(kOutputLevelWet, 0).parseText("-17.3"), -173);
    EXPECT_EQ(withValue(kNotchQ, 0).parseText("0.7"), 7);
    EXPECT_EQ(withValue(kInputGain, 0).parseText("12.56"), 125);  // between steps: truncated
    EXPECT_EQ(withValue(kInputGain, 0).parseText("-12.56"), -125);
    EXPECT_EQ(withValue(kPreDelay, 0).parseText("40 ms"), 40);
    EXPECT_EQ(withValue(kPreDelay, 0).parseText("abc"), 0);
    EXPECT_EQ(withValue(kPreDelay, 0).parseText(""), 0);
    EXPECT_EQ(withValue(kPreDelay, 0).parseText("nan"), 0);
    EXPECT_EQ(withValue(kPreDelay, 0).parseText("1e300"), INT32_MAX);
    EXPECT_EQ(withValue(kPreDelay, 0).parseText("-inf"), INT32_MIN);
}

TEST(ProgramMemoryRows, DefaultsEqualRowTwo) {
    ParamTable t;
    ProgramMemory m;
    for (int pos = 0; pos < kSoundParamCount; ++pos) EXPECT_EQ(m.rows[2][pos], t.records[pos].defaultValue) << pos;
    EXPECT_EQ(m.rows[7][3], 140);  // stored above the Damping range; loading clamps it
    EXPECT_EQ(t.records[12].id, kNotchQ);
    EXPECT_EQ(t.records[14].id, kNotchFreq);
    EXPECT_EQ(t.find(99), nullptr);
    EXPECT_EQ(t.position(12), 14);
}
