// The preparation of integer rows as they are read, against the preparation
// of the float image that the image object would load from the same samples:
// every prepared sample must have the same bits.

#include <cstring>
#include <random>
#include <vector>

#include "prep/mosaic_stream.h"
#include "tests/prep/test_images.h"

using img::BayerImage;
using img::kCfaGrbg;

namespace {

using prep::MosaicPreparation;

struct StreamCase {
    std::int32_t width, height;
    std::uint16_t bits;
    bool median;
    int size, factor;
};

// Odd and even sizes, images narrower than the window, every window size,
// factors 1 to 5, the median off, depths 8 to 16.
const StreamCase kCases[] = {
    {64, 48, 10, true, 3, 1},  {67, 49, 10, true, 3, 4}, {130, 34, 12, true, 3, 3},
    {40, 30, 10, true, 1, 2},  {41, 31, 10, true, 2, 1}, {40, 30, 12, true, 4, 2},
    {50, 38, 10, true, 5, 3},  {36, 30, 16, true, 6, 1}, {45, 41, 10, true, 7, 5},
    {40, 40, 14, true, 8, 2},  {38, 34, 10, true, 9, 4}, {60, 44, 10, true, 10, 3},
    {8, 6, 10, true, 9, 1},    {6, 14, 11, true, 3, 1},  {2, 2, 10, true, 3, 1},
    {64, 48, 10, false, 3, 1}, {65, 47, 8, false, 3, 3}, {3, 5, 10, false, 1, 2},
};

TEST(MosaicStream, GivesTheBitsOfTheFloatPreparation) {
    for (const StreamCase& c : kCases) {
        const MosaicPreparation settings{c.median, c.size, c.factor};
        // Noise over the whole range, with runs of repeats, black and white.
        std::mt19937 random(c.width * 131 + c.height);
        const std::uint32_t mask = (1u << c.bits) - 1u;
        std::vector<std::uint16_t> samples(static_cast<std::size_t>(c.width) * c.height);
        for (std::uint16_t& s : samples) {
            const auto pick = static_cast<std::uint32_t>(random() % 100);
            s = static_cast<std::uint16_t>(pick < 3    ? mask
                                           : pick < 6  ? 0
                                           : pick < 30 ? mask / 2
                                                       : random() & mask);
        }

        BayerImage image = prep_test::makeImage(c.width, c.height, 1, kCfaGrbg, c.bits);
        for (std::size_t i = 0; i < samples.size(); ++i)
            image.pixels()[i] = static_cast<float>(samples[i]) / static_cast<float>(mask);
        const BayerImage expected = prep::prepareMosaic(image, settings);

        prep::MosaicStream stream(c.width, c.height, settings);
        for (std::int32_t y = 0; y < c.height; ++y)
            stream.addRow(samples.data() + static_cast<std::size_t>(y) * c.width);
        const BayerImage actual = stream.finish(c.bits, 0, kCfaGrbg);

        SCOPED_TRACE(::testing::Message() << c.width << " x " << c.height << " size " << c.size
                                          << " factor " << c.factor);
        ASSERT_EQ(actual.width(), expected.width());
        ASSERT_EQ(actual.height(), expected.height());
        EXPECT_EQ(actual.bitsPerSample(), expected.bitsPerSample());
        EXPECT_EQ(actual.cfa(), expected.cfa());
        const std::size_t count = static_cast<std::size_t>(actual.width()) * actual.height();
        EXPECT_EQ(std::memcmp(actual.pixels(), expected.pixels(), count * sizeof(float)), 0);
        EXPECT_EQ(stream.largest(), *std::max_element(samples.begin(), samples.end()));
    }
}

TEST(MosaicStream, RefusesWhatThePreparationRefuses) {
    EXPECT_FALSE(prep::MosaicStream::accepts(1, 10, {}));
    EXPECT_FALSE(prep::MosaicStream::accepts(10, 1, {}));
    EXPECT_FALSE(prep::MosaicStream::accepts(10, 10, {true, 11, 1}));
    EXPECT_FALSE(prep::MosaicStream::accepts(10, 10, {true, 3, 0}));
    EXPECT_TRUE(prep::MosaicStream::accepts(10, 10, {false, 11, 1}));
    EXPECT_THROW(prep::MosaicStream(10, 10, {true, 0, 1}), std::invalid_argument);
}

} // namespace
