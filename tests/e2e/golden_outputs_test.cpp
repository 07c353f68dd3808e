// Byte identity of every output of whole runs on generated captures and on the
// bundled example, against the outputs kept under tests/data/golden/ (text
// files as they are, binary files as MD5 sums). Any change of a digit, a pixel
// or a message fails here. scripts/update-golden.sh rewrites the kept outputs;
// every diff it makes is reviewed before it is committed.

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/e2e/e2e_fixture.h"
#include "tests/support/temp_dir.h"
#include "tests/support/tool_runner.h"

namespace e2e {
namespace {

using testing_support::readFile;
using testing_support::toolCommandPrefix;
using testing_support::words;
using testing_support::writeFile;

const std::string kSourceDir = LSC_SOURCE_DIR;
const std::string kKeptDir = kSourceDir + "/tests/data/golden/";

struct GoldenCase {
    const char* name;
    // flatgen: format, width, height, bits, order; then the configuration's
    // sampling factor, median flag and size, sample window.
    const char* format;
    int width, height, bits;
    const char* order;
    int factor, median, medianSize, window;
    const char* extraArguments; // options beyond the outputs every case writes
};

// Several sizes, depths, Bayer orders, factors, the median on and off, sample
// windows and the three input formats. The last columns exercise the input
// exports, the translation of a headerless raw file, and debug mode (the input
// statistics and the identity test; its timer lines are left out).
const GoldenCase kCases[] = {
    {"case0", "kqraw2", 640, 480, 10, "RGGB", 4, 1, 3, 1, ""},
    {"case1", "kqraw2", 640, 480, 10, "GRBG", 2, 1, 3, 3,
     "--inputasjpeg in.jpg --inputasbmp in.bmp"},
    {"case2", "kqraw2", 800, 600, 12, "GBRG", 1, 0, 3, 1, ""},
    {"case3", "kqraw2", 1024, 768, 10, "BGGR", 4, 1, 5, 5, ""},
    {"case4", "kqraw", 1000, 750, 12, "RGGB", 2, 1, 3, 1, "--inputasbmp in.bmp"},
    {"case5", "raw", 648, 486, 10, "BGGR", 3, 1, 1, 1, "--translate in.kqraw"},
    {"case6", "kqraw2", 2000, 1500, 10, "RGGB", 4, 1, 3, 5, ""},
    {"case7", "raw", 1280, 960, 12, "GRBG", 1, 1, 3, 1, ""},
    {"case8", "kqraw2", 640, 480, 14, "GBRG", 4, 0, 3, 9, ""},
    {"case9", "kqraw2", 643, 481, 10, "GRBG", 1, 1, 2, 1, "--inputasjpeg in.jpg"},
    {"case10", "kqraw", 801, 603, 15, "BGGR", 3, 1, 10, 3, ""},
    {"case11", "raw", 900, 700, 11, "RGGB", 2, 1, 4, 1, ""},
    {"case12", "kqraw2", 1024, 768, 12, "GBRG", 2, 1, 3, 1, "--debug"},
    {"case13", "raw", 700, 500, 10, "BGGR", 1, 1, 3, 3, "--debug"},
    {"case14", "kqraw", 640, 480, 10, "GRBG", 1, 0, 3, 1, "--debug"},
};

// Test names and failure traces show the case's name, not its bytes.
void PrintTo(const GoldenCase& c, std::ostream* out) {
    *out << c.name;
}

const char* const kTextOutputs[] = {"stdout.txt",  "stderr.txt", "cal.txt",
                                    "samples.txt", "delta.csv",  "stats.csv"};
const char* const kBinaryOutputs[] = {"cal.bin",   "flat.out", "flat.jpg", "flat.bmp",
                                      "pre.kqraw", "in.jpg",   "in.bmp",   "in.kqraw"};

bool updating() {
    const char* update = std::getenv("LSC_GOLDEN_UPDATE");
    return update != nullptr && std::string(update) == "1";
}

std::string configText(const GoldenCase& c) {
    const int full = (1 << c.bits) - 1;
    std::ostringstream text;
    text << "shared.block_name = reference;\n"
         << "shared.cfg_file_date = 2026-12-01T09:00;\n"
         << "shared.bit_res = " << c.bits << ";\n"
         << "shared.proc_sampling_factor = " << c.factor << ";\n"
         << "proc.median_filter_flag = " << c.median << ";\n"
         << "proc.median_filter_size = " << c.medianSize << ";\n"
         << "proc.min_pixel_val = 1;\n"
         << "proc.max_pixel_val = " << full << ";\n"
         << "proc.peak_pixel_min = " << full / 3 << ";\n"
         << "lsc.sampling_factor = 8;\n"
         << "lsc.sample_window = " << c.window << ";\n"
         << "lsc.log_err_flag = 1;\n"
         << "apply_lsc.max_delta_ab = 10;\n"
         << "blob.log_flag = 1;\n";
    return text.str();
}

// "<md5>  <name>" for each binary output the run wrote, in table order.
std::string checksums(const testing_support::TempDir& dir) {
    std::string text;
    for (const char* name : kBinaryOutputs)
        if (testing_support::fileExists(dir.file(name)))
            text += outputDigest(readFile(dir.file(name))) + "  " + name + "\n";
    return text;
}

// Names the first differing line, so that a failure shows where, not two
// pages of text.
void expectSameText(const std::string& file, const std::string& expected,
                    const std::string& actual) {
    if (expected == actual)
        return;
    std::istringstream e(expected), a(actual);
    std::string el, al;
    for (int line = 1;; ++line) {
        const bool moreE = static_cast<bool>(std::getline(e, el));
        const bool moreA = static_cast<bool>(std::getline(a, al));
        if (!moreE && !moreA)
            break;
        if (el != al || moreE != moreA) {
            ADD_FAILURE() << file << " line " << line << "\n  expected: " << (moreE ? el : "<end>")
                          << "\n  actual:   " << (moreA ? al : "<end>");
            return;
        }
        el.clear();
        al.clear();
    }
    ADD_FAILURE() << file << " differs in its line ends";
}

// Compares (or, when updating, stores) the outputs of one run.
void checkOutputs(const std::string& name, const testing_support::TempDir& dir) {
    const std::string golden = kKeptDir + name + "/";
    std::vector<std::pair<std::string, std::string>> outputs;
    for (const char* file : kTextOutputs)
        if (testing_support::fileExists(dir.file(file)))
            outputs.emplace_back(file, readFile(dir.file(file)));
    outputs.emplace_back("checksums.txt", checksums(dir));
    if (updating()) {
        std::system(("mkdir -p " + golden).c_str());
        for (const auto& output : outputs)
            writeFile(golden + output.first, output.second);
        return;
    }
    for (const auto& output : outputs) {
        ASSERT_TRUE(testing_support::fileExists(golden + output.first))
            << "no kept output " << golden + output.first;
        expectSameText(name + "/" + output.first, readFile(golden + output.first), output.second);
    }
}

// Standard output without what differs from run to run: the timer lines
// (ending in " sec"), the start time and the execution time of debug mode.
std::string withoutTimes(const std::string& text) {
    std::istringstream in(text);
    std::string kept;
    for (std::string line; std::getline(in, line);) {
        const bool timer = line.size() >= 4 && line.compare(line.size() - 4, 4, " sec") == 0;
        if (!timer && line.rfind("Start: ", 0) != 0 && line.rfind("Execution time:", 0) != 0)
            kept += line + "\n";
    }
    return kept;
}

void runTool(const testing_support::TempDir& dir, std::vector<std::string> args) {
    const testing_support::ToolResult result = testing_support::runTool(args, dir.path());
    writeFile(dir.file("stdout.txt"),
              withoutTimes(result.out) + "status " + std::to_string(result.status) + "\n");
    writeFile(dir.file("stderr.txt"), result.err);
}

class GoldenOutputs : public ::testing::TestWithParam<GoldenCase> {};

TEST_P(GoldenOutputs, EveryOutputIsUnchanged) {
    const GoldenCase& c = GetParam();
    testing_support::TempDir dir;
    const std::string name = c.name;
    const std::string extension = std::string(".") + c.format;
    const std::string lsc = LSC_BINARY;
    const std::string flatgen = lsc.substr(0, lsc.rfind('/') + 1) + "flatgen";
    const int seed = std::stoi(name.substr(4)) + 1; // "case<n>"
    std::ostringstream generate;
    generate << "cd " << dir.path() << " && " << toolCommandPrefix() << flatgen << " --format "
             << c.format << " --width " << c.width << " --height " << c.height << " --bits "
             << c.bits << " --order " << c.order
             << " --noise 0.004 --defects 40 --corner 0.5 --seed " << seed
             << " --serial 0123456789abcdef0123456789abcd" << (seed < 10 ? "e" : "") << seed << " "
             << name << extension << " >/dev/null 2>&1";
    ASSERT_EQ(std::system(generate.str().c_str()), 0) << generate.str();
    writeFile(dir.file(name + ".cfg"), configText(c));

    std::vector<std::string> args = {"--config", name + ".cfg", "--input", name + extension};
    if (std::string(c.format) == "raw")
        args.insert(args.end(), {"--raw", name + extension + ".txt"});
    for (const std::string& word :
         words("--calibrate cal.txt --binary cal.bin --flat flat.out --jpeg flat.jpg --bmp "
               "flat.bmp --kq --delta delta.csv --stats stats.csv --outsamples samples.txt "
               "--preproc pre.kqraw " +
               std::string(c.extraArguments)))
        args.push_back(word);
    runTool(dir, args);
    checkOutputs(name, dir);
}

INSTANTIATE_TEST_SUITE_P(Captures, GoldenOutputs, ::testing::ValuesIn(kCases),
                         [](const ::testing::TestParamInfo<GoldenCase>& param) {
                             return std::string(param.param.name);
                         });

// The bundled example with its own configuration, as the README runs it.
TEST(GoldenOutputs, BundledExample) {
    testing_support::TempDir dir;
    for (const char* file : {"flatfield.kqraw", "lsc.cfg"})
        writeFile(dir.file(file), readFile(kSourceDir + "/examples/" + file));
    runTool(dir, words("--config lsc.cfg --input flatfield.kqraw --calibrate cal.txt --binary "
                       "cal.bin --flat flat.out --jpeg flat.jpg --kq --delta delta.csv --stats "
                       "stats.csv"));
    checkOutputs("example", dir);
}

} // namespace
} // namespace e2e
