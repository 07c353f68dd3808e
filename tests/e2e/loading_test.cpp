// Loading the flat field: raw containers, headerless raw files with their
// details file, the converted input images and the identity test.

#include "tests/e2e/e2e_fixture.h"

namespace e2e {
namespace {

// The process exit status keeps the low 8 bits of the program's code.
constexpr int exitStatusOf(int code) {
    return code & 0xFF;
}

class Loading : public ToolRun {
protected:
    // Writes "flat.raw" and its details file "details.txt".
    void prepareHeaderless(const std::string& details, const FlatFieldShape& shape = smallShape()) {
        prepare("", shape);
        write("flat.raw", testing_support::headerlessFileBytes(field_));
        write("details.txt", details);
    }
    ToolResult calibrateHeaderless(const std::vector<std::string>& extra = {}) const {
        std::vector<std::string> args = {"-c", "lsc.cfg",     "-i", "flat.raw",
                                         "-r", "details.txt", "-l", "cal.txt"};
        args.insert(args.end(), extra.begin(), extra.end());
        return run(args);
    }
    static std::string details(const std::string& extra = "") {
        return "image.width = 640\nimage.height = 480\n" + extra;
    }
};

TEST_F(Loading, UnreadableContainerIsReported) {
    prepare();
    write("flat.kqraw", "not a raw file at all");
    const auto result = calibrate();
    EXPECT_EQ(result.status, 1);
    EXPECT_TRUE(hasLine(result.out, "ERROR: Cannot read kqraw image.")) << result.out;
}

TEST_F(Loading, ExposureAndGainsComeFromTheCaptureBlock) {
    CaptureInfo capture;
    capture.exposureTime = 12.5f;
    capture.gains[0] = 1.25f;
    capture.gains[1] = 1.0f;
    capture.gains[2] = 1.0f;
    capture.gains[3] = 2.0f;
    prepare("", smallShape(), capture);
    const auto result = calibrate();
    EXPECT_TRUE(hasLine(result.out, "Exposure time = 12.5")) << result.out;
    EXPECT_TRUE(hasLine(result.out, "Sensor gain = { 1.25, 1, 1, 2 }")) << result.out;
}

TEST_F(Loading, RunPrintsEveryStageLineInOrder) {
    prepare();
    const auto result = calibrate();
    ASSERT_EQ(result.status, 0) << result.out;
    const std::vector<std::string> expected = {
        "lsc version 3.8.1",
        "Input file: flat.kqraw",
        "Exposure time = 33",
        "Sensor gain = { 1, 1, 1, 1 }",
        "Preprocessed image data:",
        "Minimum pixel value = 208",
        "Maximum pixel value = 818",
        "Average pixel value = 514.85",
        "Image pixels within specified parameters.",
        "Image pixels within specified parameters.",
    };
    const auto text = lines(result.out);
    ASSERT_GE(text.size(), expected.size());
    for (std::size_t i = 0; i < expected.size(); ++i)
        EXPECT_EQ(text[i], expected[i]) << "line " << i;
    EXPECT_EQ(text.back(), "Completed.");
}

TEST_F(Loading, DebugRunTimesEveryStageOnce) {
    prepare();
    const auto result = calibrate({"--kq", "--debug", "-u", "in.jpg", "-w", "in.bmp"});
    ASSERT_EQ(result.status, 0) << result.out;
    const std::vector<std::string> labels = {
        "Reading configuration: ",   "Processes configuration: ",
        "Image load time: ",         "JPEG image save time: ",
        "BMP image save time: ",     "Image inspection time: ",
        "Bayer deinterweave time: ", "Median filter and down sampling time: ",
        "Bayer interweave time: ",   "Image checking time: "};
    std::vector<std::string> seen;
    for (const std::string& line : lines(result.out))
        if (line.size() > 4 && line.compare(line.size() - 4, 4, " sec") == 0)
            seen.push_back(line.substr(0, line.find(": ") + 2));
    ASSERT_GE(seen.size(), labels.size());
    EXPECT_EQ(std::vector<std::string>(seen.begin(), seen.begin() + labels.size()), labels);
    EXPECT_TRUE(hasLine(result.out, "Input image data:"));
    EXPECT_TRUE(hasLine(result.out, "Saving raw input file in jpeg format."));
    EXPECT_TRUE(hasLine(result.out, "Saving raw input file in bmp format."));
    EXPECT_EQ(read("in.bmp").substr(0, 2), "BM");
    EXPECT_EQ(read("in.jpg").substr(0, 2), "\xFF\xD8");
}

TEST_F(Loading, BitDepthDifferentFromTheConfigurationIsWarned) {
    prepare("shared.bit_res = 12; proc.max_pixel_val = 4095; proc.peak_pixel_min = 2000;");
    const auto result = calibrate();
    EXPECT_TRUE(hasLine(result.out, "WARNING - Bit depth of input image (10) is different than bit "
                                    "depth specified by shared.bit_res (12)."))
        << result.out;
}

TEST_F(Loading, PixelsOutsideTheWindowEndTheRun) {
    prepare("proc.min_pixel_val = 300;");
    auto result = calibrate();
    EXPECT_EQ(result.status, 1);
    EXPECT_NE(result.out.find("ERROR: Image pixels are not within specified parameters of 300 to "
                              "1014.\nSome possible causes include light is not on, light in bad "
                              "position, missing diffuser, poor quality flat field input image, "
                              "damaged sensor, or invalid configuration for the sensor being "
                              "used.\nOut of range value: ("),
              std::string::npos)
        << result.out;

    write("lsc.cfg", "proc.peak_pixel_min = 900;");
    result = calibrate();
    EXPECT_EQ(result.status, 1);
    EXPECT_NE(result.out.find("Image pixels within specified parameters.\nERROR: Peak image pixel "
                              "value below specified required minimum peak value of 900.\n"),
              std::string::npos)
        << result.out;
    EXPECT_NE(result.out.find("Peak image pixel value: 818.\n"), std::string::npos);
}

TEST_F(Loading, IdentityTestPassesForAContainerAndAHeaderlessInput) {
    const std::string config = "proc.median_filter_flag = 0; shared.proc_sampling_factor = 1;";
    prepare(config);
    auto result = calibrate({"--kq", "--debug", "-p", "pre.kqraw"});
    EXPECT_TRUE(hasLine(result.out, "Preprocessed image file: pre.kqraw")) << result.out;
    EXPECT_TRUE(hasLine(result.out, "Performing identity test.")) << result.out;
    EXPECT_FALSE(
        hasLine(result.out, "WARNING - Not all output image pixels match input image pixels."));

    prepareHeaderless(details("image.bit_res = 10\n"));
    write("lsc.cfg", config);
    result = calibrateHeaderless({"--kq", "--debug", "-p", "pre.kqraw"});
    EXPECT_TRUE(hasLine(result.out, "Performing identity test.")) << result.out;
    EXPECT_FALSE(
        hasLine(result.out, "WARNING - Not all output image pixels match input image pixels."));
    EXPECT_EQ(result.status, 0);
}

TEST_F(Loading, IdentityTestOnlyWithoutFilterAndReduction) {
    prepare();
    const auto result = calibrate({"--kq", "--debug", "-p", "pre.kqraw"});
    EXPECT_TRUE(exists("pre.kqraw"));
    EXPECT_FALSE(hasLine(result.out, "Performing identity test."));
}

TEST_F(Loading, HeaderlessRawReadsAndTranslates) {
    prepareHeaderless(details("[image]\nbit_res = 10 ; depth\nexp_time = 20 # ms\n"));
    const auto result = calibrateHeaderless({"-z", "translated.kqraw"});
    ASSERT_EQ(result.status, 0) << result.out;
    EXPECT_TRUE(hasLine(result.out, "Exposure time = 20"));
    EXPECT_TRUE(hasLine(result.out, "Average pixel value = 514.85"));
    // The translated container holds the same image and capture data.
    const auto fromTranslation = run({"-c", "lsc.cfg", "-i", "translated.kqraw", "-l", "cal.txt"});
    auto expected = result.out;
    expected.replace(expected.find("flat.raw"), 8, "translated.kqraw");
    EXPECT_EQ(fromTranslation.out, expected);
}

TEST_F(Loading, HeaderlessErrorsCarryTheirCodesAndHints) {
    struct Case {
        std::string details;
        int code;
        std::string out; // the error lines
    };
    const Case cases[] = {
        {details("image.serial_no = abc\n"), 263,
         "ERROR(263): Serial number must be an even number of characters: abc\nLikely incorrect "
         "serial number entered in headerless raw details file.\n"},
        {details("image.serial_no = " + std::string(34, 'a') + "\n"), 262,
         "ERROR(262): Serial number cannot be more than 32 characters long: " +
             std::string(34, 'a') +
             "\nLikely incorrect serial number entered in headerless raw details file.\n"},
        {details("image.serial_no = " + std::string(33, 'a') + "\n"), 263,
         "ERROR(263): Serial number must be an even number of characters: " + std::string(33, 'a') +
             "\nLikely incorrect serial number entered in headerless raw details file.\n"},
        {details("image.serial_no = 0g\n"), 263,
         "ERROR(263): Serial number must consist of hexadecimal digits only: 0g\nLikely "
         "incorrect serial number entered in headerless raw details file.\n"},
        {details("image.bayer_order = rggb\n"), 1,
         "ERROR: Invalid image.bayer_order value 'rggb' in headerless raw details file.\n"},
        {"image.height = 480\n", 1, "ERROR: Missing image.width in headerless raw details file.\n"},
        {"image.width = -640\nimage.height = 480\n", 1,
         "ERROR: Invalid image.width value -640 in headerless raw details file (must be 1 to "
         "65535).\n"},
        {details("image.bit_res = 0\n"), 1,
         "ERROR: Invalid image.bit_res value 0 in headerless raw details file (must be 1 to "
         "16).\n"},
        {"image.width = 640\nimage.height = 479\n", 202,
         "ERROR(202): Invalid headerless raw file configuration.\nThe number of pixels in the "
         "headerless raw file did not match the image size specified in the headerless raw "
         "configuration file.\n"},
        {"image.width = 640\nimage.height = 481\n", 202,
         "ERROR(202): Unable to read raw scan line.\nThe number of bytes read in headerless raw "
         "file did not match the scan line size. File likely truncated.\n"},
    };
    for (const Case& c : cases) {
        prepareHeaderless(c.details);
        const auto result = calibrateHeaderless();
        EXPECT_EQ(result.status, exitStatusOf(c.code)) << c.details;
        EXPECT_EQ(result.out, "lsc version 3.8.1\nInput file: flat.raw\n" + c.out) << c.details;
    }
}

TEST_F(Loading, HeaderlessMissingFilesAreReported) {
    prepareHeaderless(details());
    auto result = run({"-c", "lsc.cfg", "-i", "flat.raw", "-r", "nothing.txt", "-l", "cal.txt"});
    EXPECT_EQ(result.status, exitStatusOf(264));
    EXPECT_TRUE(
        hasLine(result.out, "ERROR(264): Unable to read headerless raw image details file."));
    EXPECT_TRUE(hasLine(
        result.out, "Likely incorrect file name of headerless raw image details file specified."));

    result = run({"-c", "lsc.cfg", "-i", "nothing.raw", "-r", "details.txt", "-l", "cal.txt"});
    EXPECT_EQ(result.status, exitStatusOf(210));
    EXPECT_TRUE(hasLine(result.out, "ERROR(210): Unable to open image file: nothing.raw"));
    EXPECT_TRUE(hasLine(result.out, "Likely file protection issues or the file doesn't exist."));
}

TEST_F(Loading, HeaderlessBitDepthComesFromTheConfigurationWhenNotGiven) {
    // A 12-bit dump read at the default of 10 bits is masked; with
    // shared.bit_res = 12 it keeps its range.
    FlatFieldShape shape = smallShape();
    shape.bits = 12;
    prepareHeaderless(details(), shape);
    write("lsc.cfg", "shared.bit_res = 12; proc.max_pixel_val = 4095; proc.peak_pixel_min = 2000; "
                     "proc.min_pixel_val = 200;");
    const auto result = calibrateHeaderless();
    EXPECT_EQ(result.status, 0) << result.out;
    EXPECT_FALSE(hasLine(result.out, "WARNING - Bit depth of input image (10) is different than "
                                     "bit depth specified by shared.bit_res (12)."));
}

} // namespace
} // namespace e2e
