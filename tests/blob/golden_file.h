#pragma once
// Golden files under tests/data/: an output is compared with the file that
// holds it; LSC_GOLDEN_UPDATE=1 rewrites the file from the current build
// instead (every diff of a golden file is reviewed before it is committed).

#include <cstdlib>
#include <string>

#include <gtest/gtest.h>

#include "tests/support/temp_dir.h"

namespace testing_support {

inline std::string dataPath(const std::string& name) {
    return std::string(LSC_SOURCE_DIR) + "/tests/data/" + name;
}

inline void expectGolden(const std::string& name, const std::string& actual) {
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
