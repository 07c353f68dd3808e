// Production faults, run through the tool as a station would meet them: full
// devices and full disks, directories and vanished or unreadable files where
// files are expected, outputs in missing directories, standard output as an
// output file and outputs that replace the input. A failed write never passes
// for success, never leaves a half-written or temporary file, and never
// spoils an output that an earlier stage finished.

#include <algorithm>
#include <cerrno>
#include <csignal>

#include "tests/e2e/e2e_fixture.h"

#include <dirent.h>
#include <fcntl.h>
#include <poll.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

namespace e2e {
namespace {

constexpr char kPrevious[] = "previous contents\n";

// Replaces every "%" in `pattern` by `path`.
std::string fill(const std::string& pattern, const std::string& path) {
    std::string text;
    for (char c : pattern)
        text += c == '%' ? path : std::string(1, c);
    return text;
}

std::vector<std::string> fill(const std::vector<std::string>& patterns, const std::string& path) {
    std::vector<std::string> filled;
    for (const std::string& pattern : patterns)
        filled.push_back(fill(pattern, path));
    return filled;
}

// The names in a directory, sorted, without "." and "..".
std::vector<std::string> listDirectory(const std::string& path) {
    std::vector<std::string> names;
    if (DIR* dir = opendir(path.c_str())) {
        while (const dirent* entry = readdir(dir)) {
            const std::string name = entry->d_name;
            if (name != "." && name != "..")
                names.push_back(name);
        }
        closedir(dir);
    }
    std::sort(names.begin(), names.end());
    return names;
}

bool isDirectory(const std::string& path) {
    struct stat info;
    return stat(path.c_str(), &info) == 0 && S_ISDIR(info.st_mode);
}

// Runs the tool in `dir` with no file allowed to grow beyond `maxFileBytes`,
// as on a disk that is nearly full: a write past the limit fails with EFBIG.
// Standard output and error are pipes, which the limit does not touch.
ToolResult runOnFullDisk(const std::vector<std::string>& args, const std::string& dir,
                         rlim_t maxFileBytes) {
    int out[2], err[2];
    if (pipe(out) != 0 || pipe(err) != 0)
        return {};
    // Through the emulator in a cross build, like every other run.
    std::vector<std::string> words = testing_support::toolCommand(args);
    std::vector<char*> argv = testing_support::argumentVector(words);

    const pid_t pid = fork();
    if (pid == 0) {
        const int none = open("/dev/null", O_RDONLY);
        dup2(none, 0);
        dup2(out[1], 1);
        dup2(err[1], 2);
        for (int fd : {none, out[0], out[1], err[0], err[1]})
            close(fd);
        // Without this the first write past the limit would kill the tool.
        std::signal(SIGXFSZ, SIG_IGN);
        const rlimit limit = {maxFileBytes, maxFileBytes};
        if (setrlimit(RLIMIT_FSIZE, &limit) != 0 || chdir(dir.c_str()) != 0)
            _exit(127);
        execvp(argv[0], argv.data());
        _exit(127);
    }
    close(out[1]);
    close(err[1]);
    // Both pipes are read as they fill, so a chatty run cannot block on one.
    ToolResult result;
    pollfd fds[2] = {{out[0], POLLIN, 0}, {err[0], POLLIN, 0}};
    std::string* texts[2] = {&result.out, &result.err};
    int open = 2;
    while (open > 0) {
        if (poll(fds, 2, -1) < 0 && errno != EINTR)
            break;
        for (int i = 0; i < 2; ++i) {
            if (fds[i].fd < 0 || fds[i].revents == 0)
                continue;
            char chunk[4096];
            const ssize_t n = read(fds[i].fd, chunk, sizeof chunk);
            if (n > 0) {
                texts[i]->append(chunk, static_cast<std::size_t>(n));
            } else {
                close(fds[i].fd);
                fds[i].fd = -1;
                --open;
            }
        }
    }
    int status = 0;
    waitpid(pid, &status, 0);
    if (WIFEXITED(status))
        result.status = WEXITSTATUS(status);
    return result;
}

// --- Every output option --------------------------------------------------------

// One output option: the arguments that make the tool write it to "%" (beside
// the configuration and the input), and the error lines for a file that
// cannot be created and for one that cannot be written. "CAL" is the
// register file, which most runs need but which is not under test.
struct OutputCase {
    const char* name;
    std::vector<std::string> args;
    const char* openError;
    const char* writeError;
};

void PrintTo(const OutputCase& output, std::ostream* out) {
    *out << "--" << output.name;
}

const char kCalibrationError[] =
    "ERROR: Unable to open output calibration file, possible invalid output path or output "
    "filename specified.";

// An output written after the register file, with one message for a file
// that cannot be created and one that cannot be written.
OutputCase afterCalibration(const char* option, const char* openError,
                            const char* writeError = nullptr) {
    return {option,
            {"--input", "flat.kqraw", "--calibrate", "CAL", std::string("--") + option, "%"},
            openError,
            writeError ? writeError : openError};
}

const OutputCase kOutputs[] = {
    {"calibrate",
     {"--input", "flat.kqraw", "--calibrate", "%"},
     kCalibrationError,
     kCalibrationError},
    {"binary",
     {"--input", "flat.kqraw", "--calibrate", "cal.txt", "--binary", "%"},
     "ERROR: Cannot store binary calibration file.",
     "ERROR: Cannot store binary calibration file."},
    afterCalibration("flat", "ERROR: Cannot store kqraw image."),
    afterCalibration("jpeg", "ERROR: Cannot store jpeg image."),
    afterCalibration("bmp", "ERROR: Cannot store BMP image."),
    afterCalibration("inputasjpeg", "ERROR: Cannot store jpeg image."),
    afterCalibration("inputasbmp", "ERROR: Cannot store BMP image."),
    {"translate",
     {"--input", "flat.raw", "--raw", "flat.txt", "--calibrate", "CAL", "--translate", "%"},
     "ERROR: Cannot store kqraw image.",
     "ERROR: Cannot store kqraw image."},
    afterCalibration("preproc", "ERROR: Cannot store kqraw image."),
    afterCalibration("outsamples", "ERROR: Cannot open sample output file: %",
                     "ERROR: Cannot write sample output file: %"),
    afterCalibration("delta", "ERROR: Cannot open file : %", "ERROR: Cannot write file : %"),
    afterCalibration("stats", "ERROR: Cannot open file : %", "ERROR: Cannot write file : %"),
};

class OutputFaults : public ToolRun, public ::testing::WithParamInterface<OutputCase> {
protected:
    void SetUp() override {
        prepare();
        write("flat.raw", testing_support::headerlessFileBytes(field_));
        write("flat.txt", testing_support::headerlessDetailsText(field_));
    }

    // --kq --config lsc.cfg and the case's arguments, writing to `target`,
    // with the register file (where it is not the output under test) at
    // `calibration`.
    std::vector<std::string> arguments(const std::string& target,
                                       const std::string& calibration = "cal.txt") const {
        std::vector<std::string> args = {"--kq", "--config", "lsc.cfg"};
        for (const std::string& arg : fill(GetParam().args, target))
            args.push_back(arg == "CAL" ? calibration : arg);
        return args;
    }

    // The run failed with `error` as its last line and never claimed success.
    static void expectFailure(const ToolResult& result, const std::string& error) {
        EXPECT_EQ(result.status, 1) << result.out << result.err;
        EXPECT_FALSE(hasLine(result.out, "Completed.")) << result.out;
        const auto text = lines(result.out);
        ASSERT_FALSE(text.empty());
        EXPECT_EQ(text.back(), error);
    }

    // The working directory holds what the test put there and `produced`.
    void expectOnly(std::vector<std::string> produced) const {
        std::vector<std::string> expected = {"flat.kqraw", "flat.raw", "flat.txt", "lsc.cfg"};
        expected.insert(expected.end(), produced.begin(), produced.end());
        std::sort(expected.begin(), expected.end());
        EXPECT_EQ(listDirectory(dir_.path()), expected);
    }
};

TEST_P(OutputFaults, FullDeviceEndsWithTheWriteError) {
    const auto result = run(arguments("/dev/full"));
    expectFailure(result, fill(GetParam().writeError, "/dev/full"));
}

// Every output but the binary data, which are built from a register file on
// disk and so cannot be the only file a run writes.
std::vector<OutputCase> outputsAloneOnDisk() {
    std::vector<OutputCase> cases;
    for (const OutputCase& output : kOutputs)
        if (std::string(output.name) != "binary")
            cases.push_back(output);
    return cases;
}

using DiskOutputFaults = OutputFaults;

TEST_P(DiskOutputFaults, FullDiskKeepsThePreviousFileAndLeavesNoTemporary) {
    write("out", kPrevious);
    // Sixteen bytes is less than any output holds; the register file, where
    // it is not under test, goes to a device the limit does not apply to.
    const auto result = runOnFullDisk(arguments("out", "/dev/null"), dir_.path(), 16);
    expectFailure(result, fill(GetParam().writeError, "out"));
    EXPECT_EQ(read("out"), kPrevious);
    expectOnly({"out"});
}

TEST_P(OutputFaults, DirectoryAsOutputIsRefusedAndLeftAlone) {
    ASSERT_EQ(mkdir(path("outdir").c_str(), 0755), 0);
    const auto result = run(arguments("outdir"));
    expectFailure(result, fill(GetParam().openError, "outdir"));
    EXPECT_TRUE(isDirectory(path("outdir")));
    EXPECT_TRUE(listDirectory(path("outdir")).empty());
}

TEST_P(OutputFaults, OutputInAMissingDirectoryIsRefused) {
    const auto result = run(arguments("missing/out"));
    expectFailure(result, fill(GetParam().openError, "missing/out"));
    EXPECT_FALSE(exists("missing"));
}

INSTANTIATE_TEST_SUITE_P(EveryOutput, OutputFaults, ::testing::ValuesIn(kOutputs),
                         [](const auto& test) { return std::string(test.param.name); });
INSTANTIATE_TEST_SUITE_P(EveryOutput, DiskOutputFaults, ::testing::ValuesIn(outputsAloneOnDisk()),
                         [](const auto& test) { return std::string(test.param.name); });

// --- The information file ---------------------------------------------------------

using InfoFileFaults = ToolRun;

TEST_F(InfoFileFaults, FullDeviceIsReportedOnStandardErrorAtTheEnd) {
    prepare();
    const auto result = calibrate({"--kq", "--log", "/dev/full"});
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(result.err, "ERROR: Unable to write information file.\n");
    EXPECT_EQ(result.out, "");
}

TEST_F(InfoFileFaults, FullDiskIsReportedOnStandardErrorAndKeepsAFailedRunsStatus) {
    prepare();
    auto result = runOnFullDisk({"--kq", "--log", "log.txt", "--config", "lsc.cfg", "--input",
                                 "flat.kqraw", "--calibrate", "/dev/null"},
                                dir_.path(), 16);
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(result.err, "ERROR: Unable to write information file.\n");
    // A run that fails on its own keeps its own status.
    result = runOnFullDisk({"--kq", "--log", "log.txt", "--config", "lsc.cfg", "--input",
                            "flat.kqraw", "--calibrate", "/dev/null", "--raw", "absent.txt"},
                           dir_.path(), 16);
    EXPECT_EQ(result.status, 264 % 256);
    EXPECT_EQ(result.err, "ERROR: Unable to write information file.\n");
}

TEST_F(InfoFileFaults, DirectoryOrMissingDirectoryCannotBeOpened) {
    prepare();
    ASSERT_EQ(mkdir(path("logdir").c_str(), 0755), 0);
    for (const char* name : {"logdir", "missing/log.txt"}) {
        const auto result = calibrate({"--kq", "--log", name});
        EXPECT_EQ(result.status, 240) << name;
        EXPECT_EQ(result.out, "ERROR(240): Unable to output information file.\n"
                              "Likely a file protection issue.\n")
            << name;
        EXPECT_FALSE(exists("cal.txt"));
    }
    EXPECT_TRUE(listDirectory(path("logdir")).empty());
    EXPECT_FALSE(exists("missing"));
}

// --- Files the tool reads ---------------------------------------------------------

// What a file the tool needs can turn out to be.
enum class Fault { kDirectory, kVanished, kUnreadable, kEndless };

std::string faultName(Fault fault) {
    switch (fault) {
    case Fault::kDirectory:
        return "Directory";
    case Fault::kVanished:
        return "Vanished";
    case Fault::kUnreadable:
        return "Unreadable";
    case Fault::kEndless:
        return "Endless";
    }
    return "";
}

// One input option: the arguments naming the faulty file "%", the last lines
// and the status of the run for each kind of fault.
struct InputCase {
    const char* name;
    std::vector<std::string> args;
    std::vector<std::string> directory;  // a directory
    std::vector<std::string> missing;    // a vanished file
    std::vector<std::string> unreadable; // a read error
    std::vector<std::string> endless;    // a device that never ends
    int status;
};

void PrintTo(const InputCase& input, std::ostream* out) {
    *out << input.name;
}

void PrintTo(Fault fault, std::ostream* out) {
    *out << faultName(fault);
}

// The detail line under each message names the file (%) and the reason.
const std::vector<std::string> kConfigMissing = {"ERROR: Unable to open configuration file.",
                                                 "  %: No such file or directory"};
const std::vector<std::string> kConfigDirectory = {"ERROR: Unable to open configuration file.",
                                                   "  %: Is a directory"};
const std::vector<std::string> kConfigUnreadable = {"ERROR: Unable to open configuration file.",
                                                    "  %: Input/output error"};
const std::vector<std::string> kConfigEndless = {"ERROR: Configuration file is larger than 64 MiB.",
                                                 "  %"};
const std::vector<std::string> kDetailsUnreadable = {
    "ERROR(264): Unable to read headerless raw image details file.",
    "Likely incorrect file name of headerless raw image details file specified."};
const std::vector<std::string> kKqrawMissing = {"ERROR: Cannot read kqraw image.",
                                                "  %: No such file or directory"};
const std::vector<std::string> kKqrawDirectory = {"ERROR: Cannot read kqraw image.",
                                                  "  %: Is a directory"};
const std::vector<std::string> kKqrawUnreadable = {"ERROR: Cannot read kqraw image.",
                                                   "  %: Input/output error"};
const std::vector<std::string> kKqrawEndless = {
    "ERROR: Cannot read kqraw image.",
    "  %: a device or pipe that gives no KQRAW2 or KQRAW raw image"};

const InputCase kInputs[] = {
    {"config",
     {"--config", "%", "--input", "flat.kqraw", "--calibrate", "cal.txt"},
     kConfigDirectory,
     kConfigMissing,
     kConfigUnreadable,
     kConfigEndless,
     1},
    {"input",
     {"--config", "lsc.cfg", "--input", "%", "--calibrate", "cal.txt"},
     kKqrawDirectory,
     kKqrawMissing,
     kKqrawUnreadable,
     kKqrawEndless,
     1},
    {"raw_input",
     {"--config", "lsc.cfg", "--input", "%", "--raw", "flat.txt", "--calibrate", "cal.txt"},
     {"ERROR(210): Unable to open image file: %",
      "Likely file protection issues or the file doesn't exist."},
     {"ERROR(210): Unable to open image file: %",
      "Likely file protection issues or the file doesn't exist."},
     {"ERROR(202): Unable to read raw scan line.",
      "The number of bytes read in headerless raw file did not match the scan line size. File "
      "likely truncated."},
     {"ERROR(202): Invalid headerless raw file configuration.",
      "The number of pixels in the headerless raw file did not match the image size specified "
      "in the headerless raw configuration file."},
     -1},
    // Exit statuses are eight bits wide: 264 arrives as 8.
    {"details",
     {"--config", "lsc.cfg", "--input", "flat.raw", "--raw", "%", "--calibrate", "cal.txt"},
     kDetailsUnreadable,
     kDetailsUnreadable,
     kDetailsUnreadable,
     kDetailsUnreadable,
     264 % 256},
    {"samples",
     {"--kq", "--config", "lsc.cfg", "--input", "flat.kqraw", "--samples", "%", "--calibrate",
      "cal.txt"},
     {"ERROR: Cannot open input sample file: %"},
     {"ERROR: Cannot open input sample file: %"},
     {"ERROR: Cannot open input sample file: %"},
     {"ERROR: Input sample file is larger than 64 MiB: %"},
     1},
    {"autofocus",
     {"--config", "lsc.cfg", "--input", "flat.kqraw", "--calibrate", "cal.txt", "--binary",
      "cal.bin", "--autofocus", "%"},
     kConfigDirectory,
     kConfigMissing,
     kConfigUnreadable,
     kConfigEndless,
     1},
};

class InputFaults : public ToolRun,
                    public ::testing::WithParamInterface<std::tuple<InputCase, Fault>> {
protected:
    void SetUp() override {
        prepare();
        write("flat.raw", testing_support::headerlessFileBytes(field_));
        write("flat.txt", testing_support::headerlessDetailsText(field_));
    }

    // Creates the faulty file and returns the name to give the tool.
    std::string makeFault(Fault fault) const {
        switch (fault) {
        case Fault::kDirectory:
            EXPECT_EQ(mkdir(path("folder").c_str(), 0755), 0);
            return "folder";
        case Fault::kVanished:
            // The name still points where the file used to be.
            write("gone.txt", "x");
            EXPECT_EQ(symlink("gone.txt", path("vanished").c_str()), 0);
            EXPECT_EQ(unlink(path("gone.txt").c_str()), 0);
            return "vanished";
        case Fault::kUnreadable:
            // Opens, but the first read fails with an I/O error (for any
            // user, root included): the start of the tool's own address
            // space is never mapped.
            EXPECT_EQ(symlink("/proc/self/mem", path("unreadable").c_str()), 0);
            return "unreadable";
        case Fault::kEndless:
            return "/dev/zero";
        }
        return "";
    }
};

TEST_P(InputFaults, EndsWithAClearErrorAndNoSuccess) {
    const auto& [input, fault] = GetParam();
    const std::string name = makeFault(fault);
    const auto result = run(fill(input.args, name));

    const std::vector<std::string>& expected = fault == Fault::kUnreadable  ? input.unreadable
                                               : fault == Fault::kEndless   ? input.endless
                                               : fault == Fault::kDirectory ? input.directory
                                                                            : input.missing;
    const int status = input.status >= 0 ? input.status : std::stoi(expected[0].substr(6, 3));
    EXPECT_EQ(result.status, status) << result.out;
    EXPECT_FALSE(hasLine(result.out, "Completed."));
    const auto text = lines(result.out);
    ASSERT_GE(text.size(), expected.size()) << result.out;
    EXPECT_EQ(std::vector<std::string>(text.end() - static_cast<long>(expected.size()), text.end()),
              fill(expected, name));
}

INSTANTIATE_TEST_SUITE_P(EveryInput, InputFaults,
                         ::testing::Combine(::testing::ValuesIn(kInputs),
                                            ::testing::Values(Fault::kDirectory, Fault::kVanished,
                                                              Fault::kUnreadable, Fault::kEndless)),
                         [](const auto& test) {
                             return std::string(std::get<0>(test.param).name) + "_" +
                                    faultName(std::get<1>(test.param));
                         });

// --- Earlier outputs, standard output, outputs over inputs ------------------------

using OutputPlacement = ToolRun;

// Everything up to the flattened JPEG, with the JPEG going to `jpeg`.
std::vector<std::string> everyOutput(const std::string& jpeg) {
    return {
        "--kq",      "--config",  "lsc.cfg",    "--input",       "flat.kqraw",     "--calibrate",
        "cal.txt",   "--binary",  "cal.bin",    "--inputasjpeg", "input.jpg",      "--inputasbmp",
        "input.bmp", "--preproc", "prep.kqraw", "--outsamples",  "samples.txt",    "--delta",
        "delta.csv", "--stats",   "stats.csv",  "--flat",        "flat-out.kqraw", "--bmp",
        "flat.bmp",  "--jpeg",    jpeg};
}

// A file's bytes without the creation time of its container header block.
std::string withoutCreationTime(std::string bytes) {
    if (bytes.size() >= 68)
        bytes.replace(60, 8, 8, '\0');
    return bytes;
}

// A text without its line `index` (0 first).
std::string withoutLine(const std::string& text, std::size_t index) {
    std::string result;
    const auto all = lines(text);
    for (std::size_t i = 0; i < all.size(); ++i)
        if (i != index)
            result += all[i] + "\n";
    return result;
}

TEST_F(OutputPlacement, LaterFailureLeavesEveryEarlierOutputAsWritten) {
    prepare();
    const auto failed = run(everyOutput("/dev/full"));
    ASSERT_EQ(failed.status, 1) << failed.out;
    EXPECT_EQ(lines(failed.out).back(), "ERROR: Cannot store jpeg image.");

    // The same run into a second directory, ending well.
    testing_support::TempDir reference;
    testing_support::writeFile(reference.file("flat.kqraw"), read("flat.kqraw"));
    testing_support::writeFile(reference.file("lsc.cfg"), read("lsc.cfg"));
    const auto passed = testing_support::runTool(everyOutput("flat.jpg"), reference.path());
    ASSERT_EQ(passed.status, 0) << passed.out;

    // The flattened BMP comes after the JPEG and is never written.
    const std::vector<std::string> outputs = {"cal.bin",        "cal.txt",     "delta.csv",
                                              "flat-out.kqraw", "input.bmp",   "input.jpg",
                                              "prep.kqraw",     "samples.txt", "stats.csv"};
    std::vector<std::string> expected = outputs;
    expected.insert(expected.end(), {"flat.kqraw", "lsc.cfg"});
    std::sort(expected.begin(), expected.end());
    EXPECT_EQ(listDirectory(dir_.path()), expected);
    for (const std::string& name : outputs) {
        std::string written = read(name);
        std::string complete = testing_support::readFile(reference.file(name));
        if (name == "cal.txt") {
            // The register file names the command line, which ends in the JPEG's name.
            written = withoutLine(written, 1);
            complete = withoutLine(complete, 1);
        }
        EXPECT_EQ(withoutCreationTime(written), withoutCreationTime(complete)) << name;
    }
}

TEST_F(OutputPlacement, StandardOutputCarriesTheRegisterFileBetweenTheMessages) {
    prepare();
    const auto toFile = calibrate();
    ASSERT_EQ(toFile.status, 0);
    const auto toStdout =
        run({"--config", "lsc.cfg", "--input", "flat.kqraw", "--calibrate", "/dev/stdout"});
    ASSERT_EQ(toStdout.status, 0) << toStdout.out;

    // Standard output of the first run with the register file put in after
    // its message line; only the command line in the file differs.
    std::vector<std::string> expected;
    for (const std::string& line : lines(toFile.out)) {
        expected.push_back(line);
        if (line == "Generating configuration file.")
            for (const std::string& entry : lines(read("cal.txt")))
                expected.push_back(entry);
    }
    auto actual = lines(toStdout.out);
    ASSERT_EQ(actual.size(), expected.size()) << toStdout.out;
    const auto commandLine = std::find(expected.begin(), expected.end(),
                                       "# Command line: vignetteFit --config lsc.cfg --input "
                                       "flat.kqraw --calibrate cal.txt ");
    ASSERT_NE(commandLine, expected.end());
    *commandLine = "# Command line: vignetteFit --config lsc.cfg --input flat.kqraw --calibrate "
                   "/dev/stdout ";
    EXPECT_EQ(actual, expected);
}

TEST_F(OutputPlacement, StandardOutputAsInformationFileKeepsEveryLine) {
    prepare();
    const auto plain = calibrate({"--kq", "--debug"});
    const auto logged = calibrate({"--kq", "--debug", "--log", "/dev/stdout"});
    ASSERT_EQ(logged.status, 0) << logged.out;
    const auto expected = lines(plain.out);
    const auto actual = lines(logged.out);
    ASSERT_EQ(actual.size(), expected.size()) << logged.out;
    // Timer and clock lines differ from run to run; the rest is the same.
    for (std::size_t i = 0; i < actual.size(); ++i) {
        const bool varies = actual[i].find(" sec") != std::string::npos ||
                            actual[i].rfind("Start: ", 0) == 0 ||
                            actual[i].rfind("Execution time:", 0) == 0;
        if (!varies) {
            EXPECT_EQ(actual[i], expected[i]) << "line " << i;
        }
    }
    EXPECT_EQ(actual.back(), "Completed.");
}

} // namespace
} // namespace e2e
