// Text reports of a core's 17 parameters: the table and JSON of "ulvetta params" and the value list of
// "ulvetta presets show".
#pragma once

#include <string>

namespace ulvetta {

class ReverbCore;

// One row per parameter: id, name, value in steps, short and full text, minimum and maximum with their
// texts, default and position 0..1.
std::string paramsTable(ReverbCore& core);
// The same as a JSON array of objects with the keys id, name, value, text, fullText, minimum, maximum,
// minText, maxText, default and position.
std::string paramsJson(ReverbCore& core);
// "Name: text" per parameter, the algorithm by its factory name and the meter source by what it shows.
std::string presetValues(ReverbCore& core);

}  // namespace ulvetta
