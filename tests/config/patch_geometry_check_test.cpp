#include <stdexcept>
#include <string>

#include <boost/lexical_cast/bad_lexical_cast.hpp>
#include <gtest/gtest.h>

#include "config/config_file.h"
#include "config/parameter_table.h"
#include "config/patch_geometry_check.h"

namespace config {

using img::BayerImage;
using img::imageCreate;
using img::kBufferRawCfa;
using img::kCfaRggb;
using img::kDataNone;
using img::kPixelRaw;

using lsc::ShadingCorrection;
namespace {

class PatchGeometryCheckTest : public ::testing::Test {
protected:
    PatchGeometryCheckTest() {
        set_defaults(config);
        useImage(640, 480);
    }

    void useImage(std::int32_t width, std::int32_t height) {
        int result = 0;
        image.reset(imageCreate(width, height, 10, 1, 1, 0, kCfaRggb, kPixelRaw, kBufferRawCfa,
                                kDataNone, &result));
    }

    // Applies configuration and calibration-data settings, then checks.
    std::string check(const std::string& configuration, const std::string& calibration) {
        parse_config_text(configuration, config);
        parse_config_text(calibration, data);
        try {
            stored = readConfigParam(root, data, image, fitted);
        } catch (const std::exception& e) {
            return e.what();
        }
        return "(accepted)";
    }

    config_node_impl root{"root"};
    config_node& config = root.child("config");
    config_node_impl calibrationRoot{"calibration"};
    config_node& data = calibrationRoot.child("module").child("lsc");
    BayerImage image;
    ShadingCorrection fitted; // what the run had before reading the data
    StoredCalibration stored;
};

const char kLegacyData[] = "leftPatchWidth = 160; centerPatchWidth = 320;"
                           "topPatchHeight = 120; middlePatchHeight = 240;";
const char kFactorData[] = "leftPatchFactor = 0.25; centerPatchFactor = 0.5; topPatchFactor = 0.2;"
                           "middlePatchFactor = 0.6; imageWidth = 640; imageHeight = 480;";

TEST_F(PatchGeometryCheckTest, NeedsTheInputImage) {
    image.reset();
    EXPECT_EQ(check("", kLegacyData), "Input image not set before call to readConfigParam");
}

TEST_F(PatchGeometryCheckTest, DataWithoutGeometryLeavesTheFactors) {
    fitted.layout.left = 0.125;
    EXPECT_EQ(check("", ""), "(accepted)");
    EXPECT_EQ(stored.correction.layout.left, 0.125);
}

// ---- legacy data --------------------------------------------------------------

TEST_F(PatchGeometryCheckTest, LegacyDataNeedsAllFourSizes) {
    EXPECT_EQ(check("", "leftPatchWidth = 16; centerPatchWidth = 32;"),
              "Missing some patch size information from calibration file.");
}

TEST_F(PatchGeometryCheckTest, LegacyDataBecomesFractionsOfTheImage) {
    useImage(64, 48);
    EXPECT_EQ(check("", "leftPatchWidth = 16; centerPatchWidth = 32;"
                        "topPatchHeight = 12; middlePatchHeight = 7;"),
              "(accepted)");
    EXPECT_EQ(stored.correction.layout.left, 0.25);
    EXPECT_EQ(stored.correction.layout.center, 0.5);
    EXPECT_EQ(stored.correction.layout.top, 0.25);
    EXPECT_EQ(stored.correction.layout.middle, static_cast<double>(7.0f / 48.0f));
}

TEST_F(PatchGeometryCheckTest, LegacyDataAgainstFactorConfigurationIsRefused) {
    EXPECT_EQ(check("lsc.leftPatchFactor = 0.25;", kLegacyData),
              "Unsupported use of configuration file without legacy patch boundaries and "
              "calibration data with legacy patch boundaries.");
}

TEST_F(PatchGeometryCheckTest, LegacyDataIsComparedWithLegacyConfiguration) {
    const std::string sizes = "lsc.left_patch_width = 160; lsc.center_patch_width = 320;"
                              "lsc.top_patch_height = 120; lsc.middle_patch_height = 240;";
    EXPECT_EQ(check(sizes, kLegacyData), "(accepted)");
    EXPECT_EQ(check("lsc.left_patch_width = 161;", kLegacyData),
              "leftPatchWidth from input data does not match lsc.leftPatchWidth in configuration "
              "file.");
    EXPECT_EQ(check(sizes + "lsc.center_patch_width = 1;", kLegacyData),
              "centerPatchWidth from input data does not match lsc.centerPatchWidth in "
              "configuration file.");
    EXPECT_EQ(check(sizes + "lsc.top_patch_height = 1;", kLegacyData),
              "topPatchHeight from input data does not match lsc.topPatchHeight in configuration "
              "file.");
    EXPECT_EQ(check(sizes + "lsc.middle_patch_height = 1;", kLegacyData),
              "middlePatchHeight from input data does not match lsc.middlePatchHeight in "
              "configuration file.");
}

// ---- factor data --------------------------------------------------------------

TEST_F(PatchGeometryCheckTest, FactorDataNeedsFactorsAndSensorSize) {
    EXPECT_EQ(check("", "leftPatchFactor = 0.25; centerPatchFactor = 0.5; topPatchFactor = 0.2;"
                        "middlePatchFactor = 0.6; imageWidth = 640;"),
              "Missing some patch size information from calibration file.");
}

TEST_F(PatchGeometryCheckTest, SensorSizeAloneMakesFactorData) {
    EXPECT_EQ(check("", "imageHeight = 480;"),
              "Missing some patch size information from calibration file.");
}

TEST_F(PatchGeometryCheckTest, FactorDataWithoutFactorConfigurationIsAccepted) {
    EXPECT_EQ(check("", kFactorData), "(accepted)");
    EXPECT_EQ(stored.correction.layout.top, static_cast<double>(0.2f));
    EXPECT_EQ(stored.correction.layout.middle, static_cast<double>(0.6f));
}

TEST_F(PatchGeometryCheckTest, SensorSizeMustMatchTheImage) {
    useImage(640, 482);
    parse_config_text(kFactorData, data);
    try {
        stored = readConfigParam(root, data, image, fitted);
        FAIL();
    } catch (const std::range_error& e) {
        EXPECT_STREQ(e.what(), "Input image dimensions (640x482) do not match expected dimensions "
                               "for sensor (640x480).");
    }
}

TEST_F(PatchGeometryCheckTest, FactorDataAgainstLegacyConfigurationIsRefused) {
    EXPECT_EQ(check("lsc.left_patch_width = 160;", kFactorData),
              "Unsupported use of configuration file with legacy patch boundaries and calibration "
              "data without legacy patch boundaries.");
}

TEST_F(PatchGeometryCheckTest, FactorsAreComparedAsExactSingleValues) {
    const std::string factors = "lsc.leftPatchFactor = 0.25; lsc.centerPatchFactor = 0.5;"
                                "lsc.topPatchFactor = 0.2; lsc.middlePatchFactor = 0.6;"
                                "lsc.imageWidth = 640; lsc.imageHeight = 480;";
    EXPECT_EQ(check(factors, kFactorData), "(accepted)");
    EXPECT_EQ(check(factors, "leftPatchFactor = 0.2500001;"),
              "leftPatchFactor from input data does not match lsc.leftPatchFactor in configuration "
              "file.");
    EXPECT_EQ(check(factors, "leftPatchFactor = 0.25; centerPatchFactor = 0.4;"),
              "centerPatchFactor from input data does not match lsc.centerPatchFactor in "
              "configuration file.");
    EXPECT_EQ(check(factors, "centerPatchFactor = 0.5; topPatchFactor = 0.3;"),
              "topPatchFactor from input data does not match lsc.topPatchFactor in configuration "
              "file.");
    EXPECT_EQ(check(factors, "topPatchFactor = 0.2; middlePatchFactor = 0.3;"),
              "middlePatchFactor from input data does not match lsc.middlePatchFactor in "
              "configuration file.");
    EXPECT_EQ(check(factors + "lsc.imageWidth = 641;", "middlePatchFactor = 0.6;"),
              "imageWidth from input data does not match lsc.imageWidth in configuration file.");
    EXPECT_EQ(check("lsc.imageWidth = 640; lsc.imageHeight = 481;", ""),
              "imageHeight from input data does not match lsc.imageHeight in configuration file.");
}

// ---- control points and white balance -----------------------------------------

TEST_F(PatchGeometryCheckTest, ControlPointsAndLevelsAreLoaded) {
    std::string points;
    for (const char* name : {"controlPointR", "controlPointGR", "controlPointGB", "controlPointB"})
        for (int i = 0; i < 10; ++i)
            points += std::string(name) + "[" + std::to_string(i) +
                      "] = {1, 2, 3, 4, 5, 6, 7, 8, 9, " + std::to_string(i) + ".5};\n";
    EXPECT_EQ(check("", points + "R = 512; GR = 1023; GB = 1000; B = 700;"), "(accepted)");
    EXPECT_EQ(stored.correction.controlGrids[0][0], 1.0f);
    EXPECT_EQ(stored.correction.controlGrids[3][99], 9.5f);
    EXPECT_EQ(stored.correction.controlGrids[2][39], 3.5f);
    EXPECT_EQ(stored.whiteBalance[0], 512.0f);
    EXPECT_EQ(stored.whiteBalance[1], 1023.0f);
    EXPECT_EQ(stored.whiteBalance[2], 1000.0f);
    EXPECT_EQ(stored.whiteBalance[3], 700.0f);
}

TEST_F(PatchGeometryCheckTest, DataWithoutControlPointsLeavesThem) {
    fitted.controlGrids[1][5] = 4.0f;
    EXPECT_EQ(check("", "GR = 7;"), "(accepted)");
    EXPECT_EQ(stored.correction.controlGrids[1][5], 4.0f);
    EXPECT_EQ(stored.whiteBalance[2], 0.0f);
}

TEST_F(PatchGeometryCheckTest, ControlPointThatIsNoNumberGivesTheConversionError) {
    parse_config_text("controlPointR[0][0] = x;", data);
    EXPECT_THROW((void)readConfigParam(root, data, image, fitted), boost::bad_lexical_cast);
}

} // namespace
} // namespace config
