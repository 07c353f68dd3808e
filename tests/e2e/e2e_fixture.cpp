#include "tests/e2e/e2e_fixture.h"

#include <cstdint>
#include <fstream>
#include <sstream>

#include "blob/md5.h"

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

std::string outputDigest(std::string bytes) {
    if (bytes.compare(0, 9, "KQRAWFILE") == 0 && bytes.size() >= 68)
        bytes.replace(60, 8, 8, '\0');
    const blob::Md5Digest digest =
        blob::md5(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
    static const char digits[] = "0123456789abcdef";
    std::string hex;
    for (std::uint8_t byte : digest) {
        hex += digits[byte >> 4];
        hex += digits[byte & 15];
    }
    return hex;
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
