#pragma once

namespace report {

// Texts of the calibration report writer and its figures.

namespace msg {

inline constexpr char kCannotWriteReport[] = "Cannot write report file: ";
inline constexpr char kReportNeedsBayerImage[] =
    "The report needs a Bayer image of at least 2 x 2 float samples.";
inline constexpr char kReportBadBlockGrid[] = "The report's block grid needs at least one block.";

} // namespace msg

} // namespace report
