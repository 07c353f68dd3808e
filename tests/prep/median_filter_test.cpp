#include <stdexcept>

#include <gtest/gtest.h>

#include "prep/median_filter.h"
#include "prep/median_tree.h"
#include "test_images.h"

using prep_test::fillRamp;
using prep_test::makeImage;
using prep_test::samplesOf;

using img::BayerImage;

namespace {

float medianOf(std::initializer_list<float> values) {
    prep::MedianTree tree;
    tree.clear();
    for (float v : values)
        tree.insert(v);
    return tree.median();
}

TEST(MedianTree, OddCountGivesMiddleValue) {
    EXPECT_EQ(medianOf({5, 1, 9, 3, 7}), 5.0f);
}

TEST(MedianTree, EvenCountGivesMeanOfMiddleTwo) {
    EXPECT_EQ(medianOf({4, 1, 10, 2}), 3.0f);
}

TEST(MedianTree, RepeatsCountAsSeparateValues) {
    EXPECT_EQ(medianOf({1, 1, 1, 9, 9}), 1.0f);
    EXPECT_EQ(medianOf({2, 2, 8, 8}), 5.0f);
    EXPECT_EQ(medianOf({7, 7, 7, 7}), 7.0f);
}

TEST(MedianTree, SortedInputFillsTheWholePool) {
    prep::MedianTree tree;
    tree.clear();
    for (int i = 0; i < 100; ++i)
        tree.insert(static_cast<float>(i));
    EXPECT_EQ(tree.valueCount(), 100);
    EXPECT_EQ(tree.median(), 49.5f);
}

TEST(MedianTree, ClearStartsAFreshWindow) {
    prep::MedianTree tree;
    tree.clear();
    tree.insert(100.0f);
    tree.clear();
    tree.insert(1.0f);
    EXPECT_EQ(tree.median(), 1.0f);
}

TEST(MedianFilter, SizeOneReturnsEverySample) {
    BayerImage planes = makeImage(7, 5, 4);
    fillRamp(planes);
    BayerImage target;
    prep::medianFilterDownsample(planes, 1, 1, target);
    EXPECT_EQ(samplesOf(target), samplesOf(planes));
}

TEST(MedianFilter, SizeTwoAveragesMiddleTwoOfFour) {
    // Window of s = 2 at (1, 1) covers rows and columns 0..1.
    BayerImage planes = makeImage(3, 3, 1, 0);
    const float values[9] = {1, 10, 0, 4, 2, 0, 0, 0, 0};
    std::copy(values, values + 9, planes.pixels());
    BayerImage target;
    prep::medianFilterDownsample(planes, 2, 1, target);
    EXPECT_EQ(target.pixels()[1 * 3 + 1], 3.0f); // sorted 1 2 4 10
}

TEST(MedianFilter, RemovesASingleDefect) {
    BayerImage planes = makeImage(5, 5, 4);
    prep_test::fill(planes, 0.25f);
    planes.pixels()[(2 * 5 + 2) * 4 + 1] = 1.0f; // hot pixel in channel 1
    BayerImage target;
    prep::medianFilterDownsample(planes, 3, 1, target);
    for (float v : samplesOf(target))
        EXPECT_EQ(v, 0.25f);
}

TEST(MedianFilter, ChannelsAreFilteredSeparately) {
    BayerImage planes = makeImage(4, 4, 6);
    for (int i = 0; i < 16; ++i)
        for (int k = 0; k < 6; ++k)
            planes.pixels()[i * 6 + k] = static_cast<float>(k);
    BayerImage target;
    prep::medianFilterDownsample(planes, 3, 2, target);
    ASSERT_EQ(target.channels(), 6);
    for (int i = 0; i < target.width() * target.height(); ++i)
        for (int k = 0; k < 6; ++k)
            EXPECT_EQ(target.pixels()[i * 6 + k], static_cast<float>(k));
}

TEST(MedianFilter, BordersRepeatTheEdgeSample) {
    // One row 0 1 2 3 4 5 6; window 3 at x = 0 reads 0 0 1 (mirror of -1 is 0).
    BayerImage planes = makeImage(7, 1, 1, 0);
    for (int i = 0; i < 7; ++i)
        planes.pixels()[i] = static_cast<float>(i);
    BayerImage target;
    prep::medianFilterDownsample(planes, 3, 1, target);
    EXPECT_EQ(target.pixels()[0], 0.0f);
    EXPECT_EQ(target.pixels()[6], 6.0f);
    EXPECT_EQ(target.pixels()[3], 3.0f);
}

TEST(MedianFilter, WindowWiderThanImageStaysInside) {
    BayerImage planes = makeImage(1, 2, 1, 0);
    planes.pixels()[0] = 2.0f;
    planes.pixels()[1] = 4.0f;
    BayerImage target;
    prep::medianFilterDownsample(planes, 10, 1, target);
    // Rows -5..4 mirror to 0 0 1 1 0 0 1 1 0 0; rows -4..5 to 0 1 1 0 0 1 1 0 0 1.
    EXPECT_EQ(target.pixels()[0], 2.0f);
    EXPECT_EQ(target.pixels()[1], 3.0f);
}

TEST(MedianFilter, DownsamplesAtFactorPositions) {
    BayerImage planes = makeImage(9, 5, 1, 0);
    fillRamp(planes);
    BayerImage target;
    prep::medianFilterDownsample(planes, 1, 4, target);
    ASSERT_EQ(target.width(), 3);
    ASSERT_EQ(target.height(), 2);
    EXPECT_EQ(target.pixels()[0 * 3 + 2], planes.pixels()[0 * 9 + 8]);
    EXPECT_EQ(target.pixels()[1 * 3 + 1], planes.pixels()[4 * 9 + 4]);
}

TEST(MedianFilter, RefusesSizesOutsideTheTree) {
    BayerImage planes = makeImage(4, 4, 4);
    BayerImage target;
    EXPECT_THROW(prep::medianFilterDownsample(planes, 0, 1, target), std::invalid_argument);
    EXPECT_THROW(prep::medianFilterDownsample(planes, 11, 1, target), std::invalid_argument);
    EXPECT_THROW(prep::medianFilterDownsample(planes, 3, 0, target), std::invalid_argument);
}

} // namespace
