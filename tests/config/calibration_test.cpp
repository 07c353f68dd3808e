// The fit's settings from the configuration, the patch geometry of stored
// calibration data against them, and the register file. The cases are
// tests/data/config/{fit_settings,patch_geometry,register_file}.json, what each
// gives is in the .golden file of the same name (register file variants: a few
// control points of each channel, then the text read back through the
// configuration reader); register_file.cfg is the whole default file.

#include <cmath>
#include <limits>
#include <regex>
#include <sstream>
#include <stdexcept>
#include <string>

#include "config/config_file.h"
#include "config/fit_settings.h"
#include "config/parameter_table.h"
#include "config/patch_geometry_check.h"
#include "config/register_file.h"
#include "config/value_text.h"
#include "tests/config/case_data.h"
#include "tests/support/temp_dir.h"

namespace config {
namespace {

using nlohmann::json;

img::BayerImage imageOf(const json& size) {
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
        "config/fit_settings.json", "config/fit_settings.golden", [](const json& c) {
            config_node_impl config("config");
            set_defaults(config);
            parse_config_text(c["settings"].get<std::string>(), config);
            return case_data::outcomeOf(
                [&] { return describe(load_fit_settings(config, imageOf(c["image"]))); });
        });
}

TEST(PatchGeometryCheck, StoredDataAgainstConfigurationAndImage) {
    case_data::expectTranscript(
        "config/patch_geometry.json", "config/patch_geometry.golden", [](const json& c) {
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

// The run of a variant: levels R GR GB B of 0.5 1 0.25 0.75, control points
// 1 + channel / 2 except GR[3][7] = 1.1, on a 64 x 48 image of serial 0123abcd.
struct Variant {
    explicit Variant(const json& c = json::object()) {
        set_defaults(config);
        parse_config_text(c.value("settings", ""), config);
        for (int channel = 0; channel < lsc::kChannels; ++channel)
            for (int n = 0; n < lsc::kGridPoints; ++n)
                fit.correction.controlGrids[channel][n] = 1.0f + 0.5f * static_cast<float>(channel);
        fit.correction.controlGrids[1][37] = 1.1f;
        for (int k = 0; k < 4; ++k)
            fit.targetLevels[k] =
                case_data::number(c.value("levels", json::array({0.5, 1, 0.25, 0.75}))[k]);
        if (c.contains("point"))
            fit.correction.controlGrids[c["point"][0].get<int>()][c["point"][1].get<int>()] =
                case_data::number(c["point"][2]);
        if (c.contains("layout")) {
            const json& v = c["layout"];
            fit.correction.layout = {case_data::number(v[0]), case_data::number(v[1]),
                                     case_data::number(v[2]), case_data::number(v[3])};
        }
        const json size = c.value("image", json::array({64, 48, 10}));
        image.createFromHeaderless(size[0], size[1], size[2], img::kCfaRggb, 100.0f, 1.0f,
                                   c.value("serial", "0123abcd"), "", false);
        infix = c.value("infix", "");
        commandLine = c.value("commandLine", "-c a.cfg -i b.raw ");
    }

    std::string text() const {
        return register_file_text(config, "reference", infix, commandLine, fit, image);
    }

    config_node_impl config{"config"};
    lsc::FitResult fit;
    img::BayerImage image;
    std::string infix, commandLine;
};

TEST(RegisterFile, VariantsGiveTheirTexts) {
    const std::regex shownPoint(R"(controlPoint.*\[(0\]\[0|3\]\[7|3\]\[8|9\]\[9)\])");
    case_data::expectTranscript(
        "config/register_file.json", "config/register_file.golden", [&](const json& c) {
            return case_data::outcomeOf([&] {
                const Variant run(c);
                std::istringstream in(run.text());
                std::string shown;
                for (std::string line; std::getline(in, line);)
                    if (line.find("controlPoint") == std::string::npos ||
                        std::regex_search(line, shownPoint))
                        shown += line + "\n";
                config_node_impl back("root");
                parse_config_text(run.text(), back);
                const std::string point = "reference" + run.infix + ".controlPointGR[3][7]";
                return shown + "read back: serial " +
                       back.find_path("reference.serial_no").as_string() + ", GR[3][7] " +
                       number(back.find_path(point).as_float()) + ", entries " +
                       std::to_string(back.namedChildren().size());
            });
        });
}

TEST(RegisterFile, WritesTheFileAndLeavesItAloneOnRefusal) {
    testing_support::TempDir dir;
    const std::string path = dir.file("calibration.cfg");
    Variant run;
    write_register_file(path, run.config, "reference", "", "-c a.cfg -i b.raw ", run.fit,
                        run.image);
    case_data::expectGolden("config/register_file.cfg", testing_support::readFile(path));

    run.fit.correction.controlGrids[2][5] = std::numeric_limits<float>::infinity();
    const std::string before = testing_support::readFile(path);
    EXPECT_THROW(write_register_file(path, run.config, "reference", "", "", run.fit, run.image),
                 std::runtime_error);
    EXPECT_EQ(testing_support::readFile(path), before);

    Variant good;
    for (const std::string& target : {dir.file("missing/calibration.cfg"), dir.path()})
        EXPECT_EQ(case_data::errorOf([&] {
                      write_register_file(target, good.config, "reference", "", "", good.fit,
                                          good.image);
                  }),
                  "Unable to open output calibration file, possible invalid output path or output "
                  "filename specified.");
    if (testing_support::fileExists("/dev/full")) {
        EXPECT_THROW(write_register_file("/dev/full", good.config, "reference", "", "", good.fit,
                                         good.image),
                     std::runtime_error);
    }
}

} // namespace
} // namespace config
