#include <gtest/gtest.h>

#include <climits>

#include "CliSetup.h"
#include "filter/ReverbCore.h"

namespace ulvetta {
namespace {

TEST(CliSetup, WholeNumbersAreStrict) {
    long long v = 0;
    EXPECT_TRUE(parseInteger("42", 0, 100, v));
    EXPECT_EQ(v, 42);
    EXPECT_TRUE(parseInteger(" -7 ", -10, 10, v));
    EXPECT_EQ(v, -7);
    EXPECT_TRUE(parseInteger("+3", 0, 10, v));
    EXPECT_TRUE(parseInteger("-2147483648", INT32_MIN, INT32_MAX, v));
    EXPECT_EQ(v, INT32_MIN);
    for (const char* bad : {"", "-", "4.0", "1e3", "0x10", "12a", "2147483648", "99999999999999999999", "- 1"})
        EXPECT_FALSE(parseInteger(bad, INT32_MIN, INT32_MAX, v)) << bad;
    EXPECT_FALSE(parseInteger("101", 0, 100, v));
}

TEST(CliSetup, EveryParameterIsFoundByItsNameInAnyCase) {
    ReverbCore core;
    for (int id = 0; id < kParamCount; ++id) {
        std::string name = parameterName(core, id);
        ASSERT_FALSE(name.empty()) << id;
        EXPECT_EQ(findParameter(core, name), id);
        for (char& c : name) c = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
        EXPECT_EQ(findParameter(core, "  " + name + " "), id);
    }
    EXPECT_EQ(findParameter(core, "PreDelay"), -1);
    EXPECT_EQ(findParameter(core, ""), -1);
}

TEST(CliSetup, TypedNumbersGoThroughTheCoreText) {
    ReverbCore core;
    applyEdit(core, {false, "Pre Delay=1e1"});
    EXPECT_EQ(core.getValue(kPreDelay), 10);
    applyEdit(core, {false, "Output Level Dry=+6"});
    EXPECT_EQ(core.getValue(kOutputLevelDry), 60);
    applyEdit(core, {false, "Notch Gain=-.5"});
    EXPECT_EQ(core.getValue(kNotchGain), -5);
    applyEdit(core, {true, "12=-5"});
    EXPECT_EQ(core.getValue(kNotchFreq), 20) << "raw steps clamp like setValue";
    for (const char* bad : {"Notch Gain=", "Notch Gain=inf", "Notch Gain=nan", "Notch Gain=1,5", "Notch Gain=Off",
                            "Low Pass Freq=-Inf.", "Meter Source=loud", "Algorithm=8"}) {
        EXPECT_THROW(applyEdit(core, {false, bad}), CliError) << bad;
    }
    EXPECT_EQ(core.getValue(kNotchGain), -5) << "a refused edit changes nothing";
}

}  // namespace
}  // namespace ulvetta
