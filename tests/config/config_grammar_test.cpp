// The configuration grammar: texts and the trees or messages they give are in
// tests/data/config/grammar.json and grammar.golden.

#include <limits>
#include <sstream>
#include <stdexcept>
#include <string>

#include <boost/iostreams/copy.hpp>
#include <boost/iostreams/filtering_stream.hpp>

#include "config/config_file.h"
#include "config/strip_comments.h"
#include "config/value_text.h"
#include "tests/config/case_data.h"
#include "tests/support/temp_dir.h"

namespace config {
namespace {

std::string printed(const config_node& node) {
    std::ostringstream out;
    node.print(out);
    return out.str();
}

// The tree a text gives, or its message followed by what was kept.
TEST(ConfigGrammar, TextsGiveTheirTreesOrMessages) {
    case_data::expectTranscript(
        "config/grammar.json", "config/grammar.golden", [](const nlohmann::json& text) {
            config_node_impl root("root");
            const std::string error =
                case_data::errorOf([&] { parse_config_text(text.get<std::string>(), root); });
            return (error.empty() ? "" : "error: " + error + "\n") + printed(root);
        });
}

TEST(ConfigGrammar, LimitsOfKeysAndEntries) {
    config_node_impl root("root");
    const std::string key(1000, 'k');
    parse_config_text(key + ".x[10] = 1;", root); // 1009 characters: fine
    EXPECT_EQ(case_data::errorOf([&] { parse_config_text(key + "." + key + " = 1;", root); }),
              "Failed to parse configuration file parameters, key longer than 1024 characters:\n" +
                  (key + "." + key).substr(0, 1024));
    parse_config_text("b[65535] = 1;", root);
    EXPECT_EQ(root.find("b").size(), 65536u);

    std::string text; // 262141 new entries, then one key too many
    for (int i = 0; i < 3; ++i)
        text += "k" + std::to_string(i) + "[65535] = 1;\n";
    EXPECT_EQ(
        case_data::errorOf([&] { parse_config_text(text + "k3[65529] = 1;\nz[1] = 1;", root); }),
        "Failed to parse configuration file parameters, more than 262144 new entries:\nz[1]");

    std::string list = "big = {0";
    for (int i = 1; i < 65536; ++i)
        list += ",1";
    parse_config_text(list + "};", root);
    EXPECT_EQ(root.find("big").size(), 65536u);
    EXPECT_THROW(parse_config_text(list + ",1};", root), std::out_of_range);
}

TEST(ConfigGrammar, ReadsFilesAndReportsUnreadableOnes) {
    testing_support::TempDir dir;
    testing_support::writeFile(dir.file("a.cfg"), "lsc.max_gain = 5;\r\n");
    config_node_impl root("root");
    read_config_file(dir.file("a.cfg"), root);
    EXPECT_EQ(root.find_path("lsc.max_gain").as_string(), "5");
    for (const std::string& path : {dir.file("missing.cfg"), dir.path()})
        EXPECT_EQ(case_data::errorOf([&] { read_config_file(path, root); }),
                  "Unable to open configuration file.");
    EXPECT_THROW(read_config_file(dir.path(), root), std::invalid_argument);
}

TEST(StripComments, CutsAtTheFirstCommentOutsideQuotes) {
    const struct {
        const char* text;
        char mark;
        const char* kept;
    } cases[] = {
        {"a = \"x;y\"; rest", ';', "a = \"x;y\""},
        {"no comment here", ';', "no comment here"},
        {"; all comment", ';', ""},
        {"a = 1 # note", '#', "a = 1 "},
        {"a = \"x\"\";y\" ;c", ';', "a = \"x\"\";y\" "},
        {"a = \"x\";y", ';', "a = \"x\""},
        {"a = \"x\" \"y;z\";w", ';', "a = \"x\" \"y;z\""},
        {"a = \"open;", ';', "a = \"open;"},
    };
    for (const auto& c : cases)
        EXPECT_EQ(strip_comments::strip(c.text, c.mark), c.kept) << c.text;

    boost::iostreams::filtering_istream in;
    in.push(strip_comments(';'));
    in.push(strip_comments('#'));
    std::istringstream source("[image]\nwidth = 64 ; pixels\nheight = 48 # rows\n"
                              "serial_no = \"a;b#c\"\n# whole line\n");
    in.push(source);
    std::ostringstream out;
    boost::iostreams::copy(in, out);
    EXPECT_EQ(out.str(), "[image]\nwidth = 64 \nheight = 48 \nserial_no = \"a;b#c\"\n\n");
}

TEST(ValueText, SeventeenDigitsWordsForNonFiniteAndPlainIntegers) {
    const double inf = std::numeric_limits<double>::infinity();
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const struct {
        double value;
        const char* text;
    } cases[] = {{static_cast<double>(0.1f), "0.10000000149011612"},
                 {0.5, "0.5"},
                 {2.0, "2"},
                 {-1e300, "-1.0000000000000001e+300"},
                 {1e-5, "1.0000000000000001e-05"},
                 {inf, "inf"},
                 {-inf, "-inf"},
                 {nan, "nan"},
                 {-nan, "-nan"}};
    for (const auto& c : cases)
        EXPECT_EQ(doubleText(c.value), c.text);
    EXPECT_EQ(integerText(0), "0");
    EXPECT_EQ(integerText(-2147483648LL), "-2147483648");
    EXPECT_EQ(integerText(1014), "1014");
}

} // namespace
} // namespace config
