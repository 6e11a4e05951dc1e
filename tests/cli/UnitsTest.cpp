// The tool's library called directly: argument parsing, edits in the editor's units, response analysis.
#include <gtest/gtest.h>

#include <climits>
#include <cmath>
#include <utility>

#include "CliSetup.h"
#include "Render.h"
#include "ResponseAnalysis.h"
#include "filter/ReverbCore.h"

namespace ulvetta {
namespace {

TEST(CliSetup, NumbersAreStrict) {
    long long v = 0;
    EXPECT_TRUE(parseInteger(" -2147483648 ", INT32_MIN, INT32_MAX, v) && v == INT32_MIN);
    for (const char* bad : {"", "-", "4.0", "1e3", "0x10", "12a", "2147483648", "99999999999999999999", "- 1"})
        EXPECT_FALSE(parseInteger(bad, INT32_MIN, INT32_MAX, v)) << bad;
    EXPECT_TRUE(parseTailDb(" -1.5e1 ") == -15.0 && parseTailDb("-0") == 0.0);
    for (const char* bad : {"", "1", "1e-9", "inf", "-inf", "nan", "-1e999", "-60dB", "0x0", "-"})
        EXPECT_THROW(parseTailDb(bad), CliError) << bad;
}

// Typed values in the units the editor shows, the texts at the ends of a range, and refusals.
TEST(CliSetup, TypedValuesUseTheEditorUnits) {
    ReverbCore core;
    const std::pair<const char*, int32_t> cases[] = {
        {"Algorithm=large room", 4},      {"Algorithm=7", 7},              {"Pre Delay=1e1", 10},
        {"Output Level Dry=+6", 60},      {"Notch Gain=-.5", -5},          {"Output Level Wet=-17.3", -173},
        {"Notch Q=0.7", 7},               {"Early Reflections=-inf.", -600}, {"Output Level Dry=-Inf", -600},
        {"Low Pass Freq=Off", 10000},     {"High Pass Freq=off", 100},     {"Pre Delay=4000", 500},
        {"Meter Source=wet", 2},          {"meter source = 0", 0}};
    for (const auto& c : cases) {
        applyEdit(core, {false, c.first});
        const std::string name = c.first;
        EXPECT_EQ(core.getValue(findParameter(core, name.substr(0, name.find('=')))), c.second) << name;
    }
    applyEdit(core, {true, "12=-5"});
    EXPECT_EQ(core.getValue(kNotchFreq), 20) << "raw steps clamp like setValue";
    for (const char* bad : {"Notch Gain=", "Notch Gain=inf", "Notch Gain=nan", "Notch Gain=1,5", "Notch Gain=Off",
                            "Low Pass Freq=-Inf.", "Meter Source=loud", "Algorithm=8", "Notch Gain"})
        EXPECT_THROW(applyEdit(core, {false, bad}), CliError) << bad;
    EXPECT_THROW(applyEdit(core, {true, "1=2.5"}), CliError);
    EXPECT_EQ(core.getValue(kNotchGain), -5) << "a refused edit changes nothing";
}

// Exponentially decaying noise with a known reverberation time, from a fixed generator.
std::vector<float> decayingNoise(double t60, size_t n, uint32_t seed) {
    std::vector<float> v(n);
    for (size_t i = 0; i < n; ++i) {
        seed = seed * 1664525u + 1013904223u;
        v[i] = static_cast<float>(((seed >> 8) / 8388608.0 - 1.0) * std::pow(10.0, -3.0 * (i / 44100.0) / t60));
    }
    return v;
}

TEST(ResponseAnalysis, MeasuresAKnownDecayAndCorrelation) {
    const std::vector<float> a = decayingNoise(1.5, 3 * 44100, 1), b = decayingNoise(1.5, 3 * 44100, 2);
    const ResponseReport r = analyseResponse(a.data(), b.data(), a.size(), 44100.0);
    EXPECT_NEAR(r.t60_1k, 1.5, 0.1);
    EXPECT_NEAR(r.t60_250, 1.5, 0.15);
    EXPECT_NEAR(r.decayDbPerSecond, 40.0, 2.5);
    EXPECT_NEAR(r.tailCorrelation, 0.0, 0.05);
    EXPECT_NEAR(analyseResponse(a.data(), a.data(), a.size(), 44100.0).tailCorrelation, 1.0, 1e-9);
}

}  // namespace
}  // namespace ulvetta
