#pragma once
// Reads a raw sensor image of any known type: the fixed-header KQRAW file, the
// KQRAW2 container, an NKRAW file, or (asked on the console) a raw dump of
// a layout given by the user.

#include "image/image_buffer.h"

// Returns a RAW/RAW_CFA/UINT16 image, or null with *result set: -1 the file
// cannot be opened; -2 read error; -3 no memory; -4 not a raw file of any
// known type; -5 missing data; -21 container without header or pixel block,
// or a fixed-header file of the wrong size; -22 NKRAW file of the wrong size;
// -23 the layout given on the console does not match the file.
[[nodiscard]] ImageBuffer* rawRead(const char* path, int* result) noexcept;
