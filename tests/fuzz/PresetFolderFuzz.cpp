// Fills a preset folder with arbitrary entries, then lists, loads and deletes through PresetFolder, as the
// preset menu does. Each entry is a flag byte (bit 0: a folder instead of a file), a file name and its
// content. Every listed preset must read as a record and load; a record under a usable ".stp" name that no
// other file shares must be listed; deleting every name must empty the list, and no name, however it is
// spelt, may reach the file kept beside the folder.
#include <unistd.h>

#include <algorithm>
#include <cstring>
#include <cctype>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <map>
#include <set>

#include "FuzzBytes.h"
#include "FuzzCore.h"
#include "presets/PresetFile.h"

using namespace ulvetta;
using namespace ulvetta::fuzz;
namespace fs = std::filesystem;

namespace {

bool isRecord(const std::string& content) {
    return content.size() == 88 && std::memcmp(kRecordHead, content.data(), 20) == 0;
}

std::string contentOf(const fs::path& p) {
    std::ifstream f(p, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(f), std::istreambuf_iterator<char>());
}

// The preset name a file name gives: the name without a final ".stp" in any letter case, or empty.
std::string presetNameOf(const std::string& fileName) {
    if (fileName.size() < 4) return {};
    std::string suffix = fileName.substr(fileName.size() - 4);
    for (char& c : suffix) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    return suffix == ".stp" ? fileName.substr(0, fileName.size() - 4) : std::string();
}

// A folder of its own per process under the temporary directory (tmpfs when there is one), with the
// sentinel preset beside the folder that the fuzzed names try to reach.
struct Scratch {
    Scratch() {
        const fs::path base = fs::is_directory("/dev/shm") ? fs::path("/dev/shm") : fs::temp_directory_path();
        root = base / ("ulvetta-preset-fuzz-" + std::to_string(getpid()));
        folder = root / "Presets";
        fs::create_directories(folder);
        sentinel = root / "outside.stp";
        std::ofstream(sentinel, std::ios::binary).write(reinterpret_cast<const char*>(kRecordHead), 20) << std::string(68, '\0');
    }
    ~Scratch() {
        std::error_code ec;
        fs::remove_all(root, ec);
    }
    fs::path root, folder, sentinel;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    static Scratch scratch;
    FuzzBytes input(data, size);
    std::vector<std::string> written;
    // Per usable preset name: how many of its files (suffixes differing in case) hold a record, and in all.
    std::map<std::string, std::pair<int, int>> files;
    for (int entry = 0; entry < 8 && !input.empty(); ++entry) {
        const bool folder = input.take<uint8_t>() & 1;
        const std::string fileName = input.field(80);
        const std::string content = input.field(120);
        // Names the file system cannot hold, or that are not a single entry of the folder, are only asked for.
        written.push_back(fileName);
        if (fileName.empty() || fileName == "." || fileName == ".." ||
            fileName.find_first_of(std::string("/\0", 2)) != std::string::npos ||
            fs::exists(fs::symlink_status(scratch.folder / fileName)))
            continue;
        if (folder) {
            fs::create_directory(scratch.folder / fileName);
            continue;
        }
        std::ofstream(scratch.folder / fileName, std::ios::binary) << content;
        const std::string name = presetNameOf(fileName);
        if (name.empty() || !presetNameProblem(name).empty()) continue;
        files[name].first += isRecord(content);
        files[name].second += 1;
    }

    const PresetFolder presets(scratch.folder.string(), false);
    const std::vector<std::string> listed = presets.list();
    const std::set<std::string> shown(listed.begin(), listed.end());
    for (const std::string& name : shown) {
        StateBytes bytes;
        FUZZ_CHECK(presets.read(name, bytes) == PresetResult::Ok && std::memcmp(bytes.data(), kRecordHead, 20) == 0);
        FUZZ_CHECK(presets.load(name, lowRateCore()) == PresetResult::Ok);
        FUZZ_CHECK(files[name].first > 0);
    }
    // A record under a name no other file shares must be listed; which of several spellings wins is open.
    for (const auto& [name, counts] : files)
        if (counts.second == 1 && counts.first == 1) FUZZ_CHECK(shown.count(name) == 1);

    for (const std::string& name : shown) FUZZ_CHECK(presets.remove(name) == PresetResult::Ok);
    for (const std::string& fileName : written) {
        presets.remove(fileName);
        presets.remove(presetNameOf(fileName));
    }
    FUZZ_CHECK(presets.list().empty());
    FUZZ_CHECK(isRecord(contentOf(scratch.sentinel)));
    std::error_code ec;
    for (const fs::directory_entry& e : fs::directory_iterator(scratch.folder)) fs::remove_all(e.path(), ec);
    return 0;
}
