#pragma once
// Where a raw parser takes its bytes from: a block in memory (tests, fuzzers)
// or an open file. The parsers read small headers into local buffers and
// decode them with ByteReader; large payloads are read straight into their
// final memory, so a file is read once. Every read checks the size first.

#include <cstddef>
#include <cstdint>
#include <cstdio>

namespace img {

class ByteSource {
public:
    virtual ~ByteSource() = default;

    std::uint64_t size() const { return size_; }
    std::uint64_t position() const { return position_; }
    std::uint64_t remaining() const { return size_ - position_; }

    // Reads exactly n bytes at the position and steps over them. False when
    // fewer remain or the read fails; the position is then unspecified.
    [[nodiscard]] bool read(void* dst, std::size_t n) noexcept;
    // Moves to an absolute position within the data.
    [[nodiscard]] bool seek(std::uint64_t position) noexcept;
    // Name for messages (the file path, or what the caller chose).
    const char* name() const { return name_; }

protected:
    ByteSource(std::uint64_t size, const char* name) : size_(size), name_(name ? name : "") {}
    [[nodiscard]] virtual bool readAt(std::uint64_t position, void* dst,
                                      std::size_t n) noexcept = 0;

private:
    std::uint64_t size_;
    std::uint64_t position_ = 0;
    const char* name_;
};

class MemorySource final : public ByteSource {
public:
    MemorySource(const std::uint8_t* data, std::size_t size, const char* name = "")
        : ByteSource(size, name), data_(data) {}
    ~MemorySource() override;
    MemorySource(const MemorySource&) = delete;
    MemorySource& operator=(const MemorySource&) = delete;
    // Takes ownership of a malloc'd block.
    static MemorySource* adopt(std::uint8_t* data, std::size_t size, const char* name) noexcept;

private:
    [[nodiscard]] bool readAt(std::uint64_t position, void* dst, std::size_t n) noexcept override;
    const std::uint8_t* data_;
    std::uint8_t* owned_ = nullptr;
};

// Reads a regular file through stdio. The size is taken once when opened.
class FileSource final : public ByteSource {
public:
    // Takes ownership of `file`, which is closed with the source.
    FileSource(std::FILE* file, std::uint64_t size, const char* name)
        : ByteSource(size, name), file_(file) {}
    ~FileSource() override;
    FileSource(const FileSource&) = delete;
    FileSource& operator=(const FileSource&) = delete;

private:
    [[nodiscard]] bool readAt(std::uint64_t position, void* dst, std::size_t n) noexcept override;
    std::FILE* file_;
    std::uint64_t filePosition_ = 0;
};

// Largest stream (pipe, device) read into memory by openSource.
constexpr std::uint64_t kMaxStreamBytes = std::uint64_t{1} << 30;

// Opens `path` for reading. A regular file is read in place; anything else
// (a pipe, /dev/stdin) is first read into memory, at most kMaxStreamBytes.
// Returns the source (the caller deletes it) or null with *result: -1 the
// file cannot be opened; -2 read error; -3 no memory or a stream too long.
[[nodiscard]] ByteSource* openSource(const char* path, int* result) noexcept;

} // namespace img
