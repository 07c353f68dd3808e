#include "config/fit_settings.h"

#include <cmath>
#include <cstdint>
#include <stdexcept>

#include "config/config_messages.h"
#include "config/parameter_table.h"
#include "config/value_text.h"

namespace config {

using img::BayerImage;

using lsc::PatchLayout;
using lsc::ShadingSettings;

namespace {

const config_node& setting(const config_node& config, const char* section, const char* key) {
    return config.find(section).find(key);
}

void loadPatchFractions(const config_node& config, double width, double height,
                        PatchLayout& layout) {
    const config_node& lsc = config.find("lsc");
    if (!lsc.find("left_patch_width").is_default() && lsc.find("leftPatchFactor").is_default()) {
        layout.left = lsc.find("left_patch_width").as_int() / width;
        layout.center = lsc.find("center_patch_width").as_int() / width;
        layout.top = lsc.find("top_patch_height").as_int() / height;
        layout.middle = lsc.find("middle_patch_height").as_int() / height;
    } else {
        layout.left = lsc.find("leftPatchFactor").as_float();
        layout.center = lsc.find("centerPatchFactor").as_float();
        layout.top = lsc.find("topPatchFactor").as_float();
        layout.middle = lsc.find("middlePatchFactor").as_float();
    }
}

// Every block must hold at least one pixel: a count of 0 would divide by
// zero in the evaluation, and a count above the image size leaves blocks empty.
void loadDeltaAbBlocks(const config_node& config, std::int32_t width, std::int32_t height,
                       ShadingSettings& settings) {
    const config_node& blocks = setting(config, "apply_lsc", "delta_ab_blocks");
    // Columns and rows: a third value would be ignored without a word.
    if (blocks.size() != 2)
        throw std::range_error(msg::kDeltaAbBlocksNotTwo);
    const int horizontal = blocks.find(0).as_int();
    const int vertical = blocks.find(1).as_int();
    if (horizontal != 0 || vertical != 0) {
        check_int_range(config, blocks.find(0), 1, width);
        check_int_range(config, blocks.find(1), 1, height);
        settings.deltaAbBlocks[0] = horizontal;
        settings.deltaAbBlocks[1] = vertical;
        return;
    }
    const float ratio = static_cast<float>(width) / static_cast<float>(height);
    if (std::fabs(ratio - 4.0f / 3.0f) < 0.01f) {
        settings.deltaAbBlocks[0] = 20, settings.deltaAbBlocks[1] = 15;
    } else if (std::fabs(ratio - 1.5f) < 0.01f) {
        settings.deltaAbBlocks[0] = 24, settings.deltaAbBlocks[1] = 16;
    } else if (std::fabs(ratio - 16.0f / 9.0f) < 0.01f) {
        settings.deltaAbBlocks[0] = 32, settings.deltaAbBlocks[1] = 18;
    } else {
        settings.deltaAbBlocks[0] = static_cast<int>(std::floor(ratio * 15.0f));
        settings.deltaAbBlocks[1] = 15;
    }
    if (settings.deltaAbBlocks[0] < 1 || settings.deltaAbBlocks[0] > width ||
        settings.deltaAbBlocks[1] > height)
        throw std::range_error(msg::kNoDeltaAbBlocksPrefix + integerText(width) + "x" +
                               integerText(height) + msg::kNoDeltaAbBlocksSuffix);
}

} // namespace

ShadingSettings load_fit_settings(const config_node& config, const BayerImage& image) {
    ShadingSettings settings;
    const std::int32_t width = image.width();
    const std::int32_t height = image.height();

    settings.procSamplingFactor = setting(config, "shared", "proc_sampling_factor").as_int();
    loadPatchFractions(config, width, height, settings.layout);
    settings.sampleAngleStep = setting(config, "lsc", "sampling_factor").as_int();
    settings.sampleMargin = setting(config, "lsc", "sampling_margin").as_int();
    settings.falloff =
        static_cast<float>(setting(config, "lsc", "falloff_factor").as_int()) / 100.0f;
    settings.greenBalance = setting(config, "lsc", "green_balance").as_int() != 0;
    settings.applyStep =
        static_cast<unsigned>(setting(config, "apply_lsc", "sampling_factor").as_int());
    settings.maxGain = setting(config, "lsc", "max_gain").as_float();
    settings.maxRmsError = setting(config, "lsc", "max_rms_err").as_float();
    settings.maxError = setting(config, "lsc", "max_err").as_float();
    settings.logFitError = setting(config, "lsc", "log_err_flag").as_int() != 0;
    settings.sampleWindow = setting(config, "lsc", "sample_window").as_int();
    settings.maxDeltaAb = setting(config, "apply_lsc", "max_delta_ab").as_float();
    settings.maxLumaResidual = setting(config, "apply_lsc", "max_luma_residual").as_float();
    settings.autoPatchLayout = setting(config, "lsc", "patch_layout").as_string() == "auto";
    settings.awbFilterSize = setting(config, "lsc", "awb_avg_filter_size").as_int();
    settings.lumaNormalizeFactor = setting(config, "apply_lsc", "luma_normalize_factor").as_float();
    loadDeltaAbBlocks(config, width, height, settings);
    const config_node& ccm = setting(config, "apply_lsc", "ccm");
    for (std::size_t r = 0; r < 3; ++r)
        for (std::size_t c = 0; c < 3; ++c)
            settings.ccm[r][c] = ccm.find(r).find(c).as_float();
    settings.averageChannels = setting(config, "lsc", "avg_luma").as_int() != 0;

    int bits = setting(config, "shared", "bit_res").as_int();
    if (bits == 0)
        bits = image.bitsPerSample();
    if (bits <= 0)
        throw std::runtime_error(msg::kZeroBitDepth);
    const std::uint32_t fullScale = bits >= 32 ? 0xFFFFFFFFu : (1u << bits) - 1u;
    settings.blackLevel =
        setting(config, "proc", "black_level").as_float() / static_cast<float>(fullScale);
    return settings;
}

} // namespace config
