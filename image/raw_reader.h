#pragma once
// Reads a raw sensor image of any known type: the fixed-header KQRAW file, the
// KQRAW2 container, an NKRAW file, or (asked on the console) a raw dump of a
// layout given by the user.

#include <cstddef>
#include <cstdint>

#include "image/byte_source.h"
#include "image/image_buffer.h"

namespace img {

// Returns a RAW/RAW_CFA/UINT16 image (or, for a raw dump, what its layout
// holds), or null with *result set: -1 the file cannot be opened; -2 read
// error, or no answer on the console; -3 no memory; -4 not a raw file of any
// known type; -21 a container without header or pixel block, with blocks cut
// short or malformed, or with fewer samples than its size, or a fixed-header
// file of the wrong size; -22 an NKRAW file of the wrong size; -23 the layout
// given on the console does not match the file.
[[nodiscard]] ImageBuffer* rawRead(const char* path, int* result) noexcept;

struct RawLayout;
// Supplies the layout of a file of no known type: 0 or a negative result code.
using RawLayoutQuery = int (*)(void* context, RawLayout* layout);

// The reader on any source. Without a query a file of no known type gives -4.
[[nodiscard]] ImageBuffer* rawReadSource(ByteSource& source, RawLayoutQuery query, void* context,
                                         int* result) noexcept;

// The header of a KQRAW fixed-header file or KQRAW2 container without its
// samples: a RAW, RAW_CFA, UINT16 image with no sample block yet, whose depth
// is set once the samples have been read (they lie at *samplesAt, little-
// endian, width x height of them). Results as rawReadSource; -4 for every
// other format, which the full reader then takes.
[[nodiscard]] int rawReadHeaderOnly(ByteSource& source, ImageBuffer** image,
                                    std::uint64_t* samplesAt) noexcept;
// The console prompt for files of no known type (the query of rawRead).
int askOnConsole(void* context, RawLayout* layout);

// The reader on bytes in memory, without the console (for tests and fuzzing).
[[nodiscard]] ImageBuffer* rawReadMemory(const std::uint8_t* data, std::size_t size,
                                         const char* name, int* result) noexcept;

// Reads a dump of the given layout. Result as for rawRead; -23 when the file
// size is not the header plus width x height x images pixels of 1, 2, 3 or 6
// bytes, or the bit depth does not fit the samples.
[[nodiscard]] int readWithLayout(ByteSource& source, const RawLayout& layout,
                                 ImageBuffer** image) noexcept;

} // namespace img
