#pragma once
// Loads patch geometry, control points and white-balance levels from stored
// calibration data into the patch surface, checking on the way that the data
// describe the same patch layout as the configuration and the same sensor
// size as the input image.

#include "config/config_node.h"
#include "lsc/processing_context.h"

// `root` is the configuration tree's root (read as config.lsc.*); `data`
// holds the register names without their block prefix (leftPatchWidth,
// leftPatchFactor, imageWidth, controlPointR, R, ...); `context.image` must
// hold the input image. Throws std::range_error when the sensor size does
// not match, std::runtime_error for the other mismatches; values stored
// before a failure stay in `context`.
void readConfigParam(const config_node& root, const config_node& data, ProcessingContext& context);
