// A new file beside an output path that becomes that output by a rename once complete, and is removed
// otherwise, so a failed write never leaves a partial file or touches an existing one.
#pragma once

#include <filesystem>

namespace ulvetta {

class TempOutput {
public:
    // Creates the file (mode 0666 before the umask) with a random hidden name in target's folder.
    // Throws CliError with the bad-input status when it cannot (a missing or unwritable folder).
    explicit TempOutput(const std::filesystem::path& target);
    ~TempOutput();
    TempOutput(const TempOutput&) = delete;
    TempOutput& operator=(const TempOutput&) = delete;

    // Hands the open descriptor over; the receiver closes it from then on.
    int release();
    // Renames the file to the target, replacing whatever was there. Throws CliError.
    void commit();

private:
    std::filesystem::path target_;
    std::filesystem::path path_;
    int fd_ = -1;
    bool committed_ = false;
};

}  // namespace ulvetta
