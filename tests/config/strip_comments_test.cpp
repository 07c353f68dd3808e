#include <sstream>
#include <string>

#include <boost/iostreams/copy.hpp>
#include <boost/iostreams/filtering_stream.hpp>
#include <gtest/gtest.h>

#include "config/strip_comments.h"

namespace config {
namespace {

TEST(StripComments, CutsAtTheFirstCommentOutsideQuotes) {
    EXPECT_EQ(strip_comments::strip("a = \"x;y\"; rest", ';'), "a = \"x;y\"");
    EXPECT_EQ(strip_comments::strip("no comment here", ';'), "no comment here");
    EXPECT_EQ(strip_comments::strip("; all comment", ';'), "");
    EXPECT_EQ(strip_comments::strip("a = 1 # note", '#'), "a = 1 ");
}

TEST(StripComments, DoubledQuoteStaysInsideTheQuotedText) {
    EXPECT_EQ(strip_comments::strip("a = \"x\"\";y\" ;c", ';'), "a = \"x\"\";y\" ");
    EXPECT_EQ(strip_comments::strip("a = \"x\";y", ';'), "a = \"x\"");
    EXPECT_EQ(strip_comments::strip("a = \"x\" \"y;z\";w", ';'), "a = \"x\" \"y;z\"");
    EXPECT_EQ(strip_comments::strip("a = \"open;", ';'), "a = \"open;");
}

TEST(StripComments, StackedFiltersRemoveBothCommentStyles) {
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

} // namespace
} // namespace config
