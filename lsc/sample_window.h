#pragma once
// Noise-robust sample values: the per-channel median over a square of Bayer
// blocks around a sample, instead of the single 2x2 block.

#include <cstdint>

#include "lsc/shading_sample.h"
#include "lsc/working_image.h"

namespace lsc {

// Window sizes collectSamples accepts: odd, 1 to 15 blocks per side.
inline constexpr int kMaxSampleWindow = 15;
bool sampleWindowUsable(int window);

// Median of each channel's pixels in the window x window Bayer blocks
// centred on the block at (blockX, blockY) (even coordinates of a complete
// 2x2 block), clipped at the image border: only complete blocks count. An
// even count of blocks left by the clipping gives the mean of the two middle
// values. `window` must be sampleWindowUsable; no memory is allocated.
void windowMedians(const WorkingImage& image, int phase, std::uint32_t blockX, std::uint32_t blockY,
                   int window, float medians[kChannels]);

} // namespace lsc
