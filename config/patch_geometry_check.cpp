#include "config/patch_geometry_check.h"

#include <stdexcept>
#include <string>

#include "config/config_messages.h"
#include "config/value_text.h"

namespace config {

using img::BayerImage;

using lsc::kChannels;
using lsc::kGridPoints;
using lsc::PatchLayout;
using lsc::ShadingCorrection;

namespace {

constexpr const char* kLegacyKeys[] = {"leftPatchWidth", "centerPatchWidth", "topPatchHeight",
                                       "middlePatchHeight"};
constexpr const char* kFactorKeys[] = {"leftPatchFactor", "centerPatchFactor", "topPatchFactor",
                                       "middlePatchFactor"};
// The configuration's names for the legacy sizes, in the order of kLegacyKeys.
constexpr const char* kConfigLegacyKeys[] = {"left_patch_width", "center_patch_width",
                                             "top_patch_height", "middle_patch_height"};
constexpr const char* kControlPointKeys[kChannels] = {"controlPointR", "controlPointGR",
                                                      "controlPointGB", "controlPointB"};
constexpr const char* kWhiteBalanceKeys[kChannels] = {"R", "GR", "GB", "B"};

template <std::size_t N>
bool anyInitialized(const config_node& data, const char* const (&keys)[N]) {
    for (const char* key : keys)
        if (data.find(key).initialized())
            return true;
    return false;
}

template <std::size_t N>
bool allInitialized(const config_node& data, const char* const (&keys)[N]) {
    for (const char* key : keys)
        if (!data.find(key).initialized())
            return false;
    return true;
}

// "<key> from input data does not match lsc.<key> in configuration file."
[[noreturn]] void throwMismatch(const char* key) {
    throw std::runtime_error(std::string(key) + msg::kMismatchMiddle + key + msg::kMismatchSuffix);
}

void setFractions(PatchLayout& layout, const double (&fractions)[4]) {
    layout.left = fractions[0];
    layout.center = fractions[1];
    layout.top = fractions[2];
    layout.middle = fractions[3];
}

void readLegacyGeometry(const config_node& lsc, const config_node& data, float width, float height,
                        PatchLayout& layout) {
    if (!allInitialized(data, kLegacyKeys))
        throw std::runtime_error(msg::kMissingPatchSizes);
    int sizes[4];
    for (int i = 0; i < 4; ++i)
        sizes[i] = data.find(kLegacyKeys[i]).as_int();
    setFractions(layout,
                 {static_cast<float>(sizes[0]) / width, static_cast<float>(sizes[1]) / width,
                  static_cast<float>(sizes[2]) / height, static_cast<float>(sizes[3]) / height});
    if (lsc.find("left_patch_width").is_default()) {
        if (!lsc.find("leftPatchFactor").is_default())
            throw std::runtime_error(msg::kConfigWithoutLegacyDataWithLegacy);
        return;
    }
    for (int i = 0; i < 4; ++i)
        if (lsc.find(kConfigLegacyKeys[i]).as_int() != sizes[i])
            throwMismatch(kLegacyKeys[i]);
}

void readFactorGeometry(const config_node& lsc, const config_node& data, std::int32_t width,
                        std::int32_t height, PatchLayout& layout) {
    if (!allInitialized(data, kFactorKeys) || !data.find("imageWidth").initialized() ||
        !data.find("imageHeight").initialized())
        throw std::runtime_error(msg::kMissingPatchSizes);
    float factors[4];
    for (int i = 0; i < 4; ++i)
        factors[i] = data.find(kFactorKeys[i]).as_float();
    setFractions(layout, {factors[0], factors[1], factors[2], factors[3]});
    const int dataWidth = data.find("imageWidth").as_int();
    const int dataHeight = data.find("imageHeight").as_int();
    if (dataWidth != width || dataHeight != height)
        throw std::range_error(msg::kDimensionsPrefix + integerText(width) + "x" +
                               integerText(height) + msg::kDimensionsMiddle +
                               integerText(dataWidth) + "x" + integerText(dataHeight) +
                               msg::kDimensionsSuffix);
    if (lsc.find("leftPatchFactor").is_default()) {
        if (!lsc.find("left_patch_width").is_default())
            throw std::runtime_error(msg::kConfigWithLegacyDataWithout);
        return;
    }
    for (int i = 0; i < 4; ++i)
        if (lsc.find(kFactorKeys[i]).as_float() != factors[i])
            throwMismatch(kFactorKeys[i]);
    if (lsc.find("imageWidth").as_int() != dataWidth)
        throwMismatch("imageWidth");
    if (lsc.find("imageHeight").as_int() != dataHeight)
        throwMismatch("imageHeight");
}

} // namespace

StoredCalibration readConfigParam(const config_node& root, const config_node& data,
                                  const BayerImage& image, const ShadingCorrection& fitted) {
    if (image.empty())
        throw std::runtime_error(msg::kImageNotSet);
    const std::int32_t width = image.width();
    const std::int32_t height = image.height();
    const config_node& lsc = root.find("config").find("lsc");

    StoredCalibration stored;
    stored.correction = fitted;
    PatchLayout& layout = stored.correction.layout;
    if (anyInitialized(data, kLegacyKeys))
        readLegacyGeometry(lsc, data, static_cast<float>(width), static_cast<float>(height),
                           layout);
    else if (anyInitialized(data, kFactorKeys) || data.find("imageWidth").initialized() ||
             data.find("imageHeight").initialized())
        readFactorGeometry(lsc, data, width, height, layout);

    if (data.find("controlPointR").valid()) {
        for (int channel = 0; channel < kChannels; ++channel) {
            const config_node& grid = data.find(kControlPointKeys[channel]);
            for (std::size_t n = 0; n < kGridPoints; ++n)
                stored.correction.controlGrids[channel][n] =
                    grid.find(n / 10).find(n % 10).as_float();
        }
    }
    if (data.find("R").valid())
        for (int channel = 0; channel < kChannels; ++channel)
            stored.whiteBalance[channel] =
                static_cast<float>(data.find(kWhiteBalanceKeys[channel]).as_int());
    return stored;
}

} // namespace config
