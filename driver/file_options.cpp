#include "driver/file_options.h"

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <stdexcept>
#include <string>
#include <vector>

#include "image/output_file.h"

#include <sys/stat.h>

namespace driver {

using img::standardStreamDescriptor;

namespace {

constexpr const char* kInputOptions[] = {"config", "input", "raw", "samples", "autofocus"};
constexpr const char* kOutputOptions[] = {"calibrate", "binary",  "inputasjpeg", "inputasbmp",
                                          "translate", "preproc", "outsamples",  "flat",
                                          "jpeg",      "bmp",     "delta",       "stats",
                                          "log",       "report",  "json",        "check"};

// What a path names, as far as two paths can be told to name the same file.
struct FileIdentity {
    enum Kind { kNone, kStream, kExisting, kToBeMade } kind = kNone;
    dev_t device = 0;
    ino_t inode = 0;
    std::string resolved; // kToBeMade: real directory + "/" + name
};

std::string realPath(const std::string& path) {
    char resolved[PATH_MAX];
    return realpath(path.c_str(), resolved) ? std::string(resolved) : std::string();
}

FileIdentity identify(const std::string& path) {
    FileIdentity id;
    if (path.empty() || path == "-")
        return id;
    struct stat info;
    if (stat(path.c_str(), &info) == 0) {
        if (!S_ISREG(info.st_mode) || standardStreamDescriptor(path) >= 0) {
            id.kind = FileIdentity::kStream;
            return id;
        }
        id.kind = FileIdentity::kExisting;
        id.device = info.st_dev;
        id.inode = info.st_ino;
        return id;
    }
    // Not there yet: the file it becomes is the name in the real directory.
    const std::size_t slash = path.rfind('/');
    const std::string dir = slash == std::string::npos ? "." : path.substr(0, slash + 1);
    const std::string name = slash == std::string::npos ? path : path.substr(slash + 1);
    const std::string realDir = realPath(dir);
    if (realDir.empty() || name.empty())
        return id; // cannot be created at all: the writer reports that
    id.kind = FileIdentity::kToBeMade;
    id.resolved = realDir + "/" + name;
    return id;
}

bool sameFile(const FileIdentity& a, const FileIdentity& b) {
    if (a.kind != b.kind)
        return false;
    if (a.kind == FileIdentity::kExisting)
        return a.device == b.device && a.inode == b.inode;
    return a.kind == FileIdentity::kToBeMade && a.resolved == b.resolved;
}

struct NamedFile {
    const char* option;
    std::string path;
    FileIdentity id;
};

std::vector<NamedFile> namedFiles(const CommandLine& line, const char* const* options,
                                  std::size_t count) {
    std::vector<NamedFile> files;
    for (std::size_t i = 0; i < count; ++i)
        for (const std::string& path : line.values(options[i])) { // every --input frame
            FileIdentity id = identify(path);
            if (id.kind == FileIdentity::kExisting || id.kind == FileIdentity::kToBeMade)
                files.push_back({options[i], path, std::move(id)});
        }
    return files;
}

[[noreturn]] void refuse(const NamedFile& output, const char* kind, const NamedFile& other) {
    std::string text = "Output --" + std::string(output.option) + " names the same file as " +
                       kind + " --" + other.option + ": " + output.path;
    if (other.path != output.path)
        text += " (" + other.path + ")";
    throw std::runtime_error(text);
}

} // namespace

void checkOutputsReplaceNothing(const CommandLine& line) {
    const std::vector<NamedFile> inputs = namedFiles(line, kInputOptions, std::size(kInputOptions));
    const std::vector<NamedFile> outputs =
        namedFiles(line, kOutputOptions, std::size(kOutputOptions));
    for (std::size_t i = 0; i < outputs.size(); ++i) {
        for (const NamedFile& input : inputs)
            if (sameFile(outputs[i].id, input.id))
                refuse(outputs[i], "input", input);
        for (std::size_t j = 0; j < i; ++j)
            if (sameFile(outputs[i].id, outputs[j].id))
                refuse(outputs[i], "output", outputs[j]);
    }
}

} // namespace driver
