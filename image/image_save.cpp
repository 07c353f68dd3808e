#include "image/image_save.h"

#include "image/image_result.h"

int imageSave(const char*, const ImageBuffer*, int, const int*, int) noexcept {
    return img::kWrongFormat;
}
