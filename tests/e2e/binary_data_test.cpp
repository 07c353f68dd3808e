// The binary calibration data: built from the register file (and autofocus
// data), stored, read back and checked, as a station writes it to a module.

#include <cstdio>
#include <memory>

#include "tests/e2e/e2e_fixture.h"

namespace e2e {
namespace {

class BinaryData : public ToolRun {
protected:
    ToolResult calibrateBinary(const std::vector<std::string>& extra = {}) const {
        std::vector<std::string> args = {"-b", "cal.bin"};
        args.insert(args.end(), extra.begin(), extra.end());
        return calibrate(args);
    }
};

// MD5 of a file's first `size` bytes by the system's md5sum, as a station would check it.
std::string md5sumOf(const std::string& path, std::size_t size) {
    const std::string command = "head -c " + std::to_string(size) + " '" + path + "' | md5sum";
    std::unique_ptr<FILE, int (*)(FILE*)> pipe(popen(command.c_str(), "r"), pclose);
    char digest[33] = {};
    if (!pipe || std::fread(digest, 1, 32, pipe.get()) != 32)
        return "";
    return digest;
}

std::string hexOf(const std::string& bytes) {
    static const char digits[] = "0123456789abcdef";
    std::string text;
    for (unsigned char c : bytes) {
        text += digits[c >> 4];
        text += digits[c & 15];
    }
    return text;
}

TEST_F(BinaryData, IsWrittenReadBackAndDigested) {
    prepare("shared.cfg_file_date = 2012-05-01T10:30;", smallShape(), [] {
        CaptureInfo capture;
        capture.serialNumber = "0a1b2c3d";
        return capture;
    }());
    const auto result = calibrateBinary();
    ASSERT_EQ(result.status, 0) << result.out;
    const auto text = lines(result.out);
    const auto at = std::find(text.begin(), text.end(), "Generating configuration file.");
    ASSERT_NE(at, text.end());
    EXPECT_EQ(at[1], "Reading calibration data.");
    EXPECT_EQ(at[2], "Generating binary calibration data.");
    EXPECT_EQ(at[3], "Reading binary calibration data.");
    EXPECT_EQ(at[4], "Start correcting lens shading.");

    const std::string blob = read("cal.bin");
    ASSERT_GT(blob.size(), 24u);
    EXPECT_EQ(blob.substr(0, 8), std::string("\xCA\x1B\xA7\xED\x01\x04\x00\x00", 8));
    // Table: tracking, tool, lens shading, white balance, digest.
    const auto word = [&](std::size_t offset) {
        return (static_cast<unsigned char>(blob[offset]) << 8) |
               static_cast<unsigned char>(blob[offset + 1]);
    };
    EXPECT_EQ(word(8), 0x0001);
    EXPECT_EQ(word(12), 0x0003);
    EXPECT_EQ(word(16), 0x0010);
    EXPECT_EQ(word(20), 0x0020);
    EXPECT_EQ(word(24), 0xB10B);
    const std::size_t digestAt = static_cast<std::size_t>(word(26));
    ASSERT_EQ(digestAt + 16, blob.size());
    EXPECT_EQ(hexOf(blob.substr(digestAt)), md5sumOf(path("cal.bin"), digestAt));
    // Tracking: length 6, then the four serial bytes.
    const std::size_t tracking = static_cast<std::size_t>(word(10));
    EXPECT_EQ(blob.substr(tracking, 6), std::string("\x00\x06\x0a\x1b\x2c\x3d", 6));
    // Tool: size 13, version 3.8.1, 2012-05-01T10:30 UTC = 1335868200 s, program 0.
    const std::size_t tool = static_cast<std::size_t>(word(14));
    EXPECT_EQ(blob.substr(tool, 13),
              std::string("\x0d\x03\x08\x01\x00\x00\x00\x00\x4f\x9f\xbb\x28\x00", 13));
}

TEST_F(BinaryData, MissingDateIsWarnedAndBadDateRefused) {
    prepare();
    auto result = calibrateBinary();
    ASSERT_EQ(result.status, 0) << result.out;
    EXPECT_TRUE(hasLine(result.out,
                        "WARNING: No shared.cfg_file_date attribute specified in config file."));
    write("lsc.cfg", "shared.cfg_file_date = 2012-05-01;");
    std::remove(path("cal.bin").c_str());
    result = calibrateBinary();
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(
        lines(result.out).back(),
        "ERROR: Invalid value for shared.cfg_file_date attribute (must be YYYY-MM-DDTHH:MM).");
    EXPECT_FALSE(exists("cal.bin"));
    EXPECT_TRUE(exists("cal.txt")); // earlier outputs stay
}

TEST_F(BinaryData, CompressionSettingsAreChecked) {
    prepare();
    const std::pair<std::string, std::string> cases[] = {
        {"blob.compression_res = s8.8;",
         "ERROR: Compressed data values larger than 16 bits are not supported."},
        {"blob.compression_res = x3.8;",
         "ERROR: Invalid compression format in configuration file."},
        {"blob.compression_flag = 0;", "ERROR: Only compressed LSC data is supported."},
    };
    for (const auto& c : cases) {
        write("lsc.cfg", c.first);
        const auto result = calibrateBinary();
        EXPECT_EQ(result.status, 1) << c.first;
        EXPECT_EQ(lines(result.out).back(), c.second) << result.out;
    }
    // Gains near 2 do not fit a code with one integer bit.
    write("lsc.cfg", "blob.compression_res = s1.8;");
    const auto result = calibrateBinary();
    EXPECT_EQ(result.status, 1);
    EXPECT_NE(result.out.find(") is outside of the range allowed for the "
                              "lensShading.compression_res value specified in the configuration "
                              "file.\nPossible reasons include poor calibration image, invalid "
                              "configuration file, or configuration file values that do not match "
                              "the sensor being used.\n"),
              std::string::npos)
        << result.out;
}

TEST_F(BinaryData, LogFlagDumpsTextThatReadsBackAsConfiguration) {
    prepare(
        "blob.log_flag = 1; shared.cfg_file_date = 2020-01-02T03:04; shared.program_number = 7;");
    const auto result = calibrateBinary();
    ASSERT_EQ(result.status, 0) << result.out;
    const std::string& out = result.out;
    const auto begin = out.find("# BlobGenerator version 1.7.2");
    ASSERT_NE(begin, std::string::npos) << out;
    EXPECT_NE(out.find("# blob.version = 1.4.0;\n"), std::string::npos);
    EXPECT_NE(out.find("# ------------- Calibration Tool block --------------\n"
                       "# shared.program_number = 7;\n# tool.version = 3.8.1;\n"
                       "# shared.cfg_file_date = 2020-01-02T03:04;\n"),
              std::string::npos)
        << out;
    EXPECT_NE(out.find("\nreference.controlPointR[0][0] = "), std::string::npos);
    EXPECT_NE(out.find("\nreference.R = "), std::string::npos);
    // The dump is configuration text: used as a configuration, it reads.
    const auto end = out.find("Reading binary calibration data.");
    ASSERT_NE(end, std::string::npos);
    write("dump.cfg", out.substr(begin, end - begin));
    const auto again = run({"-c", "dump.cfg", "-i", "flat.kqraw", "-l", "cal2.txt"});
    EXPECT_EQ(again.status, 0) << again.out;
}

TEST_F(BinaryData, RoundTripsEveryValidConfiguration) {
    // Settings that a careless generator would not read back: an unset light
    // source, block numbers, a quoted posture and focus pairs.
    prepare("shared.light_source = -1; shared.block_num_flag = 1; shared.block_num = 3;");
    write("af.txt", "module.af.set[0].posture = 'H';\nmodule.af.set[0].macro = 100000;\n"
                    "module.af.set[0].hyper = 200;\nmodule.af.set[0].inf = 300;\n"
                    "module.af.set[0].settle_time = 40;\nmodule.af.set[0].hysteresis = 5;\n"
                    "module.af.set[0].FDN_dist_pair[0] = {1, 2};\n"
                    "module.af.set[0].FDN_dist_pair[1] = {3, 4};\n");
    const auto result = calibrateBinary({"-a", "af.txt"});
    ASSERT_EQ(result.status, 0) << result.out;
    EXPECT_TRUE(hasLine(result.out, "Reading autofocus calibration data."));
    const std::string blob = read("cal.bin");
    // The focus block: posture H, macro 100000, hyper 200, inf 300, 40, 5, two pairs.
    EXPECT_NE(blob.find(std::string("H\x00\x01\x86\xa0\x00\x00\x00\xc8\x00\x00\x01\x2c\x00\x28"
                                    "\x00\x05\x02\x00\x00\x00\x01\x00\x00\x00\x02",
                                    27)),
              std::string::npos);
}

TEST_F(BinaryData, OptionAndFileErrors) {
    prepare();
    auto result =
        run({"--kq", "-c", "lsc.cfg", "-i", "flat.kqraw", "-o", "s.txt", "-b", "cal.bin"});
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(result.out, "ERROR: Binary calibration data (--binary) can only be built with a "
                          "calibration register file (--calibrate).\n");
    EXPECT_FALSE(exists("s.txt"));

    result = calibrate({"-b", "no-dir/cal.bin"});
    EXPECT_EQ(result.status, 1);
    EXPECT_EQ(lines(result.out).back(), "ERROR: Cannot store binary calibration file.");

    const std::pair<std::string, std::string> focusCases[] = {
        {"module.af.set[0].posture = 'H';\n", "ERROR: Missing value for module.af.set[0].macro."},
        {"module.af.set[0].posture = 'H'; module.af.set[0].macro = 1; module.af.set[0].hyper = 2;"
         "module.af.set[0].inf = 3; module.af.set[0].settle_time = 70000;"
         "module.af.set[0].hysteresis = 1;",
         "ERROR: Value for module.af.set[0].settle_time does not fit in the binary calibration "
         "data, value must be between 0 and 65535."},
    };
    for (const auto& c : focusCases) {
        write("af.txt", c.first);
        result = calibrateBinary({"-a", "af.txt"});
        EXPECT_EQ(result.status, 1);
        EXPECT_EQ(lines(result.out).back(), c.second) << result.out;
        EXPECT_FALSE(exists("cal.bin"));
    }
}

} // namespace
} // namespace e2e
