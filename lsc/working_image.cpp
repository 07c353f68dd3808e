#include "lsc/working_image.h"

#include <stdexcept>

#include "lsc/lsc_messages.h"

namespace lsc {

using img::BayerImage;
using img::ImageBuffer;
using img::kDataReal32;

WorkingImage workingImage(const BayerImage& image) {
    if (image.empty())
        throw std::runtime_error(lsc::msg::kNoWorkingImage);
    const ImageBuffer* buffer = image.buffer();
    if (buffer->dataType != kDataReal32 || buffer->samplesPerPixel != 1 || !buffer->data ||
        buffer->width < 1 || buffer->height < 1)
        throw std::runtime_error(lsc::msg::kNotBayerFloatImage);
    return {static_cast<std::uint32_t>(buffer->width), static_cast<std::uint32_t>(buffer->height),
            buffer->cfa[1], static_cast<float*>(buffer->data)};
}

} // namespace lsc
