#include "driver/version.h"

namespace driver {

namespace lscversion {

std::string versionText() {
    return std::to_string(kMajor) + "." + std::to_string(kMinor) + "." + std::to_string(kPatch);
}

std::string versionLine() {
    return std::string(kShortName) + " version " + versionText();
}

} // namespace lscversion

} // namespace driver
