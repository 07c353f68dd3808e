// Several frames averaged (--input up to 16 times) and the full-resolution
// check image (--check).

#include <cmath>
#include <memory>
#include <regex>

#include <tiffio.h>

#include "image/tiff_ptr.h"
#include "tests/e2e/e2e_fixture.h"

namespace e2e {
namespace {

using Frames = ToolRun;

std::vector<std::string> frameArgs(const std::vector<std::string>& frames) {
    std::vector<std::string> args = {"--config", "lsc.cfg", "--calibrate", "cal.txt"};
    for (const std::string& frame : frames)
        args.insert(args.end(), {"--input", frame});
    return args;
}

// The register file without its command-line comment.
std::string registers(const std::string& text) {
    return std::regex_replace(text, std::regex("# Command line: [^\n]*\n"), "");
}

TEST_F(Frames, FramesThatDoNotAgreeAreRefusedByName) {
    prepare();
    FlatFieldShape other = smallShape();
    struct Case {
        std::function<void(FlatFieldShape&)> change;
        std::string difference;
    } cases[] = {
        {[](FlatFieldShape& s) {
             s.width = 800;
             s.height = 600;
         },
         "800 x 600 pixels against 640 x 480 pixels"},
        {[](FlatFieldShape& s) { s.cfa = testing_support::cfaOfBayerOrder("GRBG"); },
         "Bayer order GRBG against RGGB"},
        {[](FlatFieldShape& s) { s.bits = 12; }, "bit depth 12 against 10"},
    };
    for (const Case& c : cases) {
        FlatFieldShape shape = smallShape();
        c.change(shape);
        write("other.kqraw",
              testing_support::kqraw2FileBytes(testing_support::makeFlatField(shape)));
        const auto result = run(frameArgs({"flat.kqraw", "flat.kqraw", "other.kqraw"}));
        EXPECT_EQ(result.status, 1);
        EXPECT_TRUE(hasLine(result.out, "ERROR: Input frame 3 (other.kqraw) does not match the "
                                        "first frame (flat.kqraw): " +
                                            c.difference + "."))
            << result.out;
        EXPECT_FALSE(exists("cal.txt"));
    }
}

TEST_F(Frames, AtMostSixteenAndNeverAnOutput) {
    prepare();
    const auto tooMany = run(frameArgs(std::vector<std::string>(17, "flat.kqraw")));
    EXPECT_EQ(tooMany.status, 1);
    EXPECT_EQ(tooMany.out,
              "ERROR: At most 16 input frames can be averaged; --input is given 17 times.\n");
    write("second.kqraw", read("flat.kqraw"));
    auto args = frameArgs({"flat.kqraw", "second.kqraw"});
    args.insert(args.end(), {"--flat", "second.kqraw"});
    const auto over = run(args);
    EXPECT_EQ(over.status, 1);
    EXPECT_EQ(over.out,
              "ERROR: Output --flat names the same file as input --input: second.kqraw\n");
}

TEST_F(Frames, IdenticalFramesGiveTheSameCalibrationAsOne) {
    prepare();
    write("copy.kqraw", read("flat.kqraw"));
    const auto one = run(frameArgs({"flat.kqraw"}));
    const std::string single = read("cal.txt");
    const auto four = run(frameArgs({"flat.kqraw", "copy.kqraw", "flat.kqraw", "copy.kqraw"}));
    ASSERT_EQ(four.status, 0) << four.out;
    EXPECT_EQ(registers(read("cal.txt")), registers(single));
    // Each frame is named, then how many were averaged; nothing else changes.
    std::string expected = one.out;
    expected.replace(expected.find("Input file: flat.kqraw\n"), 23,
                     "Input file: flat.kqraw\nInput file: copy.kqraw\nInput file: flat.kqraw\n"
                     "Input file: copy.kqraw\n");
    expected.insert(expected.find("Exposure time"), "Input frames averaged: 4\n");
    EXPECT_EQ(four.out, expected);
}

TEST_F(Frames, FourNoisyFramesLowerTheResidual) {
    // Noise that dominates: no median filter, no reduction, single-pixel samples.
    FlatFieldShape shape = smallShape();
    shape.noise = 0.02;
    const std::string config = "proc.median_filter_flag = 0; shared.proc_sampling_factor = 1;\n"
                               "apply_lsc.sampling_factor = 1; lsc.log_err_flag = 1;\n"
                               "proc.min_pixel_val = 0; lsc.max_err = 1; lsc.max_rms_err = 1;";
    prepare(config);
    std::vector<std::string> frames;
    for (std::uint32_t seed = 1; seed <= 4; ++seed) {
        shape.seed = seed;
        frames.push_back("noisy" + std::to_string(seed) + ".kqraw");
        write(frames.back(),
              testing_support::kqraw2FileBytes(testing_support::makeFlatField(shape)));
    }
    // The RMS sample deviation of the green/red fit measures the noise on the samples.
    const auto rms = [&](const std::vector<std::string>& inputs) {
        const auto result = run(frameArgs(inputs));
        EXPECT_EQ(result.status, 0) << result.out;
        std::smatch match;
        EXPECT_TRUE(std::regex_search(result.out, match,
                                      std::regex("green/red deviation max, rms: \\S+ (\\S+)")));
        return match.empty() ? 0.0 : std::stod(match[1]);
    };
    const double single = rms({frames[0]});
    const double averaged = rms(frames);
    // sqrt(4) = 2 less noise; at least 1.6 here.
    EXPECT_LT(averaged * 1.6, single) << single << " " << averaged;

    // Averaged band by band into the preparation, or whole when the input
    // image itself is needed (here for --inputasbmp): the same calibration.
    const std::string streamed = registers(read("cal.txt"));
    auto args = frameArgs(frames);
    args.insert(args.end(), {"--inputasbmp", "input.bmp"});
    ASSERT_EQ(run(args).status, 0);
    EXPECT_EQ(registers(read("cal.txt")), streamed);
}

// --- The check image --------------------------------------------------------

TEST_F(Frames, CheckImageIsTheCorrectedCaptureAtFullSize) {
    prepare();
    auto args = frameArgs({"flat.kqraw"});
    args.insert(args.end(), {"--kq", "--check", "check.tiff"});
    const auto result = run(args);
    ASSERT_EQ(result.status, 0) << result.out;
    EXPECT_TRUE(hasLine(result.out, "Writing full-resolution check image."));

    img::TiffPtr tiff(TIFFOpen(path("check.tiff").c_str(), "r"));
    ASSERT_TRUE(tiff);
    std::uint32_t width = 0, height = 0;
    std::uint16_t bits = 0, samples = 0, photometric = 0;
    TIFFGetField(tiff.get(), TIFFTAG_IMAGEWIDTH, &width);
    TIFFGetField(tiff.get(), TIFFTAG_IMAGELENGTH, &height);
    TIFFGetField(tiff.get(), TIFFTAG_BITSPERSAMPLE, &bits);
    TIFFGetField(tiff.get(), TIFFTAG_SAMPLESPERPIXEL, &samples);
    TIFFGetField(tiff.get(), TIFFTAG_PHOTOMETRIC, &photometric);
    EXPECT_EQ(width, 640u);
    EXPECT_EQ(height, 480u);
    EXPECT_EQ(bits, 16);
    EXPECT_EQ(samples, 1);
    EXPECT_EQ(photometric, PHOTOMETRIC_MINISBLACK);

    // Corrected and balanced: the corners (half as bright in the capture) and
    // every channel come within a few per cent of the centre.
    std::vector<std::uint16_t> row(width);
    double corner = 0, centre = 0;
    for (std::uint32_t y = 0; y < height; ++y) {
        ASSERT_EQ(TIFFReadScanline(tiff.get(), row.data(), y), 1);
        for (std::uint32_t x = 0; x < width; ++x) {
            if (y < 16 && x < 16)
                corner += row[x];
            if (y >= 232 && y < 248 && x >= 312 && x < 328)
                centre += row[x];
        }
    }
    EXPECT_NEAR(corner / centre, 1.0, 0.05);
    EXPECT_NEAR(centre / 256 / 65535, 0.8, 0.05);
}

} // namespace
} // namespace e2e
