// The one-pass preparation (from a float mosaic, or from integer rows as they
// are read) against split, median filter or down-sampling and weave done one
// after the other: every prepared sample must have the same bits.

#include <algorithm>
#include <cstring>
#include <limits>
#include <random>
#include <sstream>
#include <stdexcept>
#include <string>

#include "prep/bayer_planes.h"
#include "prep/median_filter.h"
#include "prep/mosaic_preparation.h"
#include "prep/mosaic_stream.h"
#include "tests/prep/test_images.h"

namespace {

using img::BayerImage;
using prep::MosaicPreparation;

// Noise over 0..mask with runs of equal values (repeats share tree nodes) and
// some black and white samples.
std::vector<std::uint16_t> noise(std::size_t count, std::uint32_t mask, unsigned seed) {
    std::mt19937 random(seed);
    std::vector<std::uint16_t> samples(count);
    for (std::uint16_t& s : samples) {
        const auto pick = static_cast<std::uint32_t>(random() % 100);
        s = static_cast<std::uint16_t>(pick < 3    ? mask
                                       : pick < 6  ? 0
                                       : pick < 35 ? mask / 2
                                                   : random() & mask);
    }
    return samples;
}

BayerImage noisyMosaic(std::int32_t width, std::int32_t height, std::uint32_t cfa1,
                       std::uint16_t channels = 1) {
    std::vector<float> values;
    for (std::uint16_t s : noise(static_cast<std::size_t>(width) * height * channels, 1023, 7))
        values.push_back(static_cast<float>(s) / 1023.0f);
    return prep_test::makeImage(width, height, channels, cfa1, values);
}

BayerImage inSteps(const BayerImage& mosaic, const MosaicPreparation& settings) {
    const BayerImage planes = prep::split(mosaic);
    BayerImage reduced;
    if (settings.medianFilter)
        prep::medianFilterDownsample(planes, settings.medianSize, settings.samplingFactor, reduced);
    else
        prep::downsample(planes, settings.samplingFactor, reduced);
    const std::uint32_t* cfa = mosaic.buffer()->cfa;
    return prep::weave(reduced, prep::patternSize(cfa[0], cfa[1]), cfa[0], cfa[1]);
}

// Geometry, types and the bits of every sample.
void expectSameImage(const BayerImage& actual, const BayerImage& expected) {
    const auto identity = [](const BayerImage& image) {
        const img::ImageBuffer& b = *image.buffer();
        std::ostringstream out;
        out << image.width() << "x" << image.height() << "x" << image.channels() << " bits "
            << image.bitsPerSample() << " cfa " << b.cfa[0] << "," << b.cfa[1] << " types "
            << b.pixelType << "," << b.bufferType << std::hex;
        for (float v : prep_test::samplesOf(image)) {
            std::uint32_t bits;
            std::memcpy(&bits, &v, sizeof bits);
            out << " " << bits;
        }
        return out.str();
    };
    EXPECT_EQ(identity(actual), identity(expected));
}

TEST(MosaicPreparation, MatchesTheStepsForEveryWindowFactorSizeAndOrder) {
    // Odd sizes lose their last row or column; the small ones are narrower
    // than the window, so its mirror reflects more than once.
    const std::int32_t sizes[][2] = {{2, 2}, {3, 5}, {6, 4}, {17, 13}, {64, 48}, {101, 67}};
    for (const auto& size : sizes)
        for (int window = 1; window <= 10; ++window)
            for (int factor : {1, 2, 3, 4, 7}) {
                SCOPED_TRACE(::testing::Message() << size[0] << "x" << size[1] << " size " << window
                                                  << " factor " << factor);
                const BayerImage mosaic = noisyMosaic(size[0], size[1], img::kCfaGrbg);
                expectSameImage(prep::prepareMosaic(mosaic, {true, window, factor}),
                                inSteps(mosaic, {true, window, factor}));
            }
    for (std::uint32_t cfa : {img::kCfaRggb, img::kCfaGrbg, img::kCfaGbrg, img::kCfaBggr})
        for (int factor : {1, 2, 4, 5}) {
            const BayerImage mosaic = noisyMosaic(37, 29, cfa);
            expectSameImage(prep::prepareMosaic(mosaic, {false, 11, factor}), // size unused
                            inSteps(mosaic, {false, 11, factor}));
        }
    const BayerImage mosaic = noisyMosaic(40, 30, img::kCfaBggr);
    expectSameImage(prep::prepareMosaic(mosaic, {false, 3, 1}), mosaic);
    // No pattern: the planes are the mosaic itself; a 4 x 4 pattern (low bits
    // of the first cfa word).
    const BayerImage plain = noisyMosaic(20, 10, 0);
    expectSameImage(prep::prepareMosaic(plain, {true, 3, 2}), inSteps(plain, {true, 3, 2}));
    BayerImage sixteen = noisyMosaic(32, 16, 0);
    sixteen.buffer()->cfa[0] = 0x1;
    expectSameImage(prep::prepareMosaic(sixteen, {true, 3, 2}), inSteps(sixteen, {true, 3, 2}));
}

TEST(MosaicPreparation, UnusualSamplesLandAsInTheSteps) {
    // NaN, negative zero (equal to zero: it shares the tree's node), values
    // whose sum overflows, infinities and negative values.
    BayerImage mosaic = noisyMosaic(24, 18, img::kCfaRggb);
    float* p = mosaic.pixels();
    for (std::size_t i : {0u, 5u, 26u, 27u, 100u, 231u, 400u})
        p[i] = std::numeric_limits<float>::quiet_NaN();
    for (std::size_t i : {50u, 51u, 98u, 99u, 146u, 147u})
        p[i] = -0.0f;
    for (std::size_t i : {300u, 301u, 348u, 349u, 396u})
        p[i] = 3e38f;
    p[52] = 0.0f;
    p[302] = std::numeric_limits<float>::infinity();
    p[303] = -std::numeric_limits<float>::infinity();
    p[200] = -0.25f;
    for (int size : {2, 3, 4})
        expectSameImage(prep::prepareMosaic(mosaic, {true, size, 1}),
                        inSteps(mosaic, {true, size, 1}));
}

// Integer rows: odd and even sizes, images narrower than the window, every
// window size, factors 1 to 5, the median off, depths 8 to 16.
TEST(MosaicStream, GivesTheBitsOfTheFloatPreparation) {
    const struct {
        std::int32_t width, height;
        std::uint16_t bits;
        bool median;
        int size, factor;
    } cases[] = {
        {64, 48, 10, true, 3, 1},  {67, 49, 10, true, 3, 4}, {130, 34, 12, true, 3, 3},
        {40, 30, 10, true, 1, 2},  {41, 31, 10, true, 2, 1}, {40, 30, 12, true, 4, 2},
        {50, 38, 10, true, 5, 3},  {36, 30, 16, true, 6, 1}, {45, 41, 10, true, 7, 5},
        {40, 40, 14, true, 8, 2},  {38, 34, 10, true, 9, 4}, {60, 44, 10, true, 10, 3},
        {8, 6, 10, true, 9, 1},    {6, 14, 11, true, 3, 1},  {2, 2, 10, true, 3, 1},
        {64, 48, 10, false, 3, 1}, {65, 47, 8, false, 3, 3}, {3, 5, 10, false, 1, 2},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::Message()
                     << c.width << "x" << c.height << " size " << c.size << " factor " << c.factor);
        const MosaicPreparation settings{c.median, c.size, c.factor};
        const std::uint32_t mask = (1u << c.bits) - 1u;
        const std::vector<std::uint16_t> samples =
            noise(static_cast<std::size_t>(c.width) * c.height, mask,
                  static_cast<unsigned>(c.width * 131 + c.height));
        std::vector<float> values;
        for (std::uint16_t s : samples)
            values.push_back(static_cast<float>(s) / static_cast<float>(mask));
        const BayerImage image =
            prep_test::makeImage(c.width, c.height, 1, img::kCfaGrbg, values, c.bits);

        prep::MosaicStream stream(c.width, c.height, settings);
        for (std::int32_t y = 0; y < c.height; ++y)
            stream.addRow(samples.data() + static_cast<std::size_t>(y) * c.width);
        expectSameImage(stream.finish(c.bits, 0, img::kCfaGrbg),
                        prep::prepareMosaic(image, settings));
        EXPECT_EQ(stream.largest(), *std::max_element(samples.begin(), samples.end()));
    }
}

} // namespace
