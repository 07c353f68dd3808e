// The configuration file grammar, kept out of every header because Spirit is
// slow to compile. No skipper: white space is accepted only where a rule says
// so, and every character class is plain ASCII.

#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include <boost/phoenix/bind/bind_function.hpp>
#include <boost/phoenix/bind/bind_member_function.hpp>
#include <boost/phoenix/core.hpp>
#include <boost/spirit/include/qi.hpp>
#include <boost/variant.hpp>

#include "config/config_file.h"
#include "config/config_limits.h"
#include "config/config_messages.h"
#include "config/value_text.h"
#include "image/error_detail.h"
#include "image/file_ptr.h"

namespace config {

using img::DetailedError;
using img::systemReason;

namespace {

namespace qi = boost::spirit::qi;
namespace phx = boost::phoenix;

using Iterator = const char*;
using Range = boost::iterator_range<Iterator>;
// Integer lists hold 64-bit numbers: read as 32-bit, a focus distance of
// 2^31 or more would fall through to the float list and be rounded to single
// precision, so a value would change on its way through the text dump.
using Value = boost::variant<std::string, std::vector<std::int64_t>, std::vector<double>>;

// Limits that keep hostile or broken input from building an absurd tree
// (the key length in config_limits.h).
constexpr auto kMaxKeyLength = static_cast<std::ptrdiff_t>(config::kMaxKeyLength);
constexpr std::uint64_t kMaxIndex = 65535;
constexpr std::size_t kMaxNewEntries = 262144; // nodes one text may add

// Files beyond this are not configuration files (and /dev/zero must not hang).
constexpr std::size_t kMaxFileSize = 64u << 20;

// Where in a text a parse error lies, for the detail line under the message:
// "lsc.cfg, line 3" (lines counted as the grammar counts line ends).
struct TextPlace {
    Iterator begin = nullptr;
    std::string sourceName;

    std::string describe(Iterator at) const {
        std::size_t line = 1;
        for (Iterator c = begin; c < at; ++c)
            if (*c == '\n' || (*c == '\r' && !(c + 1 < at && c[1] == '\n')))
                ++line;
        const std::string number = "line " + std::to_string(line);
        return sourceName.empty() ? number : sourceName + ", " + number;
    }
};

[[noreturn]] void throwAt(const TextPlace& place, Iterator at, const std::string& message) {
    throw DetailedError<std::runtime_error>(place.describe(at), message);
}

[[noreturn]] void throwWithText(const TextPlace& place, const char* message, Iterator begin,
                                Iterator end) {
    std::string text(message);
    text += '\n';
    text.append(begin, end);
    throwAt(place, begin, text);
}

// One list element written back as text and widened from single precision,
// so that a list element reads back exactly as the scalar text would.
void convertFloat(const Range& text, double& value, bool& pass) {
    float single = 0.0f;
    pass = parseFloatText(std::string_view(text.begin(), static_cast<std::size_t>(text.size())),
                          single);
    value = single;
}

class ConfigGrammar : public qi::grammar<Iterator> {
public:
    ConfigGrammar(config_node& config, TextPlace place)
        : ConfigGrammar::base_type(settings_), config_(config), place_(std::move(place)) {
        using qi::char_;
        const auto digit = char_("0-9");
        const auto separator = qi::copy(-spaces_ >> ',' >> -spaces_);

        spaces_ = +char_(" \t");
        comment_ = '#' >> *(char_ - char_("\r\n")) >> (qi::eol | qi::eoi);
        // A dash as well: every block name the parameter table accepts
        // (cam-A) must read back from the register file written with it.
        name_ = qi::raw[char_("a-zA-Z") >> *char_("a-zA-Z0-9_-")];
        identifier_ =
            qi::raw[name_][phx::bind(&ConfigGrammar::navigate_first_impl, this, qi::_1)] >>
            *(qi::raw['[' >> +digit >> ']']
                     [phx::bind(&ConfigGrammar::navigate_index_impl, this, qi::_1)] |
              qi::raw['.' >> name_][phx::bind(&ConfigGrammar::navigate_node_impl, this, qi::_1)]);
        string_ = qi::raw['"' >> *(char_ - '"') >> '"'];
        parameter_ = qi::raw[+(char_("a-zA-Z0-9") | char_('_') | char_('/') | char_('\\') |
                               char_(':') | char_('-') | char_('.'))];
        character_ = qi::raw['\'' >> (char_ - '\'') >> '\''];
        integerList_ = '{' >> -spaces_ >> (qi::long_long % separator) >> -spaces_ >> '}';
        floatSyntax_ =
            -char_("+-") >> (qi::no_case["infinity"] | qi::no_case["inf"] | qi::no_case["nan"] |
                             ((+digit >> -('.' >> *digit) | '.' >> +digit) >>
                              -(char_("eE") >> -char_("+-") >> +digit)));
        floatElement_ =
            qi::raw[floatSyntax_][phx::bind(&convertFloat, qi::_1, qi::_val, qi::_pass)];
        floatList_ = '{' >> -spaces_ >> (floatElement_ % separator) >> -spaces_ >> '}';
        value_ = string_ | parameter_ | name_ | character_ | integerList_ | floatList_;
        setting_ = (identifier_ > -spaces_ > '=' > -spaces_ > value_ > -spaces_ >
                    ';')[phx::bind(&ConfigGrammar::set_value_impl, this, qi::_1)];
        settings_ = *(setting_ | comment_ | qi::eol | spaces_);

        settings_.name("settings");
        setting_.name("setting");
        identifier_.name("identifier");
        name_.name("name");
        value_.name("value");
        string_.name("string");
        parameter_.name("parameter");
        character_.name("character");
        integerList_.name("list of integers");
        floatList_.name("list of floats");
        comment_.name("comment");
        spaces_.name("spaces");

        qi::on_error<qi::fail>(
            setting_, phx::bind(&ConfigGrammar::error_handler_impl, this, qi::_1, qi::_3, qi::_4));
    }

private:
    void navigate_first_impl(const Range& step) {
        keyStart_ = step.begin();
        current_ = &config_;
        descendByName(std::string(step.begin(), step.end()), step.end());
    }

    void navigate_node_impl(const Range& step) {
        descendByName(std::string(step.begin() + 1, step.end()), step.end());
    }

    void navigate_index_impl(const Range& step) {
        checkKeyLength(step.end());
        std::uint64_t index = 0;
        for (Iterator c = step.begin() + 1; c + 1 < step.end(); ++c) {
            index = index * 10 + static_cast<std::uint64_t>(*c - '0');
            if (index > kMaxIndex)
                throwWithText(place_, msg::kKeyIndexTooLarge, keyStart_, step.end());
        }
        if (index >= current_->size())
            countNewEntries(index + 1 - current_->size(), step.end());
        current_ = &current_->child(static_cast<std::size_t>(index));
    }

    void descendByName(const std::string& name, Iterator stepEnd) {
        checkKeyLength(stepEnd);
        if (!current_->find(name).valid())
            countNewEntries(1, stepEnd);
        current_ = &current_->child(name);
    }

    void checkKeyLength(Iterator stepEnd) const {
        if (stepEnd - keyStart_ > kMaxKeyLength)
            throwWithText(place_, msg::kKeyTooLong, keyStart_, keyStart_ + kMaxKeyLength);
    }

    void countNewEntries(std::uint64_t count, Iterator stepEnd) {
        newEntries_ += count;
        if (newEntries_ > kMaxNewEntries)
            throwWithText(place_, msg::kTooManyEntries, keyStart_, stepEnd);
    }

    template <typename Number, typename Format>
    void setList(const std::vector<Number>& list, Format format) {
        if (list.size() > current_->size())
            countNewEntries(list.size() - current_->size(), keyStart_);
        for (std::size_t i = 0; i < list.size(); ++i)
            current_->child(i).set(format(list[i]));
    }

    void set_value_impl(const Value& value) {
        if (const auto* text = boost::get<std::string>(&value))
            current_->set(*text);
        else if (const auto* integers = boost::get<std::vector<std::int64_t>>(&value))
            setList(*integers, [](std::int64_t n) { return integerText(n); });
        else
            setList(boost::get<std::vector<double>>(value), [](double d) { return doubleText(d); });
    }

    [[noreturn]] void error_handler_impl(Iterator settingStart, Iterator errorPosition,
                                         const boost::spirit::info& expected) const {
        std::ostringstream message;
        message << msg::kParseExpecting << expected << ":\n";
        message.write(settingStart, errorPosition - settingStart);
        throwAt(place_, settingStart, message.str());
    }

    config_node& config_;
    const TextPlace place_;
    config_node* current_ = nullptr;
    Iterator keyStart_ = nullptr;
    std::uint64_t newEntries_ = 0;

    qi::rule<Iterator> settings_, setting_, identifier_, comment_, spaces_, floatSyntax_;
    qi::rule<Iterator, std::string()> name_, string_, parameter_, character_;
    qi::rule<Iterator, std::vector<std::int64_t>()> integerList_;
    qi::rule<Iterator, double()> floatElement_;
    qi::rule<Iterator, std::vector<double>()> floatList_;
    qi::rule<Iterator, Value()> value_;
};

} // namespace

void parse_config_text(std::string_view text, config_node& config, const std::string& sourceName) {
    const TextPlace place{text.data(), sourceName};
    const ConfigGrammar grammar(config, place);
    Iterator position = text.data();
    const Iterator end = text.data() + text.size();
    qi::parse(position, end, grammar);
    if (position == end)
        return;
    // The stop text runs to the end of its line, whichever line end the file uses.
    Iterator stop = position;
    while (stop != end && *stop != '\n' && *stop != '\r')
        ++stop;
    std::string message = msg::kParseStopped;
    message += '\n';
    message += msg::kStoppedAt;
    message += '"';
    message.append(position, stop);
    message += "\"\n";
    throwAt(place, position, message);
}

std::string read_config_text(const std::string& path) {
    img::FilePtr file(std::fopen(path.c_str(), "rb"));
    if (!file)
        throw DetailedError<std::invalid_argument>(systemReason(path, errno),
                                                   msg::kCannotOpenConfig);
    std::string text;
    char chunk[65536];
    std::size_t got = 0;
    while ((got = std::fread(chunk, 1, sizeof chunk, file.get())) > 0) {
        if (text.size() + got > kMaxFileSize)
            throw DetailedError<std::runtime_error>(path, msg::kConfigTooLarge);
        text.append(chunk, got);
    }
    if (std::ferror(file.get()))
        throw DetailedError<std::invalid_argument>(systemReason(path, errno),
                                                   msg::kCannotOpenConfig);
    return text;
}

void read_config_file(const std::string& path, config_node& config) {
    parse_config_text(read_config_text(path), config, path);
}

} // namespace config
