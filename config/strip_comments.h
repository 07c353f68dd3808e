#pragma once
// A Boost.Iostreams line filter that cuts each line before its first comment
// character standing outside double quotes. Filters stack: the headerless raw
// details reader pushes one for ";" and one for "#".

#include <string>

#include <boost/iostreams/filter/line.hpp>

namespace config {

class strip_comments : public boost::iostreams::line_filter {
public:
    explicit strip_comments(char commentChar) : commentChar_(commentChar) {}

    // The line up to (not including) the first comment character outside
    // quotes; a doubled quote inside quoted text keeps the text quoted.
    static std::string strip(const std::string& line, char commentChar);

private:
    std::string do_filter(const std::string& line) override { return strip(line, commentChar_); }

    char commentChar_;
};

} // namespace config
