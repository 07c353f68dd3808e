// The headerless raw details parser on arbitrary text, read through the same
// two comment filters the loader stacks. Refusals are the option library's
// errors, the parser's standard errors and apan::exception; anything else,
// and any accepted value outside its checked range, is a finding.

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <stdexcept>
#include <string>

#include <boost/iostreams/device/array.hpp>
#include <boost/iostreams/filtering_stream.hpp>
#include <boost/program_options/errors.hpp>

#include "config/strip_comments.h"
#include "driver/headerless_raw.h"
#include "image/image_buffer.h"
#include "lsc/apan_exception.h"

using namespace img;
using config::strip_comments;
using driver::HeaderlessRawDetails;

namespace {

void checkAccepted(const HeaderlessRawDetails& d) {
    const bool sizes = d.width >= 1 && d.width <= 65535 && d.height >= 1 && d.height <= 65535;
    const bool bits = d.bits >= 1 && d.bits <= 16;
    const bool cfa =
        d.cfa == kCfaRggb || d.cfa == kCfaGrbg || d.cfa == kCfaBggr || d.cfa == kCfaGbrg;
    const bool serial =
        d.serialNumber.size() % 2 == 0 && d.serialNumber.size() <= 32 &&
        d.serialNumber.find_first_not_of("0123456789abcdefABCDEF") == std::string::npos;
    if (!(sizes && bits && cfa && serial))
        std::abort();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    namespace io = boost::iostreams;
    // The first byte picks the driver's default bit depth (0 to 31, so the
    // out-of-range defaults are tried too); the rest is the details text.
    const std::uint16_t defaultBits = size > 0 ? data[0] % 32 : 12;
    const char* text = reinterpret_cast<const char*>(data) + (size > 0 ? 1 : 0);
    const std::size_t length = size > 0 ? size - 1 : 0;

    io::filtering_istream details;
    details.push(strip_comments(';'));
    details.push(strip_comments('#'));
    details.push(io::array_source(text, length));
    try {
        checkAccepted(driver::parseHeaderlessDetails(details, defaultBits));
    } catch (const boost::program_options::error&) {
    } catch (const apan::exception&) {
    } catch (const std::runtime_error&) {    // missing or out-of-range values
    } catch (const std::invalid_argument&) { // Bayer order, sensor GUID
    }
    return 0;
}
