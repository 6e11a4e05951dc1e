#include "filter/ParamTable.h"

#include <cmath>
#include <cstdlib>
#include <cstring>

namespace ulvetta {

namespace {

// Round half away from zero, with -0.5 itself going to -1.
int32_t roundSteps(double d) {
    return static_cast<int32_t>(d > -0.5 ? std::trunc(d + 0.5) : std::trunc(d - 0.5));
}

int32_t pow10i(int32_t n) {
    int32_t p = 1;
    while (n-- > 0) p *= 10;
    return p;
}

// Single-precision constant above which a log-taper position counts as the full range.
constexpr double kTaperTop = 0.9999989867;

}  // namespace

const char* const kAlgorithmNames[kAlgorithmCount] = {
    "CLASSIC PLATE *", "WARM PLATE **",   "RICH PLATE *",    "AUDITORIUM ****",
    "LARGE ROOM *****", "BRIGHT HALL ****", "REVERSED VERB *", "DIFFUSED DELAY *",
};

ParamDesc::ParamDesc(SkinString name_, SkinString label_, int32_t value_, int32_t decimals_, int32_t width,
                     int32_t minimum_, int32_t maximum_, bool hasMaxText_, SkinString maxText_, bool hasMinText_,
                     SkinString minText_, int32_t id_, Curve curve_, int32_t curveBase_, int32_t automationType_)
    : name(std::move(name_)),
      label(std::move(label_)),
      value(value_),
      decimals(decimals_),
      displayWidth(width),
      minimum(minimum_),
      maximum(maximum_),
      hasMaxText(hasMaxText_),
      maxText(std::move(maxText_)),
      hasMinText(hasMinText_),
      minText(std::move(minText_)),
      id(id_),
      curve(curve_),
      curveBase(curveBase_),
      automationType(automationType_),
      defaultValue(value_),
      scale(pow10i(decimals_)) {}

double ParamDesc::getNormalized() const {
    const double range = static_cast<double>(maximum) - minimum;
    const double lin = (static_cast<double>(value) - minimum) / range;
    if (curve == Curve::Linear) return lin;
    const double k = curveBase;
    return std::log10(1.0 + (k - 1.0) * lin) / std::log10(k);
}

int32_t ParamDesc::valueAt(float p) const {
    double pos = p;
    if (!(pos >= 0.0)) pos = 0.0;  // also NaN
    if (pos > 1.0) pos = 1.0;
    const double range = static_cast<double>(maximum) - minimum;
    double x = pos;
    if (curve == Curve::LogTaper) {
        const double k = curveBase;
        x = (std::pow(10.0, std::log10(k) * pos) - 1.0) / (k - 1.0);
        if (x > kTaperTop) x = 1.0;
    }
    return minimum + roundSteps(range * x);
}

void ParamDesc::setNormalized(float p) { value = valueAt(p); }

int32_t ParamDesc::clamp(int32_t v) const { return v < minimum ? minimum : (v > maximum ? maximum : v); }

SkinString ParamDesc::formatValue(bool full) const {
    if (value == minimum && hasMinText) return minText;
    if (value == maximum && hasMaxText) return maxText;
    SkinString out;
    int64_t magnitude = value;
    if (magnitude < 0) {
        out += '-';
        magnitude = -magnitude;
    }
    const int64_t unit = pow10i(decimals);
    const int64_t whole = magnitude / unit;
    if (whole >= 100000000)
        out += '-';
    else
        out += std::to_string(whole);
    int64_t fraction = magnitude - whole * unit;
    if (fraction != 0) {
        out += '.';
        for (int32_t d = decimals; d > 0; --d) {
            const int64_t place = pow10i(d - 1);
            out += static_cast<char>('0' + fraction / place);
            fraction %= place;
        }
    }
    if (!full && static_cast<int32_t>(out.size()) > displayWidth) {
        out.resize(displayWidth < 0 ? 0 : displayWidth);
        if (!out.empty() && out.back() == '.') out.pop_back();
    }
    return out;
}

int32_t ParamDesc::parseText(const char* text) const {
    if (text == nullptr) return 0;
    // Leading numeric text counts; anything unreadable reads as 0 (strtod gives 0 with no conversion).
    const double number = std::strtod(text, nullptr);
    const double scaled = number * scale;
    if (std::isnan(scaled)) return 0;
    // Out-of-range numbers saturate; the caller clamps to the parameter's range anyway.
    if (scaled >= 2147483647.0) return INT32_MAX;
    if (scaled <= -2147483648.0) return INT32_MIN;
    const double nearest = std::round(scaled);
    if (std::fabs(scaled - nearest) <= 1e-6) return static_cast<int32_t>(nearest);
    return static_cast<int32_t>(std::trunc(scaled));
}

ParamTable::ParamTable() {
    using C = Curve;
    // clang-format off
    //                 name                 label value dec width  min     max  maxText      minText        id  curve        k    auto
    records[0]  = {"Diffusion",          "",  100, 0, 3,     0,    100, false, "",    false, "",      0, C::Linear,   0,    0};
    records[1]  = {"Pre Delay",          "",   32, 0, 3,     0,    500, false, "",    false, "",      1, C::LogTaper, 10,   0};
    records[2]  = {"Decay",              "",   47, 0, 3,     0,    100, false, "",    false, "",      2, C::Linear,   0,    0};
    records[3]  = {"Damping",            "",   30, 0, 2,     0,     99, false, "",    false, "",      3, C::Linear,   0,    0};
    records[4]  = {"Room Size",          "",   46, 0, 3,     0,    200, false, "",    false, "",      4, C::LogTaper, 10,   0};
    records[5]  = {"Early Reflections",  "",    0, 1, 4,  -600,      0, false, "",    true,  "-Inf.", 5, C::Linear,   0,    0};
    records[6]  = {"Output Level Wet",   "", -180, 1, 4,  -600,     60, false, "",    true,  "-Inf.", 6, C::Linear,   0,    0};
    records[7]  = {"Output Level Dry",   "",    0, 1, 4,  -600,     60, false, "",    true,  "-Inf.", 7, C::Linear,   0,    0};
    records[8]  = {"Colour",             "",   56, 0, 3,     1,    100, false, "",    false, "",      8, C::LogTaper, 10,   0};
    records[9]  = {"Input Gain",         "",    0, 1, 4,  -300,    150, false, "",    false, "",      9, C::Linear,   0,    0};
    records[10] = {"Low Pass Freq",      "", 10000, 0, 5,   20,  10000, true,  "Off", false, "",     10, C::LogTaper, 1000, 0};
    records[11] = {"High Pass Freq",     "",  125, 0, 5,   100,  16000, false, "",    true,  "Off",  11, C::LogTaper, 1000, 0};
    records[12] = {"Notch Q",            "",   30, 1, 3,     1,     50, false, "",    false, "",     14, C::Linear,   0,    0};
    records[13] = {"Notch Gain",         "",    0, 1, 3,  -120,    120, false, "",    false, "",     13, C::Linear,   0,    0};
    records[14] = {"Notch Freq",         "", 2000, 0, 5,    20,  16000, false, "",    false, "",     12, C::LogTaper, 1000, 0};
    records[15] = {"",                   "",    2, 1, 1,     0,      7, false, "",    false, "",     15, C::Linear,   0,    0};
    records[16] = {"",                   "",    1, 0, 3,     0,      2, false, "",    false, "",     16, C::Linear,   0,    0};
    // clang-format on
}

ParamDesc* ParamTable::find(int32_t id) {
    for (ParamDesc& r : records)
        if (r.id == id) return &r;
    return nullptr;
}

const ParamDesc* ParamTable::find(int32_t id) const {
    for (const ParamDesc& r : records)
        if (r.id == id) return &r;
    return nullptr;
}

int ParamTable::position(int32_t id) const {
    for (int i = 0; i < kParamCount; ++i)
        if (records[i].id == id) return i;
    return -1;
}

ProgramMemory::ProgramMemory() {
    // clang-format off
    static const int32_t initial[kAlgorithmCount][kSoundParamCount] = {
        // Diff PreDly Decay Damp Room  Early   Wet  Dry Colour InGain LowPass HighPass NotchQ NotchGain NotchFreq
        {  17,  15,   55,    5,  38,  -100, -170,  0,  90,    0,  10000,  125,     30,    0,        2000},
        { 100,  19,   58,   33,  41,  -250, -160,  0,  36,    0,  10000,  125,     30,    0,        2000},
        { 100,  32,   47,   30,  46,     0, -180,  0,  56,    0,  10000,  125,     30,    0,        2000},
        { 100,   0,   93,    0, 136,     0, -100,  0,  33,    0,  10000,  125,     30,    0,        2000},
        { 100,   0,   81,    0, 100,     0, -110,  0, 100,    0,  10000,  125,     30,    0,        2000},
        { 100,   0,   85,    0, 100,     0, -120,  0, 100,    0,  10000,  125,     30,    0,        2000},
        { 100,  87,   20,   80,  29,  -400, -140,  0,  40,    0,  10000,  125,     30,    0,        2000},
        { 100,  12,   41,  140,  62,     0, -180,  0,  61,    0,  10000,  125,     30,    0,        2000},
    };
    // clang-format on
    std::memcpy(rows, initial, sizeof rows);
}

}  // namespace ulvetta
