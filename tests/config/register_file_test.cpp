// The calibration register file. Variants (tests/data/config/register_file.json)
// give the texts in register_file.golden (control points: a few of each
// channel); the whole default file is register_file.cfg.

#include <cmath>
#include <limits>
#include <regex>
#include <sstream>
#include <stdexcept>
#include <string>

#include "config/config_file.h"
#include "config/parameter_table.h"
#include "config/register_file.h"
#include "tests/config/case_data.h"
#include "tests/support/temp_dir.h"

namespace config {
namespace {

float floatOf(const nlohmann::json& value) {
    return value.is_string() ? std::stof(value.get<std::string>()) : value.get<float>();
}

// The run of a variant: levels R GR GB B of 0.5 1 0.25 0.75, control points
// 1 + channel / 2 except GR[3][7] = 1.1, on a 64 x 48 image of serial 0123abcd.
struct Variant {
    explicit Variant(const nlohmann::json& c = nlohmann::json::object()) {
        set_defaults(config);
        parse_config_text(c.value("settings", ""), config);
        const float levels[4] = {0.5f, 1.0f, 0.25f, 0.75f};
        std::copy(levels, levels + 4, fit.targetLevels);
        for (int channel = 0; channel < lsc::kChannels; ++channel)
            for (int n = 0; n < lsc::kGridPoints; ++n)
                fit.correction.controlGrids[channel][n] = 1.0f + 0.5f * static_cast<float>(channel);
        fit.correction.controlGrids[1][37] = 1.1f;
        if (c.contains("levels"))
            for (int k = 0; k < 4; ++k)
                fit.targetLevels[k] = floatOf(c["levels"][k]);
        if (c.contains("point"))
            fit.correction.controlGrids[c["point"][0].get<int>()][c["point"][1].get<int>()] =
                floatOf(c["point"][2]);
        if (c.contains("layout")) {
            lsc::PatchLayout& l = fit.correction.layout;
            const nlohmann::json& v = c["layout"];
            l = {v[0].is_null() ? std::nan("") : v[0].get<double>(), v[1].get<double>(),
                 v[2].get<double>(), v[3].is_null() ? std::nan("") : v[3].get<double>()};
        }
        const nlohmann::json size = c.value("image", nlohmann::json::array({64, 48, 10}));
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
    case_data::expectTranscript("config/register_file.json", "config/register_file.golden",
                                [&](const nlohmann::json& c) {
                                    return case_data::outcomeOf([&] {
                                        std::istringstream in(Variant(c).text());
                                        std::string shown;
                                        for (std::string line; std::getline(in, line);)
                                            if (line.find("controlPoint") == std::string::npos ||
                                                std::regex_search(line, shownPoint))
                                                shown += line + "\n";
                                        return shown;
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

TEST(RegisterFile, EveryVariantReadsBackThroughTheConfigurationReader) {
    for (const char* serial : {"0123abcd", "", "with space", "line\nbreak", "x;y#z"})
        for (const char* settings : {"", "lsc.left_patch_width = 16;",
                                     "shared.light_source = -1; lsc.wb_avgs_flag = 0;"}) {
            Variant run({{"settings", settings},
                         {"serial", serial},
                         {"infix", ".ctrlPoints[1]"},
                         {"commandLine", "-c\nx.cfg y = 1; "}});
            config_node_impl back("root");
            ASSERT_NO_THROW(parse_config_text(run.text(), back)) << serial << " / " << settings;
            const std::string plain = serial;
            EXPECT_EQ(back.find_path("reference.serial_no").as_string(),
                      plain.empty() || plain.find_first_of(" \n;#") != std::string::npos
                          ? "\"" + plain + "\""
                          : plain);
            EXPECT_EQ(back.find_path("reference.ctrlPoints[1].controlPointGR[3][7]").as_float(),
                      1.1f);
            EXPECT_EQ(back.find_path("global.configVersion").as_string(), "0x0100");
            EXPECT_FALSE(back.find("y").valid()); // the command line stays a comment
        }
}

} // namespace
} // namespace config
