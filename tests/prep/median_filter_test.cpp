// The median of a window and the median filter over colour planes.

#include <stdexcept>

#include "prep/median_filter.h"
#include "prep/median_tree.h"
#include "tests/prep/test_images.h"

namespace {

using img::BayerImage;
using prep_test::makeImage;
using prep_test::samplesOf;

TEST(MedianTree, MiddleValueOrMeanOfTheMiddleTwo) {
    const struct {
        std::vector<float> values;
        float median;
    } cases[] = {{{5, 1, 9, 3, 7}, 5}, {{4, 1, 10, 2}, 3}, {{1, 1, 1, 9, 9}, 1},
                 {{2, 2, 8, 8}, 5},    {{7, 7, 7, 7}, 7},  {prep_test::counting(100), 49.5f}};
    prep::MedianTree tree;
    for (const auto& c : cases) {
        tree.clear(); // each case a fresh window
        for (float v : c.values)
            tree.insert(v);
        EXPECT_EQ(tree.valueCount(), static_cast<int>(c.values.size()));
        EXPECT_EQ(tree.median(), c.median);
    }
}

// Filter size s and factor f on single-channel planes: the expected output.
TEST(MedianFilter, WindowsMirrorAtTheBordersAndDownSample) {
    const struct {
        std::int32_t width, height;
        std::vector<float> planes;
        int size, factor;
        std::vector<float> expected;
    } cases[] = {
        // s = 2 at (x, y) covers x - 1..x and y - 1..y: at (1, 1) 1 2 4 10.
        {3, 3, {1, 10, 0, 4, 2, 0, 0, 0, 0}, 2, 1, {1, 5.5f, 5, 2.5f, 3, 1, 2, 1, 0}},
        // The window of 3 at x = 0 reads 0 0 1: the edge sample repeats.
        {7, 1, {0, 1, 2, 3, 4, 5, 6}, 3, 1, {0, 1, 2, 3, 4, 5, 6}},
        // Window of 10 on 2 rows: rows -5..4 mirror to 0 0 1 1 0 0 1 1 0 0.
        {1, 2, {2, 4}, 10, 1, {2, 3}},
        {9, 5, prep_test::counting(45), 1, 4, {0, 4, 8, 36, 40, 44}},
        {5,
         5,
         {0, 0, 0, 0, 0, 0, 9, 0, 0, 0, 0, 0, 9, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0},
         3,
         1,
         std::vector<float>(25, 0.0f)},
    };
    for (const auto& c : cases) {
        BayerImage target;
        prep::medianFilterDownsample(makeImage(c.width, c.height, 1, 0, c.planes), c.size, c.factor,
                                     target);
        EXPECT_EQ(samplesOf(target), c.expected)
            << c.width << "x" << c.height << " size " << c.size;
    }
}

TEST(MedianFilter, ChannelsAreFilteredSeparatelyAndSizeOneKeepsAll) {
    BayerImage planes = makeImage(4, 4, 6, 0, prep_test::counting(6)); // channel k holds k
    planes.pixels()[(1 * 4 + 1) * 6 + 1] = 100.0f;                     // a defect in channel 1
    BayerImage target;
    prep::medianFilterDownsample(planes, 3, 2, target);
    EXPECT_EQ(samplesOf(target), samplesOf(makeImage(2, 2, 6, 0, prep_test::counting(6))));
    prep::medianFilterDownsample(planes, 1, 1, target);
    EXPECT_EQ(samplesOf(target), samplesOf(planes));
    const int refused[][2] = {{0, 1}, {11, 1}, {3, 0}}; // size, factor
    for (const auto& r : refused)
        EXPECT_THROW(prep::medianFilterDownsample(planes, r[0], r[1], target),
                     std::invalid_argument);
}

} // namespace
