#include <gtest/gtest.h>

#include "presets/FactoryPresets.h"

namespace ulvetta {

TEST(FactoryPresets, FoundRegardlessOfCaseStarsAndSpacingButNeverByPart) {
    EXPECT_EQ(findFactoryPreset("LARGE ROOM *****"), 4);
    EXPECT_EQ(findFactoryPreset("  Large   Room *"), 4);
    EXPECT_EQ(findFactoryPreset("Warm Plate**"), 1);
    for (const char* name : {"", "*****", "large", "large rooms", "largeroom", "4"})
        EXPECT_EQ(findFactoryPreset(name), -1) << name;
    EXPECT_EQ(factoryPresetSlug(4), "large-room");
    EXPECT_EQ(factoryPresetSlug(8), "");
    EXPECT_EQ(factoryPresetSlug(-1), "");
}

}  // namespace ulvetta
