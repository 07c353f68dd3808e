#include "image/output_file.h"

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <sys/stat.h>
#include <unistd.h>

namespace {

// Devices, pipes and everything under /dev and /proc are written in place:
// /dev/stdout may resolve to a regular file that the shell holds open.
bool writeDirectly(const std::string& path) {
    if (path.rfind("/dev/", 0) == 0 || path.rfind("/proc/", 0) == 0)
        return true;
    struct stat info;
    if (stat(path.c_str(), &info) != 0)
        return false;
    return !S_ISREG(info.st_mode);
}

// A symbolic link is kept: the file it points to is the one replaced.
std::string resolveLink(const std::string& path) {
    struct stat info;
    if (lstat(path.c_str(), &info) != 0 || !S_ISLNK(info.st_mode))
        return path;
    char resolved[PATH_MAX];
    if (!realpath(path.c_str(), resolved))
        return path;
    return resolved;
}

// Opens a device, pipe or standard stream for a direct write.
std::FILE* openDirect(const std::string& path) {
    const int standard = standardStreamDescriptor(path);
    if (standard < 0)
        return std::fopen(path.c_str(), "wb");
    // Whatever the tool printed before is on its way out first.
    std::fflush(standard == STDOUT_FILENO ? stdout : stderr);
    const int fd = dup(standard);
    if (fd < 0)
        return nullptr;
    std::FILE* stream = fdopen(fd, "wb");
    if (!stream)
        ::close(fd);
    return stream;
}

mode_t creationMode() {
    const mode_t mask = umask(0);
    umask(mask);
    return 0666 & ~mask;
}

} // namespace

int standardStreamDescriptor(const std::string& path) {
    struct stat named;
    if (stat(path.c_str(), &named) != 0)
        return -1;
    for (int fd : {STDOUT_FILENO, STDERR_FILENO}) {
        struct stat opened;
        if (fstat(fd, &opened) == 0 && opened.st_dev == named.st_dev &&
            opened.st_ino == named.st_ino)
            return fd;
    }
    return -1;
}

OutputFile::~OutputFile() {
    abort();
}

bool OutputFile::open(const std::string& path) {
    abort();
    if (path.empty())
        return false;
    if (writeDirectly(path)) {
        stream_ = openDirect(path);
        target_ = path;
        return stream_ != nullptr;
    }
    target_ = resolveLink(path);
    const std::size_t slash = target_.rfind('/');
    const std::string dir = slash == std::string::npos ? "" : target_.substr(0, slash + 1);
    const std::string name = slash == std::string::npos ? target_ : target_.substr(slash + 1);
    std::string pattern = dir + "." + name + ".tmp-XXXXXX";
    const int fd = mkstemp(pattern.data());
    if (fd < 0)
        return false;
    fchmod(fd, creationMode());
    stream_ = fdopen(fd, "wb");
    if (!stream_) {
        ::close(fd);
        unlink(pattern.c_str());
        return false;
    }
    temporary_ = pattern;
    return true;
}

bool OutputFile::commit() {
    if (!stream_)
        return false;
    bool ok = std::ferror(stream_) == 0;
    ok = std::fflush(stream_) == 0 && ok;
    ok = std::fclose(stream_) == 0 && ok;
    stream_ = nullptr;
    if (temporary_.empty())
        return ok;
    if (ok && std::rename(temporary_.c_str(), target_.c_str()) == 0) {
        temporary_.clear();
        return true;
    }
    unlink(temporary_.c_str());
    temporary_.clear();
    return false;
}

void OutputFile::abort() {
    if (stream_) {
        std::fclose(stream_);
        stream_ = nullptr;
    }
    if (!temporary_.empty()) {
        unlink(temporary_.c_str());
        temporary_.clear();
    }
}

bool writeWholeFile(const std::string& path, const void* data, std::size_t size) {
    OutputFile file;
    if (!file.open(path))
        return false;
    if (size > 0 && std::fwrite(data, 1, size, file.stream()) != size) {
        file.abort();
        return false;
    }
    return file.commit();
}
