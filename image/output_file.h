#pragma once
// Writes an output file so that nobody ever sees it half-written. A regular
// file (or one that does not exist yet) is written beside its target under a
// temporary name and renamed into place by commit(); a device, a FIFO or any
// other special file (/dev/stdout, /dev/full, a named pipe) is written
// directly, never renamed over; a path that names the file standard output or
// standard error already writes to is written through that descriptor, so
// nothing printed before is truncated or overwritten. Without commit() the
// temporary is removed, and so it is when the process is ended by a signal
// (removeLiveTemporaries). A file that is replaced keeps its permission bits.
//
// Procedural like the rest of the image library: no exceptions, results as bool.

#include <cstdio>
#include <string>

namespace img {

class OutputFile {
public:
    OutputFile() = default;
    ~OutputFile();
    OutputFile(const OutputFile&) = delete;
    OutputFile& operator=(const OutputFile&) = delete;

    // Opens the file for writing. False when it cannot be created.
    [[nodiscard]] bool open(const std::string& path);
    std::FILE* stream() const { return stream_; }

    // Flushes, closes and moves the file into place. False when any write,
    // the flush, the close or the rename failed; the target is then left as
    // it was (for a direct write, as far as it got).
    [[nodiscard]] bool commit();

    // Drops what was written (removes the temporary).
    void abort();

private:
    std::FILE* stream_ = nullptr;
    std::string target_;
    std::string temporary_; // empty for a direct write
    int registrySlot_ = -1; // this file's entry among the live temporaries
};

// Removes every temporary file of this process that is not yet committed or
// aborted. Async-signal-safe (it only calls unlink): meant for the handler of
// a signal that ends the run, so an interrupted write leaves nothing behind.
void removeLiveTemporaries() noexcept;

// Up to this many outputs may be open for writing at once.
constexpr int kMaxOpenOutputs = 8;

// STDOUT_FILENO or STDERR_FILENO when `path` names the file that descriptor
// writes to (/dev/stdout, /proc/self/fd/2, the same terminal), else -1.
int standardStreamDescriptor(const std::string& path);

// Writes a whole byte block to `path` through OutputFile. False on any failure.
[[nodiscard]] bool writeWholeFile(const std::string& path, const void* data, std::size_t size);

} // namespace img
