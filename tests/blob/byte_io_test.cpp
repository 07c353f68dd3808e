#include <cstdint>
#include <limits>
#include <vector>

#include <gtest/gtest.h>

#include "blob/byte_reader.h"
#include "blob/byte_writer.h"

namespace blob {
namespace {

TEST(ByteWriter, WritesBigEndian) {
    std::vector<std::uint8_t> bytes;
    ByteWriter out(bytes);
    out.u8(0x01);
    out.u16(0x0203);
    out.u32(0x04050607);
    out.u64(0x08090A0B0C0D0E0Full);
    const std::uint8_t tail[] = {0xAA, 0xBB};
    out.bytes(tail, 2);
    const std::vector<std::uint8_t> expected = {1,  2,  3,  4,  5,  6,  7,    8,   9,
                                                10, 11, 12, 13, 14, 15, 0xAA, 0xBB};
    EXPECT_EQ(bytes, expected);
    EXPECT_EQ(out.size(), expected.size());
}

TEST(ByteReader, ReadsBigEndian) {
    const std::uint8_t data[] = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15};
    ByteReader in(data, sizeof data);
    EXPECT_EQ(in.u8(), 0x01);
    EXPECT_EQ(in.u16(), 0x0203);
    EXPECT_EQ(in.u32(), 0x04050607u);
    EXPECT_EQ(in.u64(), 0x08090A0B0C0D0E0Full);
    EXPECT_TRUE(in.ok());
    EXPECT_EQ(in.remaining(), 0u);
}

TEST(ByteReader, OverrunFailsAndStaysFailed) {
    const std::uint8_t data[] = {0xFF, 0xFF, 0xFF};
    ByteReader in(data, sizeof data);
    EXPECT_EQ(in.u16(), 0xFFFF);
    EXPECT_EQ(in.u16(), 0); // one byte left: nothing of it is used
    EXPECT_FALSE(in.ok());
    EXPECT_EQ(in.u8(), 0); // would fit, but the reader stays failed
    EXPECT_EQ(in.remaining(), 0u);
}

TEST(ByteReader, ByteRunsAreCheckedAgainstWhatRemains) {
    const std::uint8_t data[] = {1, 2, 3, 4};
    ByteReader in(data, sizeof data);
    EXPECT_EQ(in.bytes(3), data);
    EXPECT_EQ(in.position(), 3u);
    EXPECT_EQ(in.bytes(std::numeric_limits<std::size_t>::max()), nullptr);
    EXPECT_FALSE(in.ok());
}

TEST(ByteReader, EmptyBufferFailsOnFirstRead) {
    ByteReader in(nullptr, 0);
    EXPECT_EQ(in.u8(), 0);
    EXPECT_FALSE(in.ok());
}

TEST(RangeInside, CannotOverflow) {
    EXPECT_TRUE(rangeInside(0, 16, 16));
    EXPECT_TRUE(rangeInside(16, 0, 16));
    EXPECT_FALSE(rangeInside(1, 16, 16));
    EXPECT_FALSE(rangeInside(17, 0, 16));
    EXPECT_FALSE(rangeInside(8, std::numeric_limits<std::uint64_t>::max(), 16));
    EXPECT_FALSE(rangeInside(std::numeric_limits<std::uint64_t>::max(), 2, 16));
}

} // namespace
} // namespace blob
