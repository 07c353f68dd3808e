#include "lsc/lens_shading_correction.h"

#include <cstddef>
#include <cstdint>
#include <stdexcept>

#include "image/bayer_phase.h"
#include "lsc/eval_patch.h"
#include "lsc/lsc_messages.h"
#include "lsc/patch_geometry.h"
#include "lsc/working_image.h"

namespace lsc {

using img::BayerImage;
using img::ImageBuffer;
using img::imageCreate;
using img::kBufferRawCfa;
using img::kDataReal32;
using img::kPixelRaw;

BayerImage applyLensShading(const BayerImage& image, const ShadingCorrection& correction,
                            float blackLevel, unsigned applyStep) {
    const WorkingImage in = workingImage(image);
    const std::uint64_t step = applyStep;
    if (step < 1)
        throw std::runtime_error(lsc::msg::kBadApplyStep);
    // Smaller inputs have no complete output block.
    if (in.width < 2 * step || in.height < 2 * step)
        throw std::runtime_error(lsc::msg::kImageTooSmallToCorrect);
    const PatchLayout& layout = correction.layout;
    const PatchBreakpoints breaks = usablePatchBreakpoints(
        in.width, in.height, layout.left, layout.center, layout.top, layout.middle);

    const std::uint32_t outWidth = static_cast<std::uint32_t>(in.width / step) & ~1u;
    const std::uint32_t outHeight = static_cast<std::uint32_t>(in.height / step) & ~1u;
    int rc = 0;
    const ImageBuffer* source = image.buffer();
    ImageBuffer* out =
        imageCreate(static_cast<std::int32_t>(outWidth), static_cast<std::int32_t>(outHeight),
                    source->bitsPerSample, 1, 1, source->cfa[0], source->cfa[1], kPixelRaw,
                    kBufferRawCfa, kDataReal32, &rc);
    if (!out)
        throw std::runtime_error(lsc::msg::kImageAllocation);
    BayerImage corrected;
    corrected.reset(out);

    const int phase = img::bayerPhase(in.cfa);
    int channelAt[2][2];
    for (int dy = 0; dy < 2; ++dy)
        for (int dx = 0; dx < 2; ++dx)
            channelAt[dy][dx] =
                img::bayerChannel(static_cast<unsigned>(dx), static_cast<unsigned>(dy), phase);
    // The row cubics of every patch of every channel, built once: the
    // per-pixel work is then one patch evaluation from them (same arithmetic
    // as evalPatch on the grid).
    PatchCubics cubics[kChannels][9];
    for (int k = 0; k < kChannels; ++k)
        for (std::uint32_t patch = 0; patch < 9; ++patch)
            cubics[k][patch] =
                patchCubics(correction.controlGrids[k], patchStart(patch / 3, patch % 3));

    const float black = blackLevel;
    const float* const src = in.pixels;
    float* const dst = static_cast<float*>(out->data);
    const std::size_t inStride = in.width;
    const std::size_t outStride = outWidth;

    // Every output block once: (outWidth / 2) x (outHeight / 2) blocks, taken
    // from input blocks 2 x step apart; the last one read ends at or before
    // W - 2 x step + 1, inside the image.
    for (std::uint32_t yo = 0; yo < outHeight; yo += 2) {
        const std::uint32_t y = static_cast<std::uint32_t>(yo * step);
        const AxisPosition row = axisPosition(y, breaks.y);
        float weights[4];
        cubicWeights(row.local, weights);
        for (std::uint32_t xo = 0; xo < outWidth; xo += 2) {
            const std::uint32_t x = static_cast<std::uint32_t>(xo * step);
            const AxisPosition column = axisPosition(x, breaks.x);
            const std::uint32_t patch = row.patch * 3 + column.patch;
            const float u = column.local, u2 = u * u, u3 = u2 * u;
            for (int dy = 0; dy < 2; ++dy) {
                const float* inRow = src + (y + dy) * inStride + x;
                float* outRow = dst + (yo + dy) * outStride + xo;
                for (int dx = 0; dx < 2; ++dx) {
                    const float gain =
                        evalPatchCubics(cubics[channelAt[dy][dx]][patch], u, u2, u3, weights);
                    outRow[dx] = gain * (inRow[dx] - black);
                }
            }
        }
    }
    return corrected;
}

} // namespace lsc
