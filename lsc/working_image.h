#pragma once
// The lens-shading code's view of a Bayer image: one REAL32 sample per pixel,
// row-major, no padding.

#include <cstdint>

#include "image/bayer_image.h"

namespace lsc {

struct WorkingImage {
    std::uint32_t width;
    std::uint32_t height;
    std::uint32_t cfa; // second cfa word
    float* pixels;
};

// Throws std::runtime_error when the image is empty or not a single-plane
// REAL32 image with pixel data. The view reads the image; only the owner of
// an image it made itself writes through it (levelledImage).
WorkingImage workingImage(const img::BayerImage& image);

} // namespace lsc
