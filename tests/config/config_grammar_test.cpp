#include <functional>
#include <sstream>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "config/config_file.h"
#include "tests/support/temp_dir.h"

namespace config {
namespace {

class ConfigGrammarTest : public ::testing::Test {
protected:
    config_node_impl root{"root"};
    config_node& config = root.child("config");

    std::string value(const std::string& path) const { return config.find_path(path).as_string(); }

    std::string parseError(const std::string& text) {
        try {
            parse_config_text(text, config);
        } catch (const std::runtime_error& e) {
            return e.what();
        }
        return "(parsed)";
    }

    std::string printed() const {
        std::ostringstream out;
        config.print(out);
        return out.str();
    }
};

// ---- accepted text ----------------------------------------------------------

TEST_F(ConfigGrammarTest, EmptyTextAndCommentsChangeNothing) {
    parse_config_text("", config);
    parse_config_text("# only a comment\n\n   \t\n# another", config);
    EXPECT_EQ(printed(), "root.config = <empty>\n");
}

TEST_F(ConfigGrammarTest, PlainValuesAreStoredAsText) {
    parse_config_text("shared.block_name = reference;\n"
                      "lsc.max_gain = 6.0;\n"
                      "shared.light_source = -1;\n"
                      "blob.compression_res = s3.8;\n"
                      "shared.cfg_file_date = 2012-05-01T10:30;\n"
                      "raw.path = C:\\dir/file_1;\n",
                      config);
    EXPECT_EQ(value("shared.block_name"), "reference");
    EXPECT_EQ(value("lsc.max_gain"), "6.0");
    EXPECT_EQ(value("shared.light_source"), "-1");
    EXPECT_EQ(value("blob.compression_res"), "s3.8");
    EXPECT_EQ(value("shared.cfg_file_date"), "2012-05-01T10:30");
    EXPECT_EQ(value("raw.path"), "C:\\dir/file_1");
    EXPECT_FALSE(config.find_path("lsc.max_gain").is_default());
    EXPECT_TRUE(config.find_path("lsc.max_gain").initialized());
}

TEST_F(ConfigGrammarTest, QuotedValuesKeepTheirQuotes) {
    parse_config_text("a = \"reference\";\nb = 'x';\nc = \"two\nlines; # not a comment\";", config);
    EXPECT_EQ(value("a"), "\"reference\"");
    EXPECT_EQ(value("b"), "'x'");
    EXPECT_EQ(value("c"), "\"two\nlines; # not a comment\"");
}

TEST_F(ConfigGrammarTest, SpacesAreFreeAroundTheEqualsSignAndSemicolon) {
    parse_config_text("lsc.max_gain=6;", config);
    EXPECT_EQ(value("lsc.max_gain"), "6");
    parse_config_text("   lsc.max_gain \t =   7   ;   # note\n\tx = 1; y = 2;", config);
    EXPECT_EQ(value("lsc.max_gain"), "7");
    EXPECT_EQ(value("x"), "1");
    EXPECT_EQ(value("y"), "2");
}

TEST_F(ConfigGrammarTest, IndexedKeysCreateTheMissingIndices) {
    parse_config_text("apply_lsc.ccm[2][0] = 0.5;", config);
    EXPECT_EQ(value("apply_lsc.ccm[2][0]"), "0.5");
    EXPECT_EQ(config.find_path("apply_lsc.ccm").size(), 3u);
    EXPECT_FALSE(config.find_path("apply_lsc.ccm[1]").initialized());
    EXPECT_EQ(config.find_path("apply_lsc.ccm[2]").size(), 1u);
}

TEST_F(ConfigGrammarTest, IntegerListsFillIndexedChildren) {
    parse_config_text("apply_lsc.delta_ab_blocks = {1, 2};\nm.pair = {+5,-7 ,  3000000000};",
                      config);
    const config_node& blocks = config.find_path("apply_lsc.delta_ab_blocks");
    EXPECT_EQ(blocks.size(), 2u);
    EXPECT_FALSE(blocks.initialized());
    EXPECT_EQ(value("apply_lsc.delta_ab_blocks[0]"), "1");
    EXPECT_EQ(value("apply_lsc.delta_ab_blocks[1]"), "2");
    // Beyond 32 bits the list is read as floats.
    EXPECT_EQ(value("m.pair[0]"), "5");
    EXPECT_EQ(value("m.pair[1]"), "-7");
    EXPECT_EQ(value("m.pair[2]"), "3000000000");
}

TEST_F(ConfigGrammarTest, FloatListsStoreSingleValuesAtSeventeenDigits) {
    parse_config_text("a = {0.1};\nb = {1, 2.5, -3e2, .5, 4.};\nc = {nan, -inf, Infinity};",
                      config);
    EXPECT_EQ(value("a[0]"), "0.10000000149011612");
    EXPECT_EQ(value("b[0]"), "1");
    EXPECT_EQ(value("b[1]"), "2.5");
    EXPECT_EQ(value("b[2]"), "-300");
    EXPECT_EQ(value("b[3]"), "0.5");
    EXPECT_EQ(value("b[4]"), "4");
    EXPECT_EQ(value("c[0]"), "nan");
    EXPECT_EQ(value("c[1]"), "-inf");
    EXPECT_EQ(value("c[2]"), "inf");
}

TEST_F(ConfigGrammarTest, LaterAssignmentsWinElementByElement) {
    parse_config_text("a = 1;\na = 2;\nl = {1, 2, 3};\nl = {9};", config);
    EXPECT_EQ(value("a"), "2");
    EXPECT_EQ(value("l[0]"), "9");
    EXPECT_EQ(value("l[1]"), "2");
    EXPECT_EQ(value("l[2]"), "3");
}

TEST_F(ConfigGrammarTest, EveryLineEndStyleParsesAlike) {
    for (const char* end : {"\n", "\r\n", "\r"}) {
        config_node_impl other("root");
        config_node& target = other.child("config");
        const std::string e = end;
        parse_config_text("# header" + e + "a = 1; # note" + e + e + "b = {1, 2};" + e +
                              "# last comment" + e + "c = x;",
                          target);
        EXPECT_EQ(target.find_path("a").as_string(), "1") << "line end " << int(e.back());
        EXPECT_EQ(target.find_path("b[1]").as_string(), "2");
        EXPECT_EQ(target.find_path("c").as_string(), "x") << "line end " << int(e.back());
    }
}

// ---- refused text -----------------------------------------------------------

TEST_F(ConfigGrammarTest, MissingSemicolonNamesTheExpectedCharacter) {
    EXPECT_EQ(parseError("lsc.max_gain = 6\nlsc.max_err = 1;"),
              "Failed to parse configuration file parameters, expecting \";\":\n"
              "lsc.max_gain = 6");
}

TEST_F(ConfigGrammarTest, ValueWithASpaceNeedsQuotes) {
    EXPECT_EQ(parseError("x = 1;\n  shared.block_name = my block;"),
              "Failed to parse configuration file parameters, expecting \";\":\n"
              "shared.block_name = my ");
}

TEST_F(ConfigGrammarTest, MissingEqualsSignOrValueIsAnExpectationFailure) {
    EXPECT_EQ(parseError("lsc.max_gain 6;"),
              "Failed to parse configuration file parameters, expecting \"=\":\n"
              "lsc.max_gain ");
    EXPECT_EQ(parseError("lsc.max_gain = ;"),
              "Failed to parse configuration file parameters, expecting <value>:\n"
              "lsc.max_gain = ");
    EXPECT_EQ(parseError("a . b = 1;"),
              "Failed to parse configuration file parameters, expecting \"=\":\na ");
    EXPECT_EQ(parseError("a[ 1] = 1;"),
              "Failed to parse configuration file parameters, expecting \"=\":\na");
}

TEST_F(ConfigGrammarTest, ListsMustStayOnOneLine) {
    EXPECT_EQ(parseError("apply_lsc.delta_ab_blocks = {1,\n2};"),
              "Failed to parse configuration file parameters, expecting <value>:\n"
              "apply_lsc.delta_ab_blocks = ");
    EXPECT_EQ(parseError("a = {1 # two\n};").substr(0, 68),
              "Failed to parse configuration file parameters, expecting <value>:\na ");
    EXPECT_NE(parseError("a = {};"), "(parsed)");
    EXPECT_NE(parseError("a = {1e50};"), "(parsed)");
}

TEST_F(ConfigGrammarTest, TextNoRuleMatchesStopsTheParse) {
    EXPECT_EQ(parseError("a = 1;\n1abc = 2;\nb = 3;"),
              "Failed to parse configuration file parameters.\nStopped at: \"1abc = 2;\"\n");
    EXPECT_EQ(parseError("= 2;"),
              "Failed to parse configuration file parameters.\nStopped at: \"= 2;\"\n");
    EXPECT_EQ(parseError("a = 1; @\r\nb = 2;"),
              "Failed to parse configuration file parameters.\nStopped at: \"@\"\n");
    EXPECT_EQ(value("a"), "1"); // what came before the error stays
}

TEST_F(ConfigGrammarTest, NonAsciiLettersAreNotNames) {
    EXPECT_EQ(
        parseError("\xc3\xa9t\xc3\xa9 = 1;"),
        "Failed to parse configuration file parameters.\nStopped at: \"\xc3\xa9t\xc3\xa9 = 1;\"\n");
    EXPECT_EQ(parseError("a = \xc3\xa9;"),
              "Failed to parse configuration file parameters, expecting <value>:\na = ");
}

TEST_F(ConfigGrammarTest, HugeIndexIsRefusedBeforeCreatingNodes) {
    EXPECT_EQ(parseError("a[4000000000] = 1;"),
              "Failed to parse configuration file parameters, index larger than 65535:\n"
              "a[4000000000]");
    EXPECT_EQ(parseError("a[99999999999999999999999999] = 1;"),
              "Failed to parse configuration file parameters, index larger than 65535:\n"
              "a[99999999999999999999999999]");
    EXPECT_EQ(config.find("a").size(), 0u);
    parse_config_text("b[65535] = 1;", config);
    EXPECT_EQ(config.find("b").size(), 65536u);
}

TEST_F(ConfigGrammarTest, OverlongKeyIsRefused) {
    const std::string key(1000, 'k');
    parse_config_text(key + ".x[10] = 1;", config); // 1009 characters: fine
    const std::string message = parseError(key + "." + key + " = 1;");
    EXPECT_EQ(message,
              "Failed to parse configuration file parameters, key longer than 1024 characters:\n" +
                  (key + "." + key).substr(0, 1024));
}

TEST_F(ConfigGrammarTest, ManyNewEntriesInOneTextAreRefused) {
    std::string text;
    for (int i = 0; i < 3; ++i)
        text += "k" + std::to_string(i) + "[65535] = 1;\n"; // 65537 new entries each
    text += "k3[65529] = 1;\n";                             // 262141 in all
    EXPECT_EQ(parseError(text + "z[1] = 1;"),
              "Failed to parse configuration file parameters, more than 262144 new entries:\nz[1]");
    std::string list = "big = {0";
    for (int i = 1; i < 65536; ++i)
        list += ",1";
    list += "};";
    config_node_impl other("root");
    parse_config_text(list, other);
    EXPECT_EQ(other.find("big").size(), 65536u);
    EXPECT_THROW(parse_config_text("big = {0," + list.substr(7), other), std::out_of_range);
}

// ---- files ------------------------------------------------------------------

TEST_F(ConfigGrammarTest, ReadsAFile) {
    testing_support::TempDir dir;
    testing_support::writeFile(dir.file("a.cfg"), "lsc.max_gain = 5;\r\n");
    read_config_file(dir.file("a.cfg"), config);
    EXPECT_EQ(value("lsc.max_gain"), "5");
}

TEST_F(ConfigGrammarTest, UnreadableFileIsReported) {
    testing_support::TempDir dir;
    for (const std::string& path : {dir.file("missing.cfg"), dir.path()}) {
        try {
            read_config_file(path, config);
            FAIL() << path;
        } catch (const std::invalid_argument& e) {
            EXPECT_STREQ(e.what(), "Unable to open configuration file.");
        }
    }
}

} // namespace
} // namespace config
