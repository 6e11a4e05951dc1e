// The parameter model: one constant ParamDesc per control (its range, text and 0..1 position rules),
// the table of all 17 indexed by id, the functions that map a value to text and position and back, and
// the per-algorithm memory of the 15 sound parameters. The live values are held by ReverbCore.
// Pure data and pure functions: nothing here locks or allocates.
#pragma once

#include <cstddef>
#include <cstdint>

namespace ulvetta {

constexpr int kParamCount = 17;
constexpr int kSoundParamCount = 15;
constexpr int kAlgorithmCount = 8;

// Parameter ids.
enum ParamId : int32_t {
    kDiffusion = 0,
    kPreDelay = 1,
    kDecay = 2,
    kDamping = 3,
    kRoomSize = 4,
    kEarlyReflections = 5,
    kOutputLevelWet = 6,
    kOutputLevelDry = 7,
    kColour = 8,
    kInputGain = 9,
    kLowPassFreq = 10,
    kHighPassFreq = 11,
    kNotchFreq = 12,
    kNotchGain = 13,
    kNotchQ = 14,
    kAlgorithm = 15,
    kMeterSource = 16,
};

enum class Curve : int32_t { Linear = 0, LogTaper = 1 };

// What a parameter is; its value lives elsewhere. Values are integer steps.
struct ParamDesc {
    const char* name;
    const char* label;
    int32_t decimals;      // implied decimal digits of the shown number
    int32_t displayWidth;  // characters of the short text
    int32_t minimum;
    int32_t maximum;
    bool hasMaxText;
    const char* maxText;  // shown at the maximum when hasMaxText
    bool hasMinText;
    const char* minText;  // shown at the minimum when hasMinText
    int32_t id;
    Curve curve;
    int32_t curveBase;  // k of the log taper (10 or 1000); 0 for linear
    int32_t automationType;
    int32_t defaultValue;
    double scale;  // 10^decimals
};

// Automation types 2 (switch) and 3 (list) are automated by integer value and name their unit; every other
// parameter is automated by its 0..1 position.
constexpr bool automatedByValue(const ParamDesc& d) { return d.automationType == 2 || d.automationType == 3; }

// A description from its table row; a taper base of 0 means the linear curve.
constexpr ParamDesc makeParam(const char* name, int32_t defaultValue, int32_t decimals, int32_t width,
                              int32_t minimum, int32_t maximum, const char* maxText, const char* minText,
                              int32_t id, int32_t curveBase) {
    double scale = 1.0;
    for (int32_t d = 0; d < decimals; ++d) scale *= 10.0;
    return ParamDesc{name,
                     "",
                     decimals,
                     width,
                     minimum,
                     maximum,
                     maxText != nullptr,
                     maxText != nullptr ? maxText : "",
                     minText != nullptr,
                     minText != nullptr ? minText : "",
                     id,
                     curveBase == 0 ? Curve::Linear : Curve::LogTaper,
                     curveBase,
                     0,
                     defaultValue,
                     scale};
}

// The 17 descriptions, entry i describing id i.
inline constexpr ParamDesc kParamTable[kParamCount] = {
    // clang-format off
    //        name                default dec width  min     max  maxText  minText  id                    k
    makeParam("Diffusion",          100,  0, 3,     0,    100, nullptr, nullptr, kDiffusion,           0),
    makeParam("Pre Delay",           32,  0, 3,     0,    500, nullptr, nullptr, kPreDelay,           10),
    makeParam("Decay",               47,  0, 3,     0,    100, nullptr, nullptr, kDecay,               0),
    makeParam("Damping",             30,  0, 2,     0,     99, nullptr, nullptr, kDamping,             0),
    makeParam("Room Size",           46,  0, 3,     0,    200, nullptr, nullptr, kRoomSize,           10),
    makeParam("Early Reflections",    0,  1, 4,  -600,      0, nullptr, "-Inf.", kEarlyReflections,    0),
    makeParam("Output Level Wet",  -180,  1, 4,  -600,     60, nullptr, "-Inf.", kOutputLevelWet,      0),
    makeParam("Output Level Dry",     0,  1, 4,  -600,     60, nullptr, "-Inf.", kOutputLevelDry,      0),
    makeParam("Colour",              56,  0, 3,     1,    100, nullptr, nullptr, kColour,             10),
    makeParam("Input Gain",           0,  1, 4,  -300,    150, nullptr, nullptr, kInputGain,           0),
    makeParam("Low Pass Freq",    10000,  0, 5,    20,  10000, "Off",   nullptr, kLowPassFreq,      1000),
    makeParam("High Pass Freq",     125,  0, 5,   100,  16000, nullptr, "Off",   kHighPassFreq,     1000),
    makeParam("Notch Freq",        2000,  0, 5,    20,  16000, nullptr, nullptr, kNotchFreq,        1000),
    makeParam("Notch Gain",           0,  1, 3,  -120,    120, nullptr, nullptr, kNotchGain,           0),
    makeParam("Notch Q",             30,  1, 3,     1,     50, nullptr, nullptr, kNotchQ,              0),
    makeParam("",                     2,  1, 1,     0,      7, nullptr, nullptr, kAlgorithm,           0),
    makeParam("",                     1,  0, 3,     0,      2, nullptr, nullptr, kMeterSource,         0),
    // clang-format on
};

// Table position of each id: the order of the settings record and of ProgramMemory's columns. Only the
// notch parameters differ from their ids (Notch Q sits at 12, Notch Freq at 14).
inline constexpr int kParamPosition[kParamCount] = {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 14, 13, 12, 15, 16};
// The id at each table position (the inverse of kParamPosition).
inline constexpr int32_t kParamAtPosition[kParamCount] = {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 14, 13, 12, 15, 16};

// The description of id, or null for an unknown id.
constexpr const ParamDesc* findParam(int32_t id) {
    return id >= 0 && id < kParamCount ? &kParamTable[id] : nullptr;
}

// Bytes a value's text needs at most, with its terminating zero.
constexpr size_t kValueTextCapacity = 32;

// Position 0..1 of value along the description's curve.
double positionOf(const ParamDesc& d, int32_t value);
// The value that position p maps to (p clamped to 0..1; NaN counts as 0), rounded half away from zero.
int32_t valueAtPosition(const ParamDesc& d, float p);
// Clamps v into minimum..maximum.
int32_t clampValue(const ParamDesc& d, int32_t v);
// Writes the shown text of value into out (capacity bytes, zero-terminated) and returns out: the special
// text at a limit, else the number with its implied decimals; without full it is cut to displayWidth
// characters (and a dangling "." removed).
char* formatValue(const ParamDesc& d, int32_t value, bool full, char* out, size_t capacity);
// The value in steps that a typed text means (before clamping): read in double precision, scaled, a
// result within 1e-6 of a whole step taken as that step, otherwise truncated toward zero. Unreadable
// text reads as 0; numbers beyond int32 saturate.
int32_t parseValueText(const ParamDesc& d, const char* text);

// One row of the 15 sound parameters per algorithm, columns in table-position order.
struct ProgramMemory {
    int32_t rows[kAlgorithmCount][kSoundParamCount];
    ProgramMemory();
};

// Names of the eight algorithms, the factory presets.
extern const char* const kAlgorithmNames[kAlgorithmCount];

}  // namespace ulvetta
