// The part of the command line that configures a core before any audio runs: the algorithm or factory
// preset, a settings file, and the --set / --set-raw edits in the order they were given. Shared by
// render, params and presets save. Every mistake is reported as a CliError with one sentence.
#pragma once

#include <stdexcept>
#include <string>
#include <vector>

namespace CLI {
class App;
class Option;
}  // namespace CLI

namespace ulvetta {

class ReverbCore;

// Exit statuses of the tool.
constexpr int kExitOk = 0;
constexpr int kExitFailure = 1;   // the work itself failed (a write error, an answer of No)
constexpr int kExitBadInput = 2;  // bad arguments or input; nothing was written

// A problem to report: one sentence without a trailing full stop, and the exit status.
class CliError : public std::runtime_error {
public:
    explicit CliError(const std::string& message, int status = kExitBadInput)
        : std::runtime_error(message), status_(status) {}
    int status() const { return status_; }

private:
    int status_;
};

// One --set (text in the units the editor shows) or --set-raw (integer steps) edit.
struct ParamEdit {
    bool raw = false;
    std::string argument;  // NAME=TEXT or ID=STEPS as typed
};

class CoreSetup {
public:
    // Adds --algorithm, --preset, --state, --set and --set-raw to a subcommand.
    void attach(CLI::App& app);
    // After parsing: gathers the edits of app in command-line order.
    void collect(const CLI::App& app);

    // The fixed sequence: the algorithm (setValue on id 15), then the settings file (loadState), then
    // every edit in order (setValueText for --set, setValue for --set-raw). Throws CliError.
    void apply(ReverbCore& core) const;

    std::string algorithm;  // as typed; empty when not given
    std::string preset;     // factory preset name; empty when not given
    std::string statePath;  // empty when not given
    std::vector<ParamEdit> edits;

private:
    CLI::Option* setOption_ = nullptr;
    CLI::Option* rawOption_ = nullptr;
};

// The name of a parameter as the tool shows and accepts it: the display name, or "Algorithm" and
// "Meter Source" for ids 15 and 16.
std::string parameterName(ReverbCore& core, int id);
// The id of a parameter name (letter case and surrounding spaces do not matter), or -1.
int findParameter(ReverbCore& core, const std::string& name);
// Applies one edit; throws CliError for an unknown name or a malformed value.
void applyEdit(ReverbCore& core, const ParamEdit& edit);
// Surrounding white space removed.
std::string trim(const std::string& s);
// ASCII letters in lower case.
std::string lower(std::string s);
// s between double quotes, as messages show names.
std::string inQuotes(const std::string& s);
// A plain decimal number: optional sign, digits with at most one point, optional exponent. Rejects
// what strtod would also take but nobody types for a fader (hex, inf, nan, trailing text).
bool isDecimalNumber(const std::string& s);
// A strict whole number: optional sign and decimal digits only, within int32. False otherwise.
bool parseInteger(const std::string& text, long long minimum, long long maximum, long long& out);
// The folder for user presets when --dir is not given: $XDG_DATA_HOME/ulvetta/Presets, falling back
// to ~/.local/share/ulvetta/Presets. Throws CliError when neither variable is usable.
std::string defaultPresetDirectory();

}  // namespace ulvetta
