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

int64_t pow10i(int32_t n) {
    int64_t p = 1;
    while (n-- > 0) p *= 10;
    return p;
}

// Single-precision constant above which a log-taper position counts as the full range.
constexpr double kTaperTop = 0.9999989867;

// Appends to a zero-terminated text in a fixed buffer, dropping what does not fit.
struct TextSink {
    char* out;
    size_t capacity;
    size_t length = 0;
    void put(char c) {
        if (length + 1 < capacity) out[length++] = c;
        out[length] = '\0';
    }
    void put(const char* s) {
        while (*s != '\0') put(*s++);
    }
    void putDigits(int64_t v) {
        char digits[20];
        int n = 0;
        do {
            digits[n++] = static_cast<char>('0' + v % 10);
            v /= 10;
        } while (v > 0);
        while (n > 0) put(digits[--n]);
    }
};

// The table is indexed by id and the two position maps are each other's inverse.
constexpr bool tableIsConsistent() {
    for (int i = 0; i < kParamCount; ++i)
        if (kParamTable[i].id != i || kParamAtPosition[kParamPosition[i]] != i) return false;
    return true;
}
static_assert(tableIsConsistent(), "parameter table out of order");

}  // namespace

const char* const kAlgorithmNames[kAlgorithmCount] = {
    "CLASSIC PLATE *", "WARM PLATE **",   "RICH PLATE *",    "AUDITORIUM ****",
    "LARGE ROOM *****", "BRIGHT HALL ****", "REVERSED VERB *", "DIFFUSED DELAY *",
};

double positionOf(const ParamDesc& d, int32_t value) {
    const double range = static_cast<double>(d.maximum) - d.minimum;
    const double lin = (static_cast<double>(value) - d.minimum) / range;
    if (d.curve == Curve::Linear) return lin;
    const double k = d.curveBase;
    return std::log10(1.0 + (k - 1.0) * lin) / std::log10(k);
}

int32_t valueAtPosition(const ParamDesc& d, float p) {
    double pos = p;
    if (!(pos >= 0.0)) pos = 0.0;  // also NaN
    if (pos > 1.0) pos = 1.0;
    const double range = static_cast<double>(d.maximum) - d.minimum;
    double x = pos;
    if (d.curve == Curve::LogTaper) {
        const double k = d.curveBase;
        x = (std::pow(10.0, std::log10(k) * pos) - 1.0) / (k - 1.0);
        if (x > kTaperTop) x = 1.0;
    }
    return d.minimum + roundSteps(range * x);
}

int32_t clampValue(const ParamDesc& d, int32_t v) {
    return v < d.minimum ? d.minimum : (v > d.maximum ? d.maximum : v);
}

char* formatValue(const ParamDesc& d, int32_t value, bool full, char* out, size_t capacity) {
    if (out == nullptr || capacity == 0) return out;
    TextSink text{out, capacity};
    out[0] = '\0';
    if (value == d.minimum && d.hasMinText) {
        text.put(d.minText);
        return out;
    }
    if (value == d.maximum && d.hasMaxText) {
        text.put(d.maxText);
        return out;
    }
    int64_t magnitude = value;
    if (magnitude < 0) {
        text.put('-');
        magnitude = -magnitude;
    }
    const int64_t unit = pow10i(d.decimals);
    const int64_t whole = magnitude / unit;
    if (whole >= 100000000)
        text.put('-');
    else
        text.putDigits(whole);
    int64_t fraction = magnitude - whole * unit;
    if (fraction != 0) {
        text.put('.');
        for (int32_t digit = d.decimals; digit > 0; --digit) {
            const int64_t place = pow10i(digit - 1);
            text.put(static_cast<char>('0' + fraction / place));
            fraction %= place;
        }
    }
    if (!full && static_cast<int64_t>(text.length) > d.displayWidth) {
        text.length = d.displayWidth < 0 ? 0 : static_cast<size_t>(d.displayWidth);
        if (text.length > 0 && out[text.length - 1] == '.') --text.length;
        out[text.length] = '\0';
    }
    return out;
}

int32_t parseValueText(const ParamDesc& d, const char* text) {
    if (text == nullptr) return 0;
    // Leading numeric text counts; anything unreadable reads as 0 (strtod gives 0 with no conversion).
    const double scaled = std::strtod(text, nullptr) * d.scale;
    if (std::isnan(scaled)) return 0;
    // Out-of-range numbers saturate; the caller clamps to the parameter's range anyway.
    if (scaled >= 2147483647.0) return INT32_MAX;
    if (scaled <= -2147483648.0) return INT32_MIN;
    const double nearest = std::round(scaled);
    if (std::fabs(scaled - nearest) <= 1e-6) return static_cast<int32_t>(nearest);
    return static_cast<int32_t>(std::trunc(scaled));
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
