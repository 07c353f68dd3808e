// The end-to-end cases of tests/data/e2e/cases/*.txt: each sets up a working
// directory, runs build/lsc once and checks its exit status, its output lines
// and the files it left. tests/data/e2e/README.md describes the keys.

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <memory>
#include <regex>
#include <sstream>

#include "tests/e2e/e2e_fixture.h"
#include "tools/flatfield/module_shading.h"

#include <sys/stat.h>
#include <unistd.h>

namespace e2e {
namespace {

namespace fs = std::filesystem;
using testing_support::readFile;
using testing_support::words;
using testing_support::writeFile;

struct Case {
    std::string name;
    std::vector<std::pair<std::string, std::string>> keys; // in the order given
    std::vector<std::string> all(const std::string& key) const {
        std::vector<std::string> values;
        for (const auto& [k, v] : keys)
            if (k == key)
                values.push_back(v);
        return values;
    }
    bool has(const std::string& key) const { return !all(key).empty(); }
    std::string get(const std::string& key, const std::string& otherwise = "") const {
        const auto values = all(key);
        return values.empty() ? otherwise : values.back();
    }
};

void PrintTo(const Case& c, std::ostream* out) {
    *out << c.name;
}

std::string unescaped(const std::string& text) {
    std::string result;
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] != '\\' || i + 1 == text.size()) {
            result += text[i];
            continue;
        }
        const char next = text[++i];
        result += next == 'n' ? '\n' : next == 'r' ? '\r' : next == 't' ? '\t' : next;
    }
    return result;
}

// "== name" starts a case, "key: value" lines fill it, "#" lines are comments.
std::vector<Case> loadCases() {
    std::vector<fs::path> files;
    for (const auto& entry : fs::directory_iterator(kGoldenDir + "cases"))
        files.push_back(entry.path());
    std::sort(files.begin(), files.end());
    std::vector<Case> cases;
    for (const fs::path& file : files) {
        std::istringstream in(readFile(file.string()));
        for (std::string line; std::getline(in, line);) {
            if (line.rfind("== ", 0) == 0) {
                cases.push_back({file.stem().string() + "_" + line.substr(3), {}});
            } else if (!line.empty() && line[0] != '#' && !cases.empty()) {
                const auto colon = line.find(": ");
                const auto key = line.substr(0, colon == std::string::npos ? line.size() : colon);
                const auto value = colon == std::string::npos ? "" : line.substr(colon + 2);
                cases.back().keys.emplace_back(key, unescaped(value));
            }
        }
    }
    return cases;
}

// "width=820 black=64 module=rpi_imx219.json@3000 ..." over the small default.
FlatFieldShape shapeOf(const std::string& text) {
    FlatFieldShape shape = smallShape();
    for (const std::string& setting : words(text)) {
        const auto eq = setting.find('=');
        const std::string key = setting.substr(0, eq), value = setting.substr(eq + 1);
        if (key == "module") {
            const auto at = value.find('@');
            shape.module = std::make_shared<const flatfield::ModuleShading>(
                flatfield::ModuleShading::fromTuningFile(
                    std::string(LSC_SOURCE_DIR) + "/tests/data/real_modules/" + value.substr(0, at),
                    std::stod(value.substr(at + 1))));
        } else if (key == "order") {
            shape.cfa = flatfield::cfaOfBayerOrder(value);
        } else {
            const double number = std::stod(value);
            const int whole = static_cast<int>(number);
            if (key == "width")
                shape.width = whole;
            else if (key == "height")
                shape.height = whole;
            else if (key == "bits")
                shape.bits = whole;
            else if (key == "noise")
                shape.noise = number;
            else if (key == "defects")
                shape.defects = whole;
            else if (key == "seed")
                shape.seed = static_cast<std::uint32_t>(whole);
            else if (key == "corner")
                shape.cornerLevel = number;
            else if (key == "black")
                shape.blackLevel = whole;
            else if (key == "fullwell")
                shape.fullWell = number;
            else if (key == "readnoise")
                shape.readNoise = number;
            else
                ADD_FAILURE() << "unknown shape setting " << key;
        }
    }
    return shape;
}

CaptureInfo captureOf(const std::string& text) {
    CaptureInfo capture;
    for (const std::string& setting : words(text)) {
        const auto eq = setting.find('=');
        const std::string key = setting.substr(0, eq), value = setting.substr(eq + 1);
        if (key == "serial")
            capture.serialNumber = value;
        else if (key == "exposure")
            capture.exposureTime = std::stof(value);
        else if (key == "gains")
            std::sscanf(value.c_str(), "%f,%f,%f,%f", &capture.gains[0], &capture.gains[1],
                        &capture.gains[2], &capture.gains[3]);
    }
    return capture;
}

// "x y size value" sets a square of samples to value; "x y diameter *factor"
// scales a disc above the black level by factor.
void paint(FlatField& field, const std::string& text) {
    std::istringstream in(text);
    int x = 0, y = 0, size = 0;
    std::string amount;
    in >> x >> y >> size >> amount;
    const bool disc = amount[0] == '*';
    const double value = std::stod(amount.substr(disc ? 1 : 0));
    const int black = field.shape.blackLevel;
    for (int row = y - size; row <= y + size; ++row)
        for (int column = x - size; column <= x + size; ++column) {
            std::uint16_t& sample =
                field.samples[static_cast<std::size_t>(row) * field.shape.width + column];
            if (!disc && row >= y && column >= x && row < y + size && column < x + size)
                sample = static_cast<std::uint16_t>(value);
            if (disc && std::hypot(column - x, row - y) <= size / 2.0)
                sample = static_cast<std::uint16_t>(
                    std::clamp(std::lround(black + (sample - black) * value), 0L,
                               static_cast<long>(field.fullScale())));
        }
}

std::vector<std::string> listing(const std::string& dir) {
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(dir))
        names.push_back(entry.path().filename().string());
    std::sort(names.begin(), names.end());
    return names;
}

// Standard output with what differs from run to run blanked: the figures of
// the timer lines, the start and the execution time of debug mode.
std::string withoutTimes(const std::string& text) {
    static const std::regex timer(" [0-9.e-]+ sec$"),
        start("^Start: [0-9]{4}-[A-Z][a-z]{2}-[0-9]{2} [0-9:.]{15}$"),
        total("^Execution time:[0-9:.]{15}$");
    std::string kept;
    for (std::string line : lines(text)) {
        line = std::regex_replace(line, timer, " # sec");
        line = std::regex_replace(line, start, "Start: #");
        kept += std::regex_replace(line, total, "Execution time: #") + "\n";
    }
    return kept;
}

std::string shellQuoted(const std::string& text) {
    std::string quoted = "'";
    for (char c : text)
        quoted += c == '\'' ? std::string("'\\''") : std::string(1, c);
    return quoted + "'";
}

class Cases : public ToolRun, public ::testing::WithParamInterface<Case> {
protected:
    // Every case's directory: the capture in each input format, damaged and
    // odd copies, links to it, and names that are no regular files.
    void prepareDirectory(const Case& c) {
        std::string runs;
        for (const char* key : {"before", "run", "then"})
            for (const std::string& args : c.all(key))
                runs += " " + args + " ";
        const auto used = [&](const std::string& name) {
            return runs.find(" " + name + " ") != std::string::npos;
        };
        const CaptureInfo info = captureOf(c.get("capture"));
        field_ = flatfield::makeFlatField(shapeOf(c.get("shape")));
        for (const std::string& area : c.all("paint"))
            paint(field_, area);
        write("lsc.cfg", c.get("cfg"));
        const std::string capture = flatfield::kqraw2FileBytes(field_, info);
        write("flat.kqraw", capture);
        write("empty.kqraw", "");
        write("flat.txt", flatfield::headerlessDetailsText(field_));
        write("guid.txt",
              flatfield::headerlessDetailsText(field_) + "image.sensor_guid = IMX219\n");
        // The larger files only where a run names them.
        if (used("short.kqraw"))
            write("short.kqraw", capture.substr(0, capture.size() - 100));
        if (used("flat.raw"))
            write("flat.raw", flatfield::headerlessFileBytes(field_));
        if (used("fixed.kqraw"))
            write("fixed.kqraw", flatfield::fixedHeaderFileBytes(field_, info));
        if (used("odd.kqraw")) {
            flatfield::KqRawBuilder odd;
            odd.header(640, 480, 0x12345678).pixels(field_.samples);
            write("odd.kqraw", odd.bytes());
        }
        write("gone.txt", "x");
        const std::string capturePath = path("flat.kqraw");
        ASSERT_EQ(symlink("flat.kqraw", path("soft.kqraw").c_str()), 0);
        ASSERT_EQ(link(capturePath.c_str(), path("hard.kqraw").c_str()), 0);
        ASSERT_EQ(symlink("gone.txt", path("vanished").c_str()), 0);
        ASSERT_EQ(unlink(path("gone.txt").c_str()), 0);
        // Opens, but the first read fails with an I/O error (for any user,
        // root included): the start of the tool's own address space is never mapped.
        ASSERT_EQ(symlink("/proc/self/mem", path("unreadable").c_str()), 0);
        for (const char* dir : {"sub", "folder"})
            ASSERT_EQ(mkdir(path(dir).c_str(), 0755), 0);
        for (const auto& [key, value] : c.keys) {
            if (key.rfind("file ", 0) == 0)
                write(key.substr(5), value);
            if (key.rfind("other ", 0) == 0)
                write(key.substr(6),
                      flatfield::kqraw2FileBytes(flatfield::makeFlatField(shapeOf(value))));
        }
    }

    // The run's arguments: "+ ..." appends to the usual calibration.
    static std::vector<std::string> argumentsOf(const std::string& text) {
        std::vector<std::string> args = words(text);
        if (!args.empty() && args[0] == "+")
            args.front() = "--config lsc.cfg --input flat.kqraw --calibrate cal.txt";
        std::vector<std::string> split;
        for (const std::string& arg : args)
            for (const std::string& word : words(arg))
                split.push_back(word);
        return split;
    }

    // A golden file named *.md5 holds the MD5 of the output (a KQRAW2 file's
    // wall-clock creation time blanked).
    void expectGoldenFile(std::string actual, const std::string& name) const {
        if (name.size() > 4 && name.compare(name.size() - 4, 4, ".md5") == 0)
            actual = outputDigest(actual) + "\n";
        if (const char* update = std::getenv("LSC_GOLDEN_UPDATE");
            update && std::string(update) == "1")
            writeFile(kGoldenDir + name, actual);
        else
            expectGolden(actual, name);
    }

    void checkJson(const Case& c) const {
        std::string command =
            "python3 " +
            shellQuoted(std::string(LSC_SOURCE_DIR) + "/tests/result/check_result.py") + " " +
            shellQuoted(path("result.json"));
        for (const std::string& expectation : c.all("json"))
            command += " " + shellQuoted(expectation);
        const int status =
            std::system((command + " > " + shellQuoted(path("findings.txt")) + " 2>&1").c_str());
        EXPECT_EQ(status, 0) << read("findings.txt");
    }
};

TEST_P(Cases, Run) {
    const Case& c = GetParam();
    // A misspelt key would silently drop its check.
    static const std::regex known("shape|capture|paint|cfg|(file|other|golden|cut) .+|before|run|"
                                  "stdin|limit|status|out|err|tail|has|contains|lacks|exists|"
                                  "absent|same|created|json|then");
    for (const auto& entry : c.keys)
        ASSERT_TRUE(std::regex_match(entry.first, known)) << "unknown key " << entry.first;
    prepareDirectory(c);
    if (HasFatalFailure())
        return;
    for (const std::string& before : c.all("before")) {
        const auto result = run(argumentsOf(before));
        ASSERT_EQ(result.status, 0) << before << "\n" << result.out;
    }
    const auto namesBefore = listing(dir_.path());
    std::vector<std::pair<std::string, std::string>> kept;
    for (const std::string& name : words(c.get("same")))
        kept.emplace_back(name, read(name));

    const auto result = testing_support::runTool(argumentsOf(c.get("run", "+")), dir_.path(),
                                                 c.get("stdin"), std::stol(c.get("limit", "0")));
    const std::string trace = "stdout:\n" + result.out + "stderr:\n" + result.err;
    EXPECT_EQ(result.status, std::stoi(c.get("status", "0"))) << trace;
    if (c.has("out")) {
        EXPECT_EQ(result.out, c.get("out"));
    }
    if (c.has("err")) {
        EXPECT_EQ(result.err, c.get("err"));
    }
    const auto text = lines(result.out);
    const auto tail = c.all("tail");
    if (!tail.empty()) {
        EXPECT_EQ(
            std::vector<std::string>(
                text.end() - static_cast<long>(std::min(tail.size(), text.size())), text.end()),
            tail)
            << trace;
    }
    for (const std::string& line : c.all("has"))
        EXPECT_TRUE(hasLine(result.out, line)) << line << "\n" << trace;
    for (const std::string& part : c.all("contains"))
        EXPECT_NE(result.out.find(part), std::string::npos) << part << "\n" << trace;
    for (const std::string& part : c.all("lacks"))
        EXPECT_EQ(result.out.find(part), std::string::npos) << part << "\n" << trace;
    for (const std::string& name : words(c.get("exists")))
        EXPECT_TRUE(exists(name)) << name;
    for (const std::string& name : words(c.get("absent")))
        EXPECT_FALSE(exists(name)) << name;
    for (const auto& [name, bytes] : kept)
        EXPECT_EQ(read(name), bytes) << name;
    if (c.has("created")) {
        std::vector<std::string> expected = namesBefore;
        for (const std::string& name : words(c.get("created")))
            expected.push_back(name);
        std::sort(expected.begin(), expected.end());
        EXPECT_EQ(listing(dir_.path()), expected);
    }
    EXPECT_TRUE(listing(path("folder")).empty());
    for (const auto& [key, value] : c.keys) {
        if (key == "golden stdout")
            expectGoldenFile(withoutTimes(result.out), value);
        else if (key.rfind("golden ", 0) == 0)
            expectGoldenFile(read(key.substr(7)), value);
    }
    if (c.has("json"))
        checkJson(c);
    // A part of standard output ("NAME: first|end") kept as a file for the next run.
    for (const auto& [key, value] : c.keys)
        if (key.rfind("cut ", 0) == 0) {
            const auto bar = value.find('|');
            const auto begin = result.out.find(value.substr(0, bar));
            const auto end = result.out.find(value.substr(bar + 1));
            ASSERT_LT(begin, end) << value;
            write(key.substr(4), result.out.substr(begin, end - begin));
        }
    for (const std::string& then : c.all("then")) {
        const auto next = run(argumentsOf(then));
        EXPECT_EQ(next.status, 0) << then << "\n" << next.out;
    }
}

INSTANTIATE_TEST_SUITE_P(Table, Cases, ::testing::ValuesIn(loadCases()),
                         [](const ::testing::TestParamInfo<Case>& test) {
                             std::string name = test.param.name;
                             for (char& ch : name)
                                 if (!std::isalnum(static_cast<unsigned char>(ch)))
                                     ch = '_';
                             return name;
                         });

} // namespace
} // namespace e2e
