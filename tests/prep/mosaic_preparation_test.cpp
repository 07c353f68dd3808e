// The one-pass preparation against split, median filter or down-sampling and
// weave done one after the other.

#include <cmath>
#include <cstring>
#include <limits>
#include <random>
#include <stdexcept>
#include <string>

#include "prep/bayer_planes.h"
#include "prep/median_filter.h"
#include "prep/mosaic_preparation.h"
#include "tests/prep/test_images.h"

using img::BayerImage;
using img::ImageBuffer;
using img::kCfaBggr;
using img::kCfaGbrg;
using img::kCfaGrbg;
using img::kCfaRggb;

namespace {

using prep::MosaicPreparation;
using prep_test::makeImage;

// Noise around a level, with runs of equal values (repeats share tree nodes)
// and a few hot and dead samples.
BayerImage noisyMosaic(std::int32_t width, std::int32_t height, std::uint32_t cfa1,
                       std::uint16_t channels = 1, unsigned seed = 7) {
    BayerImage image = makeImage(width, height, channels, cfa1);
    std::mt19937 random(seed);
    std::uniform_int_distribution<int> level(0, 1023);
    std::uniform_int_distribution<int> pick(0, 99);
    const std::size_t count = static_cast<std::size_t>(width) * height * channels;
    for (std::size_t i = 0; i < count; ++i) {
        const int choice = pick(random);
        image.pixels()[i] = choice < 3    ? 1.0f
                            : choice < 6  ? 0.0f
                            : choice < 40 ? 0.5f
                                          : static_cast<float>(level(random)) / 1023.0f;
    }
    return image;
}

BayerImage inSteps(const BayerImage& mosaic, const MosaicPreparation& settings) {
    const ImageBuffer* buffer = mosaic.buffer();
    const BayerImage planes = prep::split(mosaic);
    BayerImage reduced;
    if (settings.medianFilter)
        prep::medianFilterDownsample(planes, settings.medianSize, settings.samplingFactor, reduced);
    else
        prep::downsample(planes, settings.samplingFactor, reduced);
    return prep::weave(reduced, prep::patternSize(buffer->cfa[0], buffer->cfa[1]), buffer->cfa[0],
                       buffer->cfa[1]);
}

// Same geometry, types and bit for bit the same samples.
void expectSameImage(const BayerImage& actual, const BayerImage& expected) {
    ASSERT_EQ(actual.width(), expected.width());
    ASSERT_EQ(actual.height(), expected.height());
    ASSERT_EQ(actual.channels(), expected.channels());
    EXPECT_EQ(actual.bitsPerSample(), expected.bitsPerSample());
    EXPECT_EQ(actual.buffer()->cfa[0], expected.buffer()->cfa[0]);
    EXPECT_EQ(actual.buffer()->cfa[1], expected.buffer()->cfa[1]);
    EXPECT_EQ(actual.buffer()->pixelType, expected.buffer()->pixelType);
    EXPECT_EQ(actual.buffer()->bufferType, expected.buffer()->bufferType);
    const std::size_t bytes = static_cast<std::size_t>(actual.width()) * actual.height() *
                              actual.channels() * sizeof(float);
    EXPECT_EQ(std::memcmp(actual.pixels(), expected.pixels(), bytes), 0);
}

void expectInvalid(const BayerImage& mosaic, const MosaicPreparation& settings,
                   const std::string& message) {
    try {
        prep::prepareMosaic(mosaic, settings);
        ADD_FAILURE() << "no exception, expected: " << message;
    } catch (const std::invalid_argument& error) {
        EXPECT_EQ(error.what(), message);
    }
}

struct Geometry {
    std::int32_t width, height;
};

TEST(MosaicPreparation, MatchesTheThreeStepsForEveryWindowFactorAndSize) {
    // Odd sizes lose their last row or column; the small ones are narrower
    // than the window, so its mirror reflects more than once.
    const Geometry geometries[] = {{2, 2}, {3, 5}, {6, 4}, {17, 13}, {64, 48}, {101, 67}};
    for (const Geometry& g : geometries)
        for (int size = 1; size <= 10; ++size)
            for (int factor : {1, 2, 3, 4, 7}) {
                SCOPED_TRACE(std::to_string(g.width) + "x" + std::to_string(g.height) + " size " +
                             std::to_string(size) + " factor " + std::to_string(factor));
                const BayerImage mosaic = noisyMosaic(g.width, g.height, kCfaGrbg);
                const MosaicPreparation settings{true, size, factor};
                expectSameImage(prep::prepareMosaic(mosaic, settings), inSteps(mosaic, settings));
            }
}

TEST(MosaicPreparation, MatchesPlainDownSamplingWhenTheFilterIsOff) {
    for (std::uint32_t cfa : {kCfaRggb, kCfaGrbg, kCfaGbrg, kCfaBggr})
        for (int factor : {1, 2, 4, 5}) {
            const BayerImage mosaic = noisyMosaic(37, 29, cfa);
            const MosaicPreparation settings{false, 11, factor}; // the size is not used
            expectSameImage(prep::prepareMosaic(mosaic, settings), inSteps(mosaic, settings));
        }
}

TEST(MosaicPreparation, UnfilteredFullSizeIsTheInputMosaic) {
    const BayerImage mosaic = noisyMosaic(40, 30, kCfaBggr);
    const BayerImage prepared = prep::prepareMosaic(mosaic, {false, 3, 1});
    expectSameImage(prepared, mosaic);
}

TEST(MosaicPreparation, UnusualSamplesLandAsInTheStepwiseFilter) {
    // NaN, negative zero (equal to zero, so it shares the tree's node), values
    // whose sum overflows, infinity and negative values.
    BayerImage mosaic = noisyMosaic(24, 18, kCfaRggb);
    const float nan = std::numeric_limits<float>::quiet_NaN();
    const float inf = std::numeric_limits<float>::infinity();
    for (std::size_t i : {0u, 5u, 26u, 27u, 100u, 231u, 400u})
        mosaic.pixels()[i] = nan;
    for (std::size_t i : {50u, 51u, 98u, 99u, 146u, 147u})
        mosaic.pixels()[i] = -0.0f;
    mosaic.pixels()[52] = 0.0f;
    for (std::size_t i : {300u, 301u, 348u, 349u, 396u})
        mosaic.pixels()[i] = 3e38f;
    mosaic.pixels()[302] = inf;
    mosaic.pixels()[303] = -inf;
    mosaic.pixels()[200] = -0.25f;
    for (int size : {2, 3, 4}) {
        const MosaicPreparation settings{true, size, 1};
        expectSameImage(prep::prepareMosaic(mosaic, settings), inSteps(mosaic, settings));
    }
}

TEST(MosaicPreparation, OtherPatternsTakeTheThreeSteps) {
    // No pattern: the planes are the mosaic itself.
    const BayerImage plain = noisyMosaic(20, 10, 0);
    expectSameImage(prep::prepareMosaic(plain, {true, 3, 2}), inSteps(plain, {true, 3, 2}));
    // A 4 x 4 pattern (low nibble of the first cfa word set).
    BayerImage sixteen = noisyMosaic(32, 16, 0);
    sixteen.buffer()->cfa[0] = 0x1;
    expectSameImage(prep::prepareMosaic(sixteen, {true, 3, 2}), inSteps(sixteen, {true, 3, 2}));
}

TEST(MosaicPreparation, RefusesWhatTheStepsRefuseWithTheirMessages) {
    const BayerImage mosaic = noisyMosaic(16, 16, kCfaRggb);
    expectInvalid(mosaic, {true, 0, 4}, "The median filter size must be between 1 and 10.");
    expectInvalid(mosaic, {true, 11, 4}, "The median filter size must be between 1 and 10.");
    expectInvalid(mosaic, {true, 3, 0}, "The down-sampling factor must be at least 1.");
    expectInvalid(mosaic, {false, 3, 0}, "The down-sampling factor must be at least 1.");
    expectInvalid(noisyMosaic(1, 8, kCfaRggb), {true, 3, 1},
                  "Image preparation needs a floating-point image.");
    expectInvalid(BayerImage(), {true, 3, 1}, "Image preparation needs a floating-point image.");
    // A three-channel mosaic splits into 12 channels, which do not weave back.
    expectInvalid(noisyMosaic(8, 8, kCfaRggb, 3), {true, 3, 1},
                  "Invalid image format for Bayer interweaving.");
}

} // namespace
