// The installed manual: the man page made at build time names every option of
// the help text and every configuration key the program knows, so an option
// or key added later cannot be left out of it.

#include <regex>

#include "config/config_node.h"
#include "config/parameter_table.h"
#include "tests/e2e/e2e_fixture.h"

namespace e2e {

using config::config_node_impl;
using config::set_defaults;
namespace {

// The man page as a reader sees its words: no font changes, minus signs and
// backslashes as typed.
std::string manualText() {
    std::string text = testing_support::readFile(LSC_MANPAGE);
    text = std::regex_replace(text, std::regex(R"(\\f[BIRP])"), "");
    text = std::regex_replace(text, std::regex(R"(\\-)"), "-");
    text = std::regex_replace(text, std::regex(R"(\\&)"), "");
    return std::regex_replace(text, std::regex(R"(\\e)"), "\\");
}

bool containsWord(const std::string& text, const std::string& word) {
    const std::regex whole("(^|[^\\w.-])" +
                           std::regex_replace(word, std::regex(R"([.\-])"), R"(\$&)") +
                           "($|[^\\w-])");
    return std::regex_search(text, whole);
}

TEST(ManualPage, NamesEveryOptionOfTheHelpText) {
    const std::string manual = manualText();
    const auto help = testing_support::runTool({"--help", "--kq"});
    ASSERT_EQ(help.status, 0);
    // "  -i [ --input ] arg ..." is "-i, --input" in the manual; "  --kq" is "--kq".
    const std::regex option(R"(^  (?:-(\w) \[ (--[\w-]+) \]|(--[\w-]+)))");
    int options = 0;
    for (const std::string& line : lines(help.out)) {
        std::smatch match;
        if (!std::regex_search(line, match, option))
            continue;
        ++options;
        const std::string entry =
            match[1].matched ? "-" + match[1].str() + ", " + match[2].str() : match[3].str();
        EXPECT_NE(manual.find("\n" + entry), std::string::npos) << entry;
    }
    EXPECT_GE(options, 28);
    EXPECT_TRUE(containsWord(manual, "-h")) << "the manual should say that -h is accepted";
}

TEST(ManualPage, NamesEveryConfigurationKey) {
    const std::string manual = manualText();
    config_node_impl defaults("defaults");
    set_defaults(defaults);
    int keys = 0;
    for (const auto& [sectionName, section] : defaults.namedChildren())
        for (const auto& key : section->namedChildren()) {
            ++keys;
            EXPECT_TRUE(containsWord(manual, sectionName + "." + key.first))
                << sectionName << "." << key.first;
        }
    EXPECT_GE(keys, 50);
}

} // namespace
} // namespace e2e
