#pragma once
// The preparation of a 2 x 2 Bayer mosaic (median filter or decimation of
// each colour plane, woven back) while the capture is read: rows come in one
// at a time and only the few plane rows that the next windows need are kept,
// as integer samples. The full-resolution image is never made, in integers or
// in floats.
//
// The result is sample for sample the one of prepareMosaic on the image that
// the image object would load: the conversion of a sample s of b bits to
// (s & (2^b - 1)) / (2^b - 1) is monotonic, so the median of the converted
// window is the converted median of the integers (the mean of two middle
// values is taken after converting both, as the float filter does).

#include <cstdint>
#include <vector>

#include "image/bayer_image.h"
#include "image/mosaic_rows.h"
#include "prep/image_checks.h"
#include "prep/mosaic_preparation.h"

namespace prep {

class MosaicStream final : public img::MosaicRowSink {
public:
    // Whether a mosaic of width x height can be prepared with these
    // settings (prepareMosaic would refuse it otherwise).
    static bool accepts(std::int32_t width, std::int32_t height, const MosaicPreparation& settings);

    // For a single-channel mosaic of width x height with a 2 x 2 pattern.
    // Throws std::invalid_argument as prepareMosaic does for sizes and
    // settings it refuses.
    MosaicStream(std::int32_t width, std::int32_t height, const MosaicPreparation& settings);

    // The next of the mosaic's rows, `width` samples.
    void addRow(const std::uint16_t* samples) override;

    // The largest sample of the rows so far.
    std::uint16_t largest() const { return largest_; }

    // From the next row on, also gathers the statistics of the samples as
    // floats of the depth whose mask is given (before the first row: those of
    // the whole input image, as sampleStatistics would find them).
    void measureSamples(std::uint32_t mask);
    const SampleStatistics& statistics() const { return statistics_; }

    // After the last row: the prepared mosaic (REAL32, one channel, pixel
    // type RAW with the cfa words), samples converted at `bits` bits.
    img::BayerImage finish(std::uint16_t bits, std::uint32_t cfa0, std::uint32_t cfa1);

private:
    void emitReadyRows();
    void emitRow(std::int64_t y);
    const std::uint16_t* planeRow(std::int64_t row, int channel) const;

    MosaicPreparation settings_;
    std::int64_t width_, height_;           // mosaic
    std::int64_t planeWidth_, planeHeight_; // colour planes
    std::int32_t outWidth_, outHeight_;     // down-sampled planes
    int window_;                            // 1 when only decimating

    // The last `ringRows_` plane rows, each as its two mosaic rows of
    // rowSamples_ samples; which plane rows any window reads.
    std::int64_t ringRows_;
    std::size_t rowSamples_;
    std::vector<std::uint16_t> ring_;
    std::vector<char> readRows_;
    std::int64_t rowsIn_ = 0;      // mosaic rows received
    std::int64_t planeRowsIn_ = 0; // complete plane rows
    std::int64_t nextOut_ = 0;     // next down-sampled row to make

    // Mosaic column of the block of each window position, per output column.
    std::vector<std::uint32_t> columns_;
    // The prepared mosaic as integers: the lower middle value of each window,
    // and the upper one for windows of an even count.
    std::vector<std::uint16_t> low_, high_;
    std::vector<std::uint16_t> gather_; // window values of a run of outputs
    std::uint16_t largest_ = 0;
    bool measuring_ = false;
    std::uint32_t measureMask_ = 0;
    std::uint16_t smallest_ = 0xFFFF;
    SampleStatistics statistics_;
};

} // namespace prep
