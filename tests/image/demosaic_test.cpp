#include <cmath>
#include <cstdint>
#include <vector>

#include <gtest/gtest.h>

#include "image/demosaic.h"
#include "image/image_buffer.h"

namespace img {
namespace {

ImagePtr bayerImage(std::int32_t width, std::int32_t height, std::uint32_t cfa1,
                    const std::vector<float>& values) {
    int result = 0;
    ImagePtr image(imageCreate(width, height, 10, 1, 1, 0, cfa1, kPixelRaw, kBufferRawCfa,
                               kDataReal32, &result));
    EXPECT_EQ(result, 0);
    std::copy(values.begin(), values.end(), static_cast<float*>(image->data));
    return image;
}

ImagePtr demosaic(const ImagePtr& source) {
    int result = 1;
    ImagePtr rgb(demosaicToRgb8(source.get(), &result));
    EXPECT_EQ(result, 0);
    return rgb;
}

struct Rgb {
    int r, g, b;
    bool operator==(const Rgb& other) const { return r == other.r && g == other.g && b == other.b; }
};

std::ostream& operator<<(std::ostream& out, const Rgb& pixel) {
    return out << "(" << pixel.r << ", " << pixel.g << ", " << pixel.b << ")";
}

Rgb pixelAt(const ImagePtr& rgb, int x, int y) {
    const auto* data = static_cast<const std::uint8_t*>(rgb->data) + 3 * (y * rgb->width + x);
    return {data[0], data[1], data[2]};
}

// Values given in steps of 1/255, so each converts back to the same byte.
std::vector<float> inSteps(const std::vector<int>& steps) {
    std::vector<float> values;
    for (int step : steps)
        values.push_back(static_cast<float>(step) / 255.0f);
    return values;
}

class DemosaicPattern : public testing::TestWithParam<std::uint32_t> {};

TEST_P(DemosaicPattern, RestoresAFlatColourEverywhereIncludingTheBorders) {
    const std::uint32_t cfa = GetParam();
    std::vector<float> values;
    for (int y = 0; y < 5; ++y) {
        for (int x = 0; x < 7; ++x) {
            // The colour letter of this site, read straight from the pattern word.
            const int position = (y & 1) * 2 + (x & 1);
            const std::uint32_t colour = (cfa >> (28 - 4 * position)) & 0xF;
            values.push_back(colour == 2 ? 0.2f : colour == 3 ? 0.4f : 0.8f);
        }
    }
    const ImagePtr rgb = demosaic(bayerImage(7, 5, cfa, values));
    ASSERT_TRUE(rgb);
    for (int y = 0; y < 5; ++y)
        for (int x = 0; x < 7; ++x)
            EXPECT_EQ(pixelAt(rgb, x, y), (Rgb{51, 102, 204})) << "at " << x << "," << y;
}

INSTANTIATE_TEST_SUITE_P(AllBayerOrders, DemosaicPattern,
                         testing::Values(kCfaRggb, kCfaGrbg, kCfaGbrg, kCfaBggr));

class DemosaicRggb : public testing::Test {
protected:
    // R  G  R
    // G  B  G
    // R  G  R
    ImagePtr rgb =
        demosaic(bayerImage(3, 3, kCfaRggb, inSteps({8, 16, 40, 4, 100, 12, 24, 32, 200})));
};

TEST_F(DemosaicRggb, ProducesAnEightBitInterleavedRgbImage) {
    ASSERT_TRUE(rgb);
    EXPECT_EQ(rgb->width, 3);
    EXPECT_EQ(rgb->height, 3);
    EXPECT_EQ(rgb->pixelType, kPixelRgb);
    EXPECT_EQ(rgb->bufferType, kBufferInterleaved);
    EXPECT_EQ(rgb->dataType, kDataUint8);
    EXPECT_TRUE(imageIsEightBitDisplay(rgb.get()));
}

TEST_F(DemosaicRggb, AveragesCrossAndDiagonalNeighboursAtABlueSite) {
    EXPECT_EQ(pixelAt(rgb, 1, 1), (Rgb{(8 + 40 + 24 + 200) / 4, (16 + 32 + 4 + 12) / 4, 100}));
}

TEST_F(DemosaicRggb, AveragesRowAndColumnPairsAtGreenSites) {
    EXPECT_EQ(pixelAt(rgb, 1, 0), (Rgb{(8 + 40) / 2, 16, 100}));
    EXPECT_EQ(pixelAt(rgb, 2, 1), (Rgb{(40 + 200) / 2, 12, 100}));
}

TEST_F(DemosaicRggb, MirrorsMissingNeighboursAtTheEdges) {
    // Corner red sites see each neighbour twice, from both sides.
    EXPECT_EQ(pixelAt(rgb, 0, 0), (Rgb{8, (4 + 16) / 2, 100}));
    EXPECT_EQ(pixelAt(rgb, 2, 2), (Rgb{200, (12 + 32) / 2, 100}));
    // A green site on the left edge takes blue from the right neighbour twice.
    EXPECT_EQ(pixelAt(rgb, 0, 1), (Rgb{(8 + 24) / 2, 4, 100}));
}

TEST(Demosaic, ClampsOutOfRangeValuesAndTreatsNanAsBlack) {
    // R = 1.5, both greens negative, B = NaN.
    const ImagePtr rgb = demosaic(bayerImage(2, 2, kCfaRggb, {1.5f, -0.3f, -0.3f, std::nanf("")}));
    ASSERT_TRUE(rgb);
    EXPECT_EQ(pixelAt(rgb, 0, 0), (Rgb{255, 0, 0}));
}

TEST(Demosaic, RoundsHalfStepsUp) {
    const ImagePtr rgb = demosaic(bayerImage(2, 2, kCfaRggb, {0.5f, 1.0f, 1.0f, 0.0f}));
    ASSERT_TRUE(rgb);
    EXPECT_EQ(pixelAt(rgb, 0, 0), (Rgb{128, 255, 0}));
}

// A line of one pixel lacks a colour altogether; what matters is that its own
// colour survives and nothing is read beyond the samples.
TEST(Demosaic, HandlesImagesOnePixelWideOrHigh) {
    const ImagePtr single = demosaic(bayerImage(1, 1, kCfaRggb, {0.5f}));
    ASSERT_TRUE(single);
    EXPECT_EQ(pixelAt(single, 0, 0), (Rgb{128, 128, 128}));
    const ImagePtr column = demosaic(bayerImage(1, 4, kCfaGrbg, inSteps({10, 20, 30, 40})));
    ASSERT_TRUE(column);
    EXPECT_EQ(pixelAt(column, 0, 3).b, 40);
    const ImagePtr line = demosaic(bayerImage(5, 1, kCfaBggr, inSteps({10, 20, 30, 40, 50})));
    ASSERT_TRUE(line);
    EXPECT_EQ(pixelAt(line, 4, 0).b, 50);
}

TEST(Demosaic, RefusesSourcesThatAreNotNormalisedBayerImages) {
    int result = 0;
    EXPECT_EQ(demosaicToRgb8(nullptr, &result), nullptr);
    EXPECT_EQ(result, -6);

    const ImagePtr sixteenBit(
        imageCreate(2, 2, 10, 1, 1, 0, kCfaRggb, kPixelRaw, kBufferRawCfa, kDataUint16, &result));
    EXPECT_EQ(demosaicToRgb8(sixteenBit.get(), &result), nullptr);
    EXPECT_EQ(result, -6);

    const ImagePtr mono(
        imageCreate(2, 2, 32, 1, 1, 0, 0, kPixelMono, kBufferInterleaved, kDataReal32, &result));
    EXPECT_EQ(demosaicToRgb8(mono.get(), &result), nullptr);
    EXPECT_EQ(result, -6);
}

TEST(Demosaic, RefusesPatternsOtherThanTheFourBayerOrders) {
    int result = 0;
    const ImagePtr image = bayerImage(2, 2, 0x23330000, {0, 0, 0, 0});
    EXPECT_EQ(demosaicToRgb8(image.get(), &result), nullptr);
    EXPECT_EQ(result, -4);
}

} // namespace
} // namespace img
