// The pieces the blob is made of: value codes, bit packing, big-endian bytes,
// the digest, date texts and configuration values checked for their fields.

#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <limits>
#include <sstream>
#include <string>

#include <gtest/gtest.h>

#include "blob/bit_packing.h"
#include "blob/byte_reader.h"
#include "blob/byte_writer.h"
#include "blob/field_values.h"
#include "blob/md5.h"
#include "blob/utc_date_text.h"
#include "blob/value_code.h"
#include "golden_file.h"

namespace blob {
namespace {

using Bytes = std::vector<std::uint8_t>;

// What one row of tests/data/blob/codec_cases.txt gives: its kind, then the
// fields after it; the last field of the row is the expected text.
std::string result(config::config_node& config, const std::vector<std::string>& f) {
    static const char kHex[] = "0123456789abcdef";
    const std::string& kind = f[0];
    std::string text;
    try {
        if (kind == "format") {
            const ValueFormat v = parseValueFormat(f[1]);
            return std::to_string(v.intBits) + "." + std::to_string(v.fracBits) + " " +
                   std::to_string(v.codeBits()) + " " + valueFormatText(v);
        }
        if (kind == "encode") {
            char code[16];
            std::snprintf(code, sizeof code, "%#x",
                          encodeValue(std::stod(f[1]), parseValueFormat(f[2])));
            return code;
        }
        if (kind == "decode" || kind == "range") {
            const ValueFormat v = parseValueFormat(f[2]);
            char value[64];
            if (kind == "decode")
                std::snprintf(
                    value, sizeof value, "%.25g",
                    decodeValue(static_cast<std::uint32_t>(std::stoul(f[1], nullptr, 16)), v));
            else
                std::snprintf(value, sizeof value, "%.25g %.25g", valueFormatMaximum(v),
                              valueFormatStep(v));
            return value;
        }
        if (kind == "date")
            return utcDateText(std::stoll(f[1])).value_or("(none)");
        if (kind == "md5") {
            for (std::uint8_t byte :
                 md5(reinterpret_cast<const std::uint8_t*>(f[1].data()), f[1].size()))
                text += std::string{kHex[byte >> 4], kHex[byte & 15]};
            return text;
        }
        config::config_node& node = config.child_path(f[1]);
        node.set(f[2]);
        if (kind == "serial") {
            for (std::uint8_t byte : serialBytes(config, node))
                text += std::string{kHex[byte >> 4], kHex[byte & 15]};
            return "x" + text;
        }
        if (kind == "posture")
            return std::string("'") + postureCharacter(config, node);
        return "#" + std::to_string(fieldValue(config, node, std::stoll(f[3]), std::stoll(f[4])));
    } catch (const std::exception& e) {
        return e.what();
    }
}

TEST(BlobCodec, CasesGiveTheirResults) {
    setenv("TZ", "Asia/Kolkata", 1); // dates are UTC whatever the time zone
    tzset();
    config::config_node_impl root{"root"};
    const std::vector<std::string> rows = testing_support::dataRows("blob/codec_cases.txt");
    EXPECT_GT(rows.size(), 80u);
    for (const std::string& row : rows) {
        std::vector<std::string> fields;
        for (std::size_t at = 0, bar;; at = bar + 1) {
            bar = row.find('|', at);
            fields.push_back(row.substr(at, bar - at));
            if (bar == std::string::npos)
                break;
        }
        EXPECT_EQ(result(root.child("config"), fields), fields.back()) << row;
    }
    unsetenv("TZ");
    tzset();
}

TEST(BlobCodec, EveryCodeDecodesToAValueThatCodesTheSame) {
    const ValueFormat f = parseValueFormat("s3.8");
    for (std::uint32_t code = 0; code < (1u << f.codeBits()); ++code) // -0 too
        ASSERT_EQ(encodeValue(decodeValue(code, f), f), code) << decodeValue(code, f);
    EXPECT_EQ(encodeValue(std::numeric_limits<double>::quiet_NaN(), f), 0u);
    EXPECT_EQ(md5(nullptr, 0), md5(reinterpret_cast<const std::uint8_t*>(""), 0));
    const std::int64_t min = std::numeric_limits<std::int64_t>::min();
    EXPECT_FALSE(utcDateText(min).has_value());
    EXPECT_FALSE(utcDateText(-(min + 1)).has_value());
    config::config_node_impl root{"root"};
    config::config_node& config = root.child("config");
    config::config_node& serial = config.child_path("module.serial_no");
    serial.set(std::string(2 * 65533, 'a')); // the longest the tracking block holds
    EXPECT_EQ(serialBytes(config, serial).size(), 65533u);
    serial.set(std::string(2 * 65534, 'a'));
    EXPECT_THROW(serialBytes(config, serial), std::runtime_error);
    EXPECT_THROW(fieldValue(config, config.find("reference").find("R"), 0, 65535),
                 std::invalid_argument);
}

TEST(BitPacking, PacksMostSignificantBitFirstAndUnpacksEveryWidth) {
    Bytes bytes = {0xAB}; // appended to what is there
    packCodes({0x180, 0x980}, 12, bytes);
    packCodes({0x7, 0x7, 0x7}, 3, bytes);     // 9 bits: the last byte filled with zeros
    packCodes({0xFFFFFFF0u, 0x1u}, 4, bytes); // only the low bits of each code
    EXPECT_EQ(bytes, (Bytes{0xAB, 0x18, 0x09, 0x80, 0xFF, 0x80, 0x01}));
    for (unsigned bits = 1; bits <= 32; ++bits) {
        EXPECT_EQ(packedSize(400, bits), 50u * bits);
        std::vector<std::uint32_t> codes(37);
        for (std::size_t i = 0; i < codes.size(); ++i)
            codes[i] = static_cast<std::uint32_t>((0x9E3779B97F4A7C15ull * (i + 1) >> 17) &
                                                  ((std::uint64_t{1} << bits) - 1));
        Bytes packed;
        packCodes(codes, bits, packed);
        ASSERT_EQ(packed.size(), packedSize(codes.size(), bits));
        std::vector<std::uint32_t> back;
        ASSERT_TRUE(unpackCodes(packed.data(), packed.size(), bits, codes.size(), back));
        EXPECT_EQ(back, codes) << bits << " bits";
    }
    const Bytes short599(599); // 400 codes of 12 bits need 600
    std::vector<std::uint32_t> codes;
    EXPECT_FALSE(unpackCodes(short599.data(), short599.size(), 12, 400, codes));
    EXPECT_TRUE(codes.empty());
}

TEST(ByteIo, BigEndianBothWaysAndOverrunsFailForGood) {
    Bytes bytes;
    ByteWriter out(bytes);
    out.u8(0x01);
    out.u16(0x0203);
    out.u32(0x04050607);
    out.u64(0x08090A0B0C0D0E0Full);
    const std::uint8_t tail[] = {0xAA};
    out.bytes(tail, 1);
    EXPECT_EQ(bytes, (Bytes{1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 0xAA}));
    EXPECT_EQ(out.size(), 16u);
    ByteReader in(bytes.data(), bytes.size());
    EXPECT_EQ(in.u8(), 0x01);
    EXPECT_EQ(in.u16(), 0x0203);
    EXPECT_EQ(in.u32(), 0x04050607u);
    EXPECT_EQ(in.u64(), 0x08090A0B0C0D0E0Full);
    EXPECT_TRUE(in.ok());
    EXPECT_EQ(in.position(), 15u);
    EXPECT_EQ(in.u16(), 0); // one byte left: nothing of it is used
    EXPECT_FALSE(in.ok());
    EXPECT_EQ(in.u8(), 0); // would fit, but the reader stays failed
    EXPECT_EQ(in.remaining(), 0u);
    ByteReader runs(bytes.data(), 4);
    EXPECT_EQ(runs.bytes(3), bytes.data());
    EXPECT_EQ(runs.bytes(std::numeric_limits<std::size_t>::max()), nullptr);
    EXPECT_FALSE(runs.ok());
    ByteReader empty(nullptr, 0);
    EXPECT_EQ(empty.u8(), 0);
    EXPECT_FALSE(empty.ok());
    const std::uint64_t max = std::numeric_limits<std::uint64_t>::max();
    EXPECT_TRUE(rangeInside(0, 16, 16));
    EXPECT_TRUE(rangeInside(16, 0, 16));
    EXPECT_FALSE(rangeInside(1, 16, 16));
    EXPECT_FALSE(rangeInside(17, 0, 16));
    EXPECT_FALSE(rangeInside(8, max, 16));
    EXPECT_FALSE(rangeInside(max, 2, 16));
}

} // namespace
} // namespace blob
