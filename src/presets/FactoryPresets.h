// The eight factory presets: the values of the Algorithm parameter with their names. Selecting one is
// setValue(kAlgorithm, index) on the core; this file only finds presets by name.
#pragma once

#include <string>

namespace ulvetta {

// Index 0..7 of the factory preset that name means, or -1. Letter case does not matter, nor do the
// stars that close each name, nor runs of spaces: "large room", "LARGE ROOM *****" and "Large  Room *"
// all give 4.
int findFactoryPreset(const std::string& name);

// The name of factory preset index in lower case without its stars, spaces as '-', for use in file
// names ("large-room"); empty for an index outside 0..7.
std::string factoryPresetSlug(int index);

}  // namespace ulvetta
