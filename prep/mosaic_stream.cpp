#include "prep/mosaic_stream.h"

#include <algorithm>
#if defined(__arm__) && defined(__GNUC__) && !defined(__clang__) && !defined(__ARM_NEON)
#include <asm/hwcap.h>
#include <sys/auxv.h>
#endif
#include <cstring>
#include <stdexcept>

#include "image/simd_clones.h"
#include "prep/bayer_planes.h"
#include "prep/median_filter.h"
#include "prep/prep_image.h"
#include "prep/prep_messages.h"
#include "prep/window_mirror.h"

namespace prep {

using img::BayerImage;
using img::kBufferRawCfa;
using img::kPixelRaw;

namespace {

constexpr int kChannels = 4;     // of a 2 x 2 pattern
constexpr std::size_t kRun = 64; // outputs whose windows are sorted together

__attribute__((always_inline)) inline void exchange(std::uint16_t* a, std::uint16_t* b) {
    for (std::size_t i = 0; i < kRun; ++i) {
        const std::uint16_t low = std::min(a[i], b[i]);
        const std::uint16_t high = std::max(a[i], b[i]);
        a[i] = low;
        b[i] = high;
    }
}

// The middle of nine values for kRun outputs at once: the well-known
// 19-exchange network on nine rows of kRun values, branch-free, so that the
// compiler turns each exchange into vector minima and maxima. Row 4 ends up
// holding the medians.
__attribute__((always_inline)) inline void sortNine(std::uint16_t* v) {
    auto p = [v](int i) { return v + i * kRun; };
    exchange(p(1), p(2));
    exchange(p(4), p(5));
    exchange(p(7), p(8));
    exchange(p(0), p(1));
    exchange(p(3), p(4));
    exchange(p(6), p(7));
    exchange(p(1), p(2));
    exchange(p(4), p(5));
    exchange(p(7), p(8));
    exchange(p(0), p(3));
    exchange(p(5), p(8));
    exchange(p(4), p(7));
    exchange(p(3), p(6));
    exchange(p(1), p(4));
    exchange(p(2), p(5));
    exchange(p(4), p(7));
    exchange(p(4), p(2));
    exchange(p(6), p(4));
    exchange(p(4), p(2));
}

#if defined(__arm__) && defined(__GNUC__) && !defined(__clang__) && !defined(__ARM_NEON)
// 32-bit ARM builds do not assume NEON (Debian's armhf baseline has none): the
// network is built a second time for it and chosen where the processor has it.
__attribute__((target("fpu=neon"))) void medianOfNineNeon(std::uint16_t* v) {
    sortNine(v);
}
void medianOfNinePlain(std::uint16_t* v) {
    sortNine(v);
}
void medianOfNine(std::uint16_t* v) {
    static const bool neon = (getauxval(AT_HWCAP) & HWCAP_NEON) != 0;
    if (neon)
        medianOfNineNeon(v);
    else
        medianOfNinePlain(v);
}
#else
LSC_VECTOR_CLONES void medianOfNine(std::uint16_t* v) {
    sortNine(v);
}
#endif

// The largest of n samples and `largest`.
LSC_VECTOR_CLONES std::uint16_t largestOf(const std::uint16_t* samples, std::size_t n,
                                          std::uint16_t largest) {
    for (std::size_t i = 0; i < n; ++i)
        largest = std::max(largest, samples[i]);
    return largest;
}

// Raw sample to the image object's float: (s & mask) / mask, 0 without bits.
inline float normalised(std::uint16_t sample, std::uint32_t mask) {
    return mask == 0 ? 0.0f : static_cast<float>(sample & mask) / static_cast<float>(mask);
}

} // namespace

bool MosaicStream::accepts(std::int32_t width, std::int32_t height,
                           const MosaicPreparation& settings) {
    return width / 2 >= 1 && height / 2 >= 1 && settings.samplingFactor >= 1 &&
           (!settings.medianFilter ||
            (settings.medianSize >= 1 && settings.medianSize <= kMaxMedianSize));
}

MosaicStream::MosaicStream(std::int32_t width, std::int32_t height,
                           const MosaicPreparation& settings)
    : settings_(settings), width_(width), height_(height) {
    planeWidth_ = width_ / 2;
    planeHeight_ = height_ / 2;
    if (planeWidth_ < 1 || planeHeight_ < 1)
        throw std::invalid_argument(msg::kNotFloatImage);
    if (settings.medianFilter && (settings.medianSize < 1 || settings.medianSize > kMaxMedianSize))
        throw std::invalid_argument(msg::kBadMedianSize);
    outWidth_ = downsampledSize(static_cast<std::int32_t>(planeWidth_), settings.samplingFactor);
    outHeight_ = downsampledSize(static_cast<std::int32_t>(planeHeight_), settings.samplingFactor);
    window_ = settings.medianFilter ? settings.medianSize : 1;

    // A window reaches at most window_ - 1 rows back from the newest row it
    // needs (see emitReadyRows); one more row is kept for the one arriving.
    // A plane row is kept as its two mosaic rows, cut to whole 2 x 2 blocks.
    ringRows_ = std::min<std::int64_t>(planeHeight_, window_ + 1);
    rowSamples_ = 2 * static_cast<std::size_t>(planeWidth_);
    ring_.resize(static_cast<std::size_t>(ringRows_) * 2 * rowSamples_);

    // Mosaic column (of the block's left sample) of each window position, and
    // the plane rows that some window reads (with a factor above 1 and a small
    // window, many are never read and not kept).
    const std::int64_t half = settings.medianFilter ? window_ / 2 : 0;
    columns_.resize(static_cast<std::size_t>(outWidth_) * window_);
    for (std::int64_t x = 0; x < outWidth_; ++x)
        for (int i = 0; i < window_; ++i)
            columns_[static_cast<std::size_t>(x) * window_ + i] = static_cast<std::uint32_t>(
                2 * mirrorIndex(settings.samplingFactor * x - half + i, planeWidth_));
    readRows_.assign(static_cast<std::size_t>(planeHeight_), 0);
    for (std::int64_t y = 0; y < outHeight_; ++y)
        for (int i = 0; i < window_; ++i)
            readRows_[mirrorIndex(settings.samplingFactor * y - half + i, planeHeight_)] = 1;

    const std::size_t outSamples = 4 * static_cast<std::size_t>(outWidth_) * outHeight_;
    low_.resize(outSamples);
    if (window_ % 2 == 0)
        high_.resize(outSamples);
    gather_.resize(static_cast<std::size_t>(window_) * window_ * kRun);
}

const std::uint16_t* MosaicStream::planeRow(std::int64_t row, int channel) const {
    // A window never reaches a row that has left the ring (see emitReadyRows).
    if (row >= planeRowsIn_ || row < planeRowsIn_ - ringRows_)
        throw std::logic_error("plane row outside the kept rows");
    // Channel r * 2 + c of plane row i is mosaic row 2i + r from column c on,
    // every second sample.
    const std::size_t slot = static_cast<std::size_t>(row % ringRows_);
    return ring_.data() + (slot * 2 + channel / 2) * rowSamples_ + channel % 2;
}

void MosaicStream::measureSamples(std::uint32_t mask) {
    measuring_ = true;
    measureMask_ = mask;
}

void MosaicStream::addRow(const std::uint16_t* samples) {
    const std::int64_t y = rowsIn_++;
    largest_ = largestOf(samples, static_cast<std::size_t>(width_), largest_);
    if (measuring_) {
        // The extremes of the floats are the floats of the extremes (the
        // conversion is monotonic); the sum goes sample by sample.
        std::uint16_t smallest = smallest_, highest = 0;
        double sum = statistics_.sum;
        for (std::int64_t x = 0; x < width_; ++x) {
            smallest = std::min(smallest, samples[x]);
            highest = std::max(highest, samples[x]);
            sum += normalised(samples[x], measureMask_);
        }
        smallest_ = smallest;
        statistics_.sum = sum;
        statistics_.count += static_cast<std::size_t>(width_);
        statistics_.minimum = normalised(smallest_, measureMask_);
        statistics_.maximum = std::max(statistics_.maximum, normalised(highest, measureMask_));
    }
    // A last row of an odd height belongs to no plane row.
    if (y >= 2 * planeHeight_)
        return;
    if (readRows_[static_cast<std::size_t>(y / 2)]) {
        const std::size_t slot = static_cast<std::size_t>(planeRowsIn_ % ringRows_);
        std::memcpy(ring_.data() + (slot * 2 + static_cast<std::size_t>(y % 2)) * rowSamples_,
                    samples, rowSamples_ * sizeof(std::uint16_t));
    }
    if (y % 2 == 0)
        return;
    ++planeRowsIn_;
    emitReadyRows();
}

// Output row y reads the plane rows of its window, mirrored. Rows go out in
// order as soon as the newest row they read has come; the rows they read then
// lie within the last window_ rows received (a window spans window_ - 1 rows,
// and at the bottom edge the mirrored rows stay within the last window_ - 1).
void MosaicStream::emitReadyRows() {
    const std::int64_t half = settings_.medianFilter ? window_ / 2 : 0;
    while (nextOut_ < outHeight_) {
        std::int64_t newest = 0;
        for (int i = 0; i < window_; ++i)
            newest = std::max<std::int64_t>(
                newest, static_cast<std::int64_t>(mirrorIndex(
                            settings_.samplingFactor * nextOut_ - half + i, planeHeight_)));
        if (newest >= planeRowsIn_)
            return;
        emitRow(nextOut_++);
    }
}

void MosaicStream::emitRow(std::int64_t y) {
    const std::int64_t half = settings_.medianFilter ? window_ / 2 : 0;
    const std::size_t window = static_cast<std::size_t>(window_);
    const std::size_t count = window * window;
    const std::size_t outWidth = static_cast<std::size_t>(outWidth_);
    const std::size_t outRowSamples = 2 * outWidth;
    for (int channel = 0; channel < kChannels; ++channel) {
        const std::uint16_t* rows[kMaxMedianSize];
        for (std::size_t i = 0; i < window; ++i)
            rows[i] =
                planeRow(static_cast<std::int64_t>(mirrorIndex(settings_.samplingFactor * y - half +
                                                                   static_cast<std::int64_t>(i),
                                                               planeHeight_)),
                         channel);
        // Channel r * 2 + c goes to mosaic (2x + c, 2y + r) of the result.
        const std::size_t outRow = static_cast<std::size_t>(2 * y + channel / 2);
        std::uint16_t* low = low_.data() + outRow * outRowSamples + channel % 2;
        std::uint16_t* high = high_.empty() ? nullptr : high_.data() + (low - low_.data());

        if (window == 1) {
            for (std::size_t x = 0; x < outWidth; ++x)
                low[2 * x] = rows[0][columns_[x]];
            continue;
        }
        if (window == 3) {
            // Runs of kRun outputs: gather the nine window values of each,
            // then sort the runs together.
            std::uint16_t* v = gather_.data();
            for (std::size_t x0 = 0; x0 < outWidth; x0 += kRun) {
                const std::size_t n = std::min(kRun, outWidth - x0);
                for (std::size_t k = 0; k < n; ++k) {
                    const std::uint32_t* column = &columns_[(x0 + k) * 3];
                    for (std::size_t r = 0; r < 3; ++r)
                        for (std::size_t c = 0; c < 3; ++c)
                            v[(3 * r + c) * kRun + k] = rows[r][column[c]];
                }
                medianOfNine(v);
                for (std::size_t k = 0; k < n; ++k)
                    low[2 * (x0 + k)] = v[4 * kRun + k];
            }
            continue;
        }
        // Other sizes: the two middle order statistics of each window.
        const std::size_t lowAt = (count + 1) / 2 - 1;
        const std::size_t highAt = count / 2;
        std::uint16_t* values = gather_.data();
        for (std::size_t x = 0; x < outWidth; ++x) {
            const std::uint32_t* column = &columns_[x * window];
            for (std::size_t r = 0; r < window; ++r)
                for (std::size_t c = 0; c < window; ++c)
                    values[r * window + c] = rows[r][column[c]];
            std::nth_element(values, values + lowAt, values + count);
            low[2 * x] = values[lowAt];
            if (high)
                high[2 * x] = highAt == lowAt ? values[lowAt]
                                              : *std::min_element(values + highAt, values + count);
        }
    }
}

BayerImage MosaicStream::finish(std::uint16_t bits, std::uint32_t cfa0, std::uint32_t cfa1) {
    if (rowsIn_ < height_)
        throw std::logic_error("mosaic stream finished before its last row");
    BayerImage prepared = createFloatImage(2 * outWidth_, 2 * outHeight_, bits, 1, cfa0, cfa1,
                                           kPixelRaw, kBufferRawCfa);
    const std::uint32_t mask = bits >= 16 ? 0xFFFFu : (1u << bits) - 1u;
    float* out = prepared.pixels();
    for (std::size_t i = 0; i < low_.size(); ++i) {
        const float low = normalised(low_[i], mask);
        out[i] = high_.empty() ? low : (low + normalised(high_[i], mask)) * 0.5f;
    }
    return prepared;
}

} // namespace prep
