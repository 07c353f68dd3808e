#pragma once

namespace img {

// The fixed texts of the image library and the Bayer image object.

namespace msg {

// Bayer image object: the texts of its runtime errors.
inline constexpr char kCannotReadKqraw[] = "Cannot read kqraw image.";
inline constexpr char kImageTooLarge[] =
    "Image too large: its samples would take more than 1 GiB of memory (at most 268435456 "
    "samples, for example 16384 x 16384 pixels).";
inline constexpr char kCannotAllocateImage[] = "Unable to allocate image memory.";
inline constexpr char kCannotAllocateMetadataHeaderless[] =
    "Unable to allocate kqraw image metadata";
inline constexpr char kCannotAllocateMetadata[] = "Unable to allocate kqraw image metadata.";
inline constexpr char kCannotCopyImage[] = "Unable to copy image.";
inline constexpr char kAlreadyHasFileType[] = "Cannot copy metadata, image already has file type.";
inline constexpr char kCannotCopyMetadata[] = "Cannot copy image metadata.";
inline constexpr char kCannotStoreKqraw[] = "Cannot store kqraw image.";
inline constexpr char kCannotStoreJpeg[] = "Cannot store jpeg image.";
inline constexpr char kCannotStoreBmp[] = "Cannot store BMP image.";
inline constexpr char kNotStorableAsJpeg[] =
    "Image configuration cannot be stored as a jpeg image.";
inline constexpr char kInvalidBayerPattern[] = "Invalid Bayer pattern in image file.";

// Raw reader warnings on the error stream.
inline constexpr char kFixedHeaderTooBig[] =
    "WARNING: File '%s' is too big for KQRAW.  Ignore extra data\n";
inline constexpr char kTooManyBlocks[] =
    "WARNING: Raw container '%s' holds more than 100 blocks; block '%s' dropped.\n";
inline constexpr char kMalformedStrings[] =
    "WARNING: Raw container '%s': the strings of block '%s' do not fit its size; block kept "
    "as read.\n";

// Console prompt for raw files of no known type.
inline constexpr char kPromptIntro[] = "Read input file as RAW with or without header...\n";
inline constexpr char kPromptWidth[] = "RAW Image Width = ";
inline constexpr char kPromptHeight[] = "RAW Image Height= ";
inline constexpr char kPromptBitDepth[] = "RAW Bit Depth (1-16) = ";
inline constexpr char kPromptBitDepthError[] = "ERROR: Bit Depth must be between 1 and 16 "
                                               "inclusive\n";
inline constexpr char kPromptBayer[] = "RAW Bayer Type (1=RGGB, 2=BGGR, 3=GRBG, 4=GBRG) = ";
inline constexpr char kPromptBayerError[] = "ERROR: Invalid choice of RAW Bayer Type\n";
inline constexpr char kPromptEndian[] = "Data in Little-Endian ? (Y/N) : ";
inline constexpr char kPromptImages[] = "Number of Images = ";
inline constexpr char kPromptHeaderSize[] = "Header Size = ";
inline constexpr char kPromptNoAnswer[] = "ERROR: No answer on standard input.\n";

} // namespace msg

} // namespace img
