#pragma once
// Where a capture's samples go when they are not kept as a whole image: one
// mosaic row after another, top to bottom, as 16-bit samples in host order
// (already masked to the bit depth where the format declares one). A reader
// pushes rows into a sink; a source that combines several frames row by row
// can sit between the readers and the sink.

#include <cstdint>

namespace img {

class MosaicRowSink {
public:
    virtual ~MosaicRowSink() = default;
    // Before the first row: the mosaic's size (a sink sized in advance may
    // ignore it).
    virtual void start(std::int32_t /*width*/, std::int32_t /*height*/) {}
    // `samples` holds one row of the mosaic's width; it may be reused after
    // the call.
    virtual void addRow(const std::uint16_t* samples) = 0;
};

} // namespace img
