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

// A noisy mosaic of `bits` prepared in one pass and in steps; a Bayer mosaic
// also as integer rows streamed in. Returns the mosaic.
BayerImage expectSamePreparations(std::int32_t width, std::int32_t height, std::uint32_t cfa1,
                                  const MosaicPreparation& settings, std::uint16_t bits = 10,
                                  std::uint32_t cfa0 = 0) {
    SCOPED_TRACE(::testing::Message()
                 << width << "x" << height << " cfa " << cfa0 << "," << cfa1 << " median "
                 << settings.medianFilter << " size " << settings.medianSize << " factor "
                 << settings.samplingFactor << " bits " << bits);
    const std::uint32_t mask = (1u << bits) - 1u;
    const std::vector<std::uint16_t> samples = noise(static_cast<std::size_t>(width) * height, mask,
                                                     static_cast<unsigned>(width * 131 + height));
    std::vector<float> values;
    for (std::uint16_t s : samples)
        values.push_back(static_cast<float>(s) / static_cast<float>(mask));
    BayerImage mosaic = prep_test::makeImage(width, height, 1, cfa1, values, bits);
    mosaic.buffer()->cfa[0] = cfa0;
    const BayerImage prepared = prep::prepareMosaic(mosaic, settings);
    expectSameImage(prepared, inSteps(mosaic, settings));
    if (prep::patternSize(cfa0, cfa1) == 2) {
        prep::MosaicStream stream(width, height, settings);
        for (std::int32_t y = 0; y < height; ++y)
            stream.addRow(samples.data() + static_cast<std::size_t>(y) * width);
        expectSameImage(stream.finish(bits, 0, cfa1), prepared);
        EXPECT_EQ(stream.largest(), *std::max_element(samples.begin(), samples.end()));
    }
    return mosaic;
}

TEST(MosaicPreparation, OnePassAndStreamMatchTheStepsForEveryWindowFactorSizeOrderAndDepth) {
    // Odd sizes lose their last row or column; the small ones are narrower
    // than the window, so its mirror reflects more than once.
    const std::int32_t sizes[][2] = {{2, 2}, {3, 5}, {6, 4}, {17, 13}, {64, 48}, {101, 67}};
    for (const auto& size : sizes)
        for (int window = 1; window <= 10; ++window)
            for (int factor : {1, 2, 3, 4, 7})
                expectSamePreparations(size[0], size[1], img::kCfaGrbg, {true, window, factor});
    for (std::uint32_t cfa : {img::kCfaRggb, img::kCfaGrbg, img::kCfaGbrg, img::kCfaBggr})
        for (int factor : {1, 2, 4, 5}) // the window size is not used
            expectSamePreparations(37, 29, cfa, {false, 11, factor});
    const int depths[][5] = {{130, 34, 12, 3, 3}, {36, 30, 16, 6, 1}, {40, 40, 14, 8, 2},
                             {6, 14, 11, 3, 1},   {65, 47, 8, 0, 3},  {3, 5, 10, 0, 2}};
    for (const auto& d : depths) // width, height, bits, window (0: no median), factor
        expectSamePreparations(d[0], d[1], img::kCfaGrbg, {d[3] > 0, d[3], d[4]},
                               static_cast<std::uint16_t>(d[2]));
    const BayerImage mosaic = expectSamePreparations(40, 30, img::kCfaBggr, {false, 3, 1});
    expectSameImage(prep::prepareMosaic(mosaic, {false, 3, 1}), mosaic);
    // No pattern: the planes are the mosaic itself; a 4 x 4 pattern (low bits
    // of the first cfa word).
    expectSamePreparations(20, 10, 0, {true, 3, 2});
    expectSamePreparations(32, 16, 0, {true, 3, 2}, 10, 0x1);
}

TEST(MosaicPreparation, UnusualSamplesLandAsInTheSteps) {
    // NaN, negative zero (equal to zero: it shares the tree's node), values
    // whose sum overflows, infinities and negative values.
    BayerImage mosaic = expectSamePreparations(24, 18, img::kCfaRggb, {true, 3, 1});
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

} // namespace
