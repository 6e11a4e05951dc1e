#include "TempOutput.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <random>

#include "CliSetup.h"

namespace ulvetta {

namespace fs = std::filesystem;

TempOutput::TempOutput(const fs::path& target) : target_(target) {
    const fs::path dir = target.has_parent_path() ? target.parent_path() : fs::path(".");
    std::random_device rd;
    for (int attempt = 0; attempt < 16 && fd_ < 0; ++attempt) {
        char suffix[40];
        std::snprintf(suffix, sizeof suffix, ".%08x%08x.part", rd(), rd());
        path_ = dir / ("." + target.filename().string() + suffix);
        fd_ = ::open(path_.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0666);
        if (fd_ < 0 && errno != EEXIST) break;
    }
    if (fd_ < 0)
        throw CliError("cannot create the output " + inQuotes(target.string()) + " (" + std::strerror(errno) + ")");
}

TempOutput::~TempOutput() {
    if (fd_ >= 0) ::close(fd_);
    if (!committed_) {
        std::error_code ec;
        fs::remove(path_, ec);
    }
}

int TempOutput::release() {
    const int fd = fd_;
    fd_ = -1;
    return fd;
}

void TempOutput::commit() {
    std::error_code ec;
    fs::rename(path_, target_, ec);
    if (ec)
        throw CliError("cannot move the finished output to " + inQuotes(target_.string()) + " (" + ec.message() + ")",
                       kExitFailure);
    committed_ = true;
}

}  // namespace ulvetta
