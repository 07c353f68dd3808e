// Nothing lost, nothing crossed: a run never destroys an input or another
// output, never takes calibration data from anything but what it wrote itself,
// leaves no temporary file when it is interrupted, and refuses values it
// would otherwise change or drop without a word.

#include <algorithm>
#include <csignal>

#include "tests/e2e/e2e_fixture.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/inotify.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

namespace e2e {
namespace {

const char kFullDetails[] = "image.width = 65535\nimage.height = 65535\n";

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

// Starts the tool in `dir` with standard output and error going to
// /dev/null; returns its process id.
pid_t startTool(const std::vector<std::string>& args, const std::string& dir) {
    std::vector<std::string> words = testing_support::toolCommand(args);
    std::vector<char*> argv = testing_support::argumentVector(words);
    const pid_t pid = fork();
    if (pid == 0) {
        const int none = open("/dev/null", O_RDWR);
        for (int fd : {0, 1, 2})
            dup2(none, fd);
        if (chdir(dir.c_str()) != 0)
            _exit(127);
        execvp(argv[0], argv.data());
        _exit(127);
    }
    return pid;
}

// The exit status of a started tool; -1 when it did not exit normally.
int exitStatus(pid_t pid) {
    int status = 0;
    waitpid(pid, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

class Integrity : public ToolRun {
protected:
    void SetUp() override {
        prepare();
        write("flat.raw", testing_support::headerlessFileBytes(field_));
        write("flat.txt", testing_support::headerlessDetailsText(field_));
    }
    // The last line a run printed.
    static std::string lastLine(const ToolResult& result) {
        const auto all = lines(result.out);
        return all.empty() ? std::string() : all.back();
    }
};

// --- Binary data from the register text this run wrote --------------------------

TEST_F(Integrity, BinaryDataDoNotDependOnWhereTheRegisterFileWent) {
    ASSERT_EQ(calibrate({"--binary", "cal.bin"}).status, 0);
    const std::string expected = read("cal.bin");
    for (const char* registerFile : {"/dev/null", "/dev/stdout"}) {
        const auto result = run({"--config", "lsc.cfg", "--input", "flat.kqraw", "--calibrate",
                                 registerFile, "--binary", "other.bin"});
        ASSERT_EQ(result.status, 0) << registerFile << result.out;
        EXPECT_EQ(read("other.bin"), expected) << registerFile;
    }
    // Standard output as the binary file: nothing is read back through it.
    const auto piped = calibrate({"--binary", "/dev/stdout"});
    EXPECT_EQ(piped.status, 0);
    EXPECT_NE(piped.out.find(expected), std::string::npos);
}

// A register file in a FIFO is written into the pipe; another module's
// register text offered in the same pipe afterwards must not reach the blob.
TEST_F(Integrity, AnotherRunsRegisterFileNeverReachesTheBinaryData) {
    ASSERT_EQ(calibrate({"--binary", "cal.bin"}).status, 0);
    const std::string expected = read("cal.bin");
    const std::string foreign = read("cal.txt") + "reference.serial_no = 0badc0de;\n";
    ASSERT_EQ(mkfifo(path("cal.fifo").c_str(), 0600), 0);
    const pid_t tool = startTool({"--config", "lsc.cfg", "--input", "flat.kqraw", "--calibrate",
                                  "cal.fifo", "--binary", "fifo.bin"},
                                 dir_.path());
    const int reader = open(path("cal.fifo").c_str(), O_RDONLY);
    ASSERT_GE(reader, 0);
    char chunk[4096];
    while (::read(reader, chunk, sizeof chunk) > 0) {
    }
    close(reader);
    // Until the tool ends, offer the foreign text to any reader of the FIFO.
    int status = -1;
    for (;;) {
        int raw = 0;
        if (waitpid(tool, &raw, WNOHANG) == tool) {
            status = WIFEXITED(raw) ? WEXITSTATUS(raw) : -1;
            break;
        }
        const int writer = open(path("cal.fifo").c_str(), O_WRONLY | O_NONBLOCK);
        if (writer >= 0) {
            EXPECT_GT(::write(writer, foreign.data(), foreign.size()), 0);
            close(writer);
        }
        usleep(1000);
    }
    EXPECT_EQ(status, 0);
    EXPECT_EQ(read("fifo.bin"), expected);
}

// --- No output over an input or another output ------------------------------------

struct Overlap {
    std::vector<std::string> args; // after --kq --config lsc.cfg
    const char* message;           // without "ERROR: "
};

void PrintTo(const Overlap& overlap, std::ostream* out) {
    *out << overlap.message;
}

const Overlap kOverlaps[] = {
    {{"-i", "flat.kqraw", "-l", "flat.kqraw"},
     "Output --calibrate names the same file as input --input: flat.kqraw"},
    {{"-i", "flat.kqraw", "-l", "cal.txt", "--flat", "lsc.cfg"},
     "Output --flat names the same file as input --config: lsc.cfg"},
    {{"-i", "flat.kqraw", "-l", "cal.txt", "--log", "flat.kqraw"},
     "Output --log names the same file as input --input: flat.kqraw"},
    {{"-i", "flat.kqraw", "-l", "cal.txt", "--report", "lsc.cfg"},
     "Output --report names the same file as input --config: lsc.cfg"},
    {{"-i", "flat.raw", "-r", "flat.txt", "-l", "cal.txt", "--translate", "flat.txt"},
     "Output --translate names the same file as input --raw: flat.txt"},
    {{"-i", "flat.kqraw", "-s", "flat.txt", "-l", "cal.txt", "--preproc", "flat.txt"},
     "Output --preproc names the same file as input --samples: flat.txt"},
    {{"-i", "flat.kqraw", "-l", "cal.txt", "-b", "cal.bin", "-a", "flat.txt", "--delta",
      "flat.txt"},
     "Output --delta names the same file as input --autofocus: flat.txt"},
    {{"-i", "flat.kqraw", "-l", "new.txt", "-b", "new.txt"},
     "Output --binary names the same file as output --calibrate: new.txt"},
    {{"-i", "flat.kqraw", "-l", "new.txt", "-j", "./new.txt"},
     "Output --jpeg names the same file as output --calibrate: ./new.txt (new.txt)"},
    {{"-i", "flat.kqraw", "-l", "new.txt", "--log", "new.txt"},
     "Output --log names the same file as output --calibrate: new.txt"},
    {{"-i", "flat.kqraw", "-l", "cal.txt", "-f", "soft.kqraw"},
     "Output --flat names the same file as input --input: soft.kqraw (flat.kqraw)"},
    {{"-i", "flat.kqraw", "-l", "cal.txt", "-m", "hard.kqraw"},
     "Output --bmp names the same file as input --input: hard.kqraw (flat.kqraw)"},
    {{"-i", "flat.kqraw", "-l", "cal.txt", "-o", "out.txt", "-t", "sub/../out.txt"},
     "Output --stats names the same file as output --outsamples: sub/../out.txt (out.txt)"},
};

class OutputOverlaps : public Integrity, public ::testing::WithParamInterface<Overlap> {};

TEST_P(OutputOverlaps, AreRefusedBeforeAnyWork) {
    ASSERT_EQ(symlink("flat.kqraw", path("soft.kqraw").c_str()), 0);
    ASSERT_EQ(link(path("flat.kqraw").c_str(), path("hard.kqraw").c_str()), 0);
    ASSERT_EQ(mkdir(path("sub").c_str(), 0755), 0);
    const auto before = listDirectory(dir_.path());
    const std::string capture = read("flat.kqraw");
    const std::string config = read("lsc.cfg");

    std::vector<std::string> args = {"--kq", "--config", "lsc.cfg"};
    args.insert(args.end(), GetParam().args.begin(), GetParam().args.end());
    const auto result = run(args);
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(result.out, "ERROR: " + std::string(GetParam().message) + "\n");
    EXPECT_EQ(listDirectory(dir_.path()), before);
    EXPECT_EQ(read("flat.kqraw"), capture);
    EXPECT_EQ(read("lsc.cfg"), config);
}

INSTANTIATE_TEST_SUITE_P(Table, OutputOverlaps, ::testing::ValuesIn(kOverlaps));

TEST_F(Integrity, DevicesMayBeSharedByOutputs) {
    const auto result =
        run({"--kq", "--config", "lsc.cfg", "--input", "flat.kqraw", "--calibrate", "/dev/null",
             "--binary", "/dev/null", "--flat", "/dev/null", "--log", "/dev/null"});
    EXPECT_EQ(result.status, 0);
}

// --- Interrupted runs --------------------------------------------------------------

// A signal that arrives while a large output is being written (seen by the
// creation of its temporary) ends the run with 128 + signal, removes the
// temporary and keeps the previous file.
TEST_F(Integrity, SignalsDuringAWriteLeaveNothingBehind) {
    FlatFieldShape large = smallShape();
    large.width = 4000;
    large.height = 3000;
    prepare("", large);
    for (int signal : {SIGINT, SIGTERM, SIGHUP}) {
        write("out.bmp", "previous contents\n");
        const int watch = inotify_init1(IN_CLOEXEC);
        ASSERT_GE(watch, 0);
        ASSERT_GE(inotify_add_watch(watch, dir_.path().c_str(), IN_CREATE), 0);
        const pid_t tool = startTool({"--config", "lsc.cfg", "--input", "flat.kqraw", "--calibrate",
                                      "cal.txt", "--inputasbmp", "out.bmp"},
                                     dir_.path());
        bool seen = false;
        alignas(inotify_event) char events[4096];
        while (!seen) {
            const ssize_t n = ::read(watch, events, sizeof events);
            ASSERT_GT(n, 0);
            for (ssize_t at = 0; at < n;) {
                const auto* event = reinterpret_cast<const inotify_event*>(events + at);
                seen = seen ||
                       (event->len > 0 && std::string(event->name).rfind(".out.bmp.tmp-", 0) == 0);
                at += static_cast<ssize_t>(sizeof(inotify_event) + event->len);
            }
        }
        kill(tool, signal);
        EXPECT_EQ(exitStatus(tool), 128 + signal) << signal;
        close(watch);
        EXPECT_EQ(read("out.bmp"), "previous contents\n") << signal;
        for (const std::string& name : listDirectory(dir_.path()))
            EXPECT_EQ(name.find(".tmp-"), std::string::npos) << name;
    }
}

// --- Inputs that would take unbounded memory -------------------------------------

TEST_F(Integrity, ImagesBeyondTheSampleMemoryLimitAreRefusedBeforeAllocating) {
    const std::string tooLarge =
        "ERROR: Image too large: its samples would take more than 1 GiB of memory (at most "
        "268435456 samples, for example 16384 x 16384 pixels).";
    write("full.txt", kFullDetails);
    auto result = run({"--config", "lsc.cfg", "--input", "/dev/zero", "--raw", "full.txt",
                       "--calibrate", "cal.txt"});
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(lastLine(result), tooLarge);

    // A container whose pixel block claims 2^31 samples, in a sparse file
    // long enough to hold them.
    testing_support::KqRawBuilder container;
    container.header(65535, 32769, 0x52474742)
        .block("PIXELDATA_111107", std::string(8, '\0'), 0xFFFFFFF8u);
    write("huge.kqraw", container.bytes());
    // Summed as off_t: a 32-bit size_t would wrap.
    ASSERT_EQ(truncate(path("huge.kqraw").c_str(),
                       static_cast<off_t>(container.bytes().size()) + off_t{0xFFFFFFF8u}),
              0);
    result = run({"--config", "lsc.cfg", "--input", "huge.kqraw", "--calibrate", "cal.txt"});
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(lastLine(result), tooLarge);
}

// --- Values refused instead of changed --------------------------------------------

struct Refusal {
    const char* name;
    const char* config;            // lsc.cfg
    const char* autofocus;         // af.txt, when not null
    std::vector<std::string> args; // after --config lsc.cfg
    const char* lastLine;          // what the run ends with
    int status;
};

void PrintTo(const Refusal& refusal, std::ostream* out) {
    *out << refusal.name;
}

const std::vector<std::string> kBinary = {"-i", "flat.kqraw", "-l", "cal.txt", "-b", "cal.bin"};
const std::vector<std::string> kWithAutofocus = {"-i", "flat.kqraw", "-l", "cal.txt",
                                                 "-b", "cal.bin",    "-a", "af.txt"};
const std::vector<std::string> kRaw = {"-i", "flat.raw", "-r", "flat.txt", "-l", "cal.txt"};
const char kAfSet[] = "module.af.set[0].macro = 1; module.af.set[0].hyper = 2;\n"
                      "module.af.set[0].inf = 3; module.af.set[0].settle_time = 4;\n"
                      "module.af.set[0].hysteresis = 5;\n";
const char kDateError[] =
    "ERROR: Invalid value for shared.cfg_file_date attribute (must be YYYY-MM-DDTHH:MM).";

const Refusal kRefusals[] = {
    {"Month13", "shared.cfg_file_date = 2012-13-01T00:00;", nullptr, kBinary, kDateError, 1},
    {"February30", "shared.cfg_file_date = 2012-02-30T10:00;", nullptr, kBinary, kDateError, 1},
    {"Hour24", "shared.cfg_file_date = 2012-05-01T24:00;", nullptr, kBinary, kDateError, 1},
    {"ThreeDeltaAbBlocks", "apply_lsc.delta_ab_blocks = {4, 3, 2};", nullptr, kBinary,
     "ERROR: apply_lsc.delta_ab_blocks must hold two values: the block columns and rows.", 1},
    {"LongPosture", "", "module.af.set[0].posture = HV;", kWithAutofocus,
     "ERROR: Value for module.af.set[0].posture must be a single posture character.", 1},
    {"PairOfThree", "",
     "module.af.set[0].posture = H; module.af.set[0].FDN_dist_pair[0] = {1, 2, 3};", kWithAutofocus,
     "ERROR: Value for module.af.set[0].FDN_dist_pair[0] must hold two values, a pair of focus "
     "distances.",
     1},
    {"AutofocusControlPoint", "", "reference.controlPointB[5][5] = 1.2;", kWithAutofocus,
     "ERROR: The autofocus file may only add autofocus data (module.*); it sets "
     "reference.controlPointB[5][5], which would change the calibration data.",
     1},
    {"AutofocusLightSource", "", "global.configType = 1;\nshared.light_source = 5;", kWithAutofocus,
     "ERROR: The autofocus file may only add autofocus data (module.*); it sets "
     "shared.light_source, which would change the calibration data.",
     1},
    {"AutofocusSerial", "", "reference.serial_no = 0102;", kWithAutofocus,
     "ERROR: The autofocus file may only add autofocus data (module.*); it sets "
     "reference.serial_no, which would change the calibration data.",
     1},
    {"AutofocusWithoutBinary",
     "",
     "module.af.set[0].posture = H;",
     {"-i", "flat.kqraw", "-l", "cal.txt", "-a", "af.txt"},
     "ERROR: Autofocus calibration data (--autofocus) can only be included in binary "
     "calibration data (--binary).",
     1},
    {"LegacyFormatTwo", "raw.legacy_format = 2;", nullptr, kRaw,
     "ERROR: Value specified for raw.legacy_format is too high, value must be between 0 and 1.", 1},
    {"GuidNotHexWithLegacyFormat",
     "raw.legacy_format = 1;",
     nullptr,
     {"-i", "flat.raw", "-r", "guid.txt", "-l", "cal.txt"},
     "ERROR: Invalid image.sensor_guid value 'IMX219' in headerless raw details file (with "
     "raw.legacy_format = 1 it must be 1 to 16 hexadecimal digits).",
     1},
    {"SharedGuidNotHexForAFixedHeader",
     "shared.sensor_guid = zz;",
     nullptr,
     {"-i", "fixed.kqraw", "-l", "cal.txt"},
     "ERROR: Invalid shared.sensor_guid value 'zz' (a fixed-header raw image stores it as 1 to 16 "
     "hexadecimal digits).",
     1},
    {"UnknownBayerCode",
     "",
     nullptr,
     {"-i", "odd.kqraw", "-l", "cal.txt"},
     "ERROR: Unknown Bayer order in the input image: its Bayer code is none of RGGB, GRBG, GBRG "
     "and BGGR.",
     1},
    {"BlockNameTooLong", "", nullptr, kBinary,
     "ERROR: Value for shared.block_name may be at most 987 characters long.", 1},
    // Accepted now, each refused or failing before.
    {"DashInBlockName", "shared.block_name = cam-A;", nullptr, kBinary, "Completed.", 0},
    {"LongestBlockName", "", nullptr, kBinary, "Completed.", 0},
    {"LegacyFormatWordWithoutRaw",
     "raw.legacy_format = yes;",
     nullptr,
     {"-i", "flat.kqraw", "-l", "cal.txt"},
     "Completed.",
     0},
    {"GuidModelNameInAContainer",
     "",
     nullptr,
     {"-i", "flat.raw", "-r", "guid.txt", "-l", "cal.txt"},
     "Completed.",
     0},
    {"SharedGuidNameInAContainer",
     "shared.sensor_guid = IMX219;",
     nullptr,
     {"-i", "flat.kqraw", "-l", "cal.txt"},
     "Completed.",
     0},
    {"AutofocusRepeatingTheRegisterFile", "",
     "global.configType = 1;\nmodule.af.set[0].posture = H;", kWithAutofocus, "Completed.", 0},
};

class Refusals : public Integrity, public ::testing::WithParamInterface<Refusal> {};

TEST_P(Refusals, EndAsTheTableSays) {
    const Refusal& refusal = GetParam();
    std::string config = refusal.config;
    const std::string name = refusal.name;
    const std::string longest(987, 'b');
    if (name == "BlockNameTooLong")
        config = "shared.block_name = " + longest + "c;";
    if (name == "LongestBlockName")
        config = "shared.block_name = " + longest +
                 ";\nshared.block_num_flag = 1;\n"
                 "shared.block_num = 255;";
    write("lsc.cfg", config);
    if (refusal.autofocus)
        write("af.txt", refusal.autofocus + std::string("\n") + kAfSet);
    write("guid.txt",
          testing_support::headerlessDetailsText(field_) + "image.sensor_guid = IMX219\n");
    write("fixed.kqraw", testing_support::fixedHeaderFileBytes(field_));
    testing_support::KqRawBuilder odd;
    odd.header(640, 480, 0x12345678).pixels(field_.samples);
    write("odd.kqraw", odd.bytes());

    std::vector<std::string> args = {"--config", "lsc.cfg"};
    args.insert(args.end(), refusal.args.begin(), refusal.args.end());
    const auto result = run(args);
    EXPECT_EQ(result.status, refusal.status) << result.out;
    EXPECT_EQ(lastLine(result), refusal.lastLine);
    if (refusal.status != 0) {
        EXPECT_FALSE(exists("cal.bin"));
    }
}

INSTANTIATE_TEST_SUITE_P(Table, Refusals, ::testing::ValuesIn(kRefusals),
                         [](const auto& test) { return std::string(test.param.name); });

TEST_F(Integrity, FocusDistancesOf2To31AndAboveKeepTheirValue) {
    write("af.txt", std::string("module.af.set[0].posture = H;\n") + kAfSet +
                        "module.af.set[0].FDN_dist_pair[0] = {3000000001, 4294967295};\n");
    write("lsc.cfg", "blob.log_flag = 1;");
    const auto result = run({"--config", "lsc.cfg", "-i", "flat.kqraw", "-l", "cal.txt", "-b",
                             "cal.bin", "-a", "af.txt"});
    ASSERT_EQ(result.status, 0) << result.out;
    EXPECT_TRUE(
        hasLine(result.out, "module.af.set[0].FDN_dist_pair[0] = { 3000000001, 4294967295 };"));
}

TEST_F(Integrity, ConsoleDescribedCaptureIsNotStoredAsABareDump) {
    const auto result = run({"--config", "lsc.cfg", "--input", "flat.raw", "--calibrate", "cal.txt",
                             "--flat", "out.kqraw"},
                            "640\n480\n10\n1\nY\n1\n0\n");
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(lastLine(result), "ERROR: Cannot store kqraw image.");
    EXPECT_FALSE(exists("out.kqraw"));
}

// --- Replacing outputs ---------------------------------------------------------------

TEST_F(Integrity, ReplacedOutputsKeepTheirPermissionsAndLongNamesWork) {
    write("private.txt", "old");
    ASSERT_EQ(chmod(path("private.txt").c_str(), 0600), 0);
    ASSERT_EQ(symlink("private.txt", path("via-link.txt").c_str()), 0);
    const std::string longName(255, 'n');
    for (const std::string& output :
         {std::string("private.txt"), std::string("via-link.txt"), longName}) {
        const auto result = calibrate({"--binary", output});
        ASSERT_EQ(result.status, 0) << output << result.out;
    }
    struct stat info;
    ASSERT_EQ(stat(path("private.txt").c_str(), &info), 0);
    EXPECT_EQ(info.st_mode & 0777, 0600u);
    EXPECT_EQ(read("private.txt"), read(longName));
    ASSERT_EQ(lstat(path("via-link.txt").c_str(), &info), 0);
    EXPECT_TRUE(S_ISLNK(info.st_mode));
}

} // namespace
} // namespace e2e
