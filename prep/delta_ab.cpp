#include "prep/delta_ab.h"

#include <cmath>
#include <cstddef>
#include <stdexcept>
#include <vector>

#include "image/bayer_phase.h"
#include "prep/prep_image.h"
#include "prep/prep_messages.h"

namespace prep {

using img::BayerImage;

using lsc::kChannels;
using lsc::ShadingSettings;
namespace {

constexpr float kGamma = 0.45454544f; // 1 / 2.2

struct Rgb {
    float r = 0.0f, g = 0.0f, b = 0.0f;
};

struct Lab {
    float l, a, b;
};

float linearise(float c) {
    return c <= 0.04045f ? c / 12.92f : std::pow((c + 0.055f) / 1.055f, 2.4f);
}

float labCurve(float t) {
    return t > 0.008856f ? std::pow(t, 0.33333299f) : (903.3f * t + 16.0f) / 116.0f;
}

Lab toLab(const Rgb& display) {
    const float r = linearise(display.r);
    const float g = linearise(display.g);
    const float b = linearise(display.b);
    const float x = 41.2391f * r + 35.7584f * g + 18.0481f * b;
    const float y = 21.2639f * r + 71.5169f * g + 7.2192f * b;
    const float z = 1.9331f * r + 11.9195f * g + 95.0532f * b;
    const float fx = labCurve(x / 95.047f);
    const float fy = labCurve(y / 100.0f);
    const float fz = labCurve(z / 108.883f);
    return {116.0f * fy - 16.0f, 500.0f * (fx - fy), 200.0f * (fy - fz)};
}

float encode(float linear) {
    return std::pow(linear < 0.0f ? 0.0f : linear, kGamma);
}

} // namespace

DeltaAbResult evaluateDeltaAb(BayerImage& image, const ShadingSettings& settings) {
    requireFloatImage(image);
    if (image.channels() != 1)
        throw std::invalid_argument(msg::kNotBayerImage);
    const int columns = settings.deltaAbBlocks[0];
    const int rows = settings.deltaAbBlocks[1];
    if (columns < 1 || rows < 1)
        throw std::runtime_error(msg::kNoDeltaBlocks);
    const std::size_t width = static_cast<std::size_t>(image.width());
    const std::size_t height = static_cast<std::size_t>(image.height());
    // One RGB pixel per whole 2 x 2 block; an odd last column or row has no block.
    const std::size_t rgbWidth = width / 2;
    const std::size_t rgbHeight = height / 2;
    const std::size_t blockWidth = rgbWidth / static_cast<std::size_t>(columns);
    const std::size_t blockHeight = rgbHeight / static_cast<std::size_t>(rows);
    if (blockWidth == 0 || blockHeight == 0)
        throw std::runtime_error(msg::kDeltaBlocksTooSmall);

    // Colour conversion, written back into the mosaic. The block sums are
    // gathered in the same pass and in the same order as a pass over a
    // separate RGB image would take them, so no such image is kept.
    const std::size_t blockCount = static_cast<std::size_t>(columns) * rows;
    std::vector<Rgb> sums(blockCount);
    const int phase = img::bayerPhase(image.cfa());
    int offsetX[kChannels], offsetY[kChannels];
    for (int k = 0; k < kChannels; ++k) {
        const img::BlockOffset offset = img::channelOffset(k, phase);
        offsetX[k] = offset.x;
        offsetY[k] = offset.y;
    }
    const auto& m = settings.ccm;
    float* pixels = image.pixels();
    float greenMax = 0.0f;
    for (std::size_t py = 0; py < rgbHeight; ++py) {
        float* block = pixels + 2 * py * width;
        const bool inBlockRows = py < blockHeight * rows;
        Rgb* blockRow = sums.data() + (inBlockRows ? py / blockHeight * columns : 0);
        for (std::size_t px = 0; px < rgbWidth; ++px, block += 2) {
            float* at[kChannels];
            for (int k = 0; k < kChannels; ++k)
                at[k] = block + offsetY[k] * width + offsetX[k];
            const float r = *at[0];
            const float g = (*at[1] + *at[2]) * 0.5f;
            const float b = *at[3];
            Rgb out;
            out.r = encode(r * m[0][0] + g * m[1][0] + b * m[2][0]);
            out.g = encode(r * m[0][1] + g * m[1][1] + b * m[2][1]);
            out.b = encode(r * m[0][2] + g * m[1][2] + b * m[2][2]);
            *at[0] = out.r;
            *at[1] = out.g;
            *at[2] = out.g;
            *at[3] = out.b;
            if (out.g > greenMax)
                greenMax = out.g;
            if (inBlockRows && px < blockWidth * columns) {
                Rgb& sum = blockRow[px / blockWidth];
                sum.r += out.r;
                sum.g += out.g;
                sum.b += out.b;
            }
        }
    }
    if (!(greenMax > 0.0f))
        throw std::runtime_error(msg::kNoGreenSignal);

    const float scale = settings.lumaNormalizeFactor / greenMax;
    const std::size_t count = sampleCount(image);
    for (std::size_t i = 0; i < count; ++i)
        pixels[i] *= scale;

    const float area = static_cast<float>(blockWidth * blockHeight);
    std::vector<Lab> lab(blockCount);
    const float n = static_cast<float>(blockCount);
    float chromaSum = 0.0f, aSum = 0.0f, bSum = 0.0f;
    for (std::size_t i = 0; i < blockCount; ++i) {
        const Rgb mean = {sums[i].r / area, sums[i].g / area, sums[i].b / area};
        lab[i] = toLab(mean);
        chromaSum += std::sqrt(lab[i].a * lab[i].a + lab[i].b * lab[i].b);
        aSum += lab[i].a;
        bSum += lab[i].b;
    }
    const float meanA = aSum / n;
    const float meanB = bSum / n;

    DeltaAbResult result;
    result.columns = columns;
    result.rows = rows;
    result.deltaImage.assign(blockCount, 0.0f);
    float maxDelta = 0.0f;
    float deltaSum = 0.0f;
    for (std::size_t i = 0; i < blockCount; ++i) {
        const float da = lab[i].a - meanA;
        const float db = lab[i].b - meanB;
        const float delta = std::sqrt(da * da + db * db);
        result.deltaImage[i] = delta;
        // A block that is not a number must not pass as a small error.
        if (!std::isnan(maxDelta) && (std::isnan(delta) || delta > maxDelta))
            maxDelta = delta;
        deltaSum += delta;
    }
    const float meanDelta = deltaSum / n;
    float squares = 0.0f;
    for (float delta : result.deltaImage)
        squares += (delta - meanDelta) * (delta - meanDelta);

    result.meanChroma = chromaSum / n;
    result.maxDelta = maxDelta;
    result.deltaStdDev = std::sqrt(squares / n);
    return result;
}

} // namespace prep
