// The calibration proper, run as a station runs it: samples, fit, register
// file, correction, white balance, colour error and the flattened images.

#include <cmath>
#include <regex>

#include "tests/e2e/e2e_fixture.h"

namespace e2e {
namespace {

using Calibration = ToolRun;

CaptureInfo withSerial(const std::string& serial) {
    CaptureInfo capture;
    capture.serialNumber = serial;
    return capture;
}

// The register file's lines that do not hold fitted numbers, for a 640 x 480
// capture with the default factors.
std::vector<std::string> registerHeader(const std::string& arguments, const std::string& serial) {
    return {
        "#############################################",
        "# Command line: vignetteFit " + arguments,
        "global.configType            = 1;",
        "global.configVersion         = 0x0100;",
        "reference.imageWidth           = 640;",
        "reference.imageHeight          = 480;",
        "reference.leftPatchFactor      = 0.25;",
        "reference.centerPatchFactor    = 0.5;",
        "reference.topPatchFactor       = 0.25;",
        "reference.middlePatchFactor    = 0.5;",
        "reference.light_source         = 0;",
        "reference.GR                   = 811;",
        "reference.R                    = 446;",
        "reference.B                    = 528;",
        "reference.GB                   = 811;",
        "reference.serial_no            = " + serial + ";",
        "reference.leftPatchDeltaUMSB   = 0x0;",
        "reference.leftPatchDeltaULSB   = 0xccccccc;",
        "reference.centerPatchDeltaUMSB = 0x0;",
        "reference.centerPatchDeltaULSB = 0x6666666;",
        "reference.rightPatchDeltaUMSB  = 0x0;",
        "reference.rightPatchDeltaULSB  = 0xccccccc;",
        "reference.topPatchDeltaVMSB    = 0x0;",
        "reference.topPatchDeltaVLSB    = 0x11111111;",
        "reference.middlePatchDeltaVMSB = 0x0;",
        "reference.middlePatchDeltaVLSB = 0x8888888;",
        "reference.bottomPatchDeltaVMSB = 0x0;",
        "reference.bottomPatchDeltaVLSB = 0x11111111;",
    };
}

TEST_F(Calibration, RunPrintsTheFitAndEvaluationLinesInOrder) {
    prepare();
    const auto result = calibrate();
    ASSERT_EQ(result.status, 0) << result.out;
    const auto text = lines(result.out);
    const std::vector<std::string> expected = {
        "Image pixels within specified parameters.",
        "Create samples from image.",
        "Number of sample points = 724",
        "Computing lens shading surface.",
        "Target value[red]:0.44",
        "Target value[green/red]:0.79",
        "Target value[green/blue]:0.79",
        "Target value[blue]:0.52",
        "Fitting surface : red",
        "Fitting surface : green/red",
        "Fitting surface : green/blue",
        "Fitting surface : blue",
    };
    const auto start = std::find(text.begin() + 9, text.end(), expected[0]);
    ASSERT_NE(start, text.end());
    for (std::size_t i = 0; i < expected.size(); ++i)
        EXPECT_EQ(start[static_cast<long>(i)], expected[i]);
    const auto rest =
        std::vector<std::string>(start + static_cast<long>(expected.size()), text.end());
    ASSERT_EQ(rest.size(), 11u) << result.out;
    EXPECT_TRUE(std::regex_match(rest[0], std::regex("Measured R/G: 0\\.5[0-9]{5}")));
    EXPECT_TRUE(std::regex_match(rest[1], std::regex("Measured B/G: 0\\.6[0-9]{5}")));
    EXPECT_EQ(rest[2], "Generating configuration file.");
    EXPECT_EQ(rest[3], "Start correcting lens shading.");
    EXPECT_EQ(rest[4], "Performing white balancing.");
    EXPECT_TRUE(
        std::regex_match(rest[5], std::regex("Flattened image measured R/G: 1\\.00[0-9]{4}")))
        << rest[5];
    EXPECT_TRUE(
        std::regex_match(rest[6], std::regex("Flattened image measured B/G: 0\\.99[0-9]{4}")))
        << rest[6];
    EXPECT_EQ(rest[7], "Calculating deltaAB.");
    EXPECT_EQ(rest[8], "Delta ab blocks: 20 x 15");
    EXPECT_TRUE(std::regex_match(rest[9], std::regex("Maximum delta ab: 0\\.[0-9]{6}"))) << rest[9];
    EXPECT_EQ(rest[10], "Completed.");
}

TEST_F(Calibration, RegisterFileHoldsGeometryLevelsSerialAndFourGrids) {
    prepare("", smallShape(), withSerial("00112233445566778899aabbccddeeff"));
    const auto result = calibrate();
    ASSERT_EQ(result.status, 0) << result.out;
    const auto text = lines(read("cal.txt"));
    const auto header = registerHeader("--config lsc.cfg --input flat.kqraw --calibrate cal.txt ",
                                       "00112233445566778899aabbccddeeff");
    ASSERT_EQ(text.size(), header.size() + 400);
    for (std::size_t i = 0; i < header.size(); ++i)
        EXPECT_EQ(text[i], header[i]) << "line " << i;
    const std::regex point("reference\\.controlPoint(R|GR|GB|B)\\[([0-9])\\]\\[([0-9])\\]  = "
                           "(-?[0-9]+(\\.[0-9]+)?(e-?[0-9]+)?);");
    const char* channels[] = {"R", "GR", "GB", "B"};
    for (int n = 0; n < 400; ++n) {
        std::smatch match;
        const std::string& line = text[header.size() + static_cast<std::size_t>(n)];
        ASSERT_TRUE(std::regex_match(line, match, point)) << line;
        EXPECT_EQ(match[1], channels[n / 100]);
        EXPECT_EQ(match[2], std::to_string(n % 100 / 10));
        EXPECT_EQ(match[3], std::to_string(n % 10));
        // Gains of a flat field with corners at half the centre: about 1 to 3.
        const double value = std::stod(match[4]);
        EXPECT_GT(value, 0.8);
        EXPECT_LT(value, 3.5);
    }
}

TEST_F(Calibration, RegisterFileReadsBackAsConfiguration) {
    for (const std::string& serial : {std::string(), std::string("0a1b")}) {
        prepare("", smallShape(), withSerial(serial));
        ASSERT_EQ(calibrate().status, 0);
        // Used as a configuration file, it must parse and validate.
        const auto again = run({"-c", "cal.txt", "-i", "flat.kqraw", "-l", "cal2.txt"});
        EXPECT_EQ(again.status, 0) << again.out;
    }
    // Without a serial number the line still reads back: an empty quoted text.
    EXPECT_TRUE(hasLine(read("cal2.txt"), "reference.serial_no            = 0a1b;"));
    prepare();
    calibrate();
    EXPECT_TRUE(hasLine(read("cal.txt"), "reference.serial_no            = \"\";"));
}

TEST_F(Calibration, RegisterFileFormsFollowTheConfiguration) {
    prepare("lsc.left_patch_width = 160; lsc.center_patch_width = 320; lsc.top_patch_height = 120; "
            "lsc.middle_patch_height = 240; shared.light_source = -1; lsc.wb_avgs_flag = 0; "
            "shared.block_name = module_a; shared.block_num_flag = 1; shared.block_num = 2;");
    ASSERT_EQ(calibrate().status, 0);
    const std::string file = read("cal.txt");
    for (const char* line :
         {"module_a.leftPatchWidth       = 160;", "module_a.centerPatchWidth     = 320;",
          "module_a.topPatchHeight       = 120;", "module_a.middlePatchHeight    = 240;",
          "module_a.leftPatchDeltaULSB   = 0xccccccc;"})
        EXPECT_TRUE(hasLine(file, line)) << line;
    EXPECT_EQ(file.find("light_source"), std::string::npos);
    EXPECT_EQ(file.find("module_a.GR "), std::string::npos);
    EXPECT_EQ(file.find("imageWidth"), std::string::npos);
    EXPECT_NE(file.find("\nmodule_a.ctrlPoints[2].controlPointGR[3][7]  = "), std::string::npos);
}

TEST_F(Calibration, UnwritableRegisterFileIsReported) {
    prepare();
    const auto result = run({"-c", "lsc.cfg", "-i", "flat.kqraw", "-l", "no-dir/cal.txt"});
    EXPECT_EQ(result.status, 1);
    EXPECT_TRUE(hasLine(result.out, "ERROR: Unable to open output calibration file, possible "
                                    "invalid output path or output filename specified."))
        << result.out;
}

TEST_F(Calibration, XTestForcesTheXSurfaceAndSkipsTheColourError) {
    prepare();
    const auto result = calibrate({"-x"});
    ASSERT_EQ(result.status, 0) << result.out;
    EXPECT_TRUE(hasLine(result.out, "X test mode specified."));
    EXPECT_TRUE(hasLine(result.out,
                        "Forcing lens shading surface to produce an X shaped color distortion."));
    EXPECT_FALSE(hasLine(result.out, "Calculating deltaAB."));
    const std::string file = read("cal.txt");
    EXPECT_TRUE(hasLine(file, "reference.controlPointR[0][1]  = 1.32275390625;")) << file;
    EXPECT_TRUE(hasLine(file, "reference.controlPointGR[0][1]  = -0.32275390625;"));
}

TEST_F(Calibration, ColourErrorIsSkippedOnRequest) {
    const std::vector<std::string> files = {"--kq", "-d", "delta.csv", "-t", "stats.csv"};
    for (const auto& setup :
         {std::pair<std::string, std::string>{"lsc.avg_luma = 1;", ""}, {"", "--nodelta"}}) {
        prepare(setup.first);
        auto args = files;
        if (!setup.second.empty())
            args.push_back(setup.second);
        const auto result = calibrate(args);
        ASSERT_EQ(result.status, 0) << result.out;
        EXPECT_FALSE(hasLine(result.out, "Calculating deltaAB."));
        EXPECT_FALSE(exists("delta.csv"));
        EXPECT_FALSE(exists("stats.csv"));
    }
}

TEST_F(Calibration, ColourErrorFilesAndThreshold) {
    prepare("apply_lsc.delta_ab_blocks = {4, 3};");
    auto result = calibrate({"--kq", "-d", "delta.csv", "-t", "stats.csv"});
    ASSERT_EQ(result.status, 0) << result.out;
    EXPECT_TRUE(hasLine(result.out, "Delta ab blocks: 4 x 3"));
    EXPECT_TRUE(hasLine(result.out, "Writing delta ab data."));
    const std::string delta = read("delta.csv");
    EXPECT_TRUE(std::regex_match(delta, std::regex("(([0-9]+\\.[0-9]{5},){4}\n){3}\n"))) << delta;
    const std::string stats = read("stats.csv");
    EXPECT_TRUE(std::regex_match(stats, std::regex("[0-9.e-]+, [0-9.e-]+, [0-9.e-]+\n"))) << stats;

    // The largest block delta is also the second statistic and the printed maximum.
    std::smatch match;
    ASSERT_TRUE(std::regex_search(result.out, match, std::regex("Maximum delta ab: ([0-9.]+)")));
    const double printed = std::stod(match[1]);
    const double inStats = std::stod(stats.substr(stats.find(", ") + 2));
    EXPECT_NEAR(printed, inStats, 1e-5);

    // A tight threshold fails the run after both files were written.
    write("lsc.cfg", "apply_lsc.delta_ab_blocks = {4, 3}; apply_lsc.max_delta_ab = 0.001;");
    std::remove(path("delta.csv").c_str());
    result = calibrate({"--kq", "-d", "delta.csv", "-t", "stats.csv"});
    EXPECT_EQ(result.status, 1);
    EXPECT_NE(result.out.find("ERROR: Maximum delta ab is greater than threshold of 0.001\nSome "
                              "possible causes include light is not on, light in bad position, "
                              "missing diffuser, poor quality flat field input image, damaged "
                              "sensor, or invalid configuration for the sensor being used.\n"),
              std::string::npos)
        << result.out;
    EXPECT_TRUE(exists("delta.csv"));
    EXPECT_TRUE(exists("stats.csv"));
    EXPECT_TRUE(exists("cal.txt"));
}

TEST_F(Calibration, UnwritableColourErrorFilesAreReported) {
    prepare();
    auto result = calibrate({"--kq", "-d", "no-dir/delta.csv"});
    EXPECT_EQ(result.status, 1);
    EXPECT_TRUE(hasLine(result.out, "ERROR: Cannot open file : no-dir/delta.csv")) << result.out;
    result = calibrate({"--kq", "-t", "no-dir/stats.csv"});
    EXPECT_EQ(result.status, 1);
    EXPECT_TRUE(hasLine(result.out, "ERROR: Cannot open file : no-dir/stats.csv")) << result.out;
}

TEST_F(Calibration, TooFewBlocksPixelsAreRefusedNotDividedByZero) {
    prepare("apply_lsc.delta_ab_blocks = {100, 100};");
    const auto result = calibrate();
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(lines(result.out).back().rfind("ERROR: ", 0), 0u) << result.out;
}

TEST_F(Calibration, SampleFileRoundTripGivesTheSameRegisterFile) {
    prepare();
    ASSERT_EQ(calibrate({"--kq", "-o", "samples.txt"}).status, 0);
    const std::string fromImage = read("cal.txt");
    const auto samples = lines(read("samples.txt"));
    ASSERT_GT(samples.size(), 100u);
    // Full-resolution units: the 640 x 480 capture, four channels.
    EXPECT_EQ(samples[1], "640,480,4");

    const auto result =
        run({"--kq", "-c", "lsc.cfg", "-i", "flat.kqraw", "-s", "samples.txt", "-l", "cal2.txt"});
    ASSERT_EQ(result.status, 0) << result.out;
    EXPECT_TRUE(hasLine(result.out, "Loading sample points from file."));
    EXPECT_FALSE(hasLine(result.out, "Create samples from image."));
    // Same geometry, levels and serial; control points agree to the rounding
    // of the stored sample values.
    const auto a = lines(fromImage), b = lines(read("cal2.txt"));
    ASSERT_EQ(a.size(), b.size());
    for (std::size_t i = 2; i < 28; ++i)
        EXPECT_EQ(a[i], b[i]);
    for (std::size_t i = 28; i < a.size(); ++i) {
        const double x = std::stod(a[i].substr(a[i].find("= ") + 2));
        const double y = std::stod(b[i].substr(b[i].find("= ") + 2));
        EXPECT_NEAR(x, y, 0.01) << a[i] << " vs " << b[i];
    }
}

TEST_F(Calibration, SampleFileErrorsAreReported) {
    prepare();
    struct Case {
        std::string text;
        std::string error;
    };
    const Case cases[] = {
        {"1,2,3\n",
         "ERROR: Expecting four maximum channel values separated by commas at the beginning of "
         "the sample file."},
        {"1,2,3,4\n640\n",
         "ERROR: Expecting a width, height and channel count separated by commas on the second "
         "line of the sample file."},
        {"1,2,3,4\n600,480,4\n",
         "ERROR: Width and height in sample file does not match input image dimensions."},
        {"1,2,3,4\n640,480,4\n4,8,1.0,2.0,x,4.0\n", "ERROR: Invalid format in sample file."},
        {"1,2,3,4\n640,480,4\n4,8,1.0,nan,3.0,4.0\n", "ERROR: Invalid format in sample file."},
    };
    for (const Case& c : cases) {
        write("samples.txt", c.text);
        const auto result = run(
            {"--kq", "-c", "lsc.cfg", "-i", "flat.kqraw", "-s", "samples.txt", "-l", "cal.txt"});
        EXPECT_EQ(result.status, 1) << c.text;
        EXPECT_EQ(lines(result.out).back(), c.error) << result.out;
    }
    const auto result =
        run({"--kq", "-c", "lsc.cfg", "-i", "flat.kqraw", "-s", "missing.txt", "-l", "cal.txt"});
    EXPECT_EQ(lines(result.out).back(), "ERROR: Cannot open input sample file: missing.txt");
    const auto out = calibrate({"--kq", "-o", "no-dir/samples.txt"});
    EXPECT_EQ(lines(out.out).back(), "ERROR: Cannot open sample output file: no-dir/samples.txt");
}

TEST_F(Calibration, FlattenedImagesKeepTheInputFormat) {
    prepare();
    auto result = calibrate({"-f", "flat-out.kqraw", "-j", "flat.jpg"});
    ASSERT_EQ(result.status, 0) << result.out;
    EXPECT_TRUE(hasLine(result.out, "Writing flattened image."));
    EXPECT_TRUE(hasLine(result.out, "Writing flattened jpeg image."));
    EXPECT_EQ(read("flat-out.kqraw").substr(0, 16), "KQRAWFILE_111107");
    EXPECT_EQ(read("flat.jpg").substr(0, 2), "\xFF\xD8");

    // A fixed-header input is flattened into a fixed-header file.
    write("fixed.kqraw", testing_support::fixedHeaderFileBytes(field_));
    result = run({"-c", "lsc.cfg", "-i", "fixed.kqraw", "-l", "cal.txt", "-f", "fixed-out.kqraw"});
    ASSERT_EQ(result.status, 0) << result.out;
    const std::string fixed = read("fixed-out.kqraw");
    // 640 x 480 prepared at a quarter (160 x 120), evaluated every 4th block: 40 x 30.
    EXPECT_EQ(fixed.size(), 298672u + 2u * 40u * 30u);
}

TEST_F(Calibration, BmpAloneIsWritten) {
    prepare();
    const auto result = calibrate({"-m", "flat.bmp"});
    ASSERT_EQ(result.status, 0) << result.out;
    EXPECT_TRUE(hasLine(result.out, "Writing flattened bmp image."));
    const std::string bmp = read("flat.bmp");
    EXPECT_EQ(bmp.substr(0, 2), "BM");
    EXPECT_EQ(bmp.size(), 54u + 40u * 30u * 3u);
}

} // namespace
} // namespace e2e
