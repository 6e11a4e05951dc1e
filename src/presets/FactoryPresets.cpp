#include "presets/FactoryPresets.h"

#include <cctype>

#include "filter/ParamTable.h"

namespace ulvetta {

namespace {

// Upper case, stars removed, words separated by single spaces, no leading or trailing space.
std::string canonical(const std::string& name) {
    std::string out;
    bool pendingSpace = false;
    for (char c : name) {
        const unsigned char u = static_cast<unsigned char>(c);
        if (c == '*') continue;
        if (std::isspace(u)) {
            pendingSpace = !out.empty();
            continue;
        }
        if (pendingSpace) out += ' ';
        pendingSpace = false;
        out += static_cast<char>(std::toupper(u));
    }
    return out;
}

}  // namespace

int findFactoryPreset(const std::string& name) {
    const std::string wanted = canonical(name);
    if (wanted.empty()) return -1;
    for (int i = 0; i < kAlgorithmCount; ++i)
        if (canonical(kAlgorithmNames[i]) == wanted) return i;
    return -1;
}

std::string factoryPresetSlug(int index) {
    if (index < 0 || index >= kAlgorithmCount) return {};
    std::string slug;
    for (char c : canonical(kAlgorithmNames[index]))
        slug += c == ' ' ? '-' : static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    return slug;
}

}  // namespace ulvetta
