#include "image/kqraw_container.h"

struct KqRawContainer {};

void kqrawContainerRelease(KqRawContainer* container) noexcept {
    delete container;
}
