#include <stdexcept>

#include <gtest/gtest.h>

#include "prep/bayer_planes.h"
#include "test_images.h"

using prep_test::fillRamp;
using prep_test::makeImage;
using prep_test::samplesOf;

using img::BayerImage;
using img::imageCreate;
using img::kBufferRawCfa;
using img::kCfaBggr;
using img::kCfaGbrg;
using img::kCfaGrbg;
using img::kCfaRggb;
using img::kDataUint16;
using img::kPixelOther;
using img::kPixelRaw;

namespace {

TEST(PatternSize, TwoByTwoBayerOrders) {
    for (std::uint32_t cfa : {kCfaRggb, kCfaGrbg, kCfaGbrg, kCfaBggr})
        EXPECT_EQ(prep::patternSize(0, cfa), 2);
}

TEST(PatternSize, FourWhenFirstWordHasLowBits) {
    EXPECT_EQ(prep::patternSize(0x1, 0), 4);
    EXPECT_EQ(prep::patternSize(0x2, kCfaRggb), 4);
}

TEST(PatternSize, OneOtherwise) {
    EXPECT_EQ(prep::patternSize(0, 0), 1);
    EXPECT_EQ(prep::patternSize(0, 0x23341000), 1); // bits below 16 set
    EXPECT_EQ(prep::patternSize(0x10, 0), 1);
}

TEST(Split, PlaneChannelHoldsMosaicPosition) {
    BayerImage mosaic = makeImage(6, 4);
    fillRamp(mosaic);
    const BayerImage planes = prep::split(mosaic);
    ASSERT_EQ(planes.width(), 3);
    ASSERT_EQ(planes.height(), 2);
    ASSERT_EQ(planes.channels(), 4);
    EXPECT_EQ(planes.buffer()->pixelType, static_cast<std::uint32_t>(kPixelOther));
    for (int y = 0; y < 2; ++y)
        for (int x = 0; x < 3; ++x)
            for (int r = 0; r < 2; ++r)
                for (int c = 0; c < 2; ++c)
                    EXPECT_EQ(planes.pixels()[(y * 3 + x) * 4 + r * 2 + c],
                              mosaic.pixels()[(2 * y + r) * 6 + 2 * x + c]);
}

TEST(Split, OddSizeDropsLastRowAndColumn) {
    BayerImage mosaic = makeImage(5, 3);
    fillRamp(mosaic);
    const BayerImage planes = prep::split(mosaic);
    EXPECT_EQ(planes.width(), 2);
    EXPECT_EQ(planes.height(), 1);
}

TEST(Split, SensorSizeGivesHalfSizePlanes) {
    BayerImage mosaic = makeImage(4000, 3000);
    prep_test::fill(mosaic, 0.5f);
    const BayerImage planes = prep::split(mosaic);
    EXPECT_EQ(planes.width(), 2000);
    EXPECT_EQ(planes.height(), 1500);
    EXPECT_EQ(planes.channels(), 4);
    BayerImage reduced;
    prep::downsample(planes, 3, reduced);
    EXPECT_EQ(reduced.width(), 667);
    EXPECT_EQ(reduced.height(), 500);
    EXPECT_EQ(reduced.channels(), 4);
}

TEST(Split, RefusesIntegerSamples) {
    int result = 0;
    BayerImage mosaic;
    mosaic.reset(
        imageCreate(4, 4, 10, 1, 1, 0, kCfaRggb, kPixelRaw, kBufferRawCfa, kDataUint16, &result));
    EXPECT_THROW(prep::split(mosaic), std::invalid_argument);
}

TEST(Downsample, KeepsEveryFactorthSample) {
    BayerImage planes = makeImage(5, 4, 4);
    fillRamp(planes);
    BayerImage target;
    prep::downsample(planes, 2, target);
    ASSERT_EQ(target.width(), 3);
    ASSERT_EQ(target.height(), 2);
    for (int y = 0; y < 2; ++y)
        for (int x = 0; x < 3; ++x)
            for (int k = 0; k < 4; ++k)
                EXPECT_EQ(target.pixels()[(y * 3 + x) * 4 + k],
                          planes.pixels()[(2 * y * 5 + 2 * x) * 4 + k]);
}

TEST(Downsample, RefusesFactorBelowOne) {
    BayerImage planes = makeImage(4, 4, 4);
    BayerImage target;
    EXPECT_THROW(prep::downsample(planes, 0, target), std::invalid_argument);
}

class RoundTrip : public ::testing::TestWithParam<std::uint32_t> {};

TEST_P(RoundTrip, SplitDownsampleByOneWeaveIsIdentity) {
    BayerImage mosaic = makeImage(8, 6, 1, GetParam());
    fillRamp(mosaic);
    const BayerImage planes = prep::split(mosaic);
    BayerImage same;
    prep::downsample(planes, 1, same);
    const BayerImage woven = prep::weave(same, 2, 0, GetParam());
    EXPECT_EQ(woven.width(), 8);
    EXPECT_EQ(woven.height(), 6);
    EXPECT_EQ(woven.channels(), 1);
    EXPECT_EQ(woven.cfa(), GetParam());
    EXPECT_EQ(woven.buffer()->pixelType, static_cast<std::uint32_t>(kPixelRaw));
    EXPECT_EQ(samplesOf(woven), samplesOf(mosaic));
}

INSTANTIATE_TEST_SUITE_P(BayerOrders, RoundTrip,
                         ::testing::Values(kCfaRggb, kCfaGrbg, kCfaGbrg, kCfaBggr));

TEST(Weave, RefusesWrongChannelCount) {
    BayerImage planes = makeImage(4, 4, 3);
    try {
        prep::weave(planes, 2, 0, kCfaRggb);
        FAIL();
    } catch (const std::invalid_argument& e) {
        EXPECT_STREQ(e.what(), "Invalid image format for Bayer interweaving.");
    }
}

TEST(Weave, RefusesAbsurdPatternSize) {
    BayerImage planes = makeImage(4, 4, 4);
    EXPECT_THROW(prep::weave(planes, 65536, 0, kCfaRggb), std::invalid_argument);
    EXPECT_THROW(prep::weave(planes, 0, 0, kCfaRggb), std::invalid_argument);
}

TEST(Weave, RefusesPatternOfOtherSize) {
    BayerImage planes = makeImage(4, 4, 4);
    try {
        prep::weave(planes, 2, 0, 0);
        FAIL();
    } catch (const std::invalid_argument& e) {
        EXPECT_STREQ(e.what(), "Invalid pattern size for Bayer interweaving.");
    }
}

} // namespace
