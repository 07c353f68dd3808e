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
    const std::pair<const char*, const char*> cases[] = {
        {"in_order", "640\n480\n10\n3\nn\n1\n512\n"},
        {"repeated", "4\n4\n0\n17\n12\n5\nx\n2\ny\n1\n0\n"},
        {"not_numbers", "wide\n-3\n 8 \n99999999999\n6\n16\n4\nY\n2\n18446744073709551615\n"},
        {"no_input", ""},
        {"ends_at_depth", "640\n480\n"},
        {"ends_after_a_wrong_depth", "640\n480\n99\n"},
        {"ends_at_header_size", "1\n1\n8\n1\nY\n1\n"},
    };
    for (const auto& [name, input] : cases) {
        std::FILE* in = std::tmpfile();
        std::FILE* out = std::tmpfile();
        std::FILE* err = std::tmpfile();
        std::fputs(input, in);
        std::rewind(in);
        RawLayout l;
        const int rc = askRawLayout(in, out, err, &l);
        std::fprintf(err, "\n--- result %d", rc); // and the layout taken
        if (rc == 0)
            std::fprintf(err, ": %ux%u, %u bits, %s, %s, %u images, header %llu", l.width, l.height,
                         l.bitDepth, cfaPatternName(l.cfa),
                         l.littleEndian ? "little-endian" : "big-endian", l.images,
                         static_cast<unsigned long long>(l.headerSize));
        testing_support::expectGolden(std::string("image/prompt/") + name + ".txt",
                                      testing_support::readStream(out) + "\n--- error output\n" +
                                          testing_support::readStream(err));
        for (std::FILE* file : {in, out, err})
            std::fclose(file);
    }
}

} // namespace
} // namespace img
