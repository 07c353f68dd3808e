#include <algorithm>
#include <climits>
#include <cmath>
#include <functional>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>

#include <boost/lexical_cast/bad_lexical_cast.hpp>
#include <gtest/gtest.h>

#include "config/config_node.h"

#include <pthread.h>

namespace config {
namespace {

std::string messageOf(const std::function<void()>& action) {
    try {
        action();
    } catch (const std::exception& e) {
        return e.what();
    }
    return "(no exception)";
}

class ConfigNodeTest : public ::testing::Test {
protected:
    config_node_impl root{"root"};
    config_node& config = root.child("config");

    config_node& valued(const std::string& text) {
        config_node& node = config.child("value");
        node.set(text);
        return node;
    }
};

// ---- navigation -------------------------------------------------------------

TEST_F(ConfigNodeTest, ChildrenAreNamedAfterTheirParent) {
    EXPECT_EQ(config.child("lsc").child("max_gain").name(), "root.config.lsc.max_gain");
    EXPECT_EQ(config.child("apply_lsc").child("ccm").child(1).child(2).name(),
              "root.config.apply_lsc.ccm[1][2]");
    EXPECT_EQ(&config["lsc"], &config.child("lsc"));
}

TEST_F(ConfigNodeTest, FindingAMissingNodeCreatesNothing) {
    const config_node& missing = config.find("missing");
    EXPECT_FALSE(missing.valid());
    EXPECT_FALSE(missing.find("deeper").find(3).valid());
    EXPECT_FALSE(config.find(0).valid());
    EXPECT_TRUE(static_cast<config_node_impl&>(config).namedChildren().empty());
    EXPECT_EQ(config.size(), 0u);
}

TEST_F(ConfigNodeTest, NullNodeAbsorbsCreatingLookupsAndAssignments) {
    config_node& none = config_node_none::instance();
    EXPECT_EQ(&none.child("a"), &none);
    EXPECT_EQ(&none[7], &none);
    none.set("x");
    EXPECT_FALSE(none.initialized());
    EXPECT_EQ(none.size(), 0u);
}

TEST_F(ConfigNodeTest, CreatingAnIndexFillsTheGapsUninitialized) {
    config_node& list = config.child("list");
    config_node& third = list.child(3);
    EXPECT_EQ(list.size(), 4u);
    EXPECT_EQ(third.name(), "root.config.list[3]");
    EXPECT_FALSE(list.find(0).initialized());
    EXPECT_TRUE(list.find(2).valid());
    EXPECT_FALSE(list.find(4).valid());
}

TEST_F(ConfigNodeTest, HugeIndexIsRefusedWithoutCreatingNodes) {
    config_node& list = config.child("a");
    EXPECT_EQ(
        messageOf([&] { list.child(4000000000u); }),
        "Index 4000000000 of root.config.a is too large, the largest allowed index is 65535.");
    EXPECT_THROW(list.child(65536), std::out_of_range);
    EXPECT_EQ(list.size(), 0u);
    EXPECT_EQ(list.child(65535).name(), "root.config.a[65535]");
}

TEST_F(ConfigNodeTest, PathsDescendByNameAndIndex) {
    config_node& cell = config.child_path("apply_lsc.ccm[1][2]");
    EXPECT_EQ(cell.name(), "root.config.apply_lsc.ccm[1][2]");
    EXPECT_EQ(&config.find_path("apply_lsc.ccm[1][2]"), &cell);
    EXPECT_EQ(&root.find_path("config.apply_lsc"), &config.child("apply_lsc"));
    EXPECT_EQ(&config.find("apply_lsc").find_path("ccm[1]"),
              &config.child_path("apply_lsc.ccm[1]"));
    EXPECT_FALSE(config.find_path("apply_lsc.ccm[3]").valid());
    EXPECT_FALSE(config.find_path("apply_lsc.ccm[99999999999999999999999]").valid());
    EXPECT_FALSE(config.find_path("nothing.here").valid());
    EXPECT_FALSE(config.find("nothing").valid());
}

TEST_F(ConfigNodeTest, MalformedPathsAreRefused) {
    for (const char* path : {"", ".a", "a.", "a..b", "a[", "a[]", "a[1", "a[x]", "a b", "a]"})
        EXPECT_THROW(config.find_path(path), std::invalid_argument) << path;
    EXPECT_EQ(messageOf([&] { config.child_path("a..b"); }), "Invalid configuration path: a..b");
}

TEST_F(ConfigNodeTest, RelativePathCutsOffTheConfigNode) {
    EXPECT_EQ(config_relative_path(config, config.child_path("shared.block_name")),
              "shared.block_name");
    EXPECT_EQ(config_relative_path(config, root.child("other")), "root.other");
    EXPECT_EQ(config_relative_path(root.child("conf"), config.child("x")), "root.config.x");
}

// ---- values and flags -------------------------------------------------------

TEST_F(ConfigNodeTest, AssignmentSetsValueAndFlags) {
    config_node& node = config.child("jpeg_quality");
    EXPECT_FALSE(node.initialized());
    node.set("75", true);
    EXPECT_TRUE(node.initialized());
    EXPECT_TRUE(node.is_default());
    node.set("80");
    EXPECT_FALSE(node.is_default());
    EXPECT_EQ(node.as_string(), "80");
}

TEST_F(ConfigNodeTest, UninitializedNodeNamesItselfInTheError) {
    config_node& node = config.child_path("lsc.max_gain");
    const std::string expected = "Parameter root.config.lsc.max_gain not initialized";
    EXPECT_EQ(messageOf([&] { node.as_string(); }), expected);
    EXPECT_EQ(messageOf([&] { node.as_int(); }), expected);
    EXPECT_EQ(messageOf([&] { node.as_bool(); }), expected);
    EXPECT_EQ(messageOf([&] { node.as_float(); }), expected);
    EXPECT_EQ(messageOf([&] { node.as_uint8(); }), expected);
    EXPECT_THROW(node.as_int(), std::invalid_argument);
}

TEST_F(ConfigNodeTest, NullNodeHasNoValue) {
    const config_node& none = config.find("missing");
    for (auto getter : std::initializer_list<std::function<void()>>{
             [&] { none.as_string(); }, [&] { none.as_int(); }, [&] { none.as_bool(); },
             [&] { none.as_float(); }, [&] { none.as_uint8(); }}) {
        EXPECT_EQ(messageOf(getter), "None node does not have a value");
        EXPECT_THROW(getter(), std::invalid_argument);
    }
}

TEST_F(ConfigNodeTest, IntegersConvertFromTheWholeText) {
    EXPECT_EQ(valued("+42").as_int(), 42);
    EXPECT_EQ(valued("-2147483648").as_int(), INT_MIN);
    EXPECT_EQ(valued("2147483647").as_int(), INT_MAX);
    EXPECT_EQ(valued("007").as_int(), 7);
    EXPECT_EQ(valued("-0").as_int(), 0);
    for (const char* bad : {"", " 42", "42 ", "4.2", "2147483648", "-2147483649", "+", "-", "+-1",
                            "0x10", "1e3", "99999999999999999999"}) {
        EXPECT_THROW(valued(bad).as_int(), boost::bad_lexical_cast) << '"' << bad << '"';
    }
}

TEST_F(ConfigNodeTest, ConversionErrorNamesSourceAndTargetTypes) {
    try {
        valued("abc").as_int();
        FAIL();
    } catch (const boost::bad_lexical_cast& e) {
        EXPECT_EQ(e.source_type(), typeid(std::string));
        EXPECT_EQ(e.target_type(), typeid(int));
    }
    try {
        valued("abc").as_float();
        FAIL();
    } catch (const boost::bad_lexical_cast& e) {
        EXPECT_EQ(e.source_type(), typeid(std::string));
        EXPECT_EQ(e.target_type(), typeid(float));
    }
}

TEST_F(ConfigNodeTest, BooleansAreNonZeroIntegers) {
    EXPECT_TRUE(valued("1").as_bool());
    EXPECT_TRUE(valued("7").as_bool());
    EXPECT_FALSE(valued("0").as_bool());
    EXPECT_THROW(valued("yes").as_bool(), boost::bad_lexical_cast);
    EXPECT_THROW(valued("true").as_bool(), boost::bad_lexical_cast);
}

TEST_F(ConfigNodeTest, Uint8KeepsTheLowEightBits) {
    EXPECT_EQ(valued("300").as_uint8(), 44);
    EXPECT_EQ(valued("-1").as_uint8(), 255);
    EXPECT_EQ(valued("256").as_uint8(), 0);
    EXPECT_THROW(valued("2.5").as_uint8(), boost::bad_lexical_cast);
}

TEST_F(ConfigNodeTest, FloatsConvertFromTheWholeText) {
    EXPECT_EQ(valued("0.25").as_float(), 0.25f);
    EXPECT_EQ(valued("-1.5e2").as_float(), -150.0f);
    EXPECT_EQ(valued("+.5").as_float(), 0.5f);
    EXPECT_EQ(valued("2.").as_float(), 2.0f);
    EXPECT_EQ(valued("6").as_float(), 6.0f);
    EXPECT_EQ(valued("0.1").as_float(), 0.1f);
    EXPECT_EQ(valued("1E+3").as_float(), 1000.0f);
    EXPECT_EQ(valued("1e-50").as_float(), 0.0f);
    EXPECT_EQ(valued("1e-40").as_float(), 1e-40f);
    for (const char* bad : {"", " 1", "1 ", "1e", "1e+", ".", "-", "1.2.3", "0x1p3", "1e39",
                            "nan(1)", "infinit", "1,5", "--1"}) {
        EXPECT_THROW(valued(bad).as_float(), boost::bad_lexical_cast) << '"' << bad << '"';
    }
}

TEST_F(ConfigNodeTest, FloatsAcceptTheNonFiniteSpellings) {
    for (const char* text : {"nan", "NAN", "+nan", "-NaN"})
        EXPECT_TRUE(std::isnan(valued(text).as_float())) << text;
    for (const char* text : {"inf", "INFINITY", "infinity", "+inf"})
        EXPECT_EQ(valued(text).as_float(), HUGE_VALF) << text;
    EXPECT_EQ(valued("-inf").as_float(), -HUGE_VALF);
    EXPECT_EQ(valued("-infinity").as_float(), -HUGE_VALF);
}

// ---- printing and lifetime --------------------------------------------------

TEST_F(ConfigNodeTest, PrintListsNamedThenIndexedChildrenMarkingDefaults) {
    config.child_path("shared.jpeg_quality").set("75", true);
    config.child_path("shared.block_name").set("reference");
    config.child_path("shared.cfg_file_date").set("", true);
    config.child_path("apply_lsc.blocks[1]").set("2");
    config.child_path("apply_lsc.blocks.zeta").set("z");
    std::ostringstream out;
    root.print(out);
    EXPECT_EQ(out.str(), "root = <empty>\n"
                         "root.config = <empty>\n"
                         "root.config.apply_lsc = <empty>\n"
                         "root.config.apply_lsc.blocks = <empty>\n"
                         "root.config.apply_lsc.blocks.zeta = z\n"
                         "root.config.apply_lsc.blocks[0] = <empty>\n"
                         "root.config.apply_lsc.blocks[1] = 2\n"
                         "root.config.shared = <empty>\n"
                         "root.config.shared.block_name = reference\n"
                         "root.config.shared.cfg_file_date = <empty>\n"
                         "root.config.shared.jpeg_quality = *75\n");
}

TEST_F(ConfigNodeTest, NullNodePrintsItsName) {
    std::ostringstream out;
    config.find("missing").print(out);
    EXPECT_EQ(out.str(), "none\n");
}

// Runs `work` on a thread with a small stack: a recursive walk of a few
// thousand levels would overflow it.
void runOnSmallStack(void (*work)()) {
    pthread_attr_t attributes;
    pthread_attr_init(&attributes);
    pthread_attr_setstacksize(&attributes, 64 * 1024);
    pthread_t thread;
    ASSERT_EQ(pthread_create(
                  &thread, &attributes,
                  [](void* argument) -> void* {
                      reinterpret_cast<void (*)()>(argument)();
                      return nullptr;
                  },
                  reinterpret_cast<void*>(work)),
              0);
    pthread_join(thread, nullptr);
    pthread_attr_destroy(&attributes);
}

std::size_t deepPrintedLines = 0;

TEST(ConfigNodeDepth, DeepTreesPrintAndReleaseWithoutRecursion) {
    runOnSmallStack([] {
        auto root = std::make_unique<config_node_impl>("r");
        config_node* node = root.get();
        for (int i = 0; i < 4000; ++i)
            node = i % 2 ? &node->child(0) : &node->child("a");
        node->set("leaf");
        std::ostringstream out;
        root->print(out);
        const std::string text = out.str();
        deepPrintedLines = static_cast<std::size_t>(std::count(text.begin(), text.end(), '\n'));
        root.reset();
    });
    EXPECT_EQ(deepPrintedLines, 4001u);
}

// A path held to the size of one configuration key and one file's entries:
// nested large indices in a short text once tried to build gigabytes of nodes.
TEST_F(ConfigNodeTest, PathThatWouldAddTooManyEntriesIsRefusedBeforeCreatingThem) {
    EXPECT_EQ(messageOf([&] { config.child_path("a[65535][65535][65535][65535]"); }),
              "Configuration path would add more than 262144 new entries: "
              "a[65535][65535][65535][65535]");
    EXPECT_EQ(config.find_path("a[65535][65535][65535]").size(), 0u);
    EXPECT_THROW(config.child_path("b[1][65535][65535][65535][65535][65535][65535]"),
                 std::out_of_range);
}

TEST_F(ConfigNodeTest, EntriesThatExistDoNotCountAgainstAPath) {
    config.child_path("a[65535][65535][65535]");
    EXPECT_EQ(config.child_path("a[65535][65535][65535][3]").name(),
              "root.config.a[65535][65535][65535][3]");
}

TEST_F(ConfigNodeTest, PathLongerThanAKeyIsRefused) {
    std::string path = "a";
    while (path.size() < 1024)
        path += ".a";
    path.resize(1024);
    path.back() = 'b';
    EXPECT_EQ(config.child_path(path).name(), "root.config." + path);
    EXPECT_EQ(messageOf([&] { config.child_path(path + "c"); }),
              "Configuration path longer than 1024 characters: " + path);
    EXPECT_FALSE(config.find_path(path + "c").valid());
}

} // namespace
} // namespace config
