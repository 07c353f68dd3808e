#include "image/byte_source.h"

#include <cstdlib>
#include <cstring>
#include <limits>
#include <memory>
#include <new>

#include "image/file_ptr.h"
#include "image/image_result.h"

#include <sys/stat.h>
#include <sys/types.h>

namespace img {

bool ByteSource::read(void* dst, std::size_t n) noexcept {
    if (n > remaining())
        return false;
    if (n > 0 && !readAt(position_, dst, n))
        return false;
    position_ += n;
    return true;
}

bool ByteSource::seek(std::uint64_t position) noexcept {
    if (position > size_)
        return false;
    position_ = position;
    return true;
}

MemorySource::~MemorySource() {
    std::free(owned_);
}

MemorySource* MemorySource::adopt(std::uint8_t* data, std::size_t size, const char* name) noexcept {
    auto* source = new (std::nothrow) MemorySource(data, size, name);
    if (!source) {
        std::free(data);
        return nullptr;
    }
    source->owned_ = data;
    return source;
}

bool MemorySource::readAt(std::uint64_t position, void* dst, std::size_t n) noexcept {
    std::memcpy(dst, data_ + position, n);
    return true;
}

FileSource::~FileSource() {
    std::fclose(file_);
}

bool FileSource::readAt(std::uint64_t position, void* dst, std::size_t n) noexcept {
    if (position != filePosition_) {
        if (position > static_cast<std::uint64_t>(std::numeric_limits<off_t>::max()) ||
            fseeko(file_, static_cast<off_t>(position), SEEK_SET) != 0)
            return false;
        filePosition_ = position;
    }
    const std::size_t got = std::fread(dst, 1, n, file_);
    filePosition_ += got;
    return got == n;
}

namespace {

using img::FilePtr;

// Reads a stream of unknown length into one malloc'd block.
ByteSource* readStream(FilePtr file, const char* path, int* result) {
    std::size_t capacity = 0, size = 0;
    std::uint8_t* data = nullptr;
    for (;;) {
        if (size == capacity) {
            if (capacity >= kMaxStreamBytes) {
                std::free(data);
                *result = kNoMemory;
                return nullptr;
            }
            const std::size_t grown = capacity == 0 ? 1 << 16 : capacity * 2;
            auto* bigger = static_cast<std::uint8_t*>(std::realloc(data, grown));
            if (!bigger) {
                std::free(data);
                *result = kNoMemory;
                return nullptr;
            }
            data = bigger;
            capacity = grown;
        }
        const std::size_t got = std::fread(data + size, 1, capacity - size, file.get());
        size += got;
        if (got == 0) {
            if (std::ferror(file.get())) {
                std::free(data);
                *result = kIoError;
                return nullptr;
            }
            break;
        }
    }
    ByteSource* source = MemorySource::adopt(data, size, path);
    *result = source ? kOk : kNoMemory;
    return source;
}

} // namespace

ByteSource* openSource(const char* path, int* result) noexcept {
    int ignored;
    if (!result)
        result = &ignored;
    if (!path) {
        *result = kBadArgument;
        return nullptr;
    }
    FilePtr file(std::fopen(path, "rb"));
    struct stat info;
    if (!file || fstat(fileno(file.get()), &info) != 0 || S_ISDIR(info.st_mode)) {
        *result = kBadArgument;
        return nullptr;
    }
    if (!S_ISREG(info.st_mode))
        return readStream(std::move(file), path, result);
    auto* source =
        new (std::nothrow) FileSource(file.get(), static_cast<std::uint64_t>(info.st_size), path);
    if (!source) {
        *result = kNoMemory;
        return nullptr;
    }
    file.release();
    *result = kOk;
    return source;
}

} // namespace img
