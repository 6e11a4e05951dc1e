// The parameter model: one ParamDesc per control (value in integer steps, its text, its 0..1 position
// and its range), the table of all 17, and the per-algorithm memory of the 15 sound parameters.
// Pure data and pure functions: no locking here; the core holds its lock around every use.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace ulvetta {

// The program's small heap string of 8-bit characters; always zero-terminated.
using SkinString = std::string;

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

struct ParamDesc {
    SkinString name;
    SkinString label;
    int32_t value = 0;         // steps
    int32_t decimals = 0;      // implied decimal digits of the shown number
    int32_t displayWidth = 0;  // characters of the short text
    int32_t minimum = 0;
    int32_t maximum = 0;
    bool hasMaxText = false;
    SkinString maxText;
    bool hasMinText = false;
    SkinString minText;
    int32_t id = 0;
    Curve curve = Curve::Linear;
    int32_t curveBase = 0;  // k of the log taper (10 or 1000); 0 for linear
    int32_t automationType = 0;
    std::vector<SkinString> valueNames;
    int32_t defaultValue = 0;
    double scale = 1.0;  // 10^decimals

    ParamDesc() = default;
    ParamDesc(SkinString name, SkinString label, int32_t value, int32_t decimals, int32_t width, int32_t minimum,
              int32_t maximum, bool hasMaxText, SkinString maxText, bool hasMinText, SkinString minText,
              int32_t id, Curve curve, int32_t curveBase, int32_t automationType);

    // Position 0..1 of the value along the record's curve.
    double getNormalized() const;
    // Stores the value at position p (clamped to 0..1; NaN counts as 0), rounded half away from zero.
    void setNormalized(float p);
    // The value that position p maps to, without storing it.
    int32_t valueAt(float p) const;
    // The shown text: the special text at a limit, else the number with its implied decimals; without
    // full it is cut to displayWidth characters (and a dangling "." removed).
    SkinString formatValue(bool full) const;
    // The value in steps that a typed text means (before clamping): read in double precision, scaled,
    // a result within 1e-6 of a whole step taken as that step, otherwise truncated toward zero.
    // Unreadable text reads as 0.
    int32_t parseText(const char* text) const;
    // Clamps v into minimum..maximum.
    int32_t clamp(int32_t v) const;
};

// The 17 records at their table positions 0..16 (positions differ from ids only for the notch).
struct ParamTable {
    ParamDesc records[kParamCount];

    ParamTable();
    // Linear search by id; null for an unknown id.
    ParamDesc* find(int32_t id);
    const ParamDesc* find(int32_t id) const;
    // Table position of an id, or -1.
    int position(int32_t id) const;
};

// One row of the 15 sound parameters per algorithm, columns in table-position order.
struct ProgramMemory {
    int32_t rows[kAlgorithmCount][kSoundParamCount];
    ProgramMemory();
};

// Names of the eight algorithms, the factory presets.
extern const char* const kAlgorithmNames[kAlgorithmCount];

}  // namespace ulvetta
