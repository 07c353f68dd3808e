// The fit's settings from the configuration, and the patch geometry of stored
// calibration data against it. Cases: tests/data/config/fit_settings.json and
// patch_geometry.json, results in the .golden files beside them.

#include <sstream>
#include <string>

#include "config/config_file.h"
#include "config/fit_settings.h"
#include "config/parameter_table.h"
#include "config/patch_geometry_check.h"
#include "config/value_text.h"
#include "tests/config/case_data.h"

namespace config {
namespace {

img::BayerImage imageOf(const nlohmann::json& size) {
    int result = 0;
    img::BayerImage image;
    image.reset(img::imageCreate(size[0], size[1], size[2], 1, 1, 0, img::kCfaRggb, img::kPixelRaw,
                                 img::kBufferRawCfa, img::kDataNone, &result));
    EXPECT_EQ(result, 0);
    return image;
}

std::string number(double value) {
    return doubleText(value);
}

std::string layoutText(const lsc::PatchLayout& l) {
    return "layout " + number(l.left) + " " + number(l.center) + " " + number(l.top) + " " +
           number(l.middle);
}

std::string describe(const lsc::ShadingSettings& s) {
    std::ostringstream out;
    out << layoutText(s.layout) << " auto " << s.autoPatchLayout << "\nblack "
        << number(s.blackLevel) << " angle " << s.sampleAngleStep << " margin " << s.sampleMargin
        << " window " << s.sampleWindow << " awb " << s.awbFilterSize << " proc "
        << s.procSamplingFactor << "\ngreen " << s.greenBalance << " falloff " << number(s.falloff)
        << " avg " << s.averageChannels << " gain " << number(s.maxGain) << " rms "
        << number(s.maxRmsError) << " err " << number(s.maxError) << " log " << s.logFitError
        << "\napply " << s.applyStep << " dab " << number(s.maxDeltaAb) << " luma "
        << number(s.maxLumaResidual) << " norm " << number(s.lumaNormalizeFactor) << " blocks "
        << s.deltaAbBlocks[0] << "x" << s.deltaAbBlocks[1] << "\nccm";
    for (const auto& row : s.ccm)
        for (float v : row)
            out << " " << number(v);
    return out.str();
}

TEST(FitSettings, ConfigurationAndImageGiveTheSettings) {
    case_data::expectTranscript(
        "config/fit_settings.json", "config/fit_settings.golden", [](const nlohmann::json& c) {
            config_node_impl config("config");
            set_defaults(config);
            parse_config_text(c["settings"].get<std::string>(), config);
            return case_data::outcomeOf(
                [&] { return describe(load_fit_settings(config, imageOf(c["image"]))); });
        });
}

TEST(PatchGeometryCheck, StoredDataAgainstConfigurationAndImage) {
    case_data::expectTranscript(
        "config/patch_geometry.json", "config/patch_geometry.golden", [](const nlohmann::json& c) {
            config_node_impl root("root");
            config_node& config = root.child("config");
            set_defaults(config);
            parse_config_text(c["config"].get<std::string>(), config);
            config_node_impl data("lsc");
            parse_config_text(c["data"].get<std::string>(), data);
            img::BayerImage image;
            if (c.contains("image"))
                image = imageOf(c["image"]);
            lsc::ShadingCorrection fitted; // what the run had before reading the data
            fitted.layout.left = 0.125;
            fitted.controlGrids[1][5] = 4.0f;
            return case_data::outcomeOf([&] {
                const StoredCalibration stored = readConfigParam(root, data, image, fitted);
                std::string grids;
                for (const auto& grid : stored.correction.controlGrids)
                    grids += " " + number(grid[0]) + " " + number(grid[5]) + " " +
                             number(grid[39]) + " " + number(grid[99]);
                return layoutText(stored.correction.layout) + "\ngrids" + grids + "\nlevels " +
                       number(stored.whiteBalance[0]) + " " + number(stored.whiteBalance[1]) + " " +
                       number(stored.whiteBalance[2]) + " " + number(stored.whiteBalance[3]);
            });
        });
}

} // namespace
} // namespace config
