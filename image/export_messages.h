#pragma once
// The texts that the image writers put into their files, and the two small
// formatters they share. Every number goes through these formatters or
// through integer conversions, so no file depends on the process locale.

#include <charconv>
#include <cstdio>
#include <cstring>
#include <string>

#include "image/image_buffer.h"

namespace img {

namespace exportText {

// One metadata entry as a JPEG comment or a PNM header block: key, length of
// the value, value, key.
inline constexpr char kMetadataBlock[] =
    "# MCF_MetadataBegin = \"%s\" %d\n%s\n# MCF_MetadataEnd = \"%s\"\n";

// TIFF ImageDescription.
inline constexpr char kTiffPrefix[] = "MCF_IMAGE:";
inline constexpr char kTiffProperties[] =
    " NumberOfImages=%u, PixelType=%s%s, BufferType=%s, DataType=%s";
inline constexpr char kTiffCfa[] = ", CFA=%s";
inline constexpr char kTiffBlackVal[] = ", BlackVal=";
inline constexpr char kTiffWhiteVal[] = ", WhiteVal=";
inline constexpr char kTiffMinClip[] = ", MinClip=";
inline constexpr char kTiffMaxClip[] = ", MaxClip=";
inline constexpr char kTiffMetadataKey[] = ", Metadata=\"%s\" %d";
inline constexpr char kTiffMetadataValue[] = ",%s";

// PPM/PGM header comment lines.
inline constexpr char kPnmNumberOfImages[] = "# MCF_NumberOfImages  = %u\n";
inline constexpr char kPnmSamplesPerPixel[] = "# MCF_SamplesPerPixel = %d\n";
inline constexpr char kPnmPixelType[] = "# MCF_PixelType  = %s\n";
inline constexpr char kPnmCfa[] = "#     MCF_CFA    = %s\n";
inline constexpr char kPnmBufferType[] = "# MCF_BufferType = %s\n";
inline constexpr char kPnmDataType[] = "# MCF_DataType = %s\n";
inline constexpr char kPnmBlackVal[] = "# MCF_BlackVal =";
inline constexpr char kPnmWhiteVal[] = "\n# MCF_WhiteVal =";
inline constexpr char kPnmMinClip[] = "\n# MCF_MinClip  =";
inline constexpr char kPnmMaxClip[] = "\n# MCF_MaxClip  =";
inline constexpr char kPnmSizeInteger[] = "%d %d\n%d\n";
inline constexpr char kPnmSizeFloat[] = "%d %d\n%.0f\n";

// Appends a printf-style text. Only for %s, %d, %u and %.0f of integral
// values, which read the same in every locale. Throws std::bad_alloc.
template <typename... Args>
void appendFormatted(std::string& text, const char* format, Args... args) {
    const int length = std::snprintf(nullptr, 0, format, args...);
    if (length <= 0)
        return;
    const std::size_t start = text.size();
    text.resize(start + static_cast<std::size_t>(length) + 1);
    std::snprintf(&text[start], static_cast<std::size_t>(length) + 1, format, args...);
    text.resize(start + static_cast<std::size_t>(length));
}

// Appends a value as printf's "%f" prints it in the C locale. The largest
// float has 39 integral digits, so the buffer always suffices.
inline void appendFixed(std::string& text, float value) {
    char buffer[64];
    const std::to_chars_result converted = std::to_chars(
        buffer, buffer + sizeof buffer, static_cast<double>(value), std::chars_format::fixed, 6);
    text.append(buffer, converted.ptr);
}

enum class LevelField { kBlackVal, kWhiteVal, kMinClip, kMaxClip };

// Appends one level of each channel that has levels (at most four) as "%f",
// separated by a space, with a space before the first too when asked.
inline void appendChannelLevels(std::string& text, const ImageBuffer& image, LevelField field,
                                bool leadingSpace) {
    const int channels = image.samplesPerPixel < 4 ? image.samplesPerPixel : 4;
    for (int c = 0; c < channels; ++c) {
        if (c > 0 || leadingSpace)
            text += ' ';
        switch (field) {
        case LevelField::kBlackVal:
            appendFixed(text, image.level[c].blackVal);
            break;
        case LevelField::kWhiteVal:
            appendFixed(text, image.level[c].whiteVal);
            break;
        case LevelField::kMinClip:
            appendFixed(text, image.clip[c].minClip);
            break;
        case LevelField::kMaxClip:
            appendFixed(text, image.clip[c].maxClip);
            break;
        }
    }
}

// Appends the four level fields (black, white, lowest and highest clip),
// each label followed by its channel levels.
inline void appendLevelFields(std::string& text, const ImageBuffer& image,
                              const char* const (&labels)[4], bool leadingSpace) {
    const LevelField fields[4] = {LevelField::kBlackVal, LevelField::kWhiteVal,
                                  LevelField::kMinClip, LevelField::kMaxClip};
    for (int i = 0; i < 4; ++i) {
        text += labels[i];
        appendChannelLevels(text, image, fields[i], leadingSpace);
    }
}

// Appends the metadata block of one entry.
inline void appendMetadataBlock(std::string& text, const MetadataEntry& entry) {
    appendFormatted(text, kMetadataBlock, entry.key, static_cast<int>(std::strlen(entry.value)),
                    entry.value, entry.key);
}

} // namespace exportText

} // namespace img
