#include "tools/flatfield/module_shading.h"

#include <algorithm>
#include <cmath>
#include <fstream>
#include <limits>
#include <stdexcept>

#include <nlohmann/json.hpp>

namespace flatfield {

namespace {

constexpr int kCells = ModuleShading::kColumns * ModuleShading::kRows;

// Channel of the pixel at (x, y) for Bayer phase `phase`.
int channelOf(int phase, int x, int y) {
    return ((x + phase) & 1) + ((y + (phase >> 1)) & 1) * 2;
}

// The "rpi.alsc" block: a top-level key in version 1 files, one entry of the
// "algorithms" list in version 2 files.
const nlohmann::json* alscBlock(const nlohmann::json& tuning) {
    if (!tuning.is_object())
        return nullptr;
    if (tuning.contains("rpi.alsc"))
        return &tuning["rpi.alsc"];
    const auto algorithms = tuning.find("algorithms");
    if (algorithms == tuning.end() || !algorithms->is_array())
        return nullptr;
    for (const nlohmann::json& entry : *algorithms)
        if (entry.is_object() && entry.contains("rpi.alsc"))
            return &entry["rpi.alsc"];
    return nullptr;
}

std::vector<double> gainTable(const nlohmann::json& table, const std::string& what) {
    if (!table.is_array() || table.size() != std::size_t(kCells))
        throw std::runtime_error(what + ": expected " + std::to_string(kCells) + " gains");
    std::vector<double> gains;
    for (const nlohmann::json& value : table) {
        if (!value.is_number() || !(value.get<double>() > 0.0) ||
            !std::isfinite(value.get<double>()))
            throw std::runtime_error(what + ": a gain is not a positive number");
        gains.push_back(value.get<double>());
    }
    return gains;
}

// The table of the calibration whose "ct" lies nearest `temperature` (the
// first one on a tie), and that colour temperature.
std::vector<double> nearestTable(const nlohmann::json& calibrations, double temperature,
                                 const std::string& what, double* chosen) {
    if (!calibrations.is_array() || calibrations.empty())
        throw std::runtime_error(what + ": no calibrations");
    const nlohmann::json* best = nullptr;
    double bestDistance = std::numeric_limits<double>::infinity();
    for (const nlohmann::json& calibration : calibrations) {
        if (!calibration.is_object() || !calibration.contains("ct") ||
            !calibration["ct"].is_number() || !calibration.contains("table"))
            throw std::runtime_error(what + ": a calibration without ct or table");
        const double distance = std::fabs(calibration["ct"].get<double>() - temperature);
        if (distance < bestDistance) {
            bestDistance = distance;
            best = &calibration;
        }
    }
    *chosen = (*best)["ct"].get<double>();
    return gainTable((*best)["table"], what);
}

// Second derivatives of the natural spline through the unit node `node`
// (uniform spacing h): M_0 = M_n-1 = 0, M_i-1 + 4 M_i + M_i+1 = 6 (y_i-1 - 2 y_i + y_i+1) / h^2.
std::vector<double> unitSecondDerivatives(int count, double h, int node) {
    std::vector<double> m(std::size_t(count), 0.0);
    const int inner = count - 2;
    if (inner <= 0)
        return m;
    auto y = [node](int i) { return i == node ? 1.0 : 0.0; };
    std::vector<double> diagonal(std::size_t(inner), 4.0);
    std::vector<double> rhs(std::size_t(inner), 0.0);
    for (int i = 0; i < inner; ++i)
        rhs[std::size_t(i)] = 6.0 * (y(i) - 2.0 * y(i + 1) + y(i + 2)) / (h * h);
    // Thomas algorithm on the tridiagonal (1, 4, 1) system.
    for (int i = 1; i < inner; ++i) {
        const double factor = 1.0 / diagonal[std::size_t(i - 1)];
        diagonal[std::size_t(i)] -= factor;
        rhs[std::size_t(i)] -= factor * rhs[std::size_t(i - 1)];
    }
    for (int i = inner - 1; i >= 0; --i) {
        const double next = i + 1 < inner ? m[std::size_t(i + 2)] : 0.0;
        m[std::size_t(i + 1)] = (rhs[std::size_t(i)] - next) / diagonal[std::size_t(i)];
    }
    return m;
}

// Weights of every pixel centre 0.5, 1.5, ... of an axis of `size` pixels:
// size rows of `count` weights.
std::vector<double> axisWeights(int count, int size) {
    std::vector<double> weights;
    weights.reserve(std::size_t(size) * std::size_t(count));
    for (int i = 0; i < size; ++i) {
        const std::vector<double> w = splineWeights(count, size, i + 0.5);
        weights.insert(weights.end(), w.begin(), w.end());
    }
    return weights;
}

} // namespace

std::vector<double> splineWeights(int count, double size, double t) {
    if (count < 2 || !(size > 0.0))
        throw std::invalid_argument("spline: at least two nodes over a positive size");
    const double h = size / count;
    const double p0 = 0.5 * h;
    std::vector<double> weights(std::size_t(count), 0.0);
    for (int node = 0; node < count; ++node) {
        const std::vector<double> m = unitSecondDerivatives(count, h, node);
        auto y = [node](int i) { return i == node ? 1.0 : 0.0; };
        const double position = (t - p0) / h;
        double value;
        if (position <= 0.0) {
            const double slope = (y(1) - y(0)) / h - h * (2.0 * m[0] + m[1]) / 6.0;
            value = y(0) + (t - p0) * slope;
        } else if (position >= count - 1) {
            const int last = count - 1;
            const double slope = (y(last) - y(last - 1)) / h +
                                 h * (m[std::size_t(last - 1)] + 2.0 * m[std::size_t(last)]) / 6.0;
            value = y(last) + (t - (p0 + last * h)) * slope;
        } else {
            const int i = static_cast<int>(std::floor(position));
            const double s = position - i, r = 1.0 - s;
            value =
                r * y(i) + s * y(i + 1) +
                h * h / 6.0 *
                    ((r * r * r - r) * m[std::size_t(i)] + (s * s * s - s) * m[std::size_t(i + 1)]);
        }
        weights[std::size_t(node)] = value;
    }
    return weights;
}

ModuleShading ModuleShading::fromTuningFile(const std::string& path, double colourTemperature) {
    std::ifstream in(path, std::ios::binary);
    if (!in)
        throw std::runtime_error(path + ": cannot read the tuning file");
    nlohmann::json tuning;
    try {
        in >> tuning;
    } catch (const nlohmann::json::exception& error) {
        throw std::runtime_error(path + ": not a JSON file (" + error.what() + ")");
    }
    const nlohmann::json* alsc = alscBlock(tuning);
    if (!alsc || !alsc->is_object() || !alsc->contains("luminance_lut") ||
        !alsc->contains("calibrations_Cr") || !alsc->contains("calibrations_Cb"))
        throw std::runtime_error(path + ": no rpi.alsc block with luminance and colour tables");
    const std::vector<double> lum = gainTable((*alsc)["luminance_lut"], path + ": luminance_lut");
    double crTemperature = 0.0, cbTemperature = 0.0;
    const std::vector<double> cr = nearestTable((*alsc)["calibrations_Cr"], colourTemperature,
                                                path + ": calibrations_Cr", &crTemperature);
    const std::vector<double> cb = nearestTable((*alsc)["calibrations_Cb"], colourTemperature,
                                                path + ": calibrations_Cb", &cbTemperature);
    Table table;
    for (std::size_t i = 0; i < std::size_t(kCells); ++i) {
        table[0].push_back(1.0 / (lum[i] * cr[i]));
        table[1].push_back(1.0 / lum[i]);
        table[2].push_back(1.0 / lum[i]);
        table[3].push_back(1.0 / (lum[i] * cb[i]));
    }
    ModuleShading shading(table);
    shading.crTemperature = crTemperature;
    shading.cbTemperature = cbTemperature;
    return shading;
}

ModuleShading::ModuleShading(Table table) {
    double brightestGreen = 0.0;
    for (int k = 0; k < 4; ++k)
        if (table[std::size_t(k)].size() != std::size_t(kCells))
            throw std::invalid_argument("module shading: 16 x 12 values per channel");
    for (double value : table[1])
        brightestGreen = std::max(brightestGreen, value);
    for (int k = 0; k < 4; ++k)
        for (double value : table[std::size_t(k)]) {
            if (!(value > 0.0) || !std::isfinite(value))
                throw std::invalid_argument("module shading: values must be positive");
            log_[std::size_t(k)].push_back(std::log(value / brightestGreen));
        }
}

double ModuleShading::cell(int channel, int column, int row) const {
    return std::exp(log_[std::size_t(channel)][std::size_t(row * kColumns + column)]);
}

double ModuleShading::at(int channel, double x, double y, int width, int height) const {
    const std::vector<double> wx = splineWeights(kColumns, width, x);
    const std::vector<double> wy = splineWeights(kRows, height, y);
    const std::vector<double>& log = log_[std::size_t(channel)];
    double sum = 0.0;
    for (int j = 0; j < kRows; ++j)
        for (int i = 0; i < kColumns; ++i)
            sum += wy[std::size_t(j)] * wx[std::size_t(i)] * log[std::size_t(j * kColumns + i)];
    return std::exp(sum);
}

std::vector<double> ModuleShading::mosaic(int width, int height, int phase) const {
    const std::vector<double> wx = axisWeights(kColumns, width);
    const std::vector<double> wy = axisWeights(kRows, height);
    std::vector<double> values(std::size_t(width) * std::size_t(height));
    double rowLog[4][kColumns];
    for (int y = 0; y < height; ++y) {
        // The spline along y first: one row of 16 logarithms per channel.
        const double* weightsY = &wy[std::size_t(y) * kRows];
        for (int k = 0; k < 4; ++k)
            for (int i = 0; i < kColumns; ++i) {
                double sum = 0.0;
                for (int j = 0; j < kRows; ++j)
                    sum += weightsY[j] * log_[std::size_t(k)][std::size_t(j * kColumns + i)];
                rowLog[k][i] = sum;
            }
        double* out = &values[std::size_t(y) * std::size_t(width)];
        for (int x = 0; x < width; ++x) {
            const double* weightsX = &wx[std::size_t(x) * kColumns];
            const double* logs = rowLog[channelOf(phase, x, y)];
            double sum = 0.0;
            for (int i = 0; i < kColumns; ++i)
                sum += weightsX[i] * logs[i];
            out[x] = std::exp(sum);
        }
    }
    return values;
}

} // namespace flatfield
