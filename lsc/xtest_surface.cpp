#include "lsc/xtest_surface.h"

namespace lsc {

namespace {

// Red (and blue) control points in units of 1/4096, row by row; green is
// 1 - red. Rows 1-2 and 7-8 carry +-17521 and -13425 (4.2775879 and
// -3.2775879) in checkerboards at columns 1-2 and 7-8, mirrored so that they
// draw the two diagonals; everything else stays within -1 .. 2 for both
// colours. The first row is the one the X test has always used.
// clang-format off
constexpr int kRedUnits[kGridPoints] = {
     -1,    5418,   1538,  2798, 2722, 2667, 2825,   1348,   5791, -431,
   5302,   17521, -13425,  2140, 2061, 2093, 2201, -13425,  17521, 5120,
   1610,  -13425,  17521,  1862, 1987, 1955, 1840,  17521, -13425, 1702,
   2750,    2016,   1795,  2048, 2050, 2046, 2044,   1808,   2031, 2733,
   2700,    2090,   1981,  2052, 2048, 2048, 2050,   1990,   2077, 2690,
   2688,    2085,   1975,  2049, 2048, 2048, 2047,   1984,   2070, 2705,
   2811,    2010,   1801,  2041, 2053, 2051, 2045,   1812,   2024, 2790,
   1355,  -13425,  17521,  1850, 1992, 1960, 1835,  17521, -13425, 1341,
   5770,   17521, -13425,  2150, 2070, 2088, 2210, -13425,  17521, 5802,
   -420,    5780,   1351,  2830, 2660, 2718, 2801,   1540,   5430,   -3,
};
// clang-format on

constexpr int kUnitsPerOne = 4096;

} // namespace

void applyXTestSurface(ShadingCorrection& correction) {
    for (int i = 0; i < kGridPoints; ++i) {
        const float red = static_cast<float>(kRedUnits[i]) / kUnitsPerOne;
        const float green = static_cast<float>(kUnitsPerOne - kRedUnits[i]) / kUnitsPerOne;
        correction.controlGrids[0][i] = red;
        correction.controlGrids[1][i] = green;
        correction.controlGrids[2][i] = green;
        correction.controlGrids[3][i] = red;
    }
}

} // namespace lsc
