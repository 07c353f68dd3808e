// The questions about a headerless file's layout, over given answers; what
// they print (questions, then the error output) is a golden file per case under
// tests/data/image/prompt/.

#include <cstdio>
#include <string>

#include <gtest/gtest.h>

#include "image/image_buffer.h"
#include "image/raw_prompt.h"
#include "tests/blob/golden_file.h"
#include "tests/support/temp_dir.h"

namespace img {
namespace {

TEST(RawPrompt, AsksUntilEachAnswerIsValidAndFailsAtTheEndOfInput) {
    const struct {
        const char* name;
        const char* input;
        int result;
        RawLayout layout;
    } cases[] = {
        {"in_order", "640\n480\n10\n3\nn\n1\n512\n", 0, {640, 480, 10, kCfaGrbg, false, 1, 512}},
        {"repeated", "4\n4\n0\n17\n12\n5\nx\n2\ny\n1\n0\n", 0, {4, 4, 12, kCfaBggr, true, 1, 0}},
        {"not_numbers",
         "wide\n-3\n 8 \n99999999999\n6\n16\n4\nY\n2\n18446744073709551615\n",
         0,
         {8, 6, 16, kCfaGbrg, true, 2, 18446744073709551615ull}},
        {"no_input", "", -2, {}},
        {"ends_at_depth", "640\n480\n", -2, {}},
        {"ends_after_a_wrong_depth", "640\n480\n99\n", -2, {}},
        {"ends_at_header_size", "1\n1\n8\n1\nY\n1\n", -2, {}},
    };
    for (const auto& c : cases) {
        std::FILE* in = std::tmpfile();
        std::FILE* out = std::tmpfile();
        std::FILE* err = std::tmpfile();
        std::fputs(c.input, in);
        std::rewind(in);
        RawLayout layout;
        EXPECT_EQ(askRawLayout(in, out, err, &layout), c.result) << c.name;
        if (c.result == 0) {
            EXPECT_EQ(std::make_tuple(layout.width, layout.height, layout.bitDepth, layout.cfa,
                                      layout.littleEndian, layout.images, layout.headerSize),
                      std::make_tuple(c.layout.width, c.layout.height, c.layout.bitDepth,
                                      c.layout.cfa, c.layout.littleEndian, c.layout.images,
                                      c.layout.headerSize))
                << c.name;
        }
        testing_support::expectGolden(std::string("image/prompt/") + c.name + ".txt",
                                      testing_support::readStream(out) + "\n--- error output\n" +
                                          testing_support::readStream(err));
        for (std::FILE* file : {in, out, err})
            std::fclose(file);
    }
}

} // namespace
} // namespace img
