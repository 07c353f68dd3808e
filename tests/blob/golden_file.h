#pragma once
// Golden files under tests/data/: an output is compared with the file that
// holds it; LSC_GOLDEN_UPDATE=1 rewrites the file from the current build
// instead (every diff of a golden file is reviewed before it is committed).

#include <cstdio>
#include <cstdlib>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/support/temp_dir.h"

namespace testing_support {

inline std::string dataPath(const std::string& name) {
    return std::string(LSC_SOURCE_DIR) + "/tests/data/" + name;
}

// The rows of a case table under tests/data/: its lines but the empty ones
// and the comments ('#' first).
inline std::vector<std::string> dataRows(const std::string& name) {
    std::vector<std::string> rows;
    std::istringstream in(readFile(dataPath(name)));
    for (std::string line; std::getline(in, line);)
        if (!line.empty() && line[0] != '#')
            rows.push_back(line);
    return rows;
}

// A large output (a fixed-header raw file is ~300 KB, nearly all zeros) is
// kept as its size and the hex of its 16-byte rows that are not all zero.
inline std::string sparseHex(const std::string& bytes) {
    std::string text = std::to_string(bytes.size()) + " bytes, rows not all zero:\n";
    for (std::size_t row = 0; row < bytes.size(); row += 16) {
        const std::string part = bytes.substr(row, 16);
        if (part.find_first_not_of('\0') == std::string::npos)
            continue;
        char hex[24];
        std::snprintf(hex, sizeof hex, "%08zx:", row);
        text += hex;
        for (const char c : part) {
            std::snprintf(hex, sizeof hex, " %02x", static_cast<unsigned char>(c));
            text += hex;
        }
        text += "\n";
    }
    return text;
}

inline void expectGolden(std::string name, std::string actual) {
    if (actual.size() > 65536) {
        name += ".hex";
        actual = sparseHex(actual);
    }
    const char* update = std::getenv("LSC_GOLDEN_UPDATE");
    if (update && std::string(update) == "1")
        return writeFile(dataPath(name), actual);
    ASSERT_TRUE(fileExists(dataPath(name))) << name << " is missing";
    const std::string expected = readFile(dataPath(name));
    std::size_t at = 0;
    while (at < expected.size() && at < actual.size() && expected[at] == actual[at])
        ++at;
    EXPECT_TRUE(expected == actual) << name << " differs from byte " << at << " on (sizes "
                                    << expected.size() << " and " << actual.size() << ")";
}

} // namespace testing_support
