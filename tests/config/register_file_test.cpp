#include <cmath>
#include <limits>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "config/config_file.h"
#include "config/parameter_table.h"
#include "config/register_file.h"
#include "tests/support/temp_dir.h"

namespace config {

using img::BayerImage;
using img::kCfaRggb;

using lsc::FitResult;
using lsc::kChannels;
using lsc::kGridPoints;
namespace {

class RegisterFileTest : public ::testing::Test {
protected:
    RegisterFileTest() {
        set_defaults(config);
        useImage(64, 48, "0123abcd");
        fit.targetLevels[0] = 0.5f;  // R
        fit.targetLevels[1] = 1.0f;  // GR
        fit.targetLevels[2] = 0.25f; // GB
        fit.targetLevels[3] = 0.75f; // B
        for (int channel = 0; channel < kChannels; ++channel)
            for (int n = 0; n < kGridPoints; ++n)
                fit.correction.controlGrids[channel][n] = 1.0f + 0.5f * static_cast<float>(channel);
        fit.correction.controlGrids[1][37] = 1.1f;
    }

    void useImage(std::int32_t width, std::int32_t height, const std::string& serial,
                  std::uint16_t bits = 10) {
        image.createFromHeaderless(width, height, bits, kCfaRggb, 100.0f, 1.0f, serial, "", false);
    }

    std::string text(const std::string& infix = "") {
        return register_file_text(config, "reference", infix, "-c a.cfg -i b.raw ", fit, image);
    }

    std::vector<std::string> lines(const std::string& infix = "") {
        std::vector<std::string> result;
        std::istringstream in(text(infix));
        for (std::string line; std::getline(in, line);)
            result.push_back(line);
        return result;
    }

    std::string error() {
        try {
            text();
        } catch (const std::runtime_error& e) {
            return e.what();
        }
        return "(written)";
    }

    // The text read back through the configuration reader.
    const config_node& reread(const std::string& registerText) {
        parse_config_text(registerText, readBack.child("config"));
        return readBack.find("config");
    }

    config_node_impl root{"root"};
    config_node& config = root.child("config");
    config_node_impl readBack{"root"};
    FitResult fit;
    BayerImage image;
};

TEST_F(RegisterFileTest, WritesHeaderGeometryLevelsSerialAndDeltas) {
    const std::vector<std::string> l = lines();
    ASSERT_EQ(l.size(), 4u + 6u + 1u + 4u + 1u + 12u + 400u);
    const std::vector<std::string> head(l.begin(), l.begin() + 28);
    EXPECT_EQ(head, (std::vector<std::string>{
                        "#############################################",
                        "# Command line: vignetteFit -c a.cfg -i b.raw ",
                        "global.configType            = 1;",
                        "global.configVersion         = 0x0100;",
                        "reference.imageWidth           = 64;",
                        "reference.imageHeight          = 48;",
                        "reference.leftPatchFactor      = 0.25;",
                        "reference.centerPatchFactor    = 0.5;",
                        "reference.topPatchFactor       = 0.25;",
                        "reference.middlePatchFactor    = 0.5;",
                        "reference.light_source         = 0;",
                        "reference.GR                   = 1023;",
                        "reference.R                    = 512;",
                        "reference.B                    = 767;",
                        "reference.GB                   = 256;",
                        "reference.serial_no            = 0123abcd;",
                        "reference.leftPatchDeltaUMSB   = 0x0;",
                        "reference.leftPatchDeltaULSB   = 0x80000000;",
                        "reference.centerPatchDeltaUMSB = 0x0;",
                        "reference.centerPatchDeltaULSB = 0x40000000;",
                        "reference.rightPatchDeltaUMSB  = 0x0;",
                        "reference.rightPatchDeltaULSB  = 0x80000000;",
                        "reference.topPatchDeltaVMSB    = 0x0;",
                        "reference.topPatchDeltaVLSB    = 0xaaaaaaaa;",
                        "reference.middlePatchDeltaVMSB = 0x0;",
                        "reference.middlePatchDeltaVLSB = 0x55555555;",
                        "reference.bottomPatchDeltaVMSB = 0x0;",
                        "reference.bottomPatchDeltaVLSB = 0xaaaaaaaa;",
                    }));
}

TEST_F(RegisterFileTest, WritesControlPointsWithTwelveDigits) {
    const std::vector<std::string> l = lines();
    EXPECT_EQ(l[28], "reference.controlPointR[0][0]  = 1;");
    EXPECT_EQ(l[28 + 100 + 37], "reference.controlPointGR[3][7]  = 1.10000002384;");
    EXPECT_EQ(l[28 + 100 + 38], "reference.controlPointGR[3][8]  = 1.5;");
    EXPECT_EQ(l[28 + 200], "reference.controlPointGB[0][0]  = 2;");
    EXPECT_EQ(l.back(), "reference.controlPointB[9][9]  = 2.5;");
}

TEST_F(RegisterFileTest, BlockNumberGoesIntoControlPointNamesOnly) {
    const std::vector<std::string> l = lines(".ctrlPoints[2]");
    EXPECT_EQ(l[15], "reference.serial_no            = 0123abcd;");
    EXPECT_EQ(l[28 + 100 + 37], "reference.ctrlPoints[2].controlPointGR[3][7]  = 1.10000002384;");
}

TEST_F(RegisterFileTest, SmallPatchesGiveLargeSteps) {
    useImage(12, 12, "01");
    const std::vector<std::string> l = lines();
    EXPECT_EQ(l[16], "reference.leftPatchDeltaUMSB   = 0x2;");
    EXPECT_EQ(l[17], "reference.leftPatchDeltaULSB   = 0xaaaaaaaa;");
    EXPECT_EQ(l[18], "reference.centerPatchDeltaUMSB = 0x1;");
    EXPECT_EQ(l[19], "reference.centerPatchDeltaULSB = 0x55555555;");
}

TEST_F(RegisterFileTest, LegacyFormWhenOnlyPatchWidthsWereConfigured) {
    parse_config_text("lsc.left_patch_width = 16;", config);
    std::vector<std::string> l = lines();
    EXPECT_EQ(l[4], "reference.leftPatchWidth       = 16;");
    EXPECT_EQ(l[5], "reference.centerPatchWidth     = 32;");
    EXPECT_EQ(l[6], "reference.topPatchHeight       = 12;");
    EXPECT_EQ(l[7], "reference.middlePatchHeight    = 24;");
    EXPECT_EQ(l[8], "reference.light_source         = 0;");
    parse_config_text("lsc.leftPatchFactor = 0.25;", config);
    EXPECT_EQ(lines()[4], "reference.imageWidth           = 64;");
}

TEST_F(RegisterFileTest, FactorsPrintWithSixSignificantDigits) {
    fit.correction.layout.left = 0.2;
    fit.correction.layout.center = 0.5333333333;
    const std::vector<std::string> l = lines();
    EXPECT_EQ(l[6], "reference.leftPatchFactor      = 0.2;");
    EXPECT_EQ(l[7], "reference.centerPatchFactor    = 0.533333;");
}

TEST_F(RegisterFileTest, NegativeLightSourceAndNoAveragesDropTheirLines) {
    parse_config_text("shared.light_source = -1; lsc.wb_avgs_flag = 0;", config);
    const std::vector<std::string> l = lines();
    EXPECT_EQ(l.size(), 4u + 6u + 1u + 12u + 400u);
    EXPECT_EQ(l[10], "reference.serial_no            = 0123abcd;");
}

TEST_F(RegisterFileTest, LevelsFollowTheConfiguredBitDepthAndAreLimited) {
    parse_config_text("shared.bit_res = 8;", config);
    fit.targetLevels[1] = 1.2f;
    fit.targetLevels[0] = -0.5f;
    std::vector<std::string> l = lines();
    EXPECT_EQ(l[11], "reference.GR                   = 255;");
    EXPECT_EQ(l[12], "reference.R                    = 0;");
    EXPECT_EQ(l[13], "reference.B                    = 191;");
    // At 16 bits a gain above 1 stays at full scale instead of wrapping.
    parse_config_text("shared.bit_res = 16;", config);
    EXPECT_EQ(lines()[11], "reference.GR                   = 65535;");
    parse_config_text("shared.bit_res = 0;", config);
    useImage(64, 48, "01", 32);
    EXPECT_EQ(lines()[11], "reference.GR                   = 65535;");
}

TEST_F(RegisterFileTest, NonFiniteValuesAreRefused) {
    fit.targetLevels[2] = std::numeric_limits<float>::quiet_NaN();
    EXPECT_EQ(error(), "Target level of the green/blue channel is not a finite number.");
    fit.targetLevels[2] = 0.5f;
    fit.correction.controlGrids[3][42] = -std::numeric_limits<float>::infinity();
    EXPECT_EQ(error(), "Control point controlPointB[4][2] is not a finite number: -inf");
    fit.correction.controlGrids[3][42] = 1.0f;
    fit.correction.controlGrids[0][0] = std::numeric_limits<float>::quiet_NaN();
    EXPECT_EQ(error(), "Control point controlPointR[0][0] is not a finite number: nan");
}

TEST_F(RegisterFileTest, GeometryWithoutRoomForEveryPatchIsRefused) {
    fit.correction.layout.left = 0.0;
    EXPECT_EQ(error(),
              "Patch geometry of the 64x48 image gives patch sizes 0, 32, 32 x 12, 24, 12; "
              "every patch must be at least 2 pixels wide and high.");
    fit.correction.layout.left = 0.5;
    EXPECT_EQ(error(),
              "Patch geometry of the 64x48 image gives patch sizes 32, 32, 0 x 12, 24, 12; "
              "every patch must be at least 2 pixels wide and high.");
    fit.correction.layout.left = 0.25;
    fit.correction.layout.middle = std::numeric_limits<double>::quiet_NaN();
    EXPECT_EQ(error(),
              "Patch geometry of the 64x48 image gives patch sizes 16, 32, 16 x 12, 0, 36; "
              "every patch must be at least 2 pixels wide and high.");
    fit.correction.layout.middle = 0.5;
    useImage(6, 48, "01"); // 1-pixel outer patches: a step of 8 does not fit 3 bits
    EXPECT_EQ(error(), "Patch geometry of the 6x48 image gives patch sizes 2, 3, 1 x 12, 24, 12; "
                       "every patch must be at least 2 pixels wide and high.");
}

TEST_F(RegisterFileTest, SerialNumberIsQuotedWhenItIsNoPlainToken) {
    useImage(64, 48, "");
    EXPECT_EQ(lines()[15], "reference.serial_no            = \"\";");
    useImage(64, 48, "AB 12;#x");
    EXPECT_EQ(lines()[15], "reference.serial_no            = \"AB 12;#x\";");
    useImage(64, 48, "a\"b");
    EXPECT_EQ(error(), "The module serial number contains a double quote and cannot be written to "
                       "the calibration file.");
}

TEST_F(RegisterFileTest, FuseIdBytesLimitTheSerialNumber) {
    parse_config_text("shared.fuse_id_bytes = 2;", config);
    EXPECT_EQ(lines()[15], "reference.serial_no            = 0123;");
}

TEST_F(RegisterFileTest, EveryVariantReadsBackThroughTheConfigurationReader) {
    const std::vector<std::string> serials = {"0123abcd", "", "with space", "line\nbreak", "x;y#z"};
    for (const std::string& serial : serials) {
        for (const char* settings : {"", "lsc.left_patch_width = 16;",
                                     "shared.light_source = -1; lsc.wb_avgs_flag = 0;"}) {
            config_node_impl fresh("root");
            config_node& cfg = fresh.child("config");
            set_defaults(cfg);
            parse_config_text(settings, cfg);
            useImage(64, 48, serial);
            const std::string written =
                register_file_text(cfg, "reference", ".ctrlPoints[1]", "-c\nx.cfg ", fit, image);
            config_node_impl back("root");
            ASSERT_NO_THROW(parse_config_text(written, back.child("config")))
                << serial << " / " << settings << "\n"
                << written.substr(0, 400);
            const config_node& reference = back.find("config").find("reference");
            EXPECT_EQ(reference.find("serial_no").as_string(),
                      serial.empty() || serial.find_first_of(" \n;#") != std::string::npos
                          ? "\"" + serial + "\""
                          : serial);
            EXPECT_EQ(reference.find_path("ctrlPoints[1].controlPointGR[3][7]").as_float(), 1.1f);
            EXPECT_EQ(back.find_path("config.global.configVersion").as_string(), "0x0100");
        }
    }
}

TEST_F(RegisterFileTest, CommandLineStaysOnTheCommentLine) {
    const std::string written =
        register_file_text(config, "reference", "", "-c x\ny = 1; ", fit, image);
    const std::string expected = "#############################################\n"
                                 "# Command line: vignetteFit -c x y = 1; \n";
    EXPECT_EQ(written.substr(0, expected.size()), expected);
    EXPECT_FALSE(reread(written).find("y").valid());
}

// ---- the file ---------------------------------------------------------------

TEST_F(RegisterFileTest, WritesTheFile) {
    testing_support::TempDir dir;
    const std::string path = dir.file("calibration.cfg");
    write_register_file(path, config, "reference", "", "-c a.cfg -i b.raw ", fit, image);
    EXPECT_EQ(testing_support::readFile(path), text());
}

TEST_F(RegisterFileTest, FailureToCreateTheFileIsReported) {
    testing_support::TempDir dir;
    for (const std::string& path : {dir.file("missing/calibration.cfg"), dir.path()}) {
        try {
            write_register_file(path, config, "reference", "", "", fit, image);
            FAIL() << path;
        } catch (const std::runtime_error& e) {
            EXPECT_STREQ(e.what(), "Unable to open output calibration file, possible invalid "
                                   "output path or output filename specified.");
        }
    }
}

TEST_F(RegisterFileTest, RefusedValuesLeaveAnExistingFileAlone) {
    testing_support::TempDir dir;
    const std::string path = dir.file("calibration.cfg");
    testing_support::writeFile(path, "old contents");
    fit.correction.controlGrids[2][5] = std::numeric_limits<float>::infinity();
    EXPECT_THROW(write_register_file(path, config, "reference", "", "", fit, image),
                 std::runtime_error);
    EXPECT_EQ(testing_support::readFile(path), "old contents");
}

TEST_F(RegisterFileTest, WriteErrorsAreReported) {
    if (!testing_support::fileExists("/dev/full"))
        GTEST_SKIP() << "no /dev/full";
    EXPECT_THROW(write_register_file("/dev/full", config, "reference", "", "", fit, image),
                 std::runtime_error);
}

} // namespace
} // namespace config
