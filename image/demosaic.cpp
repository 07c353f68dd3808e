#include "image/demosaic.h"

#include <cstddef>
#include <cstdint>

#include "image/bayer_phase.h"
#include "image/image_result.h"

namespace img {

namespace {

// Colour of a pixel within its 2x2 cell.
enum Site { kRed = 0, kGreenOnRedRow = 1, kGreenOnBlueRow = 2, kBlue = 3 };

// The neighbour beyond an edge is the one on the other side, which has the
// same colour. A line of one pixel has no other side and uses the pixel itself.
std::size_t mirror(std::ptrdiff_t index, std::size_t size) {
    const auto last = static_cast<std::ptrdiff_t>(size) - 1;
    if (index < 0)
        index = -index;
    else if (index > last)
        index = 2 * last - index;
    if (index < 0 || index > last)
        return 0;
    return static_cast<std::size_t>(index);
}

// 1.0 is 255. Below zero and NaN give 0: a corrected value slightly under the
// black level must not wrap round to a bright pixel.
[[gnu::always_inline]] inline std::uint8_t toByte(float value) {
    const float positive = value > 0.0f ? value : 0.0f; // written so that NaN gives 0
    const float scaled = positive * 255.0f + 0.5f;
    return static_cast<std::uint8_t>(scaled < 255.0f ? scaled : 255.0f);
}

struct RowNeighbours {
    const float* up;
    const float* mid;
    const float* down;
};

// Inlined, with the row pointers passed by value, so that the byte stores
// cannot make the compiler reload them for every pixel.
template <int S>
[[gnu::always_inline]] inline void interpolate(RowNeighbours rows, std::size_t left, std::size_t x,
                                               std::size_t right, std::uint8_t* rgb) {
    const float centre = rows.mid[x];
    if constexpr (S == kRed || S == kBlue) {
        const float cross = (rows.up[x] + rows.down[x] + rows.mid[left] + rows.mid[right]) * 0.25f;
        const float diagonal =
            (rows.up[left] + rows.up[right] + rows.down[left] + rows.down[right]) * 0.25f;
        rgb[0] = toByte(S == kRed ? centre : diagonal);
        rgb[1] = toByte(cross);
        rgb[2] = toByte(S == kRed ? diagonal : centre);
    } else {
        const float across = (rows.mid[left] + rows.mid[right]) * 0.5f;
        const float vertical = (rows.up[x] + rows.down[x]) * 0.5f;
        rgb[0] = toByte(S == kGreenOnRedRow ? across : vertical);
        rgb[1] = toByte(centre);
        rgb[2] = toByte(S == kGreenOnRedRow ? vertical : across);
    }
}

// One output row; Even and Odd are the sites of the even and odd columns.
// The edge pixels take mirrored neighbours, the run between them plain ones.
template <int Even, int Odd>
void demosaicRow(RowNeighbours rows, std::size_t width, std::uint8_t* out) {
    interpolate<Even>(rows, mirror(-1, width), 0, mirror(1, width), out);
    if (width == 1)
        return;
    std::size_t x = 1;
    for (; x + 2 < width; x += 2) {
        interpolate<Odd>(rows, x - 1, x, x + 1, out + 3 * x);
        interpolate<Even>(rows, x, x + 1, x + 2, out + 3 * (x + 1));
    }
    if (x + 1 < width)
        interpolate<Odd>(rows, x - 1, x, x + 1, out + 3 * x);
    const std::size_t last = width - 1;
    const std::size_t right = mirror(static_cast<std::ptrdiff_t>(width), width);
    if (last % 2 == 0)
        interpolate<Even>(rows, last - 1, last, right, out + 3 * last);
    else
        interpolate<Odd>(rows, last - 1, last, right, out + 3 * last);
}

} // namespace

ImageBuffer* demosaicToRgb8(const ImageBuffer* source, int* result) noexcept {
    int ignored;
    if (!result)
        result = &ignored;
    if (!source || source->samplesPerPixel != 1 || source->pixelType != kPixelRaw ||
        source->bufferType != kBufferRawCfa || source->dataType != kDataReal32) {
        *result = img::kUnsupported;
        return nullptr;
    }
    // A cfa pattern word in the first slot is no 2 x 2 pattern.
    const int phase = source->cfa[0] != 0 ? -1 : img::knownBayerPhase(source->cfa[1]);
    if (phase < 0) {
        *result = img::kWrongFormat;
        return nullptr;
    }
    if (!source->data || source->width < 1 || source->height < 1 || source->numberOfImages < 1) {
        *result = img::kSizeMismatch;
        return nullptr;
    }
    ImageBuffer* rgb = imageCreate(source->width, source->height, 8, 3, 1, 0, 0, kPixelRgb,
                                   kBufferInterleaved, kDataUint8, result);
    if (!rgb)
        return nullptr;

    const auto width = static_cast<std::size_t>(source->width);
    const auto height = static_cast<std::size_t>(source->height);
    const auto* samples = static_cast<const float*>(source->data);
    auto* out = static_cast<std::uint8_t*>(rgb->data);
    for (std::size_t y = 0; y < height; ++y) {
        const auto row = static_cast<std::ptrdiff_t>(y);
        const RowNeighbours rows{samples + mirror(row - 1, height) * width, samples + y * width,
                                 samples + mirror(row + 1, height) * width};
        std::uint8_t* rgbRow = out + 3 * y * width;
        switch (img::bayerChannel(0, y, phase)) {
        case kRed:
            demosaicRow<kRed, kGreenOnRedRow>(rows, width, rgbRow);
            break;
        case kGreenOnRedRow:
            demosaicRow<kGreenOnRedRow, kRed>(rows, width, rgbRow);
            break;
        case kGreenOnBlueRow:
            demosaicRow<kGreenOnBlueRow, kBlue>(rows, width, rgbRow);
            break;
        default:
            demosaicRow<kBlue, kGreenOnBlueRow>(rows, width, rgbRow);
            break;
        }
    }
    *result = img::kOk;
    return rgb;
}

} // namespace img
