#include "driver/check_image.h"

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <stdexcept>

#include "image/bayer_phase.h"
#include "image/error_detail.h"
#include "image/image_buffer.h"
#include "image/image_messages.h"
#include "image/tiff_writer.h"
#include "lsc/lens_shading_correction.h"

namespace driver {

using img::BayerImage;
using img::DetailedError;
using img::imageCreate;
using img::ImagePtr;
using img::kBufferRawCfa;
using img::kDataUint16;
using img::kPixelRaw;
using img::systemReason;
using img::tiffWrite;

using lsc::applyLensShading;
using lsc::kChannels;
using lsc::ShadingCorrection;

void writeCheckImage(const std::string& path, BayerImage capture,
                     const ShadingCorrection& correction, float blackLevel,
                     const float (&targetLevels)[kChannels]) {
    BayerImage corrected = applyLensShading(capture, correction, blackLevel, 1);
    capture.reset();

    const float green = std::max(targetLevels[1], targetLevels[2]);
    float balance[kChannels];
    for (int c = 0; c < kChannels; ++c)
        balance[c] = targetLevels[c] > 0.0f ? green / targetLevels[c] : 1.0f;

    int rc = 0;
    ImagePtr out(imageCreate(corrected.width(), corrected.height(), 16, 1, 1, 0, corrected.cfa(),
                             kPixelRaw, kBufferRawCfa, kDataUint16, &rc));
    if (!out)
        throw std::runtime_error(img::msg::kCannotAllocateImage);
    const int phase = img::bayerPhase(corrected.cfa());
    const float* in = corrected.pixels();
    auto* samples = static_cast<std::uint16_t*>(out->data);
    const std::int32_t width = corrected.width();
    for (std::int32_t y = 0; y < corrected.height(); ++y) {
        const float rowBalance[2] = {
            balance[img::bayerChannel(0, static_cast<std::uint64_t>(y), phase)],
            balance[img::bayerChannel(1, static_cast<std::uint64_t>(y), phase)]};
        const std::size_t row = static_cast<std::size_t>(y) * static_cast<std::size_t>(width);
        for (std::int32_t x = 0; x < width; ++x) {
            const float value = in[row + x] * rowBalance[x & 1] * 65535.0f + 0.5f;
            // Not a number counts as black; above full scale is clipped.
            samples[row + x] = !(value > 0.0f)     ? 0
                               : value >= 65535.0f ? 65535
                                                   : static_cast<std::uint16_t>(value);
        }
    }
    errno = 0;
    if (tiffWrite(path.c_str(), out.get()) != 0)
        throw DetailedError<std::runtime_error>(
            errno != 0 ? systemReason(path, errno) : path + ": the TIFF could not be written",
            "Cannot store check image: " + path);
}

} // namespace driver
