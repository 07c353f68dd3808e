#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "blob/md5.h"
#include "reference_md5.h"

namespace blob {
namespace {

std::string hex(const Md5Digest& digest) {
    std::string text;
    char pair[3];
    for (std::uint8_t byte : digest) {
        std::snprintf(pair, sizeof pair, "%02x", byte);
        text += pair;
    }
    return text;
}

std::string md5Hex(const std::string& text) {
    return hex(md5(reinterpret_cast<const std::uint8_t*>(text.data()), text.size()));
}

TEST(Md5, MatchesTheReferenceVectors) {
    EXPECT_EQ(md5Hex(""), "d41d8cd98f00b204e9800998ecf8427e");
    EXPECT_EQ(md5Hex("a"), "0cc175b9c0f1b6a831c399e269772661");
    EXPECT_EQ(md5Hex("abc"), "900150983cd24fb0d6963f7d28e17f72");
    EXPECT_EQ(md5Hex("message digest"), "f96b697d7cb7938d525a2f31aaf161d0");
    EXPECT_EQ(md5Hex("abcdefghijklmnopqrstuvwxyz"), "c3fcd3d76192e4007dfb496cca67e13b");
    EXPECT_EQ(md5Hex("ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789"),
              "d174ab98d277d9f5a5611c2c9f419d9f");
    EXPECT_EQ(md5Hex("1234567890123456789012345678901234567890123456789012345678901234567890"
                     "1234567890"),
              "57edf4a22be3c955ac49da2e2107b67a");
}

TEST(Md5, EmptyRangeNeedsNoData) {
    EXPECT_EQ(hex(md5(nullptr, 0)), "d41d8cd98f00b204e9800998ecf8427e");
}

TEST(Md5, AgreesWithAnIndependentComputationForEveryLengthAroundTheBlockSize) {
    std::vector<std::uint8_t> data;
    for (std::size_t length = 0; length < 200; ++length) {
        EXPECT_EQ(md5(data.data(), data.size()), test::referenceMd5(data)) << length;
        data.push_back(static_cast<std::uint8_t>(length * 37 + 11));
    }
}

TEST(Md5, CoversEveryByteOfALongBinaryInput) {
    std::vector<std::uint8_t> data(100000);
    for (std::size_t i = 0; i < data.size(); ++i)
        data[i] = static_cast<std::uint8_t>(i * 7 + (i >> 8));
    const Md5Digest whole = md5(data.data(), data.size());
    data.back() ^= 1;
    EXPECT_NE(md5(data.data(), data.size()), whole);
}

} // namespace
} // namespace blob
