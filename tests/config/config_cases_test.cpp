// The configuration grammar, tree and checks, case by case: each table in
// tests/data/config/*.json has a transcript (*.golden) of what every case gives.

#include <algorithm>
#include <cstdlib>
#include <ctime>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>

#include <boost/iostreams/copy.hpp>
#include <boost/iostreams/filtering_stream.hpp>
#include <boost/lexical_cast/bad_lexical_cast.hpp>

#include "config/config_file.h"
#include "config/parameter_table.h"
#include "config/strip_comments.h"
#include "config/value_text.h"
#include "tests/config/case_data.h"
#include "tests/support/temp_dir.h"

#include <pthread.h>

namespace config {
namespace {

using nlohmann::json;

// The tree, or its size where it is large.
std::string printed(const config_node& node) {
    std::ostringstream out;
    node.print(out);
    const std::string text = out.str();
    const auto lines = std::count(text.begin(), text.end(), '\n');
    return lines <= 40 ? text : "(" + std::to_string(lines) + " lines)\n";
}

template <typename Convert> std::string converted(Convert convert) {
    try {
        return convert();
    } catch (const boost::bad_lexical_cast& e) {
        return std::string("bad cast to ") + e.target_type().name();
    } catch (const std::invalid_argument& e) {
        return e.what();
    }
}

std::string values(const config_node& node) {
    return "string " + converted([&] { return node.as_string(); }) + " | int " +
           converted([&] { return std::to_string(node.as_int()); }) + " | float " +
           converted([&] { return doubleText(static_cast<double>(node.as_float())); }) +
           " | bool " + converted([&] { return std::to_string(node.as_bool()); }) + " | uint8 " +
           converted([&] { return std::to_string(int{node.as_uint8()}); });
}

// A text parsed into a fresh tree: the tree, or the message and what was kept.
std::string parsed(const json& text) {
    config_node_impl root("root");
    const std::string outcome = case_data::outcomeOf([&] {
        parse_config_text(text.get<std::string>(), root);
        return std::string();
    });
    return outcome + (outcome.empty() ? "" : "\n") + printed(root);
}

// On the tree of "text": "find" or "child" of a path: the node's name and
// values (or the message), then the tree.
std::string path(const json& c) {
    config_node_impl root("root");
    parse_config_text(c.value("text", ""), root);
    const std::string outcome = case_data::outcomeOf([&] {
        const config_node& node = c.contains("find")
                                      ? root.find_path(c["find"].get<std::string>())
                                      : root.child_path(c["child"].get<std::string>());
        return (node.valid() ? node.name() : "invalid") + " (size " + std::to_string(node.size()) +
               ")\n" + values(node);
    });
    return outcome + "\n" + printed(root);
}

std::string value(const json& text) {
    config_node_impl node("n");
    node.set(text.get<std::string>());
    return values(node);
}

// The text with comments marked by each of "marks" cut off (a line through
// strip(), several through stacked filters).
std::string stripped(const json& c) {
    const std::string text = c["text"], marks = c["marks"];
    if (text.find('\n') == std::string::npos)
        return strip_comments::strip(text, marks[0]);
    boost::iostreams::filtering_istream in;
    for (char mark : marks)
        in.push(strip_comments(mark));
    std::istringstream source(text);
    in.push(source);
    std::ostringstream out;
    boost::iostreams::copy(in, out);
    return out.str();
}

// Each text applied to the defaults: the first check that fails speaks.
std::string validated(const json& settings) {
    config_node_impl config("config");
    set_defaults(config);
    parse_config_text(settings.get<std::string>(), config);
    return case_data::outcomeOf([&] {
        validate(config);
        return "(valid)";
    });
}

std::string date(const json& text) {
    return case_data::outcomeOf(
        [&] { return std::to_string(config_date_seconds(text.get<std::string>())); });
}

TEST(ConfigCases, EachTableGivesItsTranscript) {
    case_data::expectTranscript("config/grammar.json", "config/grammar.golden", parsed);
    case_data::expectTranscript("config/paths.json", "config/paths.golden", path);
    case_data::expectTranscript("config/conversions.json", "config/conversions.golden", value);
    case_data::expectTranscript("config/strip.json", "config/strip.golden", stripped);
    case_data::expectTranscript("config/validation.json", "config/validation.golden", validated);
    case_data::expectTranscript("config/dates.json", "config/dates.golden", date);
}

TEST(ConfigCases, NodeInterfaceDetails) {
    config_node_impl config("config");
    config_node& none = config_node_none::instance();
    EXPECT_EQ(&none.child("a"), &none);
    EXPECT_EQ(&none[7], &none);
    none.set("x");
    EXPECT_FALSE(none.initialized());
    EXPECT_FALSE(config.find(0).valid());
    EXPECT_EQ(&config["lsc"], &config.child("lsc"));
    const config_node& third = config.child("lsc")[2];
    EXPECT_EQ(&third, &config.find("lsc").find(2));
    EXPECT_EQ(&config.find("lsc").find_path("[1]"), &config.child_path("lsc[1]"));
    config_node& quality = config.child("jpeg_quality");
    quality.set("75", true);
    EXPECT_TRUE(quality.initialized() && quality.is_default());
    quality.set("80");
    EXPECT_FALSE(quality.is_default());
    std::ostringstream out;
    config.find("missing").print(out);
    EXPECT_EQ(out.str(), "none\n");
    EXPECT_EQ(integerText(-2147483648LL), "-2147483648");
}

TEST(ConfigCases, IndicesAndListsHaveLimits) {
    config_node_impl root("root");
    config_node& list = root.child("a");
    EXPECT_EQ(case_data::errorOf([&] { list.child(4000000000u); }),
              "Index 4000000000 of root.a is too large, the largest allowed index is 65535.");
    EXPECT_THROW(list.child(65536), std::out_of_range);
    EXPECT_EQ(list.size(), 0u);

    std::string numbers = "big = {0";
    for (int i = 1; i < 65536; ++i)
        numbers += ",1";
    parse_config_text(numbers + "};", root);
    EXPECT_EQ(root.find("big").size(), 65536u);
    EXPECT_THROW(parse_config_text(numbers + ",1};", root), std::out_of_range);
}

TEST(ConfigCases, DefaultsBlockPrefixAndRangeMessages) {
    config_node_impl root("root");
    set_defaults(root.child("config"));
    std::ostringstream out;
    root.print(out);
    case_data::expectGolden("config/defaults.golden", out.str());
    EXPECT_NO_THROW(validate(root.find("config")));
    EXPECT_EQ(block_prefix(root), "reference.");
    parse_config_text("config.shared.block_num_flag = 1; config.shared.block_num = 3;", root);
    EXPECT_EQ(block_prefix(root), "reference[3].");
    parse_config_text("config.shared.block_num_flag = 0; config.shared.block_name = top;", root);
    EXPECT_EQ(block_prefix(root), "top.");
    root.child_path("config.shared.block_name").set("");
    EXPECT_EQ(case_data::errorOf([&] { validate(root.find("config")); }),
              "Empty string not allowed for shared.block_name.");

    config_node& node = root.child_path("config.custom.limit");
    node.set("12");
    EXPECT_EQ(case_data::errorOf([&] { check_int_range(root.find("config"), node, 0, 10); }),
              "Value specified for custom.limit is too high, value must be between 0 and 10.");
    EXPECT_THROW(check_int_range(root.find("config"), node, 13, 20), std::range_error);
    EXPECT_NO_THROW(check_int_range(root.find("config"), node, 12, 12));
    EXPECT_NO_THROW(check_float_range(root.find("config"), node, 11.5f, 12.0f));
    EXPECT_EQ(config_relative_path(root.find("config"), root.child("other")), "root.other");
    EXPECT_EQ(config_relative_path(root.child("conf"), node), "root.config.custom.limit");
}

TEST(ConfigCases, FilesAreReadAndUnreadableOnesReported) {
    testing_support::TempDir dir;
    testing_support::writeFile(dir.file("a.cfg"), "lsc.max_gain = 5;\r\n");
    config_node_impl root("root");
    read_config_file(dir.file("a.cfg"), root);
    EXPECT_EQ(root.find_path("lsc.max_gain").as_string(), "5");
    for (const std::string& file : {dir.file("missing.cfg"), dir.path()})
        EXPECT_EQ(case_data::errorOf([&] { read_config_file(file, root); }),
                  "Unable to open configuration file.");
    EXPECT_THROW(read_config_file(dir.path(), root), std::invalid_argument);
}

TEST(ConfigCases, DatesIgnoreTheMachineTimeZone) {
    const char* previous = std::getenv("TZ");
    const std::string saved = previous ? previous : "";
    for (const char* zone : {"EST5EDT,M3.2.0,M11.1.0", "IST-5:30"}) { // POSIX rules: no zoneinfo
        setenv("TZ", zone, 1);
        tzset();
        EXPECT_EQ(config_date_seconds("2012-05-01T10:30"), 1335868200) << zone;
    }
    previous ? setenv("TZ", saved.c_str(), 1) : unsetenv("TZ");
    tzset();
}

// On a 64 KiB stack a recursive walk of 4000 levels would overflow.
std::size_t deepPrintedLines = 0;

TEST(ConfigCases, DeepTreesPrintAndReleaseWithoutRecursion) {
    pthread_attr_t attributes;
    pthread_attr_init(&attributes);
    pthread_attr_setstacksize(&attributes, 64 * 1024);
    pthread_t thread;
    ASSERT_EQ(pthread_create(
                  &thread, &attributes,
                  [](void*) -> void* {
                      auto root = std::make_unique<config_node_impl>("r");
                      config_node* node = root.get();
                      for (int i = 0; i < 4000; ++i)
                          node = i % 2 ? &node->child(0) : &node->child("a");
                      node->set("leaf");
                      std::ostringstream out;
                      root->print(out);
                      const std::string text = out.str();
                      deepPrintedLines =
                          static_cast<std::size_t>(std::count(text.begin(), text.end(), '\n'));
                      root.reset();
                      return nullptr;
                  },
                  nullptr),
              0);
    pthread_join(thread, nullptr);
    pthread_attr_destroy(&attributes);
    EXPECT_EQ(deepPrintedLines, 4001u);
}

} // namespace
} // namespace config
