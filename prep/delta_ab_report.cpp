#include "prep/delta_ab_report.h"

#include <cstdio>
#include <iomanip>
#include <locale>
#include <sstream>
#include <stdexcept>

#include "image/output_file.h"
#include "prep/prep_messages.h"

namespace prep {

using img::OutputFile;
namespace {

// Report files read the same in every locale.
std::ostringstream reportText() {
    std::ostringstream text;
    text.imbue(std::locale::classic());
    return text;
}

void writeReport(const std::string& path, const std::string& text) {
    OutputFile file;
    if (!file.open(path))
        throw std::string(msg::kCannotOpenFile) + path;
    if (std::fwrite(text.data(), 1, text.size(), file.stream()) != text.size() || !file.commit())
        throw std::string(msg::kCannotWriteFile) + path;
}

} // namespace

std::string formatDeltaFile(const DeltaAbResult& result) {
    const std::size_t columns = static_cast<std::size_t>(result.columns > 0 ? result.columns : 0);
    const std::size_t rows = static_cast<std::size_t>(result.rows > 0 ? result.rows : 0);
    if (result.deltaImage.size() != columns * rows)
        throw std::invalid_argument(msg::kDeltaGridMismatch);
    std::ostringstream text = reportText();
    text << std::fixed << std::setprecision(5);
    for (std::size_t row = 0; row < rows; ++row) {
        for (std::size_t column = 0; column < columns; ++column)
            text << result.deltaImage[row * columns + column] << ',';
        text << '\n';
    }
    text << '\n';
    return text.str();
}

std::string formatStatsFile(const DeltaAbResult& result) {
    std::ostringstream text = reportText();
    text << result.meanChroma << ", " << result.maxDelta << ", " << result.deltaStdDev << '\n';
    return text.str();
}

void writeDeltaFile(const std::string& path, const DeltaAbResult& result) {
    writeReport(path, formatDeltaFile(result));
}

void writeStatsFile(const std::string& path, const DeltaAbResult& result) {
    writeReport(path, formatStatsFile(result));
}

void checkDeltaThreshold(float maxDelta, float threshold) {
    if (maxDelta <= threshold)
        return;
    std::ostringstream text = reportText();
    text << msg::kDeltaAboveThreshold << threshold << '\n' << msg::kPossibleCauses;
    throw std::range_error(text.str());
}

} // namespace prep
