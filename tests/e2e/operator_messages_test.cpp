// What the operator is told: the detail line under an error (what and
// where), and the warnings for likely mistakes, present where the mistake is
// and absent on good flat fields.

#include <memory>

#include "tests/e2e/e2e_fixture.h"
#include "tests/support/module_shading.h"

namespace e2e {
namespace {

const std::vector<std::string> kRun = {"--config",   "lsc.cfg",     "--input",
                                       "flat.kqraw", "--calibrate", "cal.txt"};

std::vector<std::string> with(std::vector<std::string> args, const std::vector<std::string>& more) {
    args.insert(args.end(), more.begin(), more.end());
    return args;
}

// --- Detail lines -----------------------------------------------------------

struct DetailCase {
    const char* name;
    std::string config;
    std::vector<std::string> args;
    std::string lastLine; // the last line of the error's own text
    std::string detail;   // the line after it (a prefix of it, for measured figures)
};

void PrintTo(const DetailCase& c, std::ostream* out) {
    *out << c.name;
}

const DetailCase kDetails[] = {
    {"missing_config",
     "",
     {"-c", "none.cfg", "-i", "flat.kqraw", "-l", "cal.txt"},
     "ERROR: Unable to open configuration file.",
     "  none.cfg: No such file or directory"},
    {"missing_capture",
     "",
     {"-c", "lsc.cfg", "-i", "none.kqraw", "-l", "cal.txt"},
     "ERROR: Cannot read kqraw image.",
     "  none.kqraw: No such file or directory"},
    {"truncated_capture",
     "",
     {"-c", "lsc.cfg", "-i", "short.kqraw", "-l", "cal.txt"},
     "ERROR: Cannot read kqraw image.",
     "  short.kqraw: truncated or damaged (a block or the pixel data runs past the end of the "
     "file, or the header or pixel block is missing)"},
    {"empty_capture",
     "",
     {"-c", "lsc.cfg", "-i", "empty.kqraw", "-l", "cal.txt"},
     "ERROR: Cannot read kqraw image.",
     "  empty.kqraw: the file is empty"},
    {"missing_autofocus", "", with(kRun, {"-b", "cal.bin", "-a", "none.af"}),
     "ERROR: Unable to open configuration file.", "  none.af: No such file or directory"},
    {"autofocus_parse", "", with(kRun, {"-b", "cal.bin", "-a", "bad.af"}), "Stopped at: \"9 = 1;\"",
     "  bad.af, line 2"},
    {"not_a_number", "lsc.max_gain = six;", kRun,
     "ERROR: bad lexical cast: source type value could not be interpreted as target",
     "  lsc.max_gain = six: not a number"},
    {"not_a_whole_number", "\n\nlsc.sampling_factor = 8.5;", kRun,
     "ERROR: bad lexical cast: source type value could not be interpreted as target",
     "  lsc.sampling_factor = 8.5: not a whole number (32 bits)"},
    {"parse_line", "# settings\r\n\r\nlsc.max_gain = 6\r\n", kRun, "lsc.max_gain = 6",
     "  lsc.cfg, line 3"},
    // Prepared pixel (119, 159) of a 160 x 120 image: the bottom right corner.
    {"too_dark", "proc.min_pixel_val = 400;", kRun, "Out of range value: (119,159) = 293.",
     "  too dark: 5348 pixels (27.9 %) below 400 (darkest 208 at sensor x 0, y 0)"},
    {"too_bright", "proc.max_pixel_val = 700; proc.peak_pixel_min = 1;", kRun,
     "Out of range value: (103,92) = 701.",
     "  too bright: 3052 pixels (15.9 %) above 700 (brightest 818 at sensor x "},
    {"needs_kq", "", with(kRun, {"--report", "r.html"}), "ERROR: unrecognised option '--report'",
     "  --report needs --kq"},
    {"needs_kq_short", "", with(kRun, {"-p", "p.kqraw"}), "ERROR: unrecognised option '-p'",
     "  -p needs --kq"},
};

class DetailLines : public ToolRun, public ::testing::WithParamInterface<DetailCase> {};

TEST_P(DetailLines, FollowTheErrorIndentedAndGoWithItUnderQuiet) {
    const DetailCase& c = GetParam();
    prepare(c.config);
    const std::string capture = read("flat.kqraw");
    write("short.kqraw", capture.substr(0, capture.size() - 100));
    write("empty.kqraw", "");
    write("bad.af", "module.af.set[0].macro = 1;\n9 = 1;\n");

    const auto result = run(c.args);
    EXPECT_NE(result.status, 0);
    const auto text = lines(result.out);
    ASSERT_GE(text.size(), 2u) << result.out;
    // A text that ends with its own line end keeps the empty line it makes.
    std::size_t last = text.size() - 2;
    if (text[last].empty() && last > 0)
        --last;
    EXPECT_EQ(text[last], c.lastLine) << result.out;
    EXPECT_EQ(text.back().substr(0, c.detail.size()), c.detail) << result.out;

    // Under --quiet the error's line is suppressed once the messages are
    // open (after the configuration), and its detail with it.
    if (c.lastLine.find("ERROR: Cannot") == 0 || c.lastLine.find("Out of range") == 0) {
        const auto quiet = run(with(c.args, {"--kq", "--quiet"}));
        EXPECT_EQ(quiet.out.find(c.detail), std::string::npos) << quiet.out;
        EXPECT_EQ(quiet.status, result.status);
    }
}

INSTANTIATE_TEST_SUITE_P(Errors, DetailLines, ::testing::ValuesIn(kDetails),
                         [](const auto& test) { return std::string(test.param.name); });

// --- Warnings ---------------------------------------------------------------

using Warnings = ToolRun;

struct WarningCase {
    const char* name;
    std::string config;
    std::vector<std::string> extra;
    std::string warning; // the first warning line (a prefix of it); empty: none at all
};

TEST_F(Warnings, NameTheLikelyMistakeAndStayAwayFromGoodRuns) {
    const WarningCase cases[] = {
        {"good flat", "", {}, ""},
        {"register file and autofocus keys",
         "reference.controlPointR[0][0] = 1.5; global.configType = 1;\n"
         "module.af.set[0].macro = 7; reference.ctrlPoints[0].controlPointB[1][1] = 2;",
         {},
         ""},
        {"typing slip",
         "proc.min_pixle_val = 60;",
         {},
         "WARNING: Unknown configuration key proc.min_pixle_val (ignored); did you mean "
         "proc.min_pixel_val?"},
        {"unknown list",
         "lsc.weights = {1, 2, 3};",
         {},
         "WARNING: Unknown configuration key lsc.weights (ignored)"},
        {"unknown section",
         "camera.model = imx219;",
         {},
         "WARNING: Unknown configuration key camera.model (ignored)"},
        {"x test",
         "",
         {"--xtest"},
         "WARNING: X-test run: the register file holds a test surface that distorts the colours "
         "on purpose, not a calibration of this module."},
    };
    prepare();
    for (const WarningCase& c : cases) {
        write("lsc.cfg", c.config);
        const auto result = calibrate(c.extra);
        EXPECT_EQ(result.status, 0) << c.name << "\n" << result.out;
        const std::size_t at = result.out.find("WARNING");
        if (c.warning.empty()) {
            EXPECT_EQ(at, std::string::npos) << c.name << "\n" << result.out;
            continue;
        }
        ASSERT_NE(at, std::string::npos) << c.name;
        EXPECT_EQ(result.out.substr(at, c.warning.size()), c.warning) << c.name;
        // One warning line each.
        EXPECT_EQ(result.out.find("WARNING", at + 1), std::string::npos) << result.out;
    }
    // --quiet silences warnings as every other line.
    write("lsc.cfg", "proc.min_pixle_val = 60;");
    EXPECT_EQ(calibrate({"--kq", "-q"}).out, "");
}

TEST_F(Warnings, BayerOrderDeclaredWrongIsNamed) {
    // GRBG samples declared RGGB in the details file of a headerless dump.
    FlatFieldShape shape = smallShape();
    shape.cfa = testing_support::cfaOfBayerOrder("GRBG");
    prepare("", shape);
    write("flat.raw", testing_support::headerlessFileBytes(field_));
    shape.cfa = testing_support::cfaOfBayerOrder("RGGB");
    field_.shape = shape;
    write("flat.txt", testing_support::headerlessDetailsText(field_));
    const auto result = run({"-c", "lsc.cfg", "-i", "flat.raw", "-r", "flat.txt", "-l", "cal.txt"});
    EXPECT_EQ(result.status, 0);
    EXPECT_TRUE(hasLine(result.out,
                        "WARNING: The two green channels differ by 15.9 % in the centre of the "
                        "image (a sensor's greens differ by a few per cent at most): is the Bayer "
                        "order RGGB right?"))
        << result.out;
}

// Real modules: strong colour shading at every colour temperature of their
// tables, rendered at a quarter of their size, with a black level of 64.
struct ModuleCase {
    const char* file;
    double temperature;
};

testing_support::FlatField moduleField(const ModuleCase& module, int width, int height) {
    FlatFieldShape shape;
    shape.width = width;
    shape.height = height;
    shape.module = std::make_shared<const testing_support::ModuleShading>(
        testing_support::ModuleShading::fromTuningFile(
            std::string(LSC_SOURCE_DIR) + "/tests/data/real_modules/" + module.file,
            module.temperature));
    shape.fullWell = 5000;
    shape.readNoise = 2.5;
    shape.defects = 100;
    shape.blackLevel = 64;
    return testing_support::makeFlatField(shape);
}

TEST_F(Warnings, RealModulesDrawNone) {
    const ModuleCase modules[] = {
        {"rpi_imx219.json", 3000}, {"rpi_imx219.json", 3850}, {"rpi_imx219.json", 6000},
        {"rpi_imx477.json", 2960}, {"rpi_imx477.json", 4850}, {"rpi_imx477.json", 5930},
        {"rpi_ov5647.json", 3000}, {"rpi_ov5647.json", 5000}, {"rpi_ov5647.json", 6500}};
    write("lsc.cfg", "proc.black_level = 64;");
    for (const ModuleCase& module : modules) {
        write("flat.kqraw", testing_support::kqraw2FileBytes(moduleField(module, 820, 616)));
        const auto result = calibrate();
        EXPECT_EQ(result.status, 0) << module.file << " " << module.temperature << result.out;
        EXPECT_EQ(result.out.find("WARNING"), std::string::npos)
            << module.file << " " << module.temperature << "\n"
            << result.out;
    }
}

TEST_F(Warnings, PedestalLeftInIsNamedFromTheNoise) {
    // Half the IMX219's size: its shot noise shows the pedestal of 64.
    write("flat.kqraw",
          testing_support::kqraw2FileBytes(moduleField({"rpi_imx219.json", 6000}, 1640, 1232)));
    write("lsc.cfg", "");
    const auto left = calibrate();
    EXPECT_EQ(left.status, 0);
    EXPECT_NE(left.out.find("WARNING: The noise of the capture shows a black level of at least "),
              std::string::npos)
        << left.out;
    EXPECT_NE(left.out.find(", but proc.black_level is 0: the pedestal left in the samples "
                            "under-corrects the corners.\n"),
              std::string::npos);
    write("lsc.cfg", "proc.black_level = 64;");
    EXPECT_EQ(calibrate().out.find("WARNING"), std::string::npos);
}

} // namespace
} // namespace e2e
