// Splitting a mosaic into colour planes, down-sampling and weaving back.

#include <stdexcept>

#include "prep/bayer_planes.h"
#include "tests/prep/test_images.h"

namespace {

using img::BayerImage;
using prep_test::counting;
using prep_test::makeImage;
using prep_test::samplesOf;

const std::uint32_t kOrders[] = {img::kCfaRggb, img::kCfaGrbg, img::kCfaGbrg, img::kCfaBggr};

TEST(BayerPlanes, PatternSizeFromTheCfaWords) {
    for (std::uint32_t cfa : kOrders)
        EXPECT_EQ(prep::patternSize(0, cfa), 2);
    const struct {
        std::uint32_t cfa0, cfa1;
        int size;
    } cases[] = {{0x1, 0, 4}, {0x2, img::kCfaRggb, 4}, {0, 0, 1}, {0, 0x23341000, 1}, {0x10, 0, 1}};
    for (const auto& c : cases)
        EXPECT_EQ(prep::patternSize(c.cfa0, c.cfa1), c.size) << c.cfa0 << " " << c.cfa1;
}

TEST(BayerPlanes, SplitGivesEachPlanePixelItsTwoByTwoBlock) {
    const BayerImage planes = prep::split(makeImage(6, 4, 1, img::kCfaRggb, counting(24)));
    ASSERT_EQ(planes.width(), 3);
    ASSERT_EQ(planes.height(), 2);
    ASSERT_EQ(planes.channels(), 4);
    EXPECT_EQ(planes.buffer()->pixelType, static_cast<std::uint32_t>(img::kPixelOther));
    EXPECT_EQ(samplesOf(planes),
              (std::vector<float>{0,  1,  6,  7,  2,  3,  8,  9,  4,  5,  10, 11,
                                  12, 13, 18, 19, 14, 15, 20, 21, 16, 17, 22, 23}));
    const BayerImage odd = prep::split(makeImage(5, 3)); // last row and column dropped
    EXPECT_EQ(odd.width(), 2);
    EXPECT_EQ(odd.height(), 1);
    int result = 0;
    BayerImage integers;
    integers.reset(img::imageCreate(4, 4, 10, 1, 1, 0, img::kCfaRggb, img::kPixelRaw,
                                    img::kBufferRawCfa, img::kDataUint16, &result));
    EXPECT_THROW(prep::split(integers), std::invalid_argument);
}

TEST(BayerPlanes, DownsampleKeepsEveryFactorthSampleRoundingUp) {
    BayerImage target;
    prep::downsample(makeImage(5, 4, 4, 0, counting(80)), 2, target);
    ASSERT_EQ(target.width(), 3);
    ASSERT_EQ(target.height(), 2);
    EXPECT_EQ(samplesOf(target),
              (std::vector<float>{0,  1,  2,  3,  8,  9,  10, 11, 16, 17, 18, 19,
                                  40, 41, 42, 43, 48, 49, 50, 51, 56, 57, 58, 59}));
    prep::downsample(makeImage(7, 5, 4), 3, target);
    EXPECT_EQ(target.width(), 3);
    EXPECT_EQ(target.height(), 2);
    EXPECT_EQ(target.channels(), 4);
    EXPECT_THROW(prep::downsample(makeImage(4, 4, 4), 0, target), std::invalid_argument);
}

TEST(BayerPlanes, SplitThenWeaveGivesBackTheMosaicOfEveryOrder) {
    for (std::uint32_t cfa : kOrders) {
        const BayerImage mosaic = makeImage(8, 6, 1, cfa, counting(48));
        const BayerImage woven = prep::weave(prep::split(mosaic), 2, 0, cfa);
        EXPECT_EQ(woven.width(), 8);
        EXPECT_EQ(woven.height(), 6);
        EXPECT_EQ(woven.channels(), 1);
        EXPECT_EQ(woven.cfa(), cfa);
        EXPECT_EQ(woven.buffer()->pixelType, static_cast<std::uint32_t>(img::kPixelRaw));
        EXPECT_EQ(samplesOf(woven), samplesOf(mosaic));
    }
}

TEST(BayerPlanes, WeaveRefusesOtherFormatsAndPatterns) {
    const BayerImage planes = makeImage(4, 4, 4);
    EXPECT_EQ(case_data::errorOf([] { prep::weave(makeImage(4, 4, 3), 2, 0, img::kCfaRggb); }),
              "Invalid image format for Bayer interweaving.");
    EXPECT_EQ(case_data::errorOf([&] { prep::weave(planes, 2, 0, 0); }),
              "Invalid pattern size for Bayer interweaving.");
    EXPECT_THROW(prep::weave(planes, 2, 0, 0), std::invalid_argument);
    EXPECT_THROW(prep::weave(planes, 65536, 0, img::kCfaRggb), std::invalid_argument);
    EXPECT_THROW(prep::weave(planes, 0, 0, img::kCfaRggb), std::invalid_argument);
}

} // namespace
