#include "CliSetup.h"

#include <CLI/CLI.hpp>
#include <cctype>
#include <cmath>
#include <cstdlib>
#include <cstring>

#include "filter/ReverbCore.h"
#include "presets/FactoryPresets.h"
#include "presets/PresetFile.h"

namespace ulvetta {

std::string trim(const std::string& s) {
    size_t b = 0, e = s.size();
    while (b < e && std::isspace(static_cast<unsigned char>(s[b]))) ++b;
    while (e > b && std::isspace(static_cast<unsigned char>(s[e - 1]))) --e;
    return s.substr(b, e - b);
}

std::string lower(std::string s) {
    for (char& c : s) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    return s;
}

std::string inQuotes(const std::string& s) { return "\"" + s + "\""; }

bool isDecimalNumber(const std::string& s) {
    size_t i = 0;
    if (i < s.size() && (s[i] == '+' || s[i] == '-')) ++i;
    size_t digits = 0;
    while (i < s.size() && std::isdigit(static_cast<unsigned char>(s[i]))) ++i, ++digits;
    if (i < s.size() && s[i] == '.') {
        ++i;
        while (i < s.size() && std::isdigit(static_cast<unsigned char>(s[i]))) ++i, ++digits;
    }
    if (digits == 0) return false;
    if (i < s.size() && (s[i] == 'e' || s[i] == 'E')) {
        ++i;
        if (i < s.size() && (s[i] == '+' || s[i] == '-')) ++i;
        size_t expDigits = 0;
        while (i < s.size() && std::isdigit(static_cast<unsigned char>(s[i]))) ++i, ++expDigits;
        if (expDigits == 0) return false;
    }
    return i == s.size();
}

namespace {

// The number text of a step count, e.g. -600 with one decimal gives "-60.0".
std::string stepsAsText(int32_t steps, int32_t decimals) {
    char buffer[48];
    double scale = 1.0;
    for (int32_t d = 0; d < decimals; ++d) scale *= 10.0;
    std::snprintf(buffer, sizeof buffer, "%.*f", static_cast<int>(decimals), steps / scale);
    return buffer;
}

std::string factoryList() {
    std::string list;
    for (int i = 0; i < kAlgorithmCount; ++i) list += (i ? ", " : "") + inQuotes(kAlgorithmNames[i]);
    return list;
}

int algorithmFromText(const std::string& text) {
    long long n = 0;
    if (parseInteger(text, 0, kAlgorithmCount - 1, n)) return static_cast<int>(n);
    return findFactoryPreset(text);
}

// Meter Source also takes the name of what it shows.
int meterSourceFromWord(const std::string& text) {
    const std::string w = lower(text);
    if (w == "input") return 0;
    if (w == "output") return 1;
    if (w == "wet") return 2;
    return -1;
}

}  // namespace

bool parseInteger(const std::string& text, long long minimum, long long maximum, long long& out) {
    const std::string s = trim(text);
    size_t i = (!s.empty() && (s[0] == '+' || s[0] == '-')) ? 1 : 0;
    if (i == s.size() || s.size() > 12) return false;
    for (size_t k = i; k < s.size(); ++k)
        if (!std::isdigit(static_cast<unsigned char>(s[k]))) return false;
    const long long v = std::strtoll(s.c_str(), nullptr, 10);
    if (v < minimum || v > maximum) return false;
    out = v;
    return true;
}

std::string parameterName(ReverbCore&, int id) {
    if (id == kAlgorithm) return "Algorithm";
    if (id == kMeterSource) return "Meter Source";
    const ParamDesc* d = findParam(id);
    return d ? d->name : std::string();
}

int findParameter(ReverbCore& core, const std::string& name) {
    const std::string wanted = lower(trim(name));
    if (wanted.empty()) return -1;
    for (int id = 0; id < kParamCount; ++id)
        if (lower(parameterName(core, id)) == wanted) return id;
    return -1;
}

void applyEdit(ReverbCore& core, const ParamEdit& edit) {
    const char* flag = edit.raw ? "--set-raw" : "--set";
    const size_t eq = edit.argument.find('=');
    if (eq == std::string::npos)
        throw CliError(std::string(flag) + " takes " + (edit.raw ? "ID=STEPS" : "NAME=VALUE") + ", not " +
                       inQuotes(edit.argument));
    const std::string key = trim(edit.argument.substr(0, eq));
    const std::string value = trim(edit.argument.substr(eq + 1));

    long long number = 0;
    int id = findParameter(core, key);
    if (id < 0 && edit.raw && parseInteger(key, 0, kParamCount - 1, number)) id = static_cast<int>(number);
    if (id < 0)
        throw CliError("unknown parameter " + inQuotes(key) + " in " + flag +
                       "; \"ulvetta params\" lists the parameter names" + (edit.raw ? " and ids" : ""));
    const std::string name = parameterName(core, id);

    if (edit.raw) {
        if (!parseInteger(value, INT32_MIN, INT32_MAX, number))
            throw CliError("malformed value " + inQuotes(value) + " for " + name + " in --set-raw; it takes a whole number of steps");
        core.setValue(id, static_cast<int32_t>(number));
        return;
    }

    if (id == kAlgorithm) {
        // The editor shows the algorithm by its factory name; a number 0..7 is accepted as well.
        const int algorithm = algorithmFromText(value);
        if (algorithm < 0)
            throw CliError("unknown algorithm " + inQuotes(value) + "; give 0 to 7 or one of " + factoryList());
        core.setValue(kAlgorithm, algorithm);
        return;
    }
    std::string text = value;
    const ParamDesc& d = *findParam(id);
    char shown[ReverbCore::kTextCapacity];
    if (id == kMeterSource && meterSourceFromWord(value) >= 0) {
        text = std::to_string(meterSourceFromWord(value));
    } else if (!isDecimalNumber(value)) {
        // The special texts the editor shows at the ends of a range ("-Inf.", "Off") name those ends;
        // the final full stop of "-Inf." is optional.
        auto same = [&](const std::string& special) {
            if (special.empty()) return false;
            const std::string s = lower(special), v = lower(value);
            return v == s || (s.back() == '.' && v == s.substr(0, s.size() - 1));
        };
        if (d.hasMinText && same(d.minText))
            text = stepsAsText(d.minimum, d.decimals);
        else if (d.hasMaxText && same(d.maxText))
            text = stepsAsText(d.maximum, d.decimals);
        else
            throw CliError("malformed value " + inQuotes(value) + " for " + name + "; give a number such as " +
                           core.getValueText(id, shown, true));
    }
    core.setValueText(id, text.c_str());
}

void CoreSetup::attach(CLI::App& app) {
    auto* alg = app.add_option("--algorithm", algorithm, "Algorithm 0..7 (a factory preset by number)");
    auto* pre = app.add_option("--preset", preset, "Factory preset by name, e.g. \"large room\"");
    alg->excludes(pre);
    app.add_option("--state", statePath, "Settings file (.stp) loaded after the algorithm");
    // One value per occurrence, so that every occurrence is one entry of the parse order.
    setOption_ = app.add_option("--set")
                     ->description("Parameter in the editor's units: NAME=VALUE, e.g. \"Pre Delay=40\"")
                     ->type_size(1)
                     ->allow_extra_args(false)
                     ->multi_option_policy(CLI::MultiOptionPolicy::TakeAll)
                     ->type_name("NAME=VALUE");
    rawOption_ = app.add_option("--set-raw")
                     ->description("Parameter in integer steps: ID=STEPS or NAME=STEPS")
                     ->type_size(1)
                     ->allow_extra_args(false)
                     ->multi_option_policy(CLI::MultiOptionPolicy::TakeAll)
                     ->type_name("ID=STEPS");
}

void CoreSetup::collect(const CLI::App& app) {
    edits.clear();
    size_t setIndex = 0, rawIndex = 0;
    for (const CLI::Option* opt : app.parse_order()) {
        if (opt == setOption_ && setIndex < setOption_->results().size())
            edits.push_back({false, setOption_->results()[setIndex++]});
        else if (opt == rawOption_ && rawIndex < rawOption_->results().size())
            edits.push_back({true, rawOption_->results()[rawIndex++]});
    }
}

void CoreSetup::apply(ReverbCore& core) const {
    if (!algorithm.empty()) {
        long long n = 0;
        if (!parseInteger(algorithm, 0, kAlgorithmCount - 1, n))
            throw CliError("unknown algorithm " + inQuotes(algorithm) + "; --algorithm takes 0 to 7");
        core.setValue(kAlgorithm, static_cast<int32_t>(n));
    } else if (!preset.empty()) {
        const int index = findFactoryPreset(preset);
        if (index < 0) throw CliError("unknown factory preset " + inQuotes(preset) + "; the presets are " + factoryList());
        core.setValue(kAlgorithm, index);
    }
    if (!statePath.empty()) {
        StateBytes bytes;
        switch (readStateFile(statePath, bytes)) {
            case PresetResult::Ok: break;
            case PresetResult::NotFound: throw CliError("the settings file " + inQuotes(statePath) + " does not exist");
            case PresetResult::Invalid:
                throw CliError(inQuotes(statePath) + " is not a preset file (one 88-byte settings record)");
            default: throw CliError("the settings file " + inQuotes(statePath) + " cannot be read");
        }
        if (!core.loadState(bytes.data(), kCoreStateSize))
            throw CliError(inQuotes(statePath) + " is not a preset file (one 88-byte settings record)");
    }
    for (const ParamEdit& e : edits) applyEdit(core, e);
}

std::string defaultPresetDirectory() {
    const char* xdg = std::getenv("XDG_DATA_HOME");
    if (xdg != nullptr && xdg[0] == '/') return std::string(xdg) + "/ulvetta/Presets";
    const char* home = std::getenv("HOME");
    if (home != nullptr && home[0] != '\0') return std::string(home) + "/.local/share/ulvetta/Presets";
    throw CliError("no preset folder: neither XDG_DATA_HOME nor HOME is set, so give one with --dir");
}

}  // namespace ulvetta
