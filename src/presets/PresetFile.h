// User preset files: one settings record (the core's 88-byte state) per ".stp" file in a folder that the
// host names. Listing, loading, saving and deleting, with the checks that keep a preset name inside its
// folder and a damaged or foreign file out of the list.
//
// Threads: these functions touch only the file system and the core passed in (whose own lock covers the
// state calls); they may be called from any thread that may use the core. They allocate.
// Failures are returned, never thrown; the host decides whether to show them.
#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <vector>

#include "filter/CoreState.h"

namespace ulvetta {

class ReverbCore;

using StateBytes = std::array<uint8_t, kCoreStateSize>;

// Longest preset name accepted (the editor's entry field holds this many characters).
constexpr size_t kMaxPresetNameLength = 64;

// The file-name suffix of a preset, compared without regard to letter case everywhere: "x.STP" holds the
// preset "x" for listing, loading, saving and deleting alike.
extern const char* const kPresetSuffix;

enum class PresetResult {
    Ok,
    BadName,   // the name could reach outside the folder or is not a usable file name
    NotFound,  // no file of that name
    Invalid,   // the file is not a settings record (wrong size or format identifier)
    Declined,  // the file exists and the host answered that it must stay
    IoError,   // the folder or file could not be created, written, renamed or removed
};

// Why a name cannot be a preset name, as one sentence; empty when it can. A name is refused when it is
// empty or longer than kMaxPresetNameLength, contains a path separator, "..", a character that Windows
// does not allow in file names (< > : " / \ | ? * and control characters), or is a Windows device name.
std::string presetNameProblem(const std::string& name);

// Asked before an existing preset file is replaced; each host asks in its own way.
class OverwriteQuestion {
public:
    virtual ~OverwriteQuestion() = default;
    // True to replace the file at path that holds the preset name.
    virtual bool confirmOverwrite(const std::string& name, const std::string& path) = 0;
};

// A folder of preset files. The folder is named by the host; nothing here decides where it lives.
class PresetFolder {
public:
    // createOnSave: a missing folder (and its parents) is created by the first save; otherwise a save
    // into a missing folder fails with IoError.
    explicit PresetFolder(std::string directory, bool createOnSave = true);

    const std::string& directory() const { return directory_; }
    // The file that holds name (name is not checked here). Of the files named name + ".stp" with the
    // suffix in any letter case, the first in the order ".stp", ".stP", ".sTp", ... ".STP" that holds a
    // valid record; when none does, the first that exists; when none exists, name + ".stp". Loading,
    // saving and the error messages all use this file.
    std::string pathOf(const std::string& name) const;

    // Names of the valid presets, each once, in the order of the directory enumeration: files whose
    // names end in ".stp" in any letter case, with a usable name, whose pathOf holds a valid record
    // (a regular file exactly 88 bytes long; a file of any other size is skipped without being read).
    // A missing folder lists nothing.
    std::vector<std::string> list() const;

    // Reads the record of name into out (checked by size first, then by format identifier).
    PresetResult read(const std::string& name, StateBytes& out) const;
    // Reads the record and loads it into the core (algorithm first, then the other values).
    PresetResult load(const std::string& name, ReverbCore& core) const;
    // Writes the core's current record to pathOf(name). An existing file is replaced only when ask
    // agrees; the record goes to a temporary file beside the target, which is renamed over it when complete, so
    // a failure leaves either the old file or none, never a partial one.
    PresetResult save(const std::string& name, ReverbCore& core, OverwriteQuestion& ask) const;
    // Deletes every file named name + ".stp" with the suffix in any letter case, so that the name is
    // no longer listed. A missing file is nothing to delete (Ok); something else under that name, such
    // as a directory, is left alone, and is an IoError only when no file of the name was deleted.
    PresetResult remove(const std::string& name) const;

private:
    // The record of pathOf(name) and that path, without checking the name.
    PresetResult resolve(const std::string& name, std::string& path, StateBytes& out) const;

    std::string directory_;
    bool createOnSave_;
};

// Reads a settings record from any path: anything other than 88 bytes is Invalid without being read,
// as is a record with another size field or format identifier. NotFound for a missing file, IoError
// for one that cannot be read (including a directory).
PresetResult readStateFile(const std::string& path, StateBytes& out);

// True when the 88 bytes are a settings record (size field and format identifier).
bool isStateRecord(const StateBytes& bytes);

}  // namespace ulvetta
