#include "prep/mosaic_preparation.h"

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <stdexcept>

#include "prep/bayer_planes.h"
#include "prep/median_filter.h"
#include "prep/median_tree.h"
#include "prep/prep_image.h"
#include "prep/prep_messages.h"
#include "prep/window_mirror.h"

namespace prep {

using img::BayerImage;
using img::ImageBuffer;
using img::kBufferRawCfa;
using img::kPixelRaw;
namespace {

// The three steps one after the other, for the patterns the one-pass form
// does not cover (no pattern, 4 x 4, several channels).
BayerImage prepareInSteps(const BayerImage& mosaic, const MosaicPreparation& settings) {
    const ImageBuffer* source = mosaic.buffer();
    const std::uint32_t cfa0 = source->cfa[0];
    const std::uint32_t cfa1 = source->cfa[1];
    const BayerImage planes = split(mosaic);
    BayerImage reduced;
    if (settings.medianFilter)
        medianFilterDownsample(planes, settings.medianSize, settings.samplingFactor, reduced);
    else
        downsample(planes, settings.samplingFactor, reduced);
    return weave(reduced, patternSize(cfa0, cfa1), cfa0, cfa1);
}

// Where the planes of a single-channel 2 x 2 mosaic are read and the prepared
// mosaic is written. Plane sample (x, y) of channel r * 2 + c is mosaic sample
// (2x + c, 2y + r), so a plane position addresses a 2 x 2 block.
struct TwoByTwo {
    const float* in;
    std::size_t inWidth; // mosaic samples a row
    std::int64_t planeWidth, planeHeight;
    float* out;
    std::size_t outWidth;       // prepared mosaic samples a row
    std::int32_t width, height; // down-sampled plane size
    int factor;
};

void decimate(const TwoByTwo& m) {
    const std::size_t factor = static_cast<std::size_t>(m.factor);
    for (std::size_t y = 0; y < static_cast<std::size_t>(m.height); ++y) {
        const float* top = m.in + 2 * factor * y * m.inWidth;
        const float* bottom = top + m.inWidth;
        float* outTop = m.out + 2 * y * m.outWidth;
        float* outBottom = outTop + m.outWidth;
        for (std::size_t x = 0; x < static_cast<std::size_t>(m.width); ++x) {
            const std::size_t column = 2 * factor * x;
            outTop[2 * x] = top[column];
            outTop[2 * x + 1] = top[column + 1];
            outBottom[2 * x] = bottom[column];
            outBottom[2 * x + 1] = bottom[column + 1];
        }
    }
}

// The four channels of a 2 x 2 block side by side, so that the compiler can
// treat them as one vector.
struct Lanes {
    float v[4];
};

inline void sortPair(Lanes& a, Lanes& b) {
    for (int k = 0; k < 4; ++k) {
        const float low = b.v[k] < a.v[k] ? b.v[k] : a.v[k];
        const float high = b.v[k] < a.v[k] ? a.v[k] : b.v[k];
        a.v[k] = low;
        b.v[k] = high;
    }
}

// Whether the exchange network gives what the median tree gives for these
// values: without NaN (which the tree orders by insertion), negative zero
// (which shares a node with zero) and values whose double overflows.
inline bool networkSafe(const Lanes (&p)[9]) {
    std::uint32_t unsafe = 0;
    for (const Lanes& lanes : p)
        for (float value : lanes.v) {
            std::uint32_t bits;
            std::memcpy(&bits, &value, sizeof bits);
            // Sign bit set, or at least 2^126 (infinity and NaN included).
            unsafe |= static_cast<std::uint32_t>(bits >= 0x7E800000u);
        }
    return unsafe == 0;
}

// The middle of nine values by the well-known 19-exchange network; p[4]
// ends up holding it. The tree's (a + b) * 0.5 of the middle value with
// itself is that value exactly for the values networkSafe admits.
inline void medianOfNine(Lanes (&p)[9]) {
    sortPair(p[1], p[2]);
    sortPair(p[4], p[5]);
    sortPair(p[7], p[8]);
    sortPair(p[0], p[1]);
    sortPair(p[3], p[4]);
    sortPair(p[6], p[7]);
    sortPair(p[1], p[2]);
    sortPair(p[4], p[5]);
    sortPair(p[7], p[8]);
    sortPair(p[0], p[3]);
    sortPair(p[5], p[8]);
    sortPair(p[4], p[7]);
    sortPair(p[3], p[6]);
    sortPair(p[1], p[4]);
    sortPair(p[2], p[5]);
    sortPair(p[4], p[7]);
    sortPair(p[4], p[2]);
    sortPair(p[6], p[4]);
    sortPair(p[4], p[2]);
}

// The window is read in the order of the plane filter (rows, then columns),
// into the same trees, so even NaN samples give the same results. The common
// 3 x 3 window of ordinary samples takes an exchange network instead, which
// gives the same values several times faster.
void medianFilter(const TwoByTwo& m, int size) {
    const std::int64_t half = size / 2;
    const std::size_t window = static_cast<std::size_t>(size);
    MedianTree trees[4];
    std::size_t rowOffsets[kMaxMedianSize]; // mosaic offset of the block's top row
    std::size_t columns[kMaxMedianSize];    // mosaic column of the block's left sample
    for (std::int64_t y = 0; y < m.height; ++y) {
        for (std::size_t i = 0; i < window; ++i)
            rowOffsets[i] =
                2 * mirrorIndex(m.factor * y - half + static_cast<std::int64_t>(i), m.planeHeight) *
                m.inWidth;
        float* outTop = m.out + 2 * static_cast<std::size_t>(y) * m.outWidth;
        float* outBottom = outTop + m.outWidth;
        for (std::int64_t x = 0; x < m.width; ++x) {
            for (std::size_t i = 0; i < window; ++i)
                columns[i] = 2 * mirrorIndex(m.factor * x - half + static_cast<std::int64_t>(i),
                                             m.planeWidth);
            const std::size_t at = 2 * static_cast<std::size_t>(x);
            if (window == 3) {
                Lanes p[9];
                for (std::size_t r = 0; r < 3; ++r) {
                    for (std::size_t c = 0; c < 3; ++c) {
                        const float* block = m.in + rowOffsets[r] + columns[c];
                        p[3 * r + c] = {
                            {block[0], block[1], block[m.inWidth], block[m.inWidth + 1]}};
                    }
                }
                if (networkSafe(p)) {
                    medianOfNine(p);
                    outTop[at] = p[4].v[0];
                    outTop[at + 1] = p[4].v[1];
                    outBottom[at] = p[4].v[2];
                    outBottom[at + 1] = p[4].v[3];
                    continue;
                }
            }
            for (MedianTree& tree : trees)
                tree.clear();
            for (std::size_t r = 0; r < window; ++r) {
                for (std::size_t c = 0; c < window; ++c) {
                    const float* block = m.in + rowOffsets[r] + columns[c];
                    trees[0].insert(block[0]);
                    trees[1].insert(block[1]);
                    trees[2].insert(block[m.inWidth]);
                    trees[3].insert(block[m.inWidth + 1]);
                }
            }
            outTop[at] = trees[0].median();
            outTop[at + 1] = trees[1].median();
            outBottom[at] = trees[2].median();
            outBottom[at + 1] = trees[3].median();
        }
    }
}

} // namespace

BayerImage prepareMosaic(const BayerImage& mosaic, const MosaicPreparation& settings) {
    requireFloatImage(mosaic);
    const ImageBuffer* source = mosaic.buffer();
    if (patternSize(source->cfa[0], source->cfa[1]) != 2 || mosaic.channels() != 1)
        return prepareInSteps(mosaic, settings);

    TwoByTwo m{};
    m.planeWidth = mosaic.width() / 2;
    m.planeHeight = mosaic.height() / 2;
    if (m.planeWidth < 1 || m.planeHeight < 1)
        throw std::invalid_argument(msg::kNotFloatImage);
    if (settings.medianFilter && (settings.medianSize < 1 || settings.medianSize > kMaxMedianSize))
        throw std::invalid_argument(msg::kBadMedianSize);
    m.factor = settings.samplingFactor;
    m.width = downsampledSize(static_cast<std::int32_t>(m.planeWidth), m.factor);
    m.height = downsampledSize(static_cast<std::int32_t>(m.planeHeight), m.factor);

    BayerImage prepared =
        createFloatImage(2 * m.width, 2 * m.height, mosaic.bitsPerSample(), 1, source->cfa[0],
                         source->cfa[1], kPixelRaw, kBufferRawCfa);
    m.in = mosaic.pixels();
    m.inWidth = static_cast<std::size_t>(mosaic.width());
    m.out = prepared.pixels();
    m.outWidth = 2 * static_cast<std::size_t>(m.width);
    if (settings.medianFilter)
        medianFilter(m, settings.medianSize);
    else
        decimate(m);
    return prepared;
}

} // namespace prep
