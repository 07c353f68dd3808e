#include "driver/command_line.h"

#include <cstring>
#include <sstream>
#include <stdexcept>
#include <vector>

#include <boost/program_options.hpp>

#include "driver/driver_messages.h"
#include "driver/notice.h"
#include "driver/version.h"
#include "image/error_detail.h"

namespace driver {

using img::DetailedError;

namespace po = boost::program_options;

namespace {

// A file option: one string argument, empty when not given (shown without a default).
po::typed_value<std::string>* fileName() {
    return po::value<std::string>()->default_value(std::string(), "");
}

// --input may be given up to kMaxInputFrames times: the frames are averaged.
// Shown in the help text as every file option is.
po::typed_value<std::vector<std::string>>* frameNames() {
    return po::value<std::vector<std::string>>()->composing();
}

po::options_description basicOptions() {
    po::options_description options("Options");
    options.add_options()("input,i", frameNames(), "The input kqraw bayer image file.")(
        "inputasjpeg,u", fileName(),
        "Filename to save the input image file converted into jpeg format.")(
        "inputasbmp,w", fileName(),
        "Filename to save the input image file converted into bmp format.")(
        "raw,r", fileName(),
        "Indicates that the input image file is a headerless raw input file and specifies the "
        "text file with the details on the layout of the file.")(
        "translate,z", fileName(), "Filename to store headerless raw input file in kqraw format.")(
        "config,c", fileName(), "The input config file used to set various options.")(
        "calibrate,l", fileName(), "The lens shading calibration register file.")(
        "autofocus,a", fileName(),
        "Autofocus calibration data file to include in binary calibration file.")(
        "binary,b", fileName(), "filename to store binary calibration data.")(
        "flat,f", fileName(),
        "The flatten image resulting from applying the lens shading calibration register "
        "values.")(
        "jpeg,j", fileName(),
        "The flatten jpeg image resulting from applying the lens shading calibration register "
        "values.")(
        "bmp,m", fileName(),
        "The flatten bmp image resulting from applying the lens shading calibration register "
        "values.")("json", fileName(), "Output run result filename (JSON format).")(
        "xtest,x", "Generate a surface that causes obvious color distortions for sanity checking.")(
        "version,V", "Print version string.")("help,H", "Print this help message.");
    return options;
}

po::options_description advancedOptions() {
    po::options_description options("Advanced Options");
    options.add_options()("kq", "Enable advanced options.")(
        "samples,s", fileName(), "File containing input samples to process.")(
        "outsamples,o", fileName(), "File to store samples obtained from input image file.")(
        "preproc,p", fileName(),
        "Save the adjusted preprocessed image (input to lens shading algorithm) to the specified "
        "filename.")("nodelta,n", "Skip the delta ab check.")(
        "delta,d", fileName(), "Output delta ab filename (CSV format).")(
        "stats,t", fileName(), "Output delta ab stats filename (CSV format).")(
        "log", po::value<std::string>()->default_value("-"),
        "The name of the output info file.  \"-\" means use stdout.")("debug",
                                                                      "Enable debug mode.")(
        "ignore,I",
        "Ignore HW limits warnings and continue. The default is to stop writing the output "
        "configuration mid-stream upon encountering a HW limit and return error code 257.")(
        "quiet,q", "Suppress warning and informational messages.")(
        "verbose,v", "Output detailed information during processing.")(
        "report", fileName(), "Output calibration report filename (HTML format).")(
        "check", fileName(),
        "Output full-resolution corrected image filename (16-bit TIFF format).");
    return options;
}

// "-h" is another spelling of "-H", the habit of most command-line tools. It
// is not listed in the help text, which shows the options as they always were.
std::vector<const char*> withHelpSpelledOut(int argc, const char* const argv[]) {
    std::vector<const char*> args(argv, argv + argc);
    for (std::size_t i = 1; i < args.size(); ++i)
        if (std::strcmp(args[i], "-h") == 0)
            args[i] = "-H";
    return args;
}

po::variables_map parseWith(const std::vector<const char*>& args,
                            const po::options_description& options) {
    po::variables_map map;
    po::store(po::parse_command_line(static_cast<int>(args.size()), args.data(), options), map);
    po::notify(map);
    return map;
}

// Without --kq an advanced option is unknown to the parser. Its error stays
// as it is; the detail says what is missing.
[[noreturn]] void rethrowUnknown(const po::unknown_option& error,
                                 const po::options_description& advanced) {
    std::string name = error.get_option_name();
    const std::string spelled = name;
    if (name.compare(0, 2, "--") == 0)
        name.erase(0, 2);
    if (!name.empty() && advanced.find_nothrow(name, false))
        throw DetailedError<std::runtime_error>(spelled + " needs --kq", error.what());
    throw;
}

} // namespace

CommandLine CommandLine::parse(int argc, const char* const argv[], std::ostream& out,
                               std::ostream& err) {
    const po::options_description basic = basicOptions();
    const po::options_description advanced = advancedOptions();
    po::options_description all("Options");
    all.add(basic).add(advanced);

    const std::vector<const char*> args = withHelpSpelledOut(argc, argv);
    CommandLine line;
    line.map_ = parseWith(args, all);
    // Without --kq an advanced option must fail as an unknown one.
    if (!line.given("kq")) {
        try {
            parseWith(args, basic);
        } catch (const po::unknown_option& error) {
            rethrowUnknown(error, advanced);
        }
    }

    for (int i = 1; i < argc; ++i)
        line.arguments_ += std::string(argv[i]) + " ";

    if (line.given("version"))
        throw notice(lscversion::versionLine());
    if (line.given("help")) {
        out << lscversion::versionLine() << std::endl;
        std::ostringstream text;
        text << msg::kUsageLine << '\n' << (line.given("kq") ? all : basic);
        throw notice(text.str());
    }

    bool failed = false;
    const auto check = [&](bool bad, const char* message) {
        if (bad) {
            err << message << std::endl;
            failed = true;
        }
    };
    const bool noInput = line.value("input").empty();
    check(line.value("config").empty(), msg::kNeedConfig);
    check(noInput && line.value("samples").empty(), msg::kNeedInputOrSamples);
    check(noInput && !line.value("outsamples").empty(), msg::kNeedInputForOutSamples);
    check(line.value("calibrate").empty() && line.value("outsamples").empty(),
          msg::kNeedCalibrateOrOutSamples);
    if (failed)
        throw notice(msg::kUseHelp);
    const std::size_t frames = line.values("input").size();
    if (frames > kMaxInputFrames)
        throw std::runtime_error(msg::kTooManyFramesPrefix + std::to_string(kMaxInputFrames) +
                                 msg::kTooManyFramesMiddle + std::to_string(frames) +
                                 msg::kTooManyFramesSuffix);
    return line;
}

std::string CommandLine::value(const char* name) const {
    const auto found = map_.find(name);
    if (found == map_.end())
        return std::string();
    if (const auto* several = boost::any_cast<std::vector<std::string>>(&found->second.value()))
        return several->empty() ? std::string() : several->front();
    return found->second.as<std::string>();
}

std::vector<std::string> CommandLine::values(const char* name) const {
    const auto found = map_.find(name);
    if (found == map_.end())
        return {};
    if (const auto* several = boost::any_cast<std::vector<std::string>>(&found->second.value()))
        return *several;
    return {found->second.as<std::string>()};
}

} // namespace driver
