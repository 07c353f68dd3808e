#include "tests/e2e/e2e_fixture.h"

#include <fstream>
#include <sstream>

namespace e2e {

void expectGolden(const std::string& actual, const std::string& goldenName) {
    const std::string golden = testing_support::readFile(kGoldenDir + goldenName);
    if (actual == golden)
        return;
    const std::string kept = goldenName + ".actual";
    std::ofstream(kept, std::ios::binary) << actual;
    ADD_FAILURE() << goldenName << " differs; see: diff " << kGoldenDir << goldenName << " "
                  << kept;
}

std::vector<std::string> lines(const std::string& text) {
    std::vector<std::string> result;
    std::istringstream in(text);
    std::string line;
    while (std::getline(in, line))
        result.push_back(line);
    return result;
}

bool hasLine(const std::string& text, const std::string& needle) {
    for (const std::string& line : lines(text))
        if (line == needle)
            return true;
    return false;
}

} // namespace e2e
