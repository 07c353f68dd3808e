// The configuration tree: conversions of values (tests/data/config/
// conversions.json and .golden), paths, limits, printing and depth.

#include <algorithm>
#include <functional>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>

#include <boost/lexical_cast/bad_lexical_cast.hpp>

#include "config/config_node.h"
#include "config/value_text.h"
#include "tests/config/case_data.h"

#include <pthread.h>

namespace config {
namespace {

std::string converted(const std::function<std::string()>& convert) {
    try {
        return convert();
    } catch (const boost::bad_lexical_cast& e) {
        return std::string("bad cast to ") + e.target_type().name();
    }
}

TEST(ConfigNode, ValuesConvertFromTheWholeText) {
    case_data::expectTranscript(
        "config/conversions.json", "config/conversions.golden", [](const nlohmann::json& text) {
            config_node_impl node("n");
            node.set(text.get<std::string>());
            return "int " + converted([&] { return std::to_string(node.as_int()); }) + " | float " +
                   converted([&] { return doubleText(static_cast<double>(node.as_float())); }) +
                   " | bool " + converted([&] { return std::to_string(node.as_bool()); }) +
                   " | uint8 " + converted([&] { return std::to_string(int{node.as_uint8()}); });
        });
}

TEST(ConfigNode, NodesWithoutValueNameThemselves) {
    config_node_impl root("root");
    config_node& unset = root.child_path("config.lsc.max_gain");
    const config_node& none = root.find("missing");
    for (const auto& [node, message] :
         {std::pair<const config_node*, std::string>{
              &unset, "Parameter root.config.lsc.max_gain not initialized"},
          {&none, "None node does not have a value"}})
        for (const std::function<void()>& get : std::initializer_list<std::function<void()>>{
                 [&] { node->as_string(); }, [&] { node->as_int(); }, [&] { node->as_bool(); },
                 [&] { node->as_float(); }, [&] { node->as_uint8(); }}) {
            EXPECT_EQ(case_data::errorOf(get), message);
            EXPECT_THROW(get(), std::invalid_argument);
        }
    std::ostringstream out;
    none.print(out);
    EXPECT_EQ(out.str(), "none\n");
}

TEST(ConfigNode, NavigationCreatesOnlyWhenAsked) {
    config_node_impl root("root");
    config_node& config = root.child("config");
    EXPECT_FALSE(config.find("missing").find("deeper").find(3).valid());
    EXPECT_FALSE(config.find(0).valid());
    EXPECT_TRUE(static_cast<config_node_impl&>(config).namedChildren().empty());
    EXPECT_EQ(config.size(), 0u);

    config_node& none = config_node_none::instance();
    EXPECT_EQ(&none.child("a"), &none);
    EXPECT_EQ(&none[7], &none);
    none.set("x");
    EXPECT_FALSE(none.initialized());

    config_node& cell = config.child_path("apply_lsc.ccm[1][2]");
    EXPECT_EQ(cell.name(), "root.config.apply_lsc.ccm[1][2]");
    EXPECT_EQ(&config.child("apply_lsc").child("ccm").child(1).child(2), &cell);
    EXPECT_EQ(&config["apply_lsc"], &config.child("apply_lsc"));
    EXPECT_EQ(&config.find_path("apply_lsc.ccm[1][2]"), &cell);
    EXPECT_EQ(&root.find_path("config.apply_lsc"), &config.child("apply_lsc"));
    EXPECT_EQ(&config.find("apply_lsc").find_path("ccm[1]"),
              &config.child_path("apply_lsc.ccm[1]"));
    EXPECT_EQ(config.find_path("apply_lsc.ccm").size(), 2u); // index 0 filled in, uninitialized
    EXPECT_TRUE(config.find_path("apply_lsc.ccm[0]").valid());
    EXPECT_FALSE(config.find_path("apply_lsc.ccm[0]").initialized());
    for (const char* missing :
         {"apply_lsc.ccm[3]", "apply_lsc.ccm[99999999999999999999999]", "nothing.here"})
        EXPECT_FALSE(config.find_path(missing).valid()) << missing;
    for (const char* path : {"", ".a", "a.", "a..b", "a[", "a[]", "a[1", "a[x]", "a b", "a]"})
        EXPECT_THROW(config.find_path(path), std::invalid_argument) << path;
    EXPECT_EQ(case_data::errorOf([&] { config.child_path("a..b"); }),
              "Invalid configuration path: a..b");

    EXPECT_EQ(config_relative_path(config, config.child_path("shared.block_name")),
              "shared.block_name");
    EXPECT_EQ(config_relative_path(config, root.child("other")), "root.other");
    EXPECT_EQ(config_relative_path(root.child("conf"), config.child("x")), "root.config.x");

    config_node& node = config.child("jpeg_quality");
    node.set("75", true);
    EXPECT_TRUE(node.initialized() && node.is_default());
    node.set("80");
    EXPECT_FALSE(node.is_default());
}

// Large indices, paths and entry counts are refused before any node is made.
TEST(ConfigNode, OversizedPathsAreRefusedBeforeCreatingNodes) {
    config_node_impl root("root");
    config_node& config = root.child("config");
    config_node& list = config.child("a");
    EXPECT_EQ(
        case_data::errorOf([&] { list.child(4000000000u); }),
        "Index 4000000000 of root.config.a is too large, the largest allowed index is 65535.");
    EXPECT_THROW(list.child(65536), std::out_of_range);
    EXPECT_EQ(list.size(), 0u);
    EXPECT_EQ(list.child(65535).name(), "root.config.a[65535]");

    EXPECT_EQ(case_data::errorOf([&] { config.child_path("b[65535][65535][65535][65535]"); }),
              "Configuration path would add more than 262144 new entries: "
              "b[65535][65535][65535][65535]");
    EXPECT_EQ(config.find_path("b[65535][65535][65535]").size(), 0u);
    EXPECT_THROW(config.child_path("c[1][65535][65535][65535][65535][65535][65535]"),
                 std::out_of_range);
    config.child_path("b[65535][65535][65535]"); // what exists does not count again
    EXPECT_EQ(config.child_path("b[65535][65535][65535][3]").name(),
              "root.config.b[65535][65535][65535][3]");

    std::string path = "a";
    while (path.size() < 1024)
        path += ".a";
    path.resize(1024);
    path.back() = 'b';
    EXPECT_EQ(config.child_path(path).name(), "root.config." + path);
    EXPECT_EQ(case_data::errorOf([&] { config.child_path(path + "c"); }),
              "Configuration path longer than 1024 characters: " + path);
    EXPECT_FALSE(config.find_path(path + "c").valid());
}

TEST(ConfigNode, PrintListsNamedThenIndexedChildrenMarkingDefaults) {
    config_node_impl root("root");
    config_node& config = root.child("config");
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

// On a 64 KiB stack a recursive walk of 4000 levels would overflow.
std::size_t deepPrintedLines = 0;

TEST(ConfigNode, DeepTreesPrintAndReleaseWithoutRecursion) {
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
