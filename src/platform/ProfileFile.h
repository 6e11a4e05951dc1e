// A private profile (INI) file: named values in [sections], read and written one value at a time, in the
// format of the Windows profile calls, so that a file written on one platform reads on the other.
//
// Windows calls the system's profile API. Elsewhere a portable reader and writer give the same results:
// section and key names compared without letter case, spaces and tabs trimmed around names and values, a
// value in matching quotes read without them, lines starting with ";" ignored, LF or CRLF read and CRLF
// written. Each call opens and closes the file; nothing is cached. Any thread; allocates.
#pragma once

#include <string>
#include <string_view>

namespace ulvetta {

class ProfileFile {
public:
    // The longest value read, in bytes: what fits the 512-byte buffer of the Windows call.
    static constexpr size_t kMaxValue = 511;

    explicit ProfileFile(std::string path) : path_(std::move(path)) {}
    const std::string& path() const { return path_; }

    // The value of key in section; empty when the file, the section or the key is missing.
    std::string read(const std::string& section, const std::string& key) const;
    // Sets key in section to value, creating the file and the section when needed and keeping every other
    // line. The new contents go to a file beside this one that is renamed over it, so a failure leaves the
    // old file whole. False when the path is empty, the arguments are not writable(), or the file system
    // refuses. Names are written trimmed; the value as given (a read trims it and drops matching quotes).
    bool write(const std::string& section, const std::string& key, const std::string& value) const;

    // The text format on its own, used by the portable reader and writer and by the fuzz test.
    // The value of key in section of text (the rules above, without the length limit).
    static std::string findValue(std::string_view text, std::string_view section, std::string_view key);
    // text with key in section set to value: the key's line replaced, or a line added after the section's
    // last entry, or the section appended; every other line kept, all lines ending in CRLF.
    static std::string withValue(std::string_view text, std::string_view section, std::string_view key,
                                 std::string_view value);
    // True when section, key and value keep the file's structure: no line break or NUL anywhere, names not
    // empty once trimmed, no "]" in the section, no "=" in the key and no key starting with ";" or "[".
    static bool writable(std::string_view section, std::string_view key, std::string_view value);

private:
    std::string path_;
};

}  // namespace ulvetta
