#include "presets/PresetFile.h"

#include <algorithm>
#include <cctype>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <random>

#include "filter/ReverbCore.h"

namespace ulvetta {

namespace fs = std::filesystem;

const char* const kPresetSuffix = ".stp";

namespace {

constexpr size_t kSuffixLength = 4;

// The name in double quotes, control characters shown as \xNN so that a message never carries them.
std::string quoted(const std::string& name) {
    std::string out = "\"";
    for (char c : name) {
        const unsigned char u = static_cast<unsigned char>(c);
        if (u < 0x20 || u == 0x7f) {
            char hex[8];
            std::snprintf(hex, sizeof hex, "\\x%02x", u);
            out += hex;
        } else {
            out += c;
        }
    }
    return out + "\"";
}

bool equalsIgnoringCase(const std::string& a, const char* b) {
    const size_t n = std::strlen(b);
    if (a.size() != n) return false;
    for (size_t i = 0; i < n; ++i)
        if (std::toupper(static_cast<unsigned char>(a[i])) != std::toupper(static_cast<unsigned char>(b[i])))
            return false;
    return true;
}

// Windows opens a device instead of a file for these base names, whatever extension follows.
bool isWindowsDeviceName(const std::string& name) {
    std::string base = name.substr(0, name.find('.'));
    while (!base.empty() && base.back() == ' ') base.pop_back();
    static const char* const fixed[] = {"CON", "PRN", "AUX", "NUL"};
    for (const char* d : fixed)
        if (equalsIgnoringCase(base, d)) return true;
    if (base.size() == 4 && base[3] >= '1' && base[3] <= '9') {
        const std::string stem = base.substr(0, 3);
        if (equalsIgnoringCase(stem, "COM") || equalsIgnoringCase(stem, "LPT")) return true;
    }
    return false;
}

// The suffix with upper-case letters where variant has bits (4: 'S', 2: 'T', 1: 'P'); variant 0 is
// ".stp" itself, so the lower-case file comes first when several hold a record.
constexpr int kSuffixVariants = 8;
std::string suffixVariant(int variant) {
    std::string s = kPresetSuffix;
    for (int i = 1; i <= 3; ++i)
        if (variant & (8 >> i)) s[i] = static_cast<char>(std::toupper(static_cast<unsigned char>(s[i])));
    return s;
}

bool hasPresetSuffix(const std::string& fileName) {
    if (fileName.size() < kSuffixLength) return false;
    return equalsIgnoringCase(fileName.substr(fileName.size() - kSuffixLength), kPresetSuffix);
}

// Reads exactly one record from path. The size decides first, so a file of any other length is never
// read; reading one byte past the record also catches a file that grew after its size was taken.
PresetResult readRecord(const fs::path& path, StateBytes& out) {
    std::error_code ec;
    const fs::file_status st = fs::status(path, ec);
    if (st.type() == fs::file_type::not_found) return PresetResult::NotFound;
    if (ec || fs::is_directory(st)) return PresetResult::IoError;
    if (!fs::is_regular_file(st)) return PresetResult::Invalid;
    const uintmax_t size = fs::file_size(path, ec);
    if (ec) return PresetResult::IoError;
    if (size != static_cast<uintmax_t>(kCoreStateSize)) return PresetResult::Invalid;

    std::ifstream in(path, std::ios::binary);
    if (!in) return PresetResult::IoError;
    char buffer[kCoreStateSize + 1];
    in.read(buffer, sizeof buffer);
    if (in.gcount() != kCoreStateSize) return PresetResult::Invalid;
    std::memcpy(out.data(), buffer, out.size());
    return isStateRecord(out) ? PresetResult::Ok : PresetResult::Invalid;
}

// Writes bytes to a new file beside target and renames it over target once it is complete and closed.
PresetResult writeReplacing(const fs::path& target, const StateBytes& bytes) {
    std::random_device seed;
    std::mt19937_64 random((static_cast<uint64_t>(seed()) << 32) ^ seed());
    char suffix[32];
    std::snprintf(suffix, sizeof suffix, ".%016llx.tmp", static_cast<unsigned long long>(random()));
    const fs::path temp = target.parent_path() / ("." + target.filename().string() + suffix);

    std::error_code ec;
    {
        std::ofstream out(temp, std::ios::binary | std::ios::trunc);
        if (!out) return PresetResult::IoError;
        out.write(reinterpret_cast<const char*>(bytes.data()), static_cast<std::streamsize>(bytes.size()));
        out.close();
        if (!out) {
            fs::remove(temp, ec);
            return PresetResult::IoError;
        }
    }
    fs::rename(temp, target, ec);
    if (ec) {
        std::error_code ignored;
        fs::remove(temp, ignored);
        return PresetResult::IoError;
    }
    return PresetResult::Ok;
}

}  // namespace

bool isStateRecord(const StateBytes& bytes) {
    return getLe32(bytes.data()) == static_cast<uint32_t>(kCoreStateSize) &&
           std::memcmp(bytes.data() + kCoreStateGuidOffset, kCoreStateGuid, sizeof kCoreStateGuid) == 0;
}

std::string presetNameProblem(const std::string& name) {
    if (name.empty()) return "a preset name cannot be empty";
    const std::string q = "the preset name " + quoted(name);
    if (name.size() > kMaxPresetNameLength)
        return q + " is longer than " + std::to_string(kMaxPresetNameLength) + " characters";
    for (char c : name) {
        const unsigned char u = static_cast<unsigned char>(c);
        if (u < 0x20) return q + " contains a control character";
        if (c == '/' || c == '\\')
            return q + " contains a path separator ('" + c + "'), and a preset cannot lie outside its folder";
    }
    if (name.find("..") != std::string::npos)
        return q + " contains \"..\", and a preset cannot lie outside its folder";
    for (char c : name)
        if (std::strchr("<>:\"|?*", c) != nullptr)
            return q + " contains '" + c + "', which Windows does not allow in file names";
    if (isWindowsDeviceName(name)) return q + " is a device name on Windows";
    return {};
}

PresetFolder::PresetFolder(std::string directory, bool createOnSave)
    : directory_(std::move(directory)), createOnSave_(createOnSave) {}

PresetResult PresetFolder::resolve(const std::string& name, std::string& path, StateBytes& out) const {
    PresetResult first = PresetResult::NotFound;
    for (int v = 0; v < kSuffixVariants; ++v) {
        const fs::path candidate = fs::path(directory_) / (name + suffixVariant(v));
        const PresetResult r = readRecord(candidate, out);
        if (r == PresetResult::Ok) {
            path = candidate.string();
            return r;
        }
        if (r != PresetResult::NotFound && first == PresetResult::NotFound) {
            first = r;
            path = candidate.string();
        }
    }
    if (first == PresetResult::NotFound) path = (fs::path(directory_) / (name + kPresetSuffix)).string();
    return first;
}

std::string PresetFolder::pathOf(const std::string& name) const {
    std::string path;
    StateBytes unused;
    resolve(name, path, unused);
    return path;
}

std::vector<std::string> PresetFolder::list() const {
    std::vector<std::string> names;
    std::error_code ec;
    fs::directory_iterator it(directory_, ec);
    for (; !ec && it != fs::directory_iterator(); it.increment(ec)) {
        const std::string fileName = it->path().filename().string();
        if (!hasPresetSuffix(fileName)) continue;
        const std::string name = fileName.substr(0, fileName.size() - kSuffixLength);
        if (!presetNameProblem(name).empty() || std::find(names.begin(), names.end(), name) != names.end()) continue;
        std::string path;
        StateBytes bytes;
        if (resolve(name, path, bytes) == PresetResult::Ok) names.push_back(name);
    }
    return names;
}

PresetResult PresetFolder::read(const std::string& name, StateBytes& out) const {
    if (!presetNameProblem(name).empty()) return PresetResult::BadName;
    std::string path;
    return resolve(name, path, out);
}

PresetResult PresetFolder::load(const std::string& name, ReverbCore& core) const {
    StateBytes bytes;
    const PresetResult r = read(name, bytes);
    if (r != PresetResult::Ok) return r;
    return core.loadState(bytes.data(), kCoreStateSize) ? PresetResult::Ok : PresetResult::Invalid;
}

PresetResult PresetFolder::save(const std::string& name, ReverbCore& core, OverwriteQuestion& ask) const {
    if (!presetNameProblem(name).empty()) return PresetResult::BadName;
    std::string path;
    StateBytes bytes;
    const PresetResult existing = resolve(name, path, bytes);
    const fs::path target = path;
    std::error_code ec;
    if (existing != PresetResult::NotFound) {
        if (fs::is_directory(target, ec)) return PresetResult::IoError;
        if (!ask.confirmOverwrite(name, path)) return PresetResult::Declined;
    } else if (!fs::is_directory(directory_, ec)) {
        if (!createOnSave_) return PresetResult::IoError;
        fs::create_directories(directory_, ec);
        if (ec) return PresetResult::IoError;
    }
    if (!core.saveState(bytes.data())) return PresetResult::IoError;
    return writeReplacing(target, bytes);
}

PresetResult PresetFolder::remove(const std::string& name) const {
    if (!presetNameProblem(name).empty()) return PresetResult::BadName;
    // Every spelling of the suffix that is a file goes. Something else under a spelling (a folder) is left
    // alone; it makes the deletion fail only when no file of the name was there to delete.
    bool removed = false, blocked = false, failed = false;
    for (int v = 0; v < kSuffixVariants; ++v) {
        const fs::path target = fs::path(directory_) / (name + suffixVariant(v));
        std::error_code ec;
        const fs::file_status st = fs::symlink_status(target, ec);
        if (st.type() == fs::file_type::not_found) continue;
        if (st.type() != fs::file_type::regular && st.type() != fs::file_type::symlink) {
            blocked = true;
            continue;
        }
        fs::remove(target, ec);
        (ec ? failed : removed) = true;
    }
    return failed || (blocked && !removed) ? PresetResult::IoError : PresetResult::Ok;
}

PresetResult readStateFile(const std::string& path, StateBytes& out) { return readRecord(path, out); }

}  // namespace ulvetta
