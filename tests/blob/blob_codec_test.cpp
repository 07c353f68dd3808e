// The pieces the blob is made of: value codes, bit packing, big-endian bytes,
// the digest, date texts and configuration values checked for their fields.

#include <cstdlib>
#include <ctime>
#include <limits>
#include <string>

#include <gtest/gtest.h>

#include "blob/bit_packing.h"
#include "blob/byte_reader.h"
#include "blob/byte_writer.h"
#include "blob/field_values.h"
#include "blob/md5.h"
#include "blob/utc_date_text.h"
#include "blob/value_code.h"

namespace blob {
namespace {

using Bytes = std::vector<std::uint8_t>;

ValueFormat format(unsigned intBits, unsigned fracBits) {
    ValueFormat f;
    f.intBits = intBits;
    f.fracBits = fracBits;
    return f;
}

TEST(ValueFormatText, ReadsAndWritesFormats) {
    const struct {
        const char* text;
        unsigned intBits, fracBits;
        const char* written;
    } cases[] = {{"s3.8", 3, 8, "s3.8"},
                 {"u7.8", 7, 8, "s7.8"},
                 {"s3.", 3, 0, "s3.0"},
                 {"s.8", 0, 8, "s0.8"},
                 {"s", 0, 0, "s0.0"},
                 {"u.", 0, 0, "s0.0"},
                 {"s99999999999999999999.1", 65535, 1, "s65535.1"}}; // saturates, no wrap
    for (const auto& c : cases) {
        const ValueFormat f = parseValueFormat(c.text);
        EXPECT_EQ(f.intBits, c.intBits) << c.text;
        EXPECT_EQ(f.fracBits, c.fracBits) << c.text;
        EXPECT_EQ(f.codeBits(), c.intBits + c.fracBits + 1) << c.text;
        EXPECT_EQ(valueFormatText(f), c.written);
    }
    for (const char* text :
         {"x3.8", "s3.8a", "s38", "", "S3.8", "s3.8.1", "s-3.8", "s3,8", " s3.8"}) {
        try {
            parseValueFormat(text);
            ADD_FAILURE() << text << " was accepted";
        } catch (const std::invalid_argument& e) {
            EXPECT_STREQ(e.what(), "invalid float encoding format") << text;
        }
    }
    EXPECT_DOUBLE_EQ(valueFormatMaximum(format(3, 8)), 7.99609375);
    EXPECT_DOUBLE_EQ(valueFormatMaximum(format(7, 8)), 127.99609375);
    EXPECT_DOUBLE_EQ(valueFormatMaximum(format(0, 0)), 0.0);
    EXPECT_DOUBLE_EQ(valueFormatStep(format(3, 8)), 1.0 / 256);
    EXPECT_DOUBLE_EQ(valueFormatStep(format(3, 0)), 1.0);
}

TEST(ValueCode, EncodesSignAndMagnitude) {
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const double inf = std::numeric_limits<double>::infinity();
    const struct {
        double value;
        unsigned intBits, fracBits;
        std::uint32_t code;
    } cases[] = {{1.5, 3, 8, 0x180},
                 {-1.5, 3, 8, 0x980},
                 {0.0, 3, 8, 0},
                 {7.99609375, 3, 8, 0x7FF},
                 {-7.99609375, 3, 8, 0xFFF},
                 {0.9990, 3, 8, 0x100}, // carries
                 {0.7, 3, 0, 0x1},
                 {0.125, 3, 2, 0x0},
                 {0.375, 3, 2, 0x1}, // ties go down
                 {0.376, 3, 2, 0x2},
                 {-0.375, 3, 2, 0x21},
                 {-0.001, 3, 8, 0x800}, // -0 kept
                 {nan, 3, 8, 0},
                 {inf, 3, 8, 0},
                 {-(32768.0 - 1.0 / 65536), 15, 16, 0xFFFFFFFF}};
    for (const auto& c : cases)
        EXPECT_EQ(encodeValue(c.value, format(c.intBits, c.fracBits)), c.code) << c.value;
    EXPECT_DOUBLE_EQ(decodeValue(0xFFFFFFFFu, format(15, 16)), -(32768.0 - 1.0 / 65536));
    EXPECT_DOUBLE_EQ(decodeValue(0x00018000u, format(15, 16)), 1.5);
    const ValueFormat f = format(3, 8);
    for (std::uint32_t code = 0; code < (1u << f.codeBits()); ++code) // -0 codes as itself too
        ASSERT_EQ(encodeValue(decodeValue(code, f), f), code) << decodeValue(code, f);
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

TEST(Md5, MatchesTheReferenceVectors) {
    const std::pair<std::string, std::string> vectors[] = {
        {"", "d41d8cd98f00b204e9800998ecf8427e"},
        {"a", "0cc175b9c0f1b6a831c399e269772661"},
        {"abc", "900150983cd24fb0d6963f7d28e17f72"},
        {"message digest", "f96b697d7cb7938d525a2f31aaf161d0"},
        {"abcdefghijklmnopqrstuvwxyz", "c3fcd3d76192e4007dfb496cca67e13b"},
        {"ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789",
         "d174ab98d277d9f5a5611c2c9f419d9f"},
        {"12345678901234567890123456789012345678901234567890123456789012345678901234567890",
         "57edf4a22be3c955ac49da2e2107b67a"}};
    for (const auto& [text, hex] : vectors) {
        const Md5Digest digest =
            md5(reinterpret_cast<const std::uint8_t*>(text.data()), text.size());
        std::string written;
        for (std::uint8_t byte : digest)
            written +=
                "0123456789abcdef"[byte >> 4] + std::string(1, "0123456789abcdef"[byte & 15]);
        EXPECT_EQ(written, hex) << text;
    }
    EXPECT_EQ(md5(nullptr, 0), md5(reinterpret_cast<const std::uint8_t*>(""), 0));
}

TEST(UtcDateText, FourDigitYearsToTheMinuteWhateverTheTimeZone) {
    setenv("TZ", "Asia/Kolkata", 1); // restored below
    tzset();
    const std::int64_t min = std::numeric_limits<std::int64_t>::min();
    const std::pair<std::int64_t, const char*> cases[] = {{0, "1970-01-01T00:00"},
                                                          {1335868200, "2012-05-01T10:30"},
                                                          {1335868259, "2012-05-01T10:30"},
                                                          {951782400, "2000-02-29T00:00"},
                                                          {2147483647, "2038-01-19T03:14"},
                                                          {4102444800, "2100-01-01T00:00"},
                                                          {-1, "1969-12-31T23:59"},
                                                          {-2208988800, "1900-01-01T00:00"},
                                                          {-62167219200, "0000-01-01T00:00"},
                                                          {253402300799, "9999-12-31T23:59"},
                                                          {-62167219201, ""},
                                                          {253402300800, ""},
                                                          {min, ""},
                                                          {-(min + 1), ""}};
    for (const auto& [seconds, text] : cases)
        EXPECT_EQ(utcDateText(seconds).value_or(""), text) << seconds;
    unsetenv("TZ");
    tzset();
}

TEST(FieldValues, WholeNumbersSerialsAndPosturesFitTheirFields) {
    config::config_node_impl root{"root"};
    config::config_node& config = root.child("config");
    // path, text, what reading it gives ("#" + number, "x" + serial bytes, "'" + posture or the
    // message)
    const struct {
        const char* path;
        std::string text;
        std::string expected;
    } cases[] = {
        {"af.macro", "4294967295", "#4294967295"},
        {"af.macro", "-1",
         "Value for af.macro does not fit in the binary calibration data, value must be between 0 "
         "and 4294967295."},
        {"af.macro", "99999999999999999999999",
         "Value for af.macro does not fit in the binary calibration data, value must be between 0 "
         "and 4294967295."},
        {"af.macro", "+7", "#7"},
        {"light", "-1", "#-1"},
        {"R", "1.5", "Value for R is not a whole number."},
        {"R", "", "Value for R is not a whole number."},
        {"R", "-", "Value for R is not a whole number."},
        {"R", "12a", "Value for R is not a whole number."},
        {"R", " 1", "Value for R is not a whole number."},
        {"R", "0x10", "Value for R is not a whole number."},
        {"serial_no", "0a1B", "x0a1b"},
        {"serial_no", "\"ff00\"", "xff00"},
        {"serial_no", "\"\"", "x"},
        {"serial_no", "", "x"},
        {"serial_no", std::string(2 * 65533, 'a'), "x" + std::string(2 * 65533, 'a')},
        {"serial_no", std::string(2 * 65534, 'a'),
         "Value for serial_no is too long for the binary calibration data."},
        {"serial_no", "0a1",
         "Value for serial_no is not a valid serial number, it must be an even number of "
         "hexadecimal digits."},
        {"serial_no", "0g",
         "Value for serial_no is not a valid serial number, it must be an even number of "
         "hexadecimal digits."},
        {"serial_no", "\"12 34\"",
         "Value for serial_no is not a valid serial number, it must be an even number of "
         "hexadecimal digits."},
        {"serial_no", "\"",
         "Value for serial_no is not a valid serial number, it must be an even number of "
         "hexadecimal digits."},
        {"serial_no", "-1",
         "Value for serial_no is not a valid serial number, it must be an even number of "
         "hexadecimal digits."},
        {"posture", "'H'", "'H"},
        {"posture", "V", "'V"},
        {"posture", "' '", "' "},
        {"posture", "", "Value for posture is empty, a posture character is needed."},
        {"posture", "Up", "Value for posture must be a single posture character."},
    };
    const std::string hex = "0123456789abcdef";
    for (const auto& c : cases) {
        config::config_node& node = config.child_path(c.path);
        node.set(c.text);
        std::string result;
        try {
            if (std::string(c.path) == "serial_no") {
                result = "x";
                for (std::uint8_t byte : serialBytes(config, node))
                    result += std::string(1, hex[byte >> 4]) + hex[byte & 15];
            } else if (std::string(c.path) == "posture") {
                result = std::string("'") + postureCharacter(config, node);
            } else {
                result = "#" + std::to_string(fieldValue(config, node, c.path[0] == 'l' ? -1 : 0,
                                                         c.path[0] == 'R' ? 65535 : 4294967295));
            }
        } catch (const std::runtime_error& e) {
            result = e.what();
        }
        EXPECT_EQ(result, c.expected) << c.path << " = " << c.text.substr(0, 20);
    }
    EXPECT_THROW(fieldValue(config, config.find("reference").find("R"), 0, 65535),
                 std::invalid_argument);
}

} // namespace
} // namespace blob
