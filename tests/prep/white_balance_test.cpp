// White balance of the flattened mosaic: levels R, GR, GB, B.

#include <stdexcept>

#include "prep/white_balance.h"
#include "tests/prep/test_images.h"

namespace {

using img::BayerImage;
using prep_test::makeImage;

// A mosaic whose 2 x 2 tiles hold `tile` (top left, top right, bottom left,
// bottom right).
BayerImage tiled(std::int32_t width, std::int32_t height, const std::vector<float>& tile,
                 std::uint32_t cfa = img::kCfaRggb) {
    std::vector<float> rows(2 * static_cast<std::size_t>(width));
    for (std::int32_t x = 0; x < width; ++x) {
        rows[static_cast<std::size_t>(x)] = tile[x % 2];
        rows[static_cast<std::size_t>(width + x)] = tile[2 + x % 2];
    }
    return makeImage(width, height, 1, cfa, rows);
}

void balance(BayerImage& image, const float (&targetLevels)[4]) {
    float levels[4];
    prep::balanceLevels(targetLevels, image, levels);
    prep::whiteBalance(image, levels);
}

TEST(WhiteBalance, CentreWindowIs201PixelsOrTheWholeImage) {
    const struct {
        std::int32_t width, height, x0, x1, y0, y1;
    } cases[] = {
        {150, 150, 0, 149, 0, 149}, {640, 480, 220, 420, 140, 340}, {250, 199, 25, 225, 0, 198}};
    for (const auto& c : cases) {
        const prep::CentreWindow w = prep::centreWindow(c.width, c.height);
        EXPECT_EQ((std::vector<int>{w.x0, w.x1, w.y0, w.y1}),
                  (std::vector<int>{c.x0, c.x1, c.y0, c.y1}))
            << c.width << "x" << c.height;
    }
}

// Levels 1, 2, 4, 0.5 give gains 4, 2, 1, 8 (the largest level over each).
TEST(WhiteBalance, TargetLevelsGiveEachBayerPositionItsChannelsGain) {
    const struct {
        std::uint32_t cfa;
        std::vector<float> tile;
    } orders[] = {{img::kCfaRggb, {4, 2, 1, 8}},
                  {img::kCfaGrbg, {2, 4, 8, 1}},
                  {img::kCfaGbrg, {1, 8, 4, 2}},
                  {img::kCfaBggr, {8, 1, 2, 4}}};
    for (const auto& order : orders) {
        BayerImage image = makeImage(4, 4, 1, order.cfa, {1.0f});
        balance(image, {1.0f, 2.0f, 4.0f, 0.5f});
        EXPECT_EQ(prep_test::samplesOf(image), prep_test::samplesOf(tiled(4, 4, order.tile)))
            << order.cfa;
    }
}

TEST(WhiteBalance, WithoutTargetLevelsTheCentreIsMeasured) {
    BayerImage image = tiled(150, 150, {0.5f, 0.25f, 0.25f, 0.125f});
    balance(image, {0, 0, 0, 0});
    EXPECT_EQ(prep_test::samplesOf(image), std::vector<float>(150 * 150, 0.5f));

    BayerImage large = makeImage(640, 480, 1, img::kCfaRggb, {0.5f});
    for (int y = 0; y < 480; y += 2) // darker red outside the window (x < 220)
        large.pixels()[y * 640] = 0.1f;
    balance(large, {0, 0, 0, 0});
    EXPECT_EQ(large.pixels()[2 * 640 + 2], 0.5f);
    EXPECT_EQ(large.pixels()[0], 0.1f);

    BayerImage narrow = makeImage(1, 8, 1, img::kCfaRggb, {0.5f});
    EXPECT_EQ(case_data::errorOf([&] {
                  balance(narrow, {0, 0, 0, 0});
              }),
              "The centre of the flattened image does not hold pixels of all four colour "
              "channels.");
    BayerImage dark = tiled(8, 8, {0.5f, 0.5f, 0.0f, 0.5f});
    EXPECT_EQ(case_data::errorOf([&] {
                  balance(dark, {0, 0, 0, 0});
              }),
              "A colour channel of the flattened image has no positive level; it cannot be white "
              "balanced.");
    EXPECT_THROW(balance(dark, {0, 0, 0, 0}), std::runtime_error);
    EXPECT_EQ(dark.pixels()[0], 0.5f);
}

TEST(WhiteBalance, LevelsAreBoxMeansOfThePlanes) {
    const int sides[][3] = {{100, 1, 51}, {100, 4, 13}, {100, 2, 25}, {1, 1, 1}};
    for (const auto& s : sides)
        EXPECT_EQ(prep::boxSide(s[0], s[1]), s[2]) << s[0] << " " << s[1];

    float levels[4];
    prep::measureLevels(levels, tiled(20, 16, {0.5f, 0.25f, 0.75f, 0.125f}), 6, 1);
    EXPECT_EQ((std::vector<float>(levels, levels + 4)),
              (std::vector<float>{0.5f, 0.25f, 0.75f, 0.125f}));

    BayerImage spots = makeImage(10, 10); // 5 x 5 planes, box side 3
    spots.pixels()[4 * 10 + 4] = 9.0f;    // red plane (2, 2): a full 3 x 3 box
    spots.pixels()[0 * 10 + 1] = 9.0f;    // green/red plane (0, 0): a 2 x 2 corner box
    prep::measureLevels(levels, spots, 6, 1);
    EXPECT_FLOAT_EQ(levels[0], 1.0f);
    EXPECT_FLOAT_EQ(levels[1], 2.25f);
    EXPECT_FLOAT_EQ(levels[2], 0.0f);
    EXPECT_THROW(prep::measureLevels(levels, makeImage(1, 5, 1, img::kCfaRggb, {0.5f}), 100, 1),
                 std::runtime_error);
}

} // namespace
