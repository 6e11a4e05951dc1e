#include <gtest/gtest.h>

#include "presets/FactoryPresets.h"

namespace ulvetta {
namespace {

TEST(FactoryPresets, FoundRegardlessOfCaseStarsAndSpacing) {
    EXPECT_EQ(findFactoryPreset("LARGE ROOM *****"), 4);
    EXPECT_EQ(findFactoryPreset("large room"), 4);
    EXPECT_EQ(findFactoryPreset("  Large   Room *"), 4);
    EXPECT_EQ(findFactoryPreset("classic plate"), 0);
    EXPECT_EQ(findFactoryPreset("Warm Plate**"), 1);
    EXPECT_EQ(findFactoryPreset("diffused delay"), 7);
}

TEST(FactoryPresets, PartialOrUnknownNamesAreNotFound) {
    EXPECT_EQ(findFactoryPreset(""), -1);
    EXPECT_EQ(findFactoryPreset("*****"), -1);
    EXPECT_EQ(findFactoryPreset("large"), -1);
    EXPECT_EQ(findFactoryPreset("large rooms"), -1);
    EXPECT_EQ(findFactoryPreset("largeroom"), -1);
    EXPECT_EQ(findFactoryPreset("4"), -1);
}

TEST(FactoryPresets, SlugsAreFileNameFriendly) {
    EXPECT_EQ(factoryPresetSlug(0), "classic-plate");
    EXPECT_EQ(factoryPresetSlug(4), "large-room");
    EXPECT_EQ(factoryPresetSlug(7), "diffused-delay");
    EXPECT_EQ(factoryPresetSlug(8), "");
    EXPECT_EQ(factoryPresetSlug(-1), "");
}

}  // namespace
}  // namespace ulvetta
