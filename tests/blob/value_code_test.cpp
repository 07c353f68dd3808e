#include <stdexcept>

#include <gtest/gtest.h>

#include "blob/value_code.h"

namespace blob {
namespace {

ValueFormat format(unsigned intBits, unsigned fracBits) {
    ValueFormat f;
    f.intBits = intBits;
    f.fracBits = fracBits;
    return f;
}

TEST(ValueFormatText, ReadsSignedAndUnsignedForms) {
    const ValueFormat s = parseValueFormat("s3.8");
    EXPECT_EQ(s.intBits, 3u);
    EXPECT_EQ(s.fracBits, 8u);
    EXPECT_EQ(s.codeBits(), 12u);
    const ValueFormat u = parseValueFormat("u7.8");
    EXPECT_EQ(u.intBits, 7u);
    EXPECT_EQ(u.fracBits, 8u);
}

TEST(ValueFormatText, MissingNumbersReadAsZero) {
    EXPECT_EQ(parseValueFormat("s3.").intBits, 3u);
    EXPECT_EQ(parseValueFormat("s3.").fracBits, 0u);
    EXPECT_EQ(parseValueFormat("s.8").intBits, 0u);
    EXPECT_EQ(parseValueFormat("s.8").fracBits, 8u);
    EXPECT_EQ(parseValueFormat("s").codeBits(), 1u);
    EXPECT_EQ(parseValueFormat("u.").codeBits(), 1u);
}

TEST(ValueFormatText, RejectsMalformedTexts) {
    for (const char* text :
         {"x3.8", "s3.8a", "s38", "", "S3.8", "s3.8.1", "s-3.8", "s3,8", " s3.8"}) {
        try {
            parseValueFormat(text);
            ADD_FAILURE() << text << " was accepted";
        } catch (const std::invalid_argument& e) {
            EXPECT_STREQ(e.what(), "invalid float encoding format") << text;
        }
    }
}

TEST(ValueFormatText, HugeBitCountsSaturateInsteadOfWrapping) {
    const ValueFormat f = parseValueFormat("s99999999999999999999.1");
    EXPECT_EQ(f.intBits, 65535u);
    EXPECT_GT(f.intBits + f.fracBits, 15u);
}

TEST(ValueFormatText, IsWrittenWithTheLetterS) {
    EXPECT_EQ(valueFormatText(parseValueFormat("u3.8")), "s3.8");
    EXPECT_EQ(valueFormatText(format(0, 15)), "s0.15");
}

TEST(ValueFormatRange, MaximumAndStep) {
    EXPECT_DOUBLE_EQ(valueFormatMaximum(format(3, 8)), 7.99609375);
    EXPECT_DOUBLE_EQ(valueFormatStep(format(3, 8)), 1.0 / 256);
    EXPECT_DOUBLE_EQ(valueFormatMaximum(format(7, 8)), 127.99609375);
    EXPECT_DOUBLE_EQ(valueFormatMaximum(format(0, 0)), 0.0);
    EXPECT_DOUBLE_EQ(valueFormatStep(format(3, 0)), 1.0);
}

TEST(ValueCode, CodesSignAndMagnitude) {
    const ValueFormat f = format(3, 8);
    EXPECT_EQ(encodeValue(1.5, f), 0x180u);
    EXPECT_EQ(encodeValue(-1.5, f), 0x980u);
    EXPECT_EQ(encodeValue(0.0, f), 0u);
    EXPECT_EQ(encodeValue(7.99609375, f), 0x7FFu);
    EXPECT_EQ(encodeValue(-7.99609375, f), 0xFFFu);
}

TEST(ValueCode, FractionRoundingCarriesIntoTheIntegerPart) {
    EXPECT_EQ(encodeValue(0.9990, format(3, 8)), 0x100u);
    EXPECT_EQ(encodeValue(0.7, format(3, 0)), 0x1u);
}

TEST(ValueCode, TiesGoToTheLowerStep) {
    const ValueFormat f = format(3, 2); // steps of 0.25
    EXPECT_EQ(encodeValue(0.125, f), 0x0u);
    EXPECT_EQ(encodeValue(0.375, f), 0x1u);
    EXPECT_EQ(encodeValue(0.376, f), 0x2u);
    EXPECT_EQ(encodeValue(-0.375, f), 0x21u);
}

TEST(ValueCode, NegativeZeroKeepsItsSignSoItCodesTheSameAgain) {
    const ValueFormat f = format(3, 8);
    const std::uint32_t code = encodeValue(-0.001, f);
    EXPECT_EQ(code, 0x800u);
    EXPECT_EQ(encodeValue(decodeValue(code, f), f), code);
}

TEST(ValueCode, NonFiniteValuesCodeAsZero) {
    EXPECT_EQ(encodeValue(std::numeric_limits<double>::quiet_NaN(), format(3, 8)), 0u);
    EXPECT_EQ(encodeValue(std::numeric_limits<double>::infinity(), format(3, 8)), 0u);
}

TEST(ValueCode, DecodesEveryCodeOfAFormatBackToItself) {
    const ValueFormat f = format(3, 8);
    for (std::uint32_t code = 0; code < (1u << f.codeBits()); ++code) {
        if (code == 0x800u)
            continue; // -0 is the only value with two codes
        const double value = decodeValue(code, f);
        ASSERT_EQ(encodeValue(value, f), code) << value;
    }
}

TEST(ValueCode, DecodesTheWidestCodes) {
    const ValueFormat f = format(15, 16); // 32 bits
    EXPECT_DOUBLE_EQ(decodeValue(0xFFFFFFFFu, f), -(32768.0 - 1.0 / 65536));
    EXPECT_DOUBLE_EQ(decodeValue(0x00018000u, f), 1.5);
    EXPECT_EQ(encodeValue(-(32768.0 - 1.0 / 65536), f), 0xFFFFFFFFu);
}

} // namespace
} // namespace blob
