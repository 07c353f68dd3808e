#include <vector>

#include <gtest/gtest.h>

#include "blob/bit_packing.h"

namespace blob {
namespace {

TEST(BitPacking, PacksMostSignificantBitFirstWithoutGaps) {
    std::vector<std::uint8_t> bytes;
    packCodes({0x180, 0x980}, 12, bytes);
    EXPECT_EQ(bytes, (std::vector<std::uint8_t>{0x18, 0x09, 0x80}));
}

TEST(BitPacking, FillsTheLastByteWithZeroBits) {
    std::vector<std::uint8_t> bytes;
    packCodes({0x7, 0x7, 0x7}, 3, bytes); // 9 bits
    EXPECT_EQ(bytes, (std::vector<std::uint8_t>{0xFF, 0x80}));
    EXPECT_EQ(packedSize(3, 3), 2u);
}

TEST(BitPacking, KeepsOnlyTheLowBitsOfEachCode) {
    std::vector<std::uint8_t> bytes;
    packCodes({0xFFFFFFF0u, 0x1u}, 4, bytes);
    EXPECT_EQ(bytes, (std::vector<std::uint8_t>{0x01}));
}

TEST(BitPacking, AppendsToWhatIsThere) {
    std::vector<std::uint8_t> bytes = {0xAB};
    packCodes({0x1}, 8, bytes);
    EXPECT_EQ(bytes, (std::vector<std::uint8_t>{0xAB, 0x01}));
}

TEST(BitPacking, FourHundredCodesTakeFiftyBytesPerBit) {
    for (unsigned bits = 1; bits <= 32; ++bits)
        EXPECT_EQ(packedSize(400, bits), 50u * bits);
}

TEST(BitUnpacking, ReadsBackWhatWasPackedForEveryWidth) {
    for (unsigned bits = 1; bits <= 32; ++bits) {
        std::vector<std::uint32_t> codes(37);
        const std::uint64_t mask = (std::uint64_t{1} << bits) - 1;
        for (std::size_t i = 0; i < codes.size(); ++i)
            codes[i] = static_cast<std::uint32_t>((0x9E3779B97F4A7C15ull * (i + 1) >> 17) & mask);
        std::vector<std::uint8_t> bytes;
        packCodes(codes, bits, bytes);
        ASSERT_EQ(bytes.size(), packedSize(codes.size(), bits));
        std::vector<std::uint32_t> back;
        ASSERT_TRUE(unpackCodes(bytes.data(), bytes.size(), bits, codes.size(), back));
        EXPECT_EQ(back, codes) << bits << " bits";
    }
}

TEST(BitUnpacking, RefusesDataShorterThanTheCodesNeed) {
    const std::vector<std::uint8_t> bytes(599); // 400 codes of 12 bits need 600
    std::vector<std::uint32_t> codes;
    EXPECT_FALSE(unpackCodes(bytes.data(), bytes.size(), 12, 400, codes));
    EXPECT_TRUE(codes.empty());
}

} // namespace
} // namespace blob
