#pragma once
// A working directory with a generated flat field and a configuration file,
// and a shorthand to run the tool in it.

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/support/temp_dir.h"
#include "tests/support/tool_runner.h"
#include "tools/flatfield/flat_field.h"

namespace e2e {

using flatfield::CaptureInfo;
using flatfield::FlatField;
using flatfield::FlatFieldShape;
using testing_support::ToolResult;

// A small, clean 10-bit RGGB flat field that passes the default checks (the
// default white-balance filter of 100 pixels needs a width of at least 400).
inline FlatFieldShape smallShape() {
    FlatFieldShape shape;
    shape.width = 640;
    shape.height = 480;
    return shape;
}

class ToolRun : public ::testing::Test {
protected:
    std::string path(const std::string& name) const { return dir_.file(name); }
    std::string read(const std::string& name) const {
        return testing_support::readFile(path(name));
    }
    bool exists(const std::string& name) const { return testing_support::fileExists(path(name)); }
    void write(const std::string& name, const std::string& bytes) const {
        testing_support::writeFile(path(name), bytes);
    }

    // Writes "flat.kqraw" (a container of `shape`) and "lsc.cfg" with `config`.
    void prepare(const std::string& config = "", const FlatFieldShape& shape = smallShape(),
                 const CaptureInfo& capture = {}) {
        field_ = flatfield::makeFlatField(shape);
        write("flat.kqraw", flatfield::kqraw2FileBytes(field_, capture));
        write("lsc.cfg", config);
    }

    // Runs the tool in the working directory.
    ToolResult run(const std::vector<std::string>& args, const std::string& input = "") const {
        return testing_support::runTool(args, dir_.path(), input);
    }
    // --config lsc.cfg --input flat.kqraw --calibrate cal.txt, then `extra`.
    ToolResult calibrate(const std::vector<std::string>& extra = {}) const {
        std::vector<std::string> args = {"--config",   "lsc.cfg",     "--input",
                                         "flat.kqraw", "--calibrate", "cal.txt"};
        args.insert(args.end(), extra.begin(), extra.end());
        return run(args);
    }

    testing_support::TempDir dir_;
    FlatField field_;
};

// Where the golden files of the end-to-end tests live.
inline const std::string kGoldenDir = std::string(LSC_SOURCE_DIR) + "/tests/data/e2e/";

// Compares a whole text with the golden file `goldenName` in kGoldenDir. On a
// mismatch the actual text is kept as <goldenName>.actual in the working
// directory for a diff.
void expectGolden(const std::string& actual, const std::string& goldenName);

// The MD5 sum of an output as hexadecimal text; a KQRAW2 file's header
// carries its wall-clock creation time (8 bytes at 60), which is blanked.
std::string outputDigest(std::string bytes);

// The lines of a text, without their line ends.
std::vector<std::string> lines(const std::string& text);
// True when `needle` occurs in `text` as a whole line.
bool hasLine(const std::string& text, const std::string& needle);

} // namespace e2e
