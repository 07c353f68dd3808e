#include "image/kqraw_block.h"

#include <cstdlib>
#include <cstring>
#include <memory>

#include "image/byte_order.h"
#include "image/byte_reader.h"
#include "image/image_messages.h"
#include "image/image_result.h"
#include "image/image_warning.h"
#include "image/raw_samples.h"
#include "image/sample_memory.h"

#include <sys/time.h>

namespace img {

namespace {

KqRawBlock* allocateBlock(const char* tag, KqRawForm form) {
    auto* block = static_cast<KqRawBlock*>(std::calloc(1, sizeof(KqRawBlock)));
    if (block) {
        std::memcpy(block->tag, tag, kKqRawTagSize);
        block->form = form;
    }
    return block;
}

int stringCount(const KqRawBlock* block) {
    return block->form == KqRawForm::kText ? 1 : block->form == KqRawForm::kSensorInfo ? 3 : 0;
}

// The payload size that kqrawBlockWrite produces for the block's current content.
std::uint64_t contentSize(const KqRawBlock* block) {
    switch (block->form) {
    case KqRawForm::kPixels:
        return kKqRawPixelLeadSize + 2 * block->sampleCount;
    case KqRawForm::kText:
    case KqRawForm::kSensorInfo: {
        std::uint64_t size = block->form == KqRawForm::kSensorInfo ? 4 : 0;
        for (int i = 0; i < stringCount(block); ++i)
            size += 4 + std::uint64_t{block->strings[i].length};
        return size + block->tailSize;
    }
    case KqRawForm::kOpaque:
        break;
    }
    return block->size;
}

// Recomputes the size field; false when the content outgrew 32 bits.
bool updateSize(KqRawBlock* block) {
    const std::uint64_t size = contentSize(block);
    if (size > UINT32_MAX)
        return false;
    block->size = static_cast<std::uint32_t>(size);
    return true;
}

bool copyString(KqRawString* target, const char* text, std::size_t length) {
    char* copy = static_cast<char*>(std::malloc(length + 1));
    if (!copy)
        return false;
    if (length > 0)
        std::memcpy(copy, text, length);
    copy[length] = '\0';
    std::free(target->text);
    target->text = copy;
    target->length = static_cast<std::uint32_t>(length);
    return true;
}

std::uint8_t* duplicateBytes(const std::uint8_t* bytes, std::size_t size) {
    auto* copy = static_cast<std::uint8_t*>(std::malloc(size > 0 ? size : 1));
    if (copy && size > 0)
        std::memcpy(copy, bytes, size);
    return copy;
}

KqRawBlock* createOpaque(const char* tag, std::uint32_t size) {
    KqRawBlockPtr block(allocateBlock(tag, KqRawForm::kOpaque));
    if (!block)
        return nullptr;
    block->payload = static_cast<std::uint8_t*>(std::calloc(size > 0 ? size : 1, 1));
    if (!block->payload)
        return nullptr;
    block->size = size;
    return block.release();
}

KqRawBlock* createText(const char* tag, const char* text) {
    KqRawBlockPtr block(allocateBlock(tag, KqRawForm::kText));
    if (!block || !kqrawBlockSetString(block.get(), 0, text))
        return nullptr;
    return block.release();
}

// Parses the strings of a COMMENT, MAKERNOTE or SENSORINFO payload into
// `block`. False when a length runs past the payload.
bool parseStrings(KqRawBlock* block, const std::uint8_t* payload, std::uint32_t size) {
    img::ByteReader reader(payload, size);
    if (block->form == KqRawForm::kSensorInfo)
        block->infoWord = reader.u32le();
    for (int i = 0; i < stringCount(block); ++i) {
        const std::uint32_t length = reader.u32le();
        const std::uint8_t* text = reader.take(length);
        if (!reader.ok())
            return false;
        if (!copyString(&block->strings[i], reinterpret_cast<const char*>(text), length))
            return false;
    }
    block->tailSize = static_cast<std::uint32_t>(reader.remaining());
    if (block->tailSize > 0) {
        block->tail = duplicateBytes(reader.take(block->tailSize), block->tailSize);
        if (!block->tail)
            return false;
    }
    return true;
}

void releaseContent(KqRawBlock* block) {
    std::free(block->payload);
    std::free(block->samples);
    for (KqRawString& s : block->strings)
        std::free(s.text);
    std::free(block->tail);
}

} // namespace

void kqrawBlockRelease(KqRawBlock* block) noexcept {
    if (!block)
        return;
    releaseContent(block);
    std::free(block);
}

bool kqrawBlockHasTag(const KqRawBlock* block, const char* tag) noexcept {
    return block && tag && std::memcmp(block->tag, tag, kKqRawTagSize) == 0;
}

KqRawBlock* kqrawBlockClone(const KqRawBlock* source) noexcept {
    if (!source)
        return nullptr;
    KqRawBlockPtr block(static_cast<KqRawBlock*>(std::malloc(sizeof(KqRawBlock))));
    if (!block)
        return nullptr;
    *block = *source;
    // Owned pointers are cleared first, so a failed copy releases only what it made.
    block->payload = nullptr;
    block->samples = nullptr;
    block->tail = nullptr;
    for (KqRawString& s : block->strings)
        s = {nullptr, 0};
    if (source->payload && !(block->payload = duplicateBytes(source->payload, source->size)))
        return nullptr;
    if (source->samples) {
        block->samples = reinterpret_cast<std::uint16_t*>(
            duplicateBytes(reinterpret_cast<const std::uint8_t*>(source->samples),
                           static_cast<std::size_t>(source->sampleCount * 2)));
        if (!block->samples)
            return nullptr;
    }
    if (source->tail && !(block->tail = duplicateBytes(source->tail, source->tailSize)))
        return nullptr;
    for (int i = 0; i < 3; ++i)
        if (source->strings[i].text &&
            !copyString(&block->strings[i], source->strings[i].text, source->strings[i].length))
            return nullptr;
    return block.release();
}

KqRawBlock* kqrawBlockCreateHeader() noexcept {
    KqRawBlock* block = createOpaque(img::kqtag::kFileHeader, kKqRawFileHeaderPayloadSize);
    if (block)
        kqrawHeaderStamp(block);
    return block;
}

KqRawBlock* kqrawBlockCreatePixels(const std::uint16_t* samples, std::uint64_t count) noexcept {
    if (count > (UINT32_MAX - kKqRawPixelLeadSize) / 2 || (count > 0 && !samples))
        return nullptr;
    KqRawBlockPtr block(allocateBlock(img::kqtag::kPixels, KqRawForm::kPixels));
    if (!block)
        return nullptr;
    img::storeLE32(block->lead, 1);
    block->samples = reinterpret_cast<std::uint16_t*>(duplicateBytes(
        reinterpret_cast<const std::uint8_t*>(samples), static_cast<std::size_t>(count * 2)));
    if (!block->samples)
        return nullptr;
    block->sampleCount = count;
    updateSize(block.get());
    return block.release();
}

KqRawBlock* kqrawBlockCreateCapture() noexcept {
    KqRawBlock* block = createOpaque(img::kqtag::kCapture, kKqRawCapturePayloadSize);
    if (block)
        img::storeLE32(block->payload + img::kqcap::kVersion, 2);
    return block;
}

KqRawBlock* kqrawBlockCreateSensorInfo() noexcept {
    KqRawBlockPtr block(allocateBlock(img::kqtag::kSensorInfo, KqRawForm::kSensorInfo));
    if (!block)
        return nullptr;
    block->infoWord = 1;
    for (int i = 0; i < 3; ++i)
        if (!kqrawBlockSetString(block.get(), i, nullptr))
            return nullptr;
    return block.release();
}

KqRawBlock* kqrawBlockCreateComment(const char* text) noexcept {
    return createText(img::kqtag::kComment, text);
}

KqRawBlock* kqrawBlockCreateMakerNote(const char* text) noexcept {
    return createText(img::kqtag::kMakerNote, text);
}

bool kqrawBlockSetString(KqRawBlock* block, int index, const char* text) noexcept {
    if (!block || index < 0 || index >= stringCount(block))
        return false;
    const std::size_t length = text ? std::strlen(text) : 0;
    if (length > UINT32_MAX)
        return false;
    const KqRawString previous = block->strings[index];
    block->strings[index].text = nullptr; // copyString frees what it replaces
    if (!copyString(&block->strings[index], text ? text : "", length)) {
        block->strings[index] = previous;
        return false;
    }
    if (!updateSize(block)) {
        std::free(block->strings[index].text);
        block->strings[index] = previous;
        return false;
    }
    std::free(previous.text);
    return true;
}

bool kqrawBlockSetSerialNumber(KqRawBlock* block, const char* text) noexcept {
    return block && block->form == KqRawForm::kSensorInfo && kqrawBlockSetString(block, 1, text);
}

namespace {

bool fieldInPayload(const KqRawBlock* block, std::uint32_t offset) {
    return block && block->form == KqRawForm::kOpaque && block->payload &&
           std::uint64_t{offset} + 4 <= block->size;
}

} // namespace

bool kqrawBlockGet32(const KqRawBlock* block, std::uint32_t offset, std::uint32_t* value) noexcept {
    if (!fieldInPayload(block, offset))
        return false;
    *value = img::loadLE32(block->payload + offset);
    return true;
}

bool kqrawBlockGetFloat(const KqRawBlock* block, std::uint32_t offset, float* value) noexcept {
    if (!fieldInPayload(block, offset))
        return false;
    *value = img::loadLEFloat(block->payload + offset);
    return true;
}

bool kqrawBlockSet32(KqRawBlock* block, std::uint32_t offset, std::uint32_t value) noexcept {
    if (!fieldInPayload(block, offset))
        return false;
    img::storeLE32(block->payload + offset, value);
    return true;
}

bool kqrawBlockSetFloat(KqRawBlock* block, std::uint32_t offset, float value) noexcept {
    if (!fieldInPayload(block, offset))
        return false;
    img::storeLEFloat(block->payload + offset, value);
    return true;
}

void kqrawHeaderStamp(KqRawBlock* header) noexcept {
    struct timeval now;
    if (gettimeofday(&now, nullptr) != 0)
        now = {};
    kqrawBlockSet32(header, img::kqhdr::kSeconds, static_cast<std::uint32_t>(now.tv_sec));
    kqrawBlockSet32(header, img::kqhdr::kMicroseconds, static_cast<std::uint32_t>(now.tv_usec));
}

namespace {

KqRawForm formOfTag(const std::uint8_t* tag) {
    auto is = [tag](const char* name) { return std::memcmp(tag, name, kKqRawTagSize) == 0; };
    if (is(img::kqtag::kPixels))
        return KqRawForm::kPixels;
    if (is(img::kqtag::kComment) || is(img::kqtag::kMakerNote))
        return KqRawForm::kText;
    if (is(img::kqtag::kSensorInfo))
        return KqRawForm::kSensorInfo;
    return KqRawForm::kOpaque;
}

int readPixels(img::ByteSource& source, KqRawBlock* block, std::uint64_t* samplesAt) {
    if (block->size < kKqRawPixelLeadSize || (block->size - kKqRawPixelLeadSize) % 2 != 0)
        return img::kWrongFormat;
    if (!source.read(block->lead, kKqRawPixelLeadSize))
        return img::kIoError;
    block->sampleCount = (block->size - kKqRawPixelLeadSize) / 2;
    const int fits = img::checkSampleMemory(block->sampleCount, 1);
    if (fits != img::kOk)
        return fits;
    if (samplesAt) {
        // Left where they are, to be read as a stream.
        *samplesAt = source.position();
        return source.seek(source.position() + 2 * block->sampleCount) ? img::kOk : img::kIoError;
    }
    // With room for floats: the samples usually become the input image.
    block->samples = static_cast<std::uint16_t*>(
        img::allocateWidenableSamples(block->sampleCount, sizeof(std::uint16_t)));
    if (!block->samples)
        return img::kNoMemory;
    return img::readSamplesLE(source, block->samples, block->sampleCount) ? img::kOk
                                                                          : img::kIoError;
}

} // namespace

int kqrawBlockRead(img::ByteSource& source, KqRawBlock** out, std::uint64_t* samplesAt) noexcept {
    *out = nullptr;
    std::uint8_t head[kKqRawBlockHeaderSize];
    if (source.remaining() < kKqRawBlockHeaderSize)
        return img::kSizeMismatch;
    if (!source.read(head, sizeof head))
        return img::kIoError;
    img::ByteReader reader(head, sizeof head);
    const std::uint8_t* tag = reader.take(kKqRawTagSize);
    const std::uint8_t* reserved = reader.take(16);
    const std::uint32_t size = reader.u32le();
    // Checked before anything is allocated: a size field may claim gigabytes.
    if (size > source.remaining())
        return img::kSizeMismatch;

    KqRawBlockPtr block(allocateBlock(reinterpret_cast<const char*>(tag), formOfTag(tag)));
    if (!block)
        return img::kNoMemory;
    std::memcpy(block->reserved, reserved, sizeof block->reserved);
    block->size = size;
    if (block->form == KqRawForm::kPixels) {
        const int rc = readPixels(source, block.get(), samplesAt);
        if (rc != img::kOk)
            return rc;
        *out = block.release();
        return img::kOk;
    }

    std::uint8_t* payload = static_cast<std::uint8_t*>(std::malloc(size > 0 ? size : 1));
    if (!payload)
        return img::kNoMemory;
    if (!source.read(payload, size)) {
        std::free(payload);
        return img::kIoError;
    }
    if (block->form != KqRawForm::kOpaque) {
        if (parseStrings(block.get(), payload, size)) {
            std::free(payload);
            *out = block.release();
            return img::kOk;
        }
        // Lengths that overrun the payload: carry the bytes rather than lose them.
        releaseContent(block.get());
        for (KqRawString& s : block->strings)
            s = {nullptr, 0};
        block->tail = nullptr;
        block->tailSize = 0;
        block->infoWord = 0;
        block->form = KqRawForm::kOpaque;
        img::warn(img::msg::kMalformedStrings, source.name(), img::printableTag(tag).c_str());
    }
    block->payload = payload;
    *out = block.release();
    return img::kOk;
}

namespace {

bool writeAll(std::FILE* file, const void* data, std::size_t size) {
    return size == 0 || std::fwrite(data, 1, size, file) == size;
}

bool write32(std::FILE* file, std::uint32_t value) {
    std::uint8_t bytes[4];
    img::storeLE32(bytes, value);
    return writeAll(file, bytes, 4);
}

} // namespace

bool kqrawBlockWrite(const KqRawBlock* block, std::FILE* file) noexcept {
    if (!block || !file || contentSize(block) != block->size)
        return false;
    if (!writeAll(file, block->tag, kKqRawTagSize) || !writeAll(file, block->reserved, 16) ||
        !write32(file, block->size))
        return false;
    switch (block->form) {
    case KqRawForm::kOpaque:
        return writeAll(file, block->payload, block->size);
    case KqRawForm::kPixels:
        return writeAll(file, block->lead, kKqRawPixelLeadSize) &&
               img::writeSamplesLE(file, block->samples, block->sampleCount);
    case KqRawForm::kText:
    case KqRawForm::kSensorInfo:
        if (block->form == KqRawForm::kSensorInfo && !write32(file, block->infoWord))
            return false;
        for (int i = 0; i < stringCount(block); ++i)
            if (!write32(file, block->strings[i].length) ||
                !writeAll(file, block->strings[i].text, block->strings[i].length))
                return false;
        return writeAll(file, block->tail, block->tailSize);
    }
    return false;
}

} // namespace img
