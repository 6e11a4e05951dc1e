#pragma once
// The LV2 plugin's ports: stereo audio, one control input per parameter in the units the renderer shows,
// and the meter, load and latency outputs. Shared by the plugin and the Turtle writer so that the
// description always matches the code.
#include <cmath>
#include <cstdint>
#include <cstdio>

#include "filter/ParamTable.h"

namespace ulvetta::lv2 {

// The plugin's identifier: a URN, so it names no web address.
inline constexpr const char* kPluginUri = "urn:ulvetta:reverb";
// The X11 user interface.
inline constexpr const char* kUiUri = "urn:ulvetta:reverb#ui";
// The state key of the 88-byte settings record.
inline constexpr const char* kSettingsKey = "urn:ulvetta:reverb#settings";

enum Port : uint32_t {
  kInLeft = 0,
  kInRight = 1,
  kOutLeft = 2,
  kOutRight = 3,
  kFirstParam = 4,  // parameter id i is port kFirstParam + i, i = 0..16
  kMeter = kFirstParam + kParamCount,
  kLoad,
  kLatency,
  kPortCount,
};

constexpr uint32_t paramPort(int32_t id) { return kFirstParam + static_cast<uint32_t>(id); }

// Port symbols, by parameter id.
inline constexpr const char* kParamSymbols[kParamCount] = {
    "diffusion", "pre_delay", "decay",     "damping",    "room_size",  "early_reflections",
    "wet",       "dry",       "colour",    "input_gain", "low_pass",   "high_pass",
    "notch_freq", "notch_gain", "notch_q", "algorithm",  "meter_source",
};

// Port names (the algorithm and meter source have no name in the parameter table).
inline const char* paramPortName(int32_t id) {
  if (id == kAlgorithm) return "Algorithm";
  if (id == kMeterSource) return "Meter Source";
  return kParamTable[id].name;
}

// A value in steps as the port shows it: the algorithm and meter source by index, every other parameter in
// its shown units (steps divided by 10 to the number of implied decimals).
inline double portValueOf(int32_t id, int32_t steps) {
  if (id == kAlgorithm || id == kMeterSource) return steps;
  return steps / kParamTable[id].scale;
}

// The value in steps that a port's reading means, exactly as the renderer reads a --set text: the algorithm
// and meter source by index, every other parameter as the text of the reading in its shown units. A
// non-finite reading means the default.
inline int32_t stepsOfPortValue(int32_t id, float reading) {
  const ParamDesc& d = kParamTable[id];
  if (!std::isfinite(reading)) return d.defaultValue;
  if (id == kAlgorithm || id == kMeterSource) return clampValue(d, static_cast<int32_t>(std::lround(reading)));
  char text[kValueTextCapacity];
  std::snprintf(text, sizeof text, "%.9g", static_cast<double>(reading));
  return clampValue(d, parseValueText(d, text));
}

}  // namespace ulvetta::lv2
