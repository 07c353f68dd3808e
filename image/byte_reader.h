#pragma once
// A bounds-checked, non-owning reader over a byte block. After the first
// overrun ok() stays false and every further read gives 0, so a parser can
// read a whole header and check once.

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "image/byte_order.h"

namespace img {

class ByteReader {
public:
    ByteReader(const std::uint8_t* data, std::size_t size) : data_(data), size_(size) {}

    bool ok() const { return ok_; }
    std::size_t position() const { return pos_; }
    std::size_t remaining() const { return ok_ ? size_ - pos_ : 0; }

    std::uint8_t u8() { return static_cast<std::uint8_t>(fixed(1)); }
    std::uint16_t u16le() { return static_cast<std::uint16_t>(fixed(2)); }
    std::uint32_t u32le() { return static_cast<std::uint32_t>(fixed(4)); }
    std::uint64_t u64le() { return fixed(8); }
    float f32le() {
        const std::uint32_t bits = u32le();
        float value;
        std::memcpy(&value, &bits, sizeof value);
        return value;
    }

    // Points at the next n bytes and steps over them; null after an overrun
    // (check ok(): an empty block may also sit at null).
    const std::uint8_t* take(std::size_t n) {
        if (!ok_ || n > size_ - pos_) {
            ok_ = false;
            return nullptr;
        }
        const std::uint8_t* p = data_ + pos_;
        pos_ += n;
        return p;
    }
    void skip(std::size_t n) { take(n); }
    // Copies n bytes out; on an overrun dst is left untouched.
    void copy(void* dst, std::size_t n) {
        const std::uint8_t* p = take(n);
        if (ok_ && n > 0)
            std::memcpy(dst, p, n);
    }
    // A reader over the next n bytes (a block payload); this one steps over them.
    ByteReader sub(std::size_t n) {
        const std::uint8_t* p = take(n);
        ByteReader inner(ok_ ? p : nullptr, ok_ ? n : 0);
        inner.ok_ = ok_;
        return inner;
    }

private:
    std::uint64_t fixed(std::size_t n) {
        const std::uint8_t* p = take(n);
        if (!p)
            return 0;
        std::uint64_t v = 0;
        for (std::size_t i = 0; i < n; ++i)
            v |= std::uint64_t{p[i]} << (8 * i);
        return v;
    }

    const std::uint8_t* data_;
    std::size_t size_;
    std::size_t pos_ = 0;
    bool ok_ = true;
};

} // namespace img
