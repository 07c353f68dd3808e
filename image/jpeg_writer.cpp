#include "image/jpeg_writer.h"

#include <csetjmp>
#include <cstdint>
#include <cstdio>
#include <new>
#include <string>
#include <vector>

#include <jpeglib.h>

#include "image/export_messages.h"
#include "image/image_result.h"
#include "image/output_file.h"

namespace img {

namespace {

// libjpeg's error exit must not return: it jumps back into compress().
struct JumpingErrorManager {
    jpeg_error_mgr base;
    std::jmp_buf jump;
};

[[noreturn]] void jumpOnError(j_common_ptr common) {
    auto* manager = reinterpret_cast<JumpingErrorManager*>(common->err);
    std::longjmp(manager->jump, 1);
}

// The library reports through result codes, never on the console.
void stayQuiet(j_common_ptr) {
}

// Everything compress() touches lives here, outside its frame, so nothing it
// needs after a long jump is a local that the jump could leave indeterminate.
struct JpegJob {
    jpeg_compress_struct compressor;
    JumpingErrorManager errors;
    std::FILE* stream;
    const ImageBuffer* image;
    int quality;
    const std::string* comments;
    std::size_t commentCount;
};

// Runs the compressor. Holds no object with a destructor: the error exit
// leaves by longjmp, and the compressor is destroyed by hand on both paths.
int compress(JpegJob* job) {
    jpeg_compress_struct* compressor = &job->compressor;
    compressor->err = jpeg_std_error(&job->errors.base);
    job->errors.base.error_exit = jumpOnError;
    job->errors.base.output_message = stayQuiet;
    if (setjmp(job->errors.jump)) {
        jpeg_destroy_compress(&job->compressor);
        return img::kIoError;
    }
    jpeg_create_compress(compressor);
    jpeg_stdio_dest(compressor, job->stream);

    const ImageBuffer* image = job->image;
    compressor->image_width = static_cast<JDIMENSION>(image->width);
    compressor->image_height = static_cast<JDIMENSION>(image->height);
    compressor->input_components = image->samplesPerPixel;
    compressor->in_color_space = image->samplesPerPixel == 1 ? JCS_GRAYSCALE : JCS_RGB;
    jpeg_set_defaults(compressor);
    jpeg_set_quality(compressor, job->quality, TRUE);
    jpeg_start_compress(compressor, TRUE);

    for (std::size_t i = 0; i < job->commentCount; ++i) {
        const std::string& comment = job->comments[i];
        // A text longer than one marker holds makes the library fail (-2).
        jpeg_write_marker(compressor, JPEG_COM, reinterpret_cast<const JOCTET*>(comment.data()),
                          static_cast<unsigned int>(comment.size()));
    }

    const std::size_t rowBytes =
        static_cast<std::size_t>(image->width) * static_cast<std::size_t>(image->samplesPerPixel);
    auto* pixels = static_cast<JSAMPLE*>(image->data);
    while (compressor->next_scanline < compressor->image_height) {
        JSAMPROW row = pixels + static_cast<std::size_t>(compressor->next_scanline) * rowBytes;
        jpeg_write_scanlines(compressor, &row, 1);
    }
    jpeg_finish_compress(compressor);
    jpeg_destroy_compress(compressor);
    return img::kOk;
}

} // namespace

int jpegWrite(const char* path, const ImageBuffer* image, int quality) noexcept {
    if (!image || !image->data || image->width < 1 || image->height < 1)
        return img::kSizeMismatch;
    if (image->dataType != kDataUint8 ||
        (image->samplesPerPixel != 1 && image->samplesPerPixel != 3))
        return img::kUnsupported;
    if (!path)
        return img::kBadArgument;

    std::vector<std::string> comments;
    try {
        for (const MetadataEntry* entry = image->metadata; entry; entry = entry->next) {
            comments.emplace_back();
            img::exportText::appendMetadataBlock(comments.back(), *entry);
        }
    } catch (const std::bad_alloc&) {
        return img::kNoMemory;
    }

    OutputFile file;
    if (!file.open(path))
        return img::kBadArgument;
    JpegJob job{};
    job.stream = file.stream();
    job.image = image;
    // The quality travels as one byte; outside 0-100 it is clamped rather than wrapped.
    job.quality = quality < 0 ? 0 : quality > 100 ? 100 : quality;
    job.comments = comments.data();
    job.commentCount = comments.size();
    const int result = compress(&job);
    if (result != img::kOk)
        return result;
    return file.commit() ? img::kOk : img::kIoError;
}

} // namespace img
