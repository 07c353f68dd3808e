#pragma once
// Builds binary calibration data byte by byte for the tests, so each case
// shows the bytes it feeds the parser.

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "blob/blob_layout.h"
#include "blob/md5.h"

namespace blob::test {

using Bytes = std::vector<std::uint8_t>;

inline void put(Bytes& out, std::uint64_t value, int bytes) {
    for (int i = bytes - 1; i >= 0; --i)
        out.push_back(static_cast<std::uint8_t>(value >> (8 * i)));
}

inline Bytes trackingBlock(const Bytes& serial) {
    Bytes out;
    put(out, serial.size() + 2, 2);
    out.insert(out.end(), serial.begin(), serial.end());
    return out;
}

inline Bytes toolBlock(std::uint8_t major, std::uint8_t minor, std::uint8_t patch,
                       std::uint64_t date, std::uint8_t program) {
    Bytes out = {13, major, minor, patch};
    put(out, date, 8);
    out.push_back(program);
    return out;
}

// 400 codes of `bits` bits packed MSB first; `code(n)` gives code n.
template <typename CodeOf>
Bytes lscBlock(std::uint8_t light, std::uint8_t intBits, std::uint8_t fracBits, CodeOf code) {
    Bytes out = {light, intBits, fracBits, 0};
    const unsigned bits = intBits + fracBits + 1u;
    std::uint64_t pending = 0;
    unsigned pendingBits = 0;
    for (int n = 0; n < 400; ++n) {
        pending = (pending << bits) | (static_cast<std::uint64_t>(code(n)) & ((1ull << bits) - 1));
        pendingBits += bits;
        while (pendingBits >= 8) {
            pendingBits -= 8;
            out.push_back(static_cast<std::uint8_t>(pending >> pendingBits));
        }
        pending &= (1ull << pendingBits) - 1;
    }
    if (pendingBits)
        out.push_back(static_cast<std::uint8_t>(pending << (8 - pendingBits)));
    return out;
}

inline Bytes awbBlock(std::uint16_t light, std::uint16_t r, std::uint16_t gr, std::uint16_t gb,
                      std::uint16_t b) {
    Bytes out;
    for (std::uint16_t v : {light, r, gr, gb, b})
        put(out, v, 2);
    return out;
}

struct Focus {
    char posture = 'H';
    std::uint32_t macro = 0, hyper = 0, inf = 0;
    std::uint16_t settle = 0, hysteresis = 0;
    std::vector<std::pair<std::uint32_t, std::uint32_t>> pairs;
};

// Minor version 4 and above: 32-bit values; before: 16-bit values.
inline Bytes focusBlock(const Focus& f, bool wide = true) {
    const int width = wide ? 4 : 2;
    Bytes out = {static_cast<std::uint8_t>(f.posture)};
    put(out, f.macro, width);
    put(out, f.hyper, width);
    put(out, f.inf, width);
    put(out, f.settle, 2);
    put(out, f.hysteresis, 2);
    out.push_back(static_cast<std::uint8_t>(f.pairs.size()));
    for (const auto& [a, b] : f.pairs) {
        put(out, a, width);
        put(out, b, width);
    }
    return out;
}

class BlobBuilder {
public:
    BlobBuilder& minor(std::uint8_t value) {
        minor_ = value;
        return *this;
    }
    BlobBuilder& block(std::uint16_t type, Bytes bytes) {
        blocks_.emplace_back(type, std::move(bytes));
        return *this;
    }

    // Header, table, blocks in table order, then the digest of all of it.
    Bytes build() const {
        Bytes out = {0xCA, 0x1B, 0xA7, 0xED, 1, minor_, 0, 0};
        std::size_t offset = 8 + 4 * (blocks_.size() + 1);
        for (const auto& [type, bytes] : blocks_) {
            put(out, type, 2);
            put(out, offset, 2);
            offset += bytes.size();
        }
        put(out, 0xB10B, 2);
        put(out, offset, 2);
        for (const auto& entry : blocks_)
            out.insert(out.end(), entry.second.begin(), entry.second.end());
        const Md5Digest digest = md5(out.data(), out.size());
        out.insert(out.end(), digest.begin(), digest.end());
        return out;
    }

private:
    std::uint8_t minor_ = 4;
    std::vector<std::pair<std::uint16_t, Bytes>> blocks_;
};

// Rewrites the digest after a test changed bytes before it.
inline void resign(Bytes& blob) {
    const std::size_t end = blob.size() - 16;
    const Md5Digest digest = md5(blob.data(), end);
    std::copy(digest.begin(), digest.end(), blob.begin() + static_cast<std::ptrdiff_t>(end));
}

} // namespace blob::test
