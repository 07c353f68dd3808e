// flatgen: writes a synthetic flat-field capture for trying out and testing
// lsc, as a KQRAW2 container, a fixed-header KQRAW file, or a headerless raw
// file with its details file.

#include <charconv>
#include <cstdio>
#include <exception>
#include <locale>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include "image/output_file.h"
#include "tools/flatfield/flat_field.h"
#include "tools/flatfield/module_shading.h"

using namespace flatfield;

using img::writeWholeFile;

namespace {

const char kHelp[] =
    "Usage: flatgen [options] OUTPUT\n"
    "Writes a synthetic flat-field Bayer capture to OUTPUT.\n"
    "\n"
    "Options (defaults in brackets):\n"
    "  --format F              kqraw2 (chunked container), kqraw (fixed header) or raw\n"
    "                          (headerless samples plus a details file) [kqraw2]\n"
    "  --details FILE          details file written with --format raw [OUTPUT.txt]\n"
    "  --width N               image width in pixels [640]\n"
    "  --height N              image height in pixels [480]\n"
    "  --bits N                sample bit depth, 1..16 [10]\n"
    "  --order O               Bayer order: RGGB, GRBG, GBRG or BGGR [RGGB]\n"
    "  --level F               green level at the optical centre, fraction of full scale [0.8]\n"
    "  --corner F              green level in the corners relative to the centre, (0, 1] [0.5]\n"
    "  --centre X,Y            optical centre, fractions of width and height [0.5,0.5]\n"
    "  --channel-levels R,GR,GB,B\n"
    "                          channel levels relative to green [0.55,1,1,0.65]\n"
    "  --colour-shading F      extra fall of red and rise of blue at the corners [0.08]\n"
    "  --shading FILE          render the shading measured on a real module: a tuning file\n"
    "                          with an rpi.alsc block (luminance and colour tables); the\n"
    "                          brightest green lies at --level; --corner, --centre,\n"
    "                          --channel-levels and --colour-shading are then unused\n"
    "  --ct K                  colour temperature whose colour tables --shading takes\n"
    "                          (the nearest one) [5000]\n"
    "  --noise F               noise standard deviation, fraction of full scale [0]\n"
    "  --full-well E           photon shot noise of a pixel holding E electrons at full\n"
    "                          scale; 0: none [0]\n"
    "  --read-noise N          read noise standard deviation, in sample units [0]\n"
    "  --defects N             hot and dead pixels at random positions [0]\n"
    "  --black-level N         pedestal added to every sample, in sample units [0]\n"
    "  --seed N                seed of the noise and defect positions [1]\n"
    "  --serial HEX            module serial number, up to 32 hexadecimal digits [none]\n"
    "  --exposure F            exposure time in milliseconds [33]\n"
    "  --gain F                gain of all four channels [1]\n"
    "  --sensor-guid HEX       sensor GUID (fixed-header file and details file only) [none]\n"
    "  --help                  print this text\n";

struct Options {
    FlatFieldShape shape;
    CaptureInfo capture;
    std::string format = "kqraw2";
    std::string output;
    std::string details;
    std::string shadingFile;
    double colourTemperature = 5000.0;
};

class UsageError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

template <typename Int>
Int parseInt(const std::string& name, const std::string& text, int base = 10) {
    Int value{};
    const char* end = text.data() + text.size();
    const auto [ptr, ec] = std::from_chars(text.data(), end, value, base);
    if (text.empty() || ec != std::errc() || ptr != end)
        throw UsageError("--" + name + ": not a valid integer: '" + text + "'");
    return value;
}

// Always the C conventions, whatever the user's locale says about decimal points.
double parseDouble(const std::string& name, const std::string& text) {
    std::istringstream in(text);
    in.imbue(std::locale::classic());
    double value = 0.0;
    in >> value;
    if (text.empty() || in.fail() || !in.eof())
        throw UsageError("--" + name + ": not a valid number: '" + text + "'");
    return value;
}

std::vector<double> parseList(const std::string& name, const std::string& text, std::size_t count) {
    std::vector<double> values;
    std::size_t start = 0;
    while (true) {
        const std::size_t comma = text.find(',', start);
        values.push_back(parseDouble(name, text.substr(start, comma - start)));
        if (comma == std::string::npos)
            break;
        start = comma + 1;
    }
    if (values.size() != count)
        throw UsageError("--" + name + ": expected " + std::to_string(count) +
                         " comma-separated numbers");
    return values;
}

void applyOption(Options& options, const std::string& name, const std::string& value) {
    FlatFieldShape& shape = options.shape;
    if (name == "format") {
        if (value != "kqraw2" && value != "kqraw" && value != "raw")
            throw UsageError("--format: expected kqraw2, kqraw or raw");
        options.format = value;
    } else if (name == "details") {
        options.details = value;
    } else if (name == "width") {
        shape.width = parseInt<int>(name, value);
    } else if (name == "height") {
        shape.height = parseInt<int>(name, value);
    } else if (name == "bits") {
        shape.bits = parseInt<int>(name, value);
    } else if (name == "order") {
        shape.cfa = cfaOfBayerOrder(value);
        if (shape.cfa == 0)
            throw UsageError("--order: expected RGGB, GRBG, GBRG or BGGR");
    } else if (name == "level") {
        shape.centerLevel = parseDouble(name, value);
    } else if (name == "corner") {
        shape.cornerLevel = parseDouble(name, value);
    } else if (name == "centre" || name == "center") {
        const auto xy = parseList(name, value, 2);
        shape.centerX = xy[0];
        shape.centerY = xy[1];
    } else if (name == "channel-levels") {
        const auto levels = parseList(name, value, 4);
        for (int k = 0; k < 4; ++k)
            shape.channelLevel[k] = levels[std::size_t(k)];
    } else if (name == "colour-shading" || name == "color-shading") {
        shape.colourShading = parseDouble(name, value);
    } else if (name == "shading") {
        options.shadingFile = value;
    } else if (name == "ct") {
        options.colourTemperature = parseDouble(name, value);
    } else if (name == "noise") {
        shape.noise = parseDouble(name, value);
    } else if (name == "full-well") {
        shape.fullWell = parseDouble(name, value);
    } else if (name == "read-noise") {
        shape.readNoise = parseDouble(name, value);
    } else if (name == "defects") {
        shape.defects = parseInt<int>(name, value);
    } else if (name == "black-level") {
        shape.blackLevel = parseInt<int>(name, value);
    } else if (name == "seed") {
        shape.seed = parseInt<std::uint32_t>(name, value);
    } else if (name == "serial") {
        options.capture.serialNumber = value;
    } else if (name == "exposure") {
        options.capture.exposureTime = float(parseDouble(name, value));
    } else if (name == "gain") {
        const float gain = float(parseDouble(name, value));
        for (float& g : options.capture.gains)
            g = gain;
    } else if (name == "sensor-guid") {
        options.capture.sensorGuid = parseInt<std::uint64_t>(name, value, 16);
    } else {
        throw UsageError("unknown option --" + name);
    }
}

// Returns false when only the help text is wanted.
bool parseArguments(int argc, char** argv, Options& options) {
    for (int i = 1; i < argc; ++i) {
        const std::string arg = argv[i];
        if (arg == "--help" || arg == "-h")
            return false;
        if (arg.rfind("--", 0) != 0) {
            if (!options.output.empty())
                throw UsageError("more than one output file given");
            options.output = arg;
            continue;
        }
        std::string name = arg.substr(2), value;
        const std::size_t equals = name.find('=');
        if (equals != std::string::npos) {
            value = name.substr(equals + 1);
            name.erase(equals);
        } else if (i + 1 < argc) {
            value = argv[++i];
        } else {
            throw UsageError("--" + name + " needs a value");
        }
        applyOption(options, name, value);
    }
    if (options.output.empty())
        throw UsageError("no output file given");
    if (options.details.empty())
        options.details = options.output + ".txt";
    return true;
}

void writeOrThrow(const std::string& path, const std::string& bytes) {
    if (!writeWholeFile(path, bytes.data(), bytes.size()))
        throw std::runtime_error("cannot write " + path);
}

void generate(const Options& options) {
    FlatFieldShape shape = options.shape;
    if (!options.shadingFile.empty())
        shape.module = std::make_shared<const ModuleShading>(
            ModuleShading::fromTuningFile(options.shadingFile, options.colourTemperature));
    const FlatField field = makeFlatField(shape);
    if (options.format == "kqraw") {
        writeOrThrow(options.output, fixedHeaderFileBytes(field, options.capture));
    } else if (options.format == "raw") {
        writeOrThrow(options.output, headerlessFileBytes(field));
        writeOrThrow(options.details, headerlessDetailsText(field, options.capture));
    } else {
        writeOrThrow(options.output, kqraw2FileBytes(field, options.capture));
    }
}

} // namespace

int main(int argc, char** argv) {
    try {
        Options options;
        if (!parseArguments(argc, argv, options)) {
            std::fputs(kHelp, stdout);
            return std::fflush(stdout) == 0 ? 0 : 1;
        }
        generate(options);
        return 0;
    } catch (const UsageError& error) {
        std::fprintf(stderr, "flatgen: %s\nUse --help to list the options.\n", error.what());
    } catch (const std::exception& error) {
        std::fprintf(stderr, "flatgen: %s\n", error.what());
    }
    return 1;
}
