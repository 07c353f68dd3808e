#include "image/output_file.h"

#include <cerrno>
#include <climits>
#include <csignal>
#include <cstdlib>
#include <cstring>

#include <sys/stat.h>
#include <unistd.h>

namespace img {

namespace {

#ifndef NAME_MAX
#define NAME_MAX 255
#endif

// The temporaries being written, in storage made before any signal can come:
// a handler may read it at any moment, so a slot is filled before it is
// marked live and marked dead only after its file is renamed or removed.
struct TemporarySlot {
    volatile std::sig_atomic_t live;
    char path[PATH_MAX];
};
TemporarySlot liveTemporaries[kMaxOpenOutputs];

// Creates the temporary from `pattern` (ending in XXXXXX) in a free slot.
// Returns the descriptor (or -1) and the slot (or -1).
int createRegisteredTemporary(const std::string& pattern, int& slot) {
    slot = -1;
    if (pattern.size() >= PATH_MAX)
        return -1;
    for (int i = 0; i < kMaxOpenOutputs; ++i) {
        if (liveTemporaries[i].live)
            continue;
        std::memcpy(liveTemporaries[i].path, pattern.c_str(), pattern.size() + 1);
        liveTemporaries[i].live = 1;
        const int fd = mkstemp(liveTemporaries[i].path);
        if (fd < 0) {
            liveTemporaries[i].live = 0;
            return -1;
        }
        slot = i;
        return fd;
    }
    return -1;
}

void releaseSlot(int& slot) {
    if (slot >= 0)
        liveTemporaries[slot].live = 0;
    slot = -1;
}

// ".<name>.tmp-XXXXXX" beside the target; a long name is cut so that the
// temporary's name stays within the file-name limit.
std::string temporaryPattern(const std::string& dir, const std::string& name) {
    constexpr std::size_t kDecoration = sizeof(".") - 1 + sizeof(".tmp-XXXXXX") - 1;
    const std::size_t keep = NAME_MAX > kDecoration ? NAME_MAX - kDecoration : 0;
    return dir + "." + name.substr(0, keep) + ".tmp-XXXXXX";
}

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

// A file that is replaced keeps its permissions (a 0600 calibration stays
// private); a new one gets what the umask leaves of 0666.
mode_t creationMode(const std::string& target) {
    struct stat existing;
    if (stat(target.c_str(), &existing) == 0 && S_ISREG(existing.st_mode))
        return existing.st_mode & 0777;
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
    const int fd = createRegisteredTemporary(temporaryPattern(dir, name), registrySlot_);
    if (fd < 0)
        return false;
    temporary_ = liveTemporaries[registrySlot_].path;
    fchmod(fd, creationMode(target_));
    stream_ = fdopen(fd, "wb");
    if (!stream_) {
        ::close(fd);
        abort();
        return false;
    }
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
        releaseSlot(registrySlot_);
        return true;
    }
    unlink(temporary_.c_str());
    temporary_.clear();
    releaseSlot(registrySlot_);
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
    releaseSlot(registrySlot_);
}

void removeLiveTemporaries() noexcept {
    for (TemporarySlot& slot : liveTemporaries)
        if (slot.live)
            unlink(slot.path);
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

} // namespace img
