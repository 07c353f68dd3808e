// The capture data that a Bayer image carries in its raw header.

#include "image/bayer_image.h"
#include "image/hex_text.h"
#include "image/kqraw_container.h"
#include "image/kqraw_fixed_header.h"

namespace img {

namespace {

const KqRawContainer* containerOf(const ImageBuffer* image) {
    return image && image->fileType == kFileKqRaw2
               ? static_cast<const KqRawContainer*>(image->rawHeader)
               : nullptr;
}

const KqRawFixedHeader* fixedHeaderOf(const ImageBuffer* image) {
    return image && image->fileType == kFileKqRaw
               ? static_cast<const KqRawFixedHeader*>(image->rawHeader)
               : nullptr;
}

// A float of the last capture block; 0 when there is none or it is too short.
float captureValue(const KqRawContainer* container, std::uint32_t offset) {
    const int index = kqrawContainerFindLast(container, img::kqtag::kCapture);
    float value = 0.0f;
    if (index < 0 || !kqrawBlockGetFloat(container->blocks[index], offset, &value))
        return 0.0f;
    return value;
}

} // namespace

float BayerImage::exposureTime() const {
    if (const KqRawContainer* container = containerOf(buffer_.get()))
        return captureValue(container, img::kqcap::kExposureTime);
    if (const KqRawFixedHeader* header = fixedHeaderOf(buffer_.get())) {
        if (kqrawFixedGet32(header, img::kqfix::kRevision) < img::kqfix::kFirstFixedPointRevision)
            return kqrawFixedGetFloat(header, img::kqfix::kExposureFloat);
        return static_cast<float>(kqrawFixedGet32(header, img::kqfix::kExposureFixed)) / 65536.0f;
    }
    return 0.0f;
}

float BayerImage::channelGain(int channel) const {
    if (channel < 0 || channel > 3)
        return 0.0f;
    const auto offset = static_cast<std::uint32_t>(4 * channel);
    if (const KqRawContainer* container = containerOf(buffer_.get()))
        return captureValue(container, img::kqcap::kGain0 + offset);
    if (const KqRawFixedHeader* header = fixedHeaderOf(buffer_.get()))
        return kqrawFixedGetFloat(header, img::kqfix::kGain0 + offset);
    return 0.0f;
}

std::string BayerImage::serialNumber(std::size_t maxLength) const {
    if (const KqRawContainer* container = containerOf(buffer_.get())) {
        const int index = kqrawContainerFind(container, img::kqtag::kSensorInfo);
        if (index < 0 || container->blocks[index]->form != KqRawForm::kSensorInfo)
            return std::string();
        std::string serial(container->blocks[index]->strings[1].text);
        if (maxLength != 0 && serial.size() > maxLength)
            serial.resize(maxLength);
        return serial;
    }
    if (const KqRawFixedHeader* header = fixedHeaderOf(buffer_.get())) {
        // The field holds 16 bytes; what lies behind it is not serial number.
        const std::size_t bytes =
            maxLength / 2 < img::kqfix::kSerialSize ? maxLength / 2 : img::kqfix::kSerialSize;
        return img::hexOfBytes(header->bytes + img::kqfix::kSerial, bytes);
    }
    return std::string();
}

bool BayerImage::hasFixedHeader() const {
    return fixedHeaderOf(buffer_.get()) != nullptr;
}

void BayerImage::setSensorGuid(const std::string& guidHex) {
    if (!fixedHeaderOf(buffer_.get()))
        return;
    kqrawFixedSet64(static_cast<KqRawFixedHeader*>(buffer_->rawHeader), img::kqfix::kSensorGuid,
                    img::parseHex64(guidHex.c_str()));
}

} // namespace img
