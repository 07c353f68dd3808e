// Captures rendered from the shading measured on real camera modules
// (tests/data/real_modules): the fit check accepts them at the default
// settings and still refuses a flat field with a defect on a sample point;
// the luminance bound fails a dust blotch that delta ab lets through; the
// automatic patch layout is repeatable and no worse than the configured one.

#include <algorithm>
#include <cmath>
#include <memory>
#include <regex>

#include "image/bayer_image.h"
#include "lsc/lens_shading_correction.h"
#include "lsc/lens_shading_fit.h"
#include "lsc/patch_layout_choice.h"
#include "lsc/sample_collection.h"
#include "tests/e2e/e2e_fixture.h"
#include "tests/support/module_shading.h"

namespace e2e {

using img::BayerImage;

using lsc::applyLensShading;
using lsc::candidateLayouts;
using lsc::chooseLayout;
using lsc::collectSamples;
using lsc::FitDeviations;
using lsc::fitLensShading;
using lsc::FitResult;
using lsc::LayoutChoice;
using lsc::levelledImage;
using lsc::PatchLayout;
using lsc::SampleSet;
using lsc::ShadingSettings;
namespace {

struct Module {
    const char* file;
    int width, height; // half the sensor's size, to keep the tests quick
    const char* order;
    int blackLevel; // 10-bit units
    double temperature;
};

const Module kImx219 = {"rpi_imx219.json", 1640, 1232, "RGGB", 64, 6000};

// Test names and failure messages show the file name, not the bytes.
void PrintTo(const Module& module, std::ostream* out) {
    *out << module.file << " at " << module.temperature << " K";
}

// A capture as a station takes it: 10 bits, brightest green at 80 %, photon
// and read noise, 300 hot and dead pixels, the module's black level.
FlatFieldShape moduleShape(const Module& module, int divisor = 1) {
    FlatFieldShape shape;
    shape.width = module.width / divisor & ~1;
    shape.height = module.height / divisor & ~1;
    shape.cfa = testing_support::cfaOfBayerOrder(module.order);
    shape.module = std::make_shared<const testing_support::ModuleShading>(
        testing_support::ModuleShading::fromTuningFile(
            std::string(LSC_SOURCE_DIR) + "/tests/data/real_modules/" + module.file,
            module.temperature));
    shape.fullWell = 5000;
    shape.readNoise = 2.5;
    shape.defects = 300;
    shape.blackLevel = module.blackLevel;
    return shape;
}

std::string baseConfig(const Module& module) {
    return "shared.bit_res = 10; proc.black_level = " + std::to_string(module.blackLevel) + ";\n";
}

class ModuleRun : public ToolRun {
protected:
    // Scales a disc of `diameter` pixels centred at (x, y) by `factor`,
    // above the black level.
    void paintDisc(int x, int y, int diameter, double factor, int black) {
        const double radius = diameter / 2.0;
        for (int row = y - diameter; row <= y + diameter; ++row)
            for (int column = x - diameter; column <= x + diameter; ++column)
                if (std::hypot(column - x, row - y) <= radius) {
                    std::uint16_t& sample =
                        field_.samples[std::size_t(row) * field_.shape.width + column];
                    const long value = std::lround(black + (sample - black) * factor);
                    sample = std::uint16_t(std::clamp(value, 0L, 1023L));
                }
        write("flat.kqraw", testing_support::kqraw2FileBytes(field_));
    }
};

class ModuleAcceptance : public ModuleRun, public ::testing::WithParamInterface<Module> {};

TEST_P(ModuleAcceptance, DefaultSettingsAcceptTheModule) {
    prepare(baseConfig(GetParam()), moduleShape(GetParam()));
    const auto result = calibrate();
    EXPECT_EQ(result.status, 0) << result.out;
    EXPECT_TRUE(exists("cal.txt"));
}

INSTANTIATE_TEST_SUITE_P(RealModules, ModuleAcceptance,
                         ::testing::Values(kImx219,
                                           Module{"rpi_imx477.json", 2028, 1520, "RGGB", 64, 2960},
                                           Module{"rpi_ov5647.json", 1296, 972, "BGGR", 16, 6500}),
                         [](const ::testing::TestParamInfo<Module>& param) {
                             const std::string file = param.param.file;
                             return file.substr(4, file.size() - 9); // rpi_<sensor>.json
                         });

// On a quarter-size capture prepared as it is (no filter, no reduction), the
// block at (396, 296) is a sample: the sine grid's angle -2 degrees gives
// 410 (1 + sin -2) = 395.7 and 308 (1 + sin -2) = 297.3.
TEST_F(ModuleRun, DefectsOnASamplePointAreStillRefused) {
    struct Case {
        const char* name;
        int diameter; // pixels; 10 is 1.2 % of the width
        double factor;
        const char* message;
    };
    const Case cases[] = {
        {"bright blotch of 15 %", 10, 1.15, "ERROR: MAX error bound exceeded."},
        {"dark blotch of 15 %", 10, 0.85, "ERROR: MAX error bound exceeded."},
        {"dead cluster of 5 x 5", 5, 0.0,
         "ERROR: A value of zero in the input cannot be corrected (i.e. gained up to unity)."},
    };
    // Without defective pixels: unfiltered, one on a sample would be refused too.
    FlatFieldShape shape = moduleShape(kImx219, 2);
    shape.defects = 0;
    for (const Case& c : cases) {
        prepare(baseConfig(kImx219) +
                    "proc.median_filter_flag = 0; shared.proc_sampling_factor = 1;"
                    "proc.min_pixel_val = 0; proc.max_pixel_val = 1023;",
                shape);
        paintDisc(397, 297, c.diameter, c.factor, kImx219.blackLevel);
        const auto result = calibrate();
        EXPECT_EQ(result.status, 1) << c.name << "\n" << result.out;
        EXPECT_TRUE(hasLine(result.out, c.message)) << c.name << "\n" << result.out;
        EXPECT_FALSE(exists("cal.txt")) << c.name;
    }
}

TEST_F(ModuleRun, LuminanceBoundFailsADustBlotchThatDeltaAbLetsThrough) {
    struct Case {
        bool blotch;
        const char* bound;
        int status;
        const char* line; // a whole line the output must hold
    };
    const Case cases[] = {
        {false, "3", 0, "Completed."},
        {true, "0", 0, "Completed."},
        {true, "3", 1, "ERROR: Maximum luminance residual is greater than threshold of 3 %"},
    };
    for (const Case& c : cases) {
        // The fit bounds opened, so that only the luminance decides.
        prepare(baseConfig(kImx219) +
                    "lsc.max_err = 1; lsc.max_rms_err = 1;"
                    "apply_lsc.max_luma_residual = " +
                    c.bound + ";",
                moduleShape(kImx219, 2));
        if (c.blotch) // 4 % of the width, 25 % darker
            paintDisc(500, 200, 33, 0.75, kImx219.blackLevel);
        const auto result = calibrate();
        EXPECT_EQ(result.status, c.status) << result.out;
        EXPECT_TRUE(hasLine(result.out, c.line)) << result.out;
        const bool printed = result.out.find("Maximum luminance residual: ") != std::string::npos;
        EXPECT_EQ(printed, std::string(c.bound) != "0") << result.out;
        // Delta ab (threshold 10) passes the blotch: the run without the bound completes.
    }
}

TEST_F(ModuleRun, AutomaticLayoutIsRepeatableAndPassesTheBinaryDataCheck) {
    // Factors in the configuration: the binary data must match the chosen ones.
    prepare(baseConfig(kImx219) + "lsc.patch_layout = auto; lsc.leftPatchFactor = 0.25;"
                                  "shared.cfg_file_date = 2026-12-01T09:00;",
            moduleShape(kImx219, 2));
    const auto first = calibrate({"--binary", "cal.bin"});
    ASSERT_EQ(first.status, 0) << first.out;
    const std::string registers = read("cal.txt");
    const auto second = calibrate({"--binary", "cal.bin"});
    EXPECT_EQ(second.out, first.out);
    EXPECT_EQ(read("cal.txt"), registers);
    // One line names the chosen factors, which the register file then holds.
    std::smatch chosen;
    ASSERT_TRUE(std::regex_search(
        first.out, chosen,
        std::regex("\nPatch layout: leftPatchFactor ([0-9.]+), centerPatchFactor ([0-9.]+), "
                   "topPatchFactor ([0-9.]+), middlePatchFactor ([0-9.]+) \\(the flattest of "
                   "5\\)\n")))
        << first.out;
    EXPECT_NE(chosen[1].str(), "0.25"); // this module's corners want larger outer patches
    EXPECT_NE(registers.find("reference.leftPatchFactor      = " + chosen[1].str() + ";"),
              std::string::npos);
    EXPECT_NE(registers.find("reference.middlePatchFactor    = " + chosen[4].str() + ";"),
              std::string::npos);

    write("lsc.cfg", "lsc.patch_layout = auto; lsc.left_patch_width = 200;"
                     "lsc.center_patch_width = 420; lsc.top_patch_height = 150;"
                     "lsc.middle_patch_height = 316;");
    const auto legacy = calibrate();
    EXPECT_EQ(legacy.status, 1);
    EXPECT_TRUE(hasLine(legacy.out,
                        "ERROR: lsc.patch_layout = auto chooses patch factors; it cannot be used "
                        "with patch sizes in pixels (lsc.left_patch_width and the others)."))
        << legacy.out;
}

// Calibration error of a fit with the given layout: the largest |8 x 8-block
// mean / channel mean - 1| of the gain times the exact shading.
double calibrationError(const FlatField& field, const BayerImage& capture,
                        const ShadingSettings& runSettings, const PatchLayout& layout) {
    ShadingSettings settings;
    settings.blackLevel = runSettings.blackLevel;
    settings.sampleAngleStep = runSettings.sampleAngleStep;
    settings.quiet = true;
    settings.layout = layout;
    std::ostringstream messages;
    const BayerImage levelled = levelledImage(capture, settings.blackLevel);
    const SampleSet samples = collectSamples(levelled, settings, messages);
    FitDeviations deviations;
    const FitResult fit = fitLensShading(samples, {levelled, true}, settings, messages, deviations);
    BayerImage exact;
    exact.copy(capture);
    std::copy(field.exact.begin(), field.exact.end(), exact.pixels());
    const BayerImage corrected = applyLensShading(exact, fit.correction, 0.0f, 1);
    const int width = field.shape.width, height = field.shape.height;
    double worst = 0.0;
    for (int k = 0; k < 4; ++k) {
        std::vector<double> means;
        for (int by = 0; by + 8 <= height; by += 8)
            for (int bx = 0; bx + 8 <= width; bx += 8) {
                double sum = 0.0;
                for (int y = by; y < by + 8; ++y)
                    for (int x = bx; x < bx + 8; ++x)
                        if (field.channelAt(x, y) == k)
                            sum += corrected.pixels()[std::size_t(y) * width + x];
                means.push_back(sum);
            }
        double mean = 0.0;
        for (double m : means)
            mean += m / static_cast<double>(means.size());
        for (double m : means)
            worst = std::max(worst, std::fabs(m / mean - 1.0));
    }
    return worst;
}

TEST_F(ModuleRun, AutomaticLayoutIsNoWorseThanTheConfiguredOne) {
    // A quarter-size capture, without defective pixels, taken as the prepared image.
    FlatFieldShape shape = moduleShape(kImx219, 2);
    shape.defects = 0;
    prepare("", shape);
    BayerImage capture;
    capture.read(path("flat.kqraw"));
    ShadingSettings settings;
    settings.blackLevel = static_cast<float>(kImx219.blackLevel) / 1023.0f;
    settings.sampleAngleStep = 8;
    const LayoutChoice choice = chooseLayout(capture, settings);
    const LayoutChoice again = chooseLayout(capture, settings);
    EXPECT_EQ(again.index, choice.index);
    EXPECT_EQ(again.flatness, choice.flatness);
    ASSERT_EQ(choice.candidates, 5u);
    EXPECT_LE(choice.flatness[choice.index], choice.flatness[0]);
    const std::vector<PatchLayout> layouts = candidateLayouts(settings.layout, 820, 616);
    const double configured = calibrationError(field_, capture, settings, layouts[0]);
    const double chosen = calibrationError(field_, capture, settings, choice.layout);
    EXPECT_LE(chosen, configured + 0.003) << configured << " " << chosen;
}

} // namespace
} // namespace e2e
