#include <gtest/gtest.h>

#include "presets/FactoryPresets.h"

TEST(FactoryPresets, FoundRegardlessOfCaseStarsAndSpacingButNeverByPart) {
    EXPECT_EQ(ulvetta::findFactoryPreset("  Large   Room *"), 4);
    for (const char* name : {"", "*****", "large", "large rooms", "largeroom", "4"})
        EXPECT_EQ(ulvetta::findFactoryPreset(name), -1) << name;
    EXPECT_EQ(ulvetta::factoryPresetSlug(4) + ulvetta::factoryPresetSlug(8), "large-room");
}
