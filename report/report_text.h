#pragma once
// Text pieces of the calibration report: HTML escaping and numbers formatted
// the way the message stream and the report files print them, in every
// locale alike.

#include <string>
#include <string_view>

namespace report {

// & < > " and ' as character references. Control characters other than tab
// and line feed, and bytes that are not UTF-8, become U+FFFD, so a file name
// of any bytes still makes a well-formed page.
std::string htmlEscape(std::string_view text);

// A number as a stream in its default notation prints it with `precision`
// significant digits ("0.0333", "1e+03").
std::string formatGeneral(double value, int precision);

// A number as a stream in fixed notation prints it with `decimals` digits
// after the point ("0.912345").
std::string formatFixed(double value, int decimals);

} // namespace report
