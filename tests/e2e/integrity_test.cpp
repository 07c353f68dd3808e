// What the case tables cannot say: a register file in a FIFO, signals during
// a write, a sparse container claiming 2^31 samples, replaced outputs and
// the outputs left by a run that fails late.

#include <algorithm>
#include <csignal>
#include <filesystem>

#include "tests/e2e/e2e_fixture.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/inotify.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

namespace e2e {
namespace {

using testing_support::exitStatus;
using testing_support::startTool;

std::vector<std::string> listDirectory(const std::string& path) {
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(path))
        names.push_back(entry.path().filename().string());
    std::sort(names.begin(), names.end());
    return names;
}

using Integrity = ToolRun;

// A register file in a FIFO is written into the pipe; another module's
// register text offered in the same pipe afterwards must not reach the blob.
TEST_F(Integrity, AnotherRunsRegisterFileNeverReachesTheBinaryData) {
    prepare();
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
    for (int raw = 0;;) {
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

// A signal that arrives while a large output is being written (seen by the
// creation of its temporary) ends the run with 128 + signal, removes the
// temporary and keeps the previous file.
TEST_F(Integrity, SignalsDuringAWriteLeaveNothingBehind) {
    // Large enough for the signal to arrive during the write; a constant
    // level, as nothing but the write is under test.
    FlatField large;
    large.shape.width = 4000;
    large.shape.height = 3000;
    large.samples.assign(4000 * 3000, 512);
    write("flat.kqraw", flatfield::kqraw2FileBytes(large));
    write("lsc.cfg", "");
    for (int signal : {SIGINT, SIGTERM, SIGHUP}) {
        write("out.bmp", "previous contents\n");
        const int watch = inotify_init1(IN_CLOEXEC);
        ASSERT_GE(watch, 0);
        ASSERT_GE(inotify_add_watch(watch, dir_.path().c_str(), IN_CREATE), 0);
        const pid_t tool = startTool({"--config", "lsc.cfg", "--input", "flat.kqraw", "--calibrate",
                                      "cal.txt", "--inputasbmp", "out.bmp"},
                                     dir_.path());
        // Until the temporary appears; a run that ends first fails the test
        // instead of leaving it waiting.
        alignas(inotify_event) char events[4096];
        for (bool seen = false; !seen;) {
            pollfd ready = {watch, POLLIN, 0};
            if (poll(&ready, 1, 100) == 0) {
                ASSERT_EQ(waitpid(tool, nullptr, WNOHANG), 0) << "no temporary written";
                continue;
            }
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

// A container whose pixel block claims 2^31 samples, in a sparse file long
// enough to hold them, is refused before allocating.
TEST_F(Integrity, SparseContainerBeyondTheSampleMemoryLimitIsRefused) {
    prepare();
    flatfield::KqRawBuilder container;
    container.header(65535, 32769, 0x52474742)
        .block("PIXELDATA_111107", std::string(8, '\0'), 0xFFFFFFF8u);
    write("huge.kqraw", container.bytes());
    // Summed as off_t: a 32-bit size_t would wrap.
    ASSERT_EQ(truncate(path("huge.kqraw").c_str(),
                       static_cast<off_t>(container.bytes().size()) + off_t{0xFFFFFFF8u}),
              0);
    const auto result =
        run({"--config", "lsc.cfg", "--input", "huge.kqraw", "--calibrate", "cal.txt"});
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(lines(result.out).back(),
              "ERROR: Image too large: its samples would take more than 1 GiB of memory (at most "
              "268435456 samples, for example 16384 x 16384 pixels).");
}

TEST_F(Integrity, ReplacedOutputsKeepTheirPermissionsAndLongNamesWork) {
    prepare();
    write("private.txt", "old");
    ASSERT_EQ(chmod(path("private.txt").c_str(), 0600), 0);
    ASSERT_EQ(symlink("private.txt", path("via-link.txt").c_str()), 0);
    const std::string longName(255, 'n');
    for (const std::string& output :
         {std::string("private.txt"), std::string("via-link.txt"), longName})
        ASSERT_EQ(calibrate({"--binary", output}).status, 0) << output;
    struct stat info;
    ASSERT_EQ(stat(path("private.txt").c_str(), &info), 0);
    EXPECT_EQ(info.st_mode & 0777, 0600u);
    EXPECT_EQ(read("private.txt"), read(longName));
    ASSERT_EQ(lstat(path("via-link.txt").c_str(), &info), 0);
    EXPECT_TRUE(S_ISLNK(info.st_mode));
}

// A failure at the flattened JPEG leaves every earlier output as a good run
// writes it; the flattened BMP, which comes later, is never written.
TEST_F(Integrity, LaterFailureLeavesEveryEarlierOutputAsWritten) {
    prepare();
    const auto outputs = [](const std::string& jpeg) {
        return std::vector<std::string>{"--kq",          "--config",       "lsc.cfg",
                                        "--input",       "flat.kqraw",     "--calibrate",
                                        "cal.txt",       "--binary",       "cal.bin",
                                        "--inputasjpeg", "input.jpg",      "--inputasbmp",
                                        "input.bmp",     "--preproc",      "prep.kqraw",
                                        "--outsamples",  "samples.txt",    "--delta",
                                        "delta.csv",     "--stats",        "stats.csv",
                                        "--flat",        "flat-out.kqraw", "--bmp",
                                        "flat.bmp",      "--jpeg",         jpeg};
    };
    testing_support::TempDir good;
    for (const char* input : {"flat.kqraw", "lsc.cfg"})
        testing_support::writeFile(good.file(input), read(input));
    ASSERT_EQ(testing_support::runTool(outputs("flat.jpg"), good.path()).status, 0);
    const auto failed = run(outputs("/dev/full"));
    EXPECT_EQ(failed.status, 1);
    EXPECT_EQ(lines(failed.out).back(), "ERROR: Cannot store jpeg image.");
    std::vector<std::string> expected = listDirectory(good.path());
    expected.erase(std::find(expected.begin(), expected.end(), "flat.bmp"));
    expected.erase(std::find(expected.begin(), expected.end(), "flat.jpg"));
    EXPECT_EQ(listDirectory(dir_.path()), expected);
    for (const std::string& name : expected) {
        std::string written = read(name), complete = testing_support::readFile(good.file(name));
        // The register file names the command line (ending in the JPEG's
        // name); KQRAW2 headers carry their creation time.
        const auto cut = [&](std::string& text) {
            if (name == "cal.txt")
                text.erase(text.find("# Command line"), text.find("global.") - text.find("# C"));
            else if (text.compare(0, 9, "KQRAWFILE") == 0)
                text.replace(60, 8, 8, '\0');
        };
        cut(written);
        cut(complete);
        EXPECT_EQ(written, complete) << name;
    }
}

} // namespace
} // namespace e2e
