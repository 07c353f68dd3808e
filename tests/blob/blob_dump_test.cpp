#include <sstream>
#include <string>

#include <gtest/gtest.h>

#include "blob/blob_dump.h"
#include "blob/blob_parser.h"
#include "blob_test_builder.h"

namespace blob {

using config::config_node;
using config::config_node_impl;
namespace {

using test::BlobBuilder;
using test::Bytes;

class BlobDump : public ::testing::Test {
protected:
    std::string dump(const Bytes& blob, const std::string& prefix = "reference.") {
        const BlobVersions versions = parseBlob(blob.data(), blob.size(), calibration, config);
        std::ostringstream out;
        writeCalibrationText(calibration, prefix, config, "BlobGenerator", "3.8.1", versions, out);
        return out.str();
    }

    static constexpr char kHead[] =
        "# BlobGenerator version 3.8.1, binary calibration data as text\n"
        "# blob.version = 1.4.0;\n"
        "global.configType            = 1;\n"
        "global.configVersion         = 0x0100;\n";

    config_node_impl root{"root"};
    config_node& calibration = root.child("calibration");
    config_node& config = root.child("config");
};

TEST_F(BlobDump, WritesEveryBlockInItsFixedForm) {
    test::Focus focus;
    focus.posture = 'H';
    focus.macro = 123;
    focus.hyper = 456;
    focus.inf = 789;
    focus.settle = 10;
    focus.hysteresis = 2;
    focus.pairs = {{1, 2}, {3, 4}};
    const Bytes blob =
        BlobBuilder()
            .block(kTrackingBlock, test::trackingBlock({0x0A, 0x1B}))
            .block(kToolBlock, test::toolBlock(1, 7, 2, 1335868200, 5))
            .block(kLscBlock, test::lscBlock(0, 3, 8, [](int n) { return n == 0 ? 0x140 : 0x100; }))
            .block(kAwbBlock, test::awbBlock(0, 512, 1023, 1000, 600))
            .block(kFocusBlock, test::focusBlock(focus))
            .build();

    std::string expected = kHead;
    expected += "\n# --------------- Tracking Data block ---------------\n"
                "reference.serial_no = 0a1b;\n"
                "\n# -------------------- LSC block --------------------\n"
                "# reference.light_id = 0;\n"
                "# reference.compression_res = s3.8;\n";
    for (const char* name : {"controlPointR", "controlPointGR", "controlPointGB", "controlPointB"})
        for (int i = 0; i < 10; ++i)
            for (int j = 0; j < 10; ++j)
                expected +=
                    std::string("reference.") + name + "[" + std::to_string(i) + "][" +
                    std::to_string(j) + "] = " +
                    (std::string(name) == "controlPointR" && i == 0 && j == 0 ? "1.25" : "1") +
                    ";\n";
    expected += "\n# -------------------- AWB block --------------------\n"
                "reference.light_source = 0;\n"
                "reference.R = 512;\n"
                "reference.GR = 1023;\n"
                "reference.GB = 1000;\n"
                "reference.B = 600;\n"
                "\n# -------------------- Focus Calibration block --------------------\n"
                "module.af.set[0].posture = 'H';\n"
                "module.af.set[0].macro = 123;\n"
                "module.af.set[0].hyper = 456;\n"
                "module.af.set[0].inf = 789;\n"
                "module.af.set[0].settle_time = 10;\n"
                "module.af.set[0].hysteresis = 2;\n"
                "module.af.set[0].FDN_dist_pair[0] = { 1, 2 };\n"
                "module.af.set[0].FDN_dist_pair[1] = { 3, 4 };\n"
                "\n# ------------- Calibration Tool block --------------\n"
                "# shared.program_number = 5;\n"
                "# tool.version = 1.7.2;\n"
                "# shared.cfg_file_date = 2012-05-01T10:30;\n";
    EXPECT_EQ(dump(blob), expected);
}

TEST_F(BlobDump, ToolAndDigestOnly) {
    const Bytes blob = BlobBuilder().block(kToolBlock, test::toolBlock(2, 4, 10, 0, 0)).build();
    EXPECT_EQ(dump(blob), std::string(kHead) +
                              "\n# ------------- Calibration Tool block --------------\n"
                              "# shared.program_number = 0;\n"
                              "# tool.version = 2.4.10;\n"
                              "# shared.cfg_file_date = 1970-01-01T00:00;\n");
}

TEST_F(BlobDump, WithoutAToolBlockTheToolLinesStayEmpty) {
    EXPECT_EQ(dump(BlobBuilder().build()), std::string(kHead) +
                                               "\n# ------------- Calibration Tool block "
                                               "--------------\n"
                                               "# shared.program_number = ;\n"
                                               "# tool.version = 0.0.0;\n"
                                               "# shared.cfg_file_date = ;\n");
}

TEST_F(BlobDump, EmptySerialIsQuotedSoTheLineReadsBack) {
    const std::string text =
        dump(BlobBuilder().block(kTrackingBlock, test::trackingBlock({})).build());
    EXPECT_NE(text.find("\nreference.serial_no = \"\";\n"), std::string::npos) << text;
}

TEST_F(BlobDump, ModuleSerialHasItsOwnLine) {
    calibration.child_path("module.serial_no").set("77");
    const std::string text = dump(BlobBuilder().build());
    EXPECT_NE(text.find("# --------------- Tracking Data block ---------------\n"
                        "module.serial_no = 77;\n"),
              std::string::npos)
        << text;
}

TEST_F(BlobDump, PairsWithoutACountAreAllWritten) {
    // A dump read back as autofocus data has no num_pairs and a quoted posture.
    calibration.child_path("module.af.set[0].posture").set("'V'");
    for (const char* name : {"macro", "hyper", "inf", "settle_time", "hysteresis"})
        calibration.child_path(std::string("module.af.set[0].") + name).set("1");
    calibration.child_path("module.af.set[0].FDN_dist_pair[0][0]").set("5");
    calibration.child_path("module.af.set[0].FDN_dist_pair[0][1]").set("6");
    calibration.child_path("module.af.set[0].FDN_dist_pair[1][0]").set("7");
    calibration.child_path("module.af.set[0].FDN_dist_pair[1][1]").set("8");
    const std::string text = dump(BlobBuilder().build());
    EXPECT_NE(text.find("module.af.set[0].posture = 'V';\n"), std::string::npos) << text;
    EXPECT_NE(text.find("module.af.set[0].FDN_dist_pair[0] = { 5, 6 };\n"
                        "module.af.set[0].FDN_dist_pair[1] = { 7, 8 };\n"),
              std::string::npos)
        << text;
}

TEST_F(BlobDump, NegativePairCountWritesNoPairs) {
    calibration.child_path("module.af.set[0].posture").set("H");
    calibration.child_path("module.af.set[0].num_pairs").set("-1");
    const std::string text = dump(BlobBuilder().build());
    EXPECT_EQ(text.find("FDN_dist_pair"), std::string::npos);
}

TEST_F(BlobDump, NumbersIgnoreTheStreamFormat) {
    test::Focus focus;
    focus.pairs.assign(12, {1, 2});
    const Bytes blob = BlobBuilder().block(kFocusBlock, test::focusBlock(focus)).build();
    const BlobVersions versions = parseBlob(blob.data(), blob.size(), calibration, config);
    std::ostringstream out;
    out << std::hex << std::showbase;
    writeCalibrationText(calibration, "p.", config, "t", "1", versions, out);
    EXPECT_NE(out.str().find("FDN_dist_pair[11] = { 1, 2 };"), std::string::npos);
}

} // namespace
} // namespace blob
