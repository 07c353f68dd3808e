#pragma once
// A filled-in report of a plausible passing run: a 640 x 480 RGGB capture
// prepared to 160 x 120, bowl-shaped gain surfaces, shading that falls off
// towards the corners, a small residual and a delta ab grid under the
// threshold. Tests change the parts they are about.

#include <cmath>
#include <cstdint>

#include "report/run_report.h"

namespace report::test {

inline ChannelBlockMeans exampleBlocks(int columns, int rows,
                                       float (*value)(int k, double u, double v)) {
    ChannelBlockMeans means;
    means.columns = columns;
    means.rows = rows;
    for (int k = 0; k < lsc::kChannels; ++k)
        for (int r = 0; r < rows; ++r)
            for (int c = 0; c < columns; ++c)
                means.mean[k].push_back(value(k, (c + 0.5) / columns, (r + 0.5) / rows));
    return means;
}

inline RunReport exampleRunReport() {
    RunReport report;
    report.finished = true;
    report.toolVersion = "3.8.1";
    report.commandLine = "--config lsc.cfg --input flatfield.kqraw --calibrate calibration.txt "
                         "--kq --report report.html";
    report.changedSettings = {{"shared.block_name", "CAM0"}, {"apply_lsc.max_delta_ab", "8.0"}};

    report.haveInput = true;
    report.inputPath = "captures/flatfield.kqraw";
    report.width = 640;
    report.height = 480;
    report.bayerOrder = "RGGB";
    report.bitDepth = 10;
    report.exposureTime = 0.0333f;
    for (float& gain : report.gains)
        gain = 1.0f;

    report.havePrepared = true;
    report.preparedWidth = 160;
    report.preparedHeight = 120;
    report.shadingBefore = exampleBlocks(16, 12, [](int k, double u, double v) {
        const double r2 = (u - 0.5) * (u - 0.5) + (v - 0.5) * (v - 0.5);
        return static_cast<float>(1.0 - (0.9 + 0.1 * k) * r2 * 1.4);
    });

    report.haveFit = true;
    for (int k = 0; k < lsc::kChannels; ++k)
        for (int r = 0; r < 10; ++r)
            for (int c = 0; c < 10; ++c)
                report.controlGrids[k][r * 10 + c] = static_cast<float>(
                    1.0 + (0.5 + 0.1 * k) * ((r - 4.5) * (r - 4.5) + (c - 4.5) * (c - 4.5)) / 40.5);
    for (std::uint32_t y = 0; y < 120; y += 8)
        for (std::uint32_t x = 0; x < 160; x += 8)
            report.samplePoints.emplace_back(x, y);
    report.targetLevels[0] = 0.41f;
    report.targetLevels[1] = report.targetLevels[2] = 0.62f;
    report.targetLevels[3] = 0.37f;
    report.maxGain = 6.0f;

    report.haveResidual = true;
    report.residualAfter = exampleBlocks(16, 12, [](int k, double u, double v) {
        return static_cast<float>(0.006 * std::sin(6.0 * u + k) * std::cos(5.0 * v));
    });
    report.haveWhiteBalance = true;
    report.measuredRatios[0] = 0.661290f;
    report.measuredRatios[1] = 0.596774f;
    report.flattenedRatios[0] = 1.000124f;
    report.flattenedRatios[1] = 0.999871f;

    report.haveDelta = true;
    report.deltaColumns = 20;
    report.deltaRows = 15;
    for (int r = 0; r < 15; ++r)
        for (int c = 0; c < 20; ++c)
            report.delta.push_back(
                static_cast<float>(0.4 + 2.5 * std::fabs(std::sin(0.3 * c) * std::cos(0.25 * r))));
    report.threshold = 8.0f;
    report.maxDelta = 2.891234f;
    report.meanChroma = 1.23457f;
    report.deltaStdDev = 0.654321f;
    return report;
}

} // namespace report::test
