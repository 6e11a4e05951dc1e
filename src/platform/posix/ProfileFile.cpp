#include "platform/ProfileFile.h"

#include <errno.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <atomic>
#include <cstdio>

namespace ulvetta {

namespace {

// Reads the whole file into text; a missing file reads as empty. False when it exists but cannot be read.
bool readAll(const std::string& path, std::string* text) {
    text->clear();
    const int fd = ::open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0) return errno == ENOENT;
    char buffer[4096];
    bool ok = true;
    for (;;) {
        const ssize_t n = ::read(fd, buffer, sizeof buffer);
        if (n > 0) {
            text->append(buffer, static_cast<size_t>(n));
        } else if (n == 0 || errno != EINTR) {
            ok = n == 0;
            break;
        }
    }
    ::close(fd);
    return ok;
}

bool writeAll(int fd, const std::string& text) {
    size_t done = 0;
    while (done < text.size()) {
        const ssize_t n = ::write(fd, text.data() + done, text.size() - done);
        if (n < 0 && errno == EINTR) continue;
        if (n <= 0) return false;
        done += static_cast<size_t>(n);
    }
    return true;
}

// Creates a new file beside path (its permissions from the process's umask) and returns its descriptor.
int createBeside(const std::string& path, std::string* tempPath) {
    static std::atomic<unsigned> counter{0};
    for (int attempt = 0; attempt < 100; ++attempt) {
        *tempPath = path + "." + std::to_string(::getpid()) + "-" + std::to_string(counter++) + ".tmp";
        const int fd = ::open(tempPath->c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0666);
        if (fd >= 0 || errno != EEXIST) return fd;
    }
    return -1;
}

}  // namespace

std::string ProfileFile::read(const std::string& section, const std::string& key) const {
    std::string text;
    if (path_.empty() || !readAll(path_, &text)) return {};
    std::string value = findValue(text, section, key);
    if (value.size() > kMaxValue) value.resize(kMaxValue);
    return value;
}

bool ProfileFile::write(const std::string& section, const std::string& key, const std::string& value) const {
    std::string text;
    // A file that exists but cannot be read is left alone rather than replaced by one value.
    if (path_.empty() || !writable(section, key, value) || !readAll(path_, &text)) return false;
    const std::string updated = withValue(text, section, key, value);

    std::string temp;
    const int fd = createBeside(path_, &temp);
    if (fd < 0) return false;
    struct stat old {};
    bool ok = true;
    if (::stat(path_.c_str(), &old) == 0) ok = ::fchmod(fd, old.st_mode & 07777) == 0;
    ok = ok && writeAll(fd, updated) && ::fsync(fd) == 0;
    ok = ::close(fd) == 0 && ok;
    ok = ok && std::rename(temp.c_str(), path_.c_str()) == 0;
    if (!ok) ::unlink(temp.c_str());
    return ok;
}

}  // namespace ulvetta
