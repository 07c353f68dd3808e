#pragma once
// A plain RFC 1321 MD5, written out here so the tests can check the library
// digest against a computation that shares no code with it.

#include <array>
#include <cmath>
#include <cstdint>
#include <vector>

namespace blob::test {

inline std::array<std::uint8_t, 16> referenceMd5(const std::vector<std::uint8_t>& input) {
    static const unsigned kShift[64] = {7, 12, 17, 22, 7, 12, 17, 22, 7, 12, 17, 22, 7, 12, 17, 22,
                                        5, 9,  14, 20, 5, 9,  14, 20, 5, 9,  14, 20, 5, 9,  14, 20,
                                        4, 11, 16, 23, 4, 11, 16, 23, 4, 11, 16, 23, 4, 11, 16, 23,
                                        6, 10, 15, 21, 6, 10, 15, 21, 6, 10, 15, 21, 6, 10, 15, 21};
    std::uint32_t table[64];
    for (int i = 0; i < 64; ++i)
        table[i] =
            static_cast<std::uint32_t>(std::floor(std::fabs(std::sin(i + 1.0)) * 4294967296.0));

    std::vector<std::uint8_t> message = input;
    const std::uint64_t bitLength = std::uint64_t{input.size()} * 8;
    message.push_back(0x80);
    while (message.size() % 64 != 56)
        message.push_back(0);
    for (int i = 0; i < 8; ++i)
        message.push_back(static_cast<std::uint8_t>(bitLength >> (8 * i)));

    std::uint32_t h[4] = {0x67452301, 0xefcdab89, 0x98badcfe, 0x10325476};
    for (std::size_t chunk = 0; chunk < message.size(); chunk += 64) {
        std::uint32_t w[16];
        for (int i = 0; i < 16; ++i)
            w[i] = std::uint32_t{message[chunk + 4 * i]} |
                   std::uint32_t{message[chunk + 4 * i + 1]} << 8 |
                   std::uint32_t{message[chunk + 4 * i + 2]} << 16 |
                   std::uint32_t{message[chunk + 4 * i + 3]} << 24;
        std::uint32_t a = h[0], b = h[1], c = h[2], d = h[3];
        for (int i = 0; i < 64; ++i) {
            std::uint32_t f;
            int g;
            if (i < 16) {
                f = (b & c) | (~b & d);
                g = i;
            } else if (i < 32) {
                f = (d & b) | (~d & c);
                g = (5 * i + 1) % 16;
            } else if (i < 48) {
                f = b ^ c ^ d;
                g = (3 * i + 5) % 16;
            } else {
                f = c ^ (b | ~d);
                g = (7 * i) % 16;
            }
            const std::uint32_t sum = a + f + table[i] + w[g];
            a = d;
            d = c;
            c = b;
            b = b + (sum << kShift[i] | sum >> (32 - kShift[i]));
        }
        h[0] += a;
        h[1] += b;
        h[2] += c;
        h[3] += d;
    }
    std::array<std::uint8_t, 16> digest{};
    for (int i = 0; i < 16; ++i)
        digest[i] = static_cast<std::uint8_t>(h[i / 4] >> (8 * (i % 4)));
    return digest;
}

} // namespace blob::test
