#include "driver/pipeline.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <iostream>
#include <stdexcept>

#include <boost/date_time/posix_time/posix_time.hpp>

#include "blob/blob_dump.h"
#include "blob/blob_parser.h"
#include "blob/blob_writer.h"
#include "config/config_file.h"
#include "config/fit_settings.h"
#include "config/parameter_table.h"
#include "config/patch_geometry_check.h"
#include "config/register_file.h"
#include "driver/autofocus_file.h"
#include "driver/changed_settings.h"
#include "driver/check_image.h"
#include "driver/driver_messages.h"
#include "driver/failure_text.h"
#include "driver/file_options.h"
#include "driver/headerless_raw.h"
#include "driver/input_frames.h"
#include "driver/output_stream.h"
#include "driver/unknown_settings.h"
#include "driver/version.h"
#include "image/bayer_phase.h"
#include "image/hex_text.h"
#include "image/output_file.h"
#include "lsc/lens_shading_correction.h"
#include "lsc/lens_shading_fit.h"
#include "lsc/patch_layout_choice.h"
#include "lsc/sample_collection.h"
#include "lsc/xtest_surface.h"
#include "prep/capture_evidence.h"
#include "prep/capture_stream.h"
#include "prep/delta_ab.h"
#include "prep/delta_ab_report.h"
#include "prep/image_checks.h"
#include "prep/luminance_residual.h"
#include "prep/mosaic_preparation.h"
#include "prep/sample_file.h"
#include "prep/white_balance.h"
#include "report/run_report_html.h"
#include "report/run_result_json.h"
#include "report/stage_records.h"

namespace driver {

using img::BayerImage;
using img::cfaPatternName;
using img::writeWholeFile;

using lsc::applyLensShading;
using lsc::applyXTestSurface;
using lsc::chooseLayout;
using lsc::collectSamples;
using lsc::fitLensShading;
using lsc::FitResult;
using lsc::kChannels;
using lsc::LayoutChoice;
using lsc::levelledImage;
using lsc::PatchLayout;
using lsc::SampleOrigin;
using lsc::ShadingCorrection;
using lsc::ShadingSettings;

using config::check_int_range;
using config::config_node;
using config::config_node_impl;
using config::load_fit_settings;
using config::parse_config_text;
using config::read_config_file;
using config::readConfigParam;
using config::set_defaults;
using config::StoredCalibration;
using config::validate;
using config::write_register_file;

namespace {

std::ostream& out() {
    return messageStream;
}

// The binary data name the tool that wrote them with the program's own
// version; the text dump of a freshly generated blob names its generator
// component with that component's version.
constexpr blob::ToolVersion kBlobToolVersion = {lscversion::kMajor, lscversion::kMinor,
                                                lscversion::kPatch};
constexpr char kBlobGeneratorName[] = "BlobGenerator";
constexpr char kBlobGeneratorVersion[] = "1.7.2";

// Prints "<label>R/G" and "<label>B/G" with six significant digits (G is the
// larger green) and returns the two ratios.
std::pair<float, float> printColourRatios(const char* label, const float (&levels)[kChannels]) {
    const float green = std::max(levels[1], levels[2]);
    if (!(green > 0.0f))
        throw std::runtime_error(msg::kNoGreenSignal);
    const float red = levels[0] / green;
    const float blue = levels[3] / green;
    out().precision(6);
    out() << label << msg::kRedRatio << red << std::endl;
    out() << label << msg::kBlueRatio << blue << std::endl;
    return {red, blue};
}

// Fixed-point text with `decimals` decimals, whatever the locale and the
// message stream's state.
std::string fixedText(double value, int decimals) {
    char buffer[64];
    const auto result =
        std::to_chars(buffer, buffer + sizeof buffer, value, std::chars_format::fixed, decimals);
    return result.ec == std::errc() ? std::string(buffer, result.ptr) : "?";
}

// Up to six significant digits, as the register file writes the factors.
std::string generalText(double value) {
    char buffer[64];
    const auto result =
        std::to_chars(buffer, buffer + sizeof buffer, value, std::chars_format::general, 6);
    return result.ec == std::errc() ? std::string(buffer, result.ptr) : "?";
}

} // namespace

Pipeline::Pipeline()
    : startTime_(boost::posix_time::microsec_clock::local_time()), timer_(startStageTimer()) {
}

int Pipeline::run(int argc, const char* const argv[]) {
    commandLine_ = CommandLine::parse(argc, argv, std::cout, std::cerr);
    // The binary data are built from the register file: without one there is
    // nothing to build them from.
    if (!commandLine_.value("binary").empty() && commandLine_.value("calibrate").empty())
        throw std::runtime_error(msg::kBinaryNeedsCalibrate);
    // The autofocus data go only into the binary data: without them the file
    // would be silently ignored.
    if (!commandLine_.value("autofocus").empty() && commandLine_.value("binary").empty())
        throw std::runtime_error(msg::kAutofocusNeedsBinary);
    checkOutputsReplaceNothing(commandLine_);
    frames_ = commandLine_.values("input");
    checkPath_ = commandLine_.value("check");
    reportPath_ = commandLine_.value("report");
    resultPath_ = commandLine_.value("json");
    report_.toolVersion = lscversion::versionText();
    report_.commandLine = commandLine_.argumentsText();
    for (const char* option : {"config", "input", "raw", "samples", "autofocus"})
        for (const std::string& path : commandLine_.values(option))
            if (!path.empty())
                report_.inputFiles.emplace_back(option, path);
    try {
        runStages();
    } catch (...) {
        recordFailure();
        throw;
    }
    report_.finished = true;
    writeReport();
    writeResult();
    finish();
    return 0;
}

void Pipeline::runStages() {
    beginStage(msg::kStageReadingTheConfiguration);
    readConfiguration();
    openMessages();
    beginStage(msg::kStageLoadingTheInputImage);
    loadInput();
    beginStage(msg::kStageCheckingTheInputImage);
    decideBitDepth();
    checkSettingsAgainstImage();
    applySensorGuid();
    inspectInput();
    beginStage(msg::kStagePreparingTheImage);
    prepareImage();
    beginStage(msg::kStageCheckingThePreparedImage);
    checkPreparedImage();
    lookForSetUpMistakes();
    writePreparedImage();
    shading_ = readShadingSettings();
    if (shading_.autoPatchLayout) {
        beginStage(msg::kStageChoosingThePatchLayout);
        shading_.layout = choosePatchLayout();
    }
    FitResult fit;
    {
        beginStage(msg::kStageObtainingTheSamples);
        const SamplesTaken samples = obtainSamples();
        beginStage(msg::kStageFittingTheLensShadingSurface);
        fit = fitSurface(samples);
    } // the levelled image the samples were measured on is released here
    beginStage(msg::kStageWritingTheCalibrationRegisterFile);
    writeRegisterFile(fit);
    // The correction as stored in the binary data, when they are written.
    ShadingCorrection correction = fit.correction;
    if (!settings_.binary.empty()) {
        beginStage(msg::kStageBinaryCalibrationData);
        correction = writeBinaryData(fit);
    }
    beginStage(msg::kStageCorrectingTheLensShading);
    BayerImage flattened = correct(correction);
    beginStage(msg::kStageWhiteBalance);
    balanceWhite(flattened, fit);
    // Before delta ab, which turns the flattened image into display values.
    const std::optional<float> lumaResidual = measureLuminance(flattened);
    beginStage(msg::kStageDeltaAb);
    measureColourError(flattened);
    // After delta ab, so that its files are written for a failed run too.
    beginStage(msg::kStageLuminanceResidual);
    prep::checkLuminanceResidual(lumaResidual, shading_.maxLumaResidual);
    beginStage(msg::kStageWritingTheFlattenedImages);
    writeFlattenedImages(std::move(flattened));
    if (!checkPath_.empty()) {
        beginStage(msg::kStageWritingTheCheckImage);
        writeCheck(correction, fit);
    }
}

// The report and the result file of a failed run show what failed and
// everything computed before.
void Pipeline::recordFailure() {
    if (reportPath_.empty() && resultPath_.empty())
        return;
    report_.failedStage = stage_;
    recordFitError();
    const FailureText failure = describeFailure(std::current_exception());
    report_.failureMessage = failure.text;
    report_.exitStatus = failure.status;
    for (void (Pipeline::*write)() : {&Pipeline::writeReport, &Pipeline::writeResult}) {
        try {
            (this->*write)();
        } catch (const std::exception& error) {
            // The run's own error is what the operator must see first; this
            // one goes on the line before it.
            out() << msg::kErrorPrefix << error.what() << std::endl;
        }
    }
}

void Pipeline::writeReport() {
    if (reportPath_.empty())
        return;
    out() << msg::kProgressWritingCalibrationReport << std::endl;
    report::writeRunReport(reportPath_, report_);
    noteOutput("report", reportPath_);
}

void Pipeline::writeResult() {
    if (resultPath_.empty())
        return;
    out() << msg::kProgressWritingRunResult << std::endl;
    report::writeRunResult(resultPath_, report_);
}

void Pipeline::readConfiguration() {
    root_ = std::make_shared<config_node_impl>("root");
    config_ = static_cast<config_node_impl*>(&root_->child("config"));
    set_defaults(*config_);
    read_config_file(commandLine_.value("config"), *config_);
    validate(*config_);
    report_.changedSettings = changedSettings(*config_);

    settings_.debug = config_->find_path("proc.debug").as_bool() || commandLine_.given("debug");
    timer_.enabled = settings_.debug;
    if (settings_.debug)
        out() << msg::kStartLabel << boost::posix_time::to_simple_string(startTime_) << std::endl;
    timerLine(timer_, msg::kTimerReadingConfiguration, out());

    // The median work area holds at most 100 distinct values of a window.
    if (config_->find_path("proc.median_filter_size").as_int() > 10)
        throw std::runtime_error(msg::kMedianTooLarge);
    const bool debug = settings_.debug;
    settings_ = readRunSettings(commandLine_, *config_);
    settings_.debug = debug;
}

void Pipeline::openMessages() {
    messageStream.setQuiet(settings_.quiet);
    messageStream.openInfoFile(settings_.log);
    out() << lscversion::versionLine() << std::endl;
    for (const std::string& text : unknownSettingWarnings(*config_, settings_.blockName))
        warn(text);
    if (settings_.input.empty())
        throw std::runtime_error(msg::kNoInput);
    timerLine(timer_, msg::kTimerProcessesConfiguration, out());
    for (const std::string& frame : frames_)
        out() << msg::kInputFileLabel << frame << std::endl;
}

void Pipeline::saveIfAsked(const char* option, const std::string& path, const char* message,
                           const char* timerLabel,
                           const std::function<void(const std::string&)>& store) {
    if (path.empty())
        return;
    out() << message << std::endl;
    store(path);
    noteOutput(option, path);
    timerLine(timer_, timerLabel, out());
}

prep::MosaicPreparation Pipeline::preparation() const {
    prep::MosaicPreparation preparation;
    preparation.medianFilter = settings_.medianFilter;
    preparation.medianSize = settings_.medianFilterSize;
    preparation.samplingFactor = settings_.procSamplingFactor;
    return preparation;
}

// Unless something needs the input image itself (its exports and
// translation, the identity test, the full-resolution check image), the
// capture is prepared as it is read and never held at full resolution.
bool Pipeline::needsInputImage() const {
    return !settings_.inputAsJpeg.empty() || !settings_.inputAsBmp.empty() ||
           !settings_.translate.empty() || identityTest() || !checkPath_.empty();
}

// In debug mode, when the stored prepared image should be the input again.
bool Pipeline::identityTest() const {
    const bool unfiltered = !settings_.medianFilter || settings_.medianFilterSize == 1;
    return settings_.debug && !settings_.preproc.empty() && unfiltered &&
           settings_.procSamplingFactor == 1;
}

void Pipeline::loadInput() {
    const prep::MosaicPreparation preparation = this->preparation();
    const bool stream = !needsInputImage();
    // Debug mode shows the input's statistics.
    prep::SampleStatistics* statistics = settings_.debug ? &inputStatistics_ : nullptr;
    if (settings_.raw.empty()) {
        if (frames_.size() > 1) {
            if (stream && !statistics)
                preparedWhileLoading_ =
                    prep::loadAveragedPrepared(frames_, preparation, input_, prepared_, &noise_) ==
                    prep::CaptureLoad::kPrepared;
            if (!preparedWhileLoading_)
                readAveragedFrames(input_, frames_, [](BayerImage& frame, const std::string& path) {
                    frame.read(path);
                });
        } else if (stream) {
            preparedWhileLoading_ =
                prep::loadPrepared(settings_.input, preparation, input_, prepared_, statistics,
                                   &noise_) == prep::CaptureLoad::kPrepared;
        } else {
            input_.read(settings_.input);
        }
        // A code the reader does not know leaves no Bayer order: every later
        // stage would fail with a message that points elsewhere.
        if (img::knownBayerPhase(input_.cfa()) < 0)
            throw std::runtime_error(msg::kUnknownBayerOrder);
    } else {
        const int bits = settings_.bitRes == 0 ? 10 : settings_.bitRes;
        // Read only here: a run without --raw never looks at it.
        const config_node& legacyFormat = config_->find_path("raw.legacy_format");
        check_int_range(*config_, legacyFormat, 0, 1);
        if (frames_.size() > 1)
            readAveragedFrames(input_, frames_, [&](BayerImage& frame, const std::string& path) {
                loadHeaderlessRaw(frame, path, static_cast<std::uint16_t>(bits), settings_.raw,
                                  legacyFormat.as_bool());
            });
        else
            preparedWhileLoading_ =
                loadHeaderlessRaw(input_, settings_.input, static_cast<std::uint16_t>(bits),
                                  settings_.raw, legacyFormat.as_bool(),
                                  stream ? &preparation : nullptr, &prepared_, statistics, &noise_);
        if (!settings_.translate.empty()) {
            input_.storeKqraw(settings_.translate);
            noteOutput("translate", settings_.translate);
        }
    }
    if (frames_.size() > 1)
        out() << msg::kFramesAveragedLabel << frames_.size() << std::endl;
    timerLine(timer_, msg::kTimerImageLoadTime, out());
    saveIfAsked("inputasjpeg", settings_.inputAsJpeg, msg::kProgressSavingRawInputFileInJpegFormat,
                msg::kTimerJPEGImageSaveTime,
                [&](const std::string& path) { input_.storeJpeg(path, settings_.jpegQuality); });
    saveIfAsked("inputasbmp", settings_.inputAsBmp, msg::kProgressSavingRawInputFileInBmpFormat,
                msg::kTimerBMPImageSaveTime,
                [&](const std::string& path) { input_.storeBmp(path); });
}

void Pipeline::decideBitDepth() {
    const int imageBits = input_.bitsPerSample();
    depth_ = settings_.bitRes == 0 ? imageBits : settings_.bitRes;
    if (settings_.bitRes != 0 && settings_.bitRes != imageBits)
        out() << msg::kBitDepthDiffersPrefix << imageBits << msg::kBitDepthDiffersMiddle
              << settings_.bitRes << msg::kBitDepthDiffersSuffix << std::endl;
    fullScale_ = prep::fullScale(depth_);

    report::recordInput(report_, input_, settings_.input, depth_, static_cast<int>(frames_.size()),
                        settings_.debug);
}

void Pipeline::checkSettingsAgainstImage() {
    const config_node& config = *config_;
    const int width = input_.width();
    const int height = input_.height();
    if (!config.find_path("lsc.left_patch_width").is_default()) {
        check_int_range(config, config.find_path("lsc.left_patch_width"), 0, width / 2);
        check_int_range(config, config.find_path("lsc.center_patch_width"), 0, width);
        check_int_range(config, config.find_path("lsc.top_patch_height"), 0, height / 2);
        check_int_range(config, config.find_path("lsc.middle_patch_height"), 0, height);
    }
    check_int_range(config, config.find_path("lsc.awb_avg_filter_size"), 1, width / 4);

    // The full scale of the configured depth bounds the pixel levels. (Taken
    // as a signed 16-bit number it would be -1 for 16 bits and refuse every
    // configuration.)
    const int depth = settings_.bitRes != 0 ? settings_.bitRes : input_.bitsPerSample();
    const int levelLimit = static_cast<int>(prep::fullScale(depth));
    for (const char* key :
         {"proc.black_level", "proc.min_pixel_val", "proc.max_pixel_val", "proc.peak_pixel_min"})
        check_int_range(config, config.find_path(key), 0, levelLimit);

    const config_node& sensorWidth = config.find_path("lsc.imageWidth");
    const config_node& sensorHeight = config.find_path("lsc.imageHeight");
    if (!sensorWidth.is_default() && !sensorHeight.is_default() &&
        (width != sensorWidth.as_int() || height != sensorHeight.as_int()))
        throw std::runtime_error(std::string(msg::kDimensionsPrefix) + std::to_string(width) + "x" +
                                 std::to_string(height) + msg::kDimensionsMiddle +
                                 std::to_string(sensorWidth.as_int()) + "x" +
                                 std::to_string(sensorHeight.as_int()) + ").");
}

void Pipeline::applySensorGuid() {
    if (settings_.sensorGuid.empty())
        return;
    // Stored only in a fixed header, as a 64-bit number: a text that is not
    // one would be stored as 0.
    if (input_.hasFixedHeader() && !img::isHexGuid(settings_.sensorGuid))
        throw std::invalid_argument(msg::kBadSensorGuidPrefix + settings_.sensorGuid +
                                    msg::kBadSensorGuidSuffix);
    input_.setSensorGuid(settings_.sensorGuid);
}

void Pipeline::inspectInput() {
    if (settings_.debug) {
        out() << msg::kProgressInputImageData << std::endl;
        if (input_.hasSamples())
            prep::writeStatistics(input_, depth_, out());
        else
            prep::writeStatistics(inputStatistics_, depth_, out());
        out() << std::endl;
    }
    out().precision(3);
    out() << msg::kExposureTimeLabel << input_.exposureTime() << std::endl;
    out() << msg::kSensorGainPrefix << input_.channelGain(0) << msg::kListSeparator
          << input_.channelGain(1) << msg::kListSeparator << input_.channelGain(2)
          << msg::kListSeparator << input_.channelGain(3) << msg::kSensorGainSuffix << std::endl;
    timerLine(timer_, msg::kTimerImageInspectionTime, out());
}

void Pipeline::prepareImage() {
    // Split, filter and weave run as one pass over the mosaic, so the colour
    // planes are never held at full resolution. The three timer lines stay;
    // the split's and the weave's work is counted in the filter's line.
    // A capture prepared while it was read is counted in the load's line.
    timerLine(timer_, msg::kTimerBayerDeinterweaveTime, out());
    if (!preparedWhileLoading_)
        prepared_ = prep::prepareMosaic(input_, preparation());
    timerLine(timer_, msg::kTimerMedianFilterAndDownSamplingTime, out());

    // The prepared image keeps the input's capture data, so it is stored in
    // the input's raw format.
    prepared_.copyMetadata(input_);
    timerLine(timer_, msg::kTimerBayerInterweaveTime, out());

    out() << msg::kProgressPreprocessedImageData << std::endl;
    prep::writeStatistics(prepared_, depth_, out());
    out() << std::endl;
}

void Pipeline::checkPreparedImage() {
    prep::PixelLimits limits;
    limits.minPixel = settings_.minPixel;
    limits.maxPixel = settings_.maxPixel;
    limits.peakMinimum = settings_.peakPixelMin;
    limits.samplingFactor = settings_.procSamplingFactor;
    prep::checkPixels(prepared_, limits, fullScale_, out());
}

// Mistakes that let a run complete with a wrong register file. Each rule
// warns only on clear evidence: a good flat field prints nothing here.
void Pipeline::lookForSetUpMistakes() {
    const config_node& blackNode = config_->find_path("proc.black_level");
    const double blackLevel = blackNode.as_int();
    const std::string doubt = prep::bayerOrderDoubt(
        prep::centreLevels(prepared_, static_cast<float>(blackLevel / fullScale_)),
        cfaPatternName(input_.cfa()));
    if (!doubt.empty())
        warn(doubt);

    // The rows of a capture loaded whole have not passed the sampler yet.
    if (!noise_.started() && input_.hasSamples())
        feedRows(input_, noise_);
    const prep::PedestalEvidence pedestal = noise_.evidence();
    const double tolerance = std::max(2.0, prep::kPedestalTolerance * fullScale_);
    if (pedestal.measured && pedestal.lowerBound > blackLevel + tolerance)
        warn(msg::kPedestalPrefix +
             std::to_string(static_cast<long long>(std::floor(pedestal.lowerBound))) +
             msg::kPedestalMiddle + std::to_string(static_cast<long long>(blackLevel)) +
             msg::kPedestalSuffix);
}

void Pipeline::warn(const std::string& text) {
    out() << msg::kWarningPrefix << text << std::endl;
    report_.warnings.push_back(text);
}

void Pipeline::writePreparedImage() {
    if (settings_.preproc.empty())
        return;
    out() << msg::kPreprocessedFileLabel << settings_.preproc << std::endl;
    prepared_.storeKqraw(settings_.preproc);
    noteOutput("preproc", settings_.preproc);
    if (identityTest()) {
        out() << msg::kProgressPerformingIdentityTest << std::endl;
        BayerImage stored;
        stored.read(settings_.preproc);
        if (!stored.samePixels(input_))
            out() << msg::kIdentityMismatch << std::endl;
    }
}

ShadingSettings Pipeline::readShadingSettings() {
    ShadingSettings shading = load_fit_settings(*config_, input_);
    shading.quiet = settings_.quiet;
    report::recordPrepared(report_, prepared_, shading.blackLevel, !reportPath_.empty());
    timerLine(timer_, msg::kTimerImageCheckingTime, out());
    return shading;
}

Pipeline::SamplesTaken Pipeline::obtainSamples() {
    const prep::SampleFileScale scale{prep::sampleFullScale(depth_), shading_.procSamplingFactor};
    SamplesTaken taken;
    if (settings_.samples.empty()) {
        out() << msg::kProgressCreateSamplesFromImage << std::endl;
        taken.measuredOn = levelledImage(prepared_, shading_.blackLevel);
        taken.set = collectSamples(taken.measuredOn, shading_, out());
        taken.fromImage = true;
        if (!settings_.outSamples.empty()) {
            prep::writeSampleFile(settings_.outSamples, taken.set, taken.measuredOn, scale);
            noteOutput("outsamples", settings_.outSamples);
        }
    } else {
        out() << msg::kProgressLoadingSamplePointsFromFile << std::endl;
        taken.set = prep::readSampleFile(settings_.samples, prepared_, scale);
    }
    return taken;
}

FitResult Pipeline::fitSurface(const SamplesTaken& samples) {
    out() << msg::kProgressComputingLensShadingSurface << std::endl;
    const SampleOrigin origin{samples.fromImage ? samples.measuredOn : prepared_,
                              samples.fromImage};
    FitResult fit = fitLensShading(samples.set, origin, shading_, out(), deviations_);
    const auto ratios = printColourRatios(msg::kMeasuredLabel, fit.targetLevels);
    report::recordMeasuredRatios(report_, ratios.first, ratios.second);
    if (settings_.xtest) {
        out() << msg::kProgressXTestModeSpecified << std::endl;
        out() << msg::kProgressXTestSurface << std::endl;
        applyXTestSurface(fit.correction);
        report_.xtest = true;
        warn(msg::kXTestWarning);
    }
    report::recordSamples(report_, samples.set);
    report::recordFit(report_, fit.correction, fit.targetLevels);
    recordFitError();
    return fit;
}

// Also after a failed fit: the deviations show why a bound ended the run.
void Pipeline::recordFitError() {
    report::recordDeviations(report_, deviations_, shading_);
}

void Pipeline::writeRegisterFile(const FitResult& fit) {
    if (!settings_.calibrate.empty()) {
        out() << msg::kProgressGeneratingConfigurationFile << std::endl;
        registerText_ = write_register_file(settings_.calibrate, *config_, settings_.blockName,
                                            settings_.controlPointInfix,
                                            commandLine_.argumentsText(), fit, input_);
        noteOutput("calibrate", settings_.calibrate);
    }
    timerLine(timer_, msg::kTimerLensShadingCalculationTime, out());
}

// The calibration is read from the register text this run wrote and the
// stored bytes are checked as this run wrote them: read back through their
// paths they could be another run's files written over ours in the meantime,
// or a device or pipe that gives nothing back (/dev/null, /dev/stdout).
ShadingCorrection Pipeline::writeBinaryData(const FitResult& fit) {
    out() << msg::kProgressReadingCalibrationData << std::endl;
    parse_config_text(registerText_, *config_);
    if (!settings_.autofocus.empty()) {
        out() << msg::kProgressReadingAutofocusCalibrationData << std::endl;
        readAutofocusFile(settings_.autofocus, *config_);
    }
    const blob::BlobSources sources = blob::blobSourcesFromConfig(*config_);
    timerLine(timer_, msg::kTimerReadCalibrationTime, out());

    out() << msg::kProgressGeneratingBinaryCalibrationData << std::endl;
    const std::vector<std::uint8_t> bytes = blob::generateBlob(sources, kBlobToolVersion, out());
    if (config_->find_path("blob.log_flag").as_bool()) {
        config_node_impl scratch("root");
        const blob::BlobVersions versions = blob::parseBlob(
            bytes.data(), bytes.size(), scratch.child("calibration"), scratch.child("config"));
        blob::writeCalibrationText(scratch.child("calibration"), settings_.blockName + ".",
                                   scratch.child("config"), kBlobGeneratorName,
                                   kBlobGeneratorVersion, versions, std::cout);
        if (!std::cout)
            throw std::runtime_error(msg::kCannotWriteDump);
    }
    timerLine(timer_, msg::kTimerBinaryDataConstructionTime, out());

    if (!writeWholeFile(settings_.binary, bytes.data(), bytes.size()))
        throw std::runtime_error(msg::kCannotStoreBinary);
    noteOutput("binary", settings_.binary);
    timerLine(timer_, msg::kTimerBinaryDataSaveTime, out());

    out() << msg::kProgressReadingBinaryCalibrationData << std::endl;
    const std::vector<std::uint8_t>& stored = bytes;
    timerLine(timer_, msg::kTimerBinaryDataReadingTime, out());
    config_node_impl storedRoot("root");
    config_node& data = storedRoot.child("module").child("lsc");
    blob::parseBlob(stored.data(), stored.size(), data, storedRoot.child("config"));
    timerLine(timer_, msg::kTimerBinaryDataParsingTime, out());
    // From here on the correction uses the control points as stored.
    const StoredCalibration calibration = readConfigParam(*root_, data, prepared_, fit.correction);
    report::recordFit(report_, calibration.correction, fit.targetLevels);
    recordFitError();
    timerLine(timer_, msg::kTimerBinaryDataTransferTime, out());
    return calibration.correction;
}

BayerImage Pipeline::correct(const ShadingCorrection& correction) {
    out() << msg::kProgressStartCorrectingLensShading << std::endl;
    BayerImage corrected =
        applyLensShading(prepared_, correction, shading_.blackLevel, shading_.applyStep);
    timerLine(timer_, msg::kTimerApplyLensShadingTime, out());
    return corrected;
}

void Pipeline::balanceWhite(BayerImage& flattened, const FitResult& fit) {
    out() << msg::kProgressPerformingWhiteBalancing << std::endl;
    float balance[kChannels];
    prep::balanceLevels(fit.targetLevels, flattened, balance);
    prep::whiteBalance(flattened, balance);
    float levels[kChannels];
    prep::measureLevels(levels, flattened, shading_.awbFilterSize, shading_.procSamplingFactor);
    const auto ratios = printColourRatios(msg::kFlattenedMeasuredLabel, levels);
    report::recordWhiteBalance(report_, ratios.first, ratios.second, flattened,
                               !reportPath_.empty());
    timerLine(timer_, msg::kTimerWhiteBalanceTime, out());
}

void Pipeline::measureColourError(BayerImage& flattened) {
    if (settings_.avgLuma == 1 || settings_.noDelta || settings_.xtest)
        return;
    out() << msg::kProgressCalculatingDeltaAB << std::endl;
    out() << msg::kDeltaBlocksLabel << shading_.deltaAbBlocks[0] << msg::kBlocksBy
          << shading_.deltaAbBlocks[1] << std::endl;
    const prep::DeltaAbResult delta = prep::evaluateDeltaAb(flattened, shading_);
    report::recordDeltaAb(report_, delta, shading_.maxDeltaAb);
    if (!settings_.delta.empty()) {
        out() << msg::kProgressWritingDeltaAbData << std::endl;
        prep::writeDeltaFile(settings_.delta, delta);
        noteOutput("delta", settings_.delta);
    }
    out().precision(6);
    out() << msg::kMaximumDeltaLabel << delta.maxDelta << std::endl;
    if (!settings_.stats.empty()) {
        prep::writeStatsFile(settings_.stats, delta);
        noteOutput("stats", settings_.stats);
    }
    prep::checkDeltaThreshold(delta.maxDelta, shading_.maxDeltaAb);
    timerLine(timer_, msg::kTimerCalculateDeltaAbTime, out());
}

// The samples, the fit, the register file and the binary data then use the
// chosen factors. Configured factors are replaced in the configuration too,
// so that the binary data's geometry check compares with what was used.
PatchLayout Pipeline::choosePatchLayout() {
    config_node& lsc = config_->child("lsc");
    if (!lsc.find("left_patch_width").is_default() && lsc.find("leftPatchFactor").is_default())
        throw std::runtime_error(msg::kAutoLayoutNeedsFactors);
    const LayoutChoice choice = chooseLayout(prepared_, shading_);
    const PatchLayout& layout = choice.layout;
    const std::pair<const char*, double> factors[] = {{"leftPatchFactor", layout.left},
                                                      {"centerPatchFactor", layout.center},
                                                      {"topPatchFactor", layout.top},
                                                      {"middlePatchFactor", layout.middle}};
    const bool configured = !lsc.find("leftPatchFactor").is_default();
    std::string text;
    for (const auto& [key, value] : factors) {
        const std::string number = generalText(value);
        if (configured)
            lsc.child(key).set(number);
        text += std::string(text.empty() ? "" : ", ") + key + " " + number;
    }
    out() << msg::kPatchLayoutLabel << text << msg::kPatchLayoutCandidatesPrefix
          << choice.candidates << msg::kPatchLayoutCandidatesSuffix << std::endl;
    timerLine(timer_, msg::kTimerPatchLayoutTime, out());
    return layout;
}

std::optional<float> Pipeline::measureLuminance(const BayerImage& balanced) {
    const std::optional<float> residual = prep::luminanceResidual(balanced, shading_);
    report::recordLuminance(report_, residual, shading_.maxLumaResidual);
    // Only runs that set the bound print the figure, so that every other
    // run's output stays as it was.
    if (shading_.maxLumaResidual > 0.0f && residual)
        out() << msg::kMaximumLumaLabel << fixedText(100.0 * *residual, 2) << msg::kPerCent
              << std::endl;
    return residual;
}

void Pipeline::writeFlattenedImages(BayerImage flattened) {
    // Built for --bmp as well: a BMP alone must still be written.
    if (settings_.flat.empty() && settings_.jpeg.empty() && settings_.bmp.empty())
        return;
    flattened.copyMetadata(input_);
    saveIfAsked("flat", settings_.flat, msg::kProgressWritingFlattenedImage,
                msg::kTimerFlattenedRawImageSaveTime,
                [&](const std::string& path) { flattened.storeKqraw(path); });
    saveIfAsked("jpeg", settings_.jpeg, msg::kProgressWritingFlattenedJpegImage,
                msg::kTimerFlattenedJPEGImageSaveTime,
                [&](const std::string& path) { flattened.storeJpeg(path, settings_.jpegQuality); });
    saveIfAsked("bmp", settings_.bmp, msg::kProgressWritingFlattenedBmpImage,
                msg::kTimerFlattenedBMPImageSaveTime,
                [&](const std::string& path) { flattened.storeBmp(path); });
}

// Last: it takes the capture's samples, which nothing needs after it.
void Pipeline::writeCheck(const ShadingCorrection& correction, const FitResult& fit) {
    out() << msg::kProgressWritingFullResolutionCheckImage << std::endl;
    writeCheckImage(checkPath_, std::move(input_), correction, shading_.blackLevel,
                    fit.targetLevels);
    noteOutput("check", checkPath_);
    timerLine(timer_, msg::kTimerCheckImageSaveTime, out());
}

void Pipeline::finish() {
    if (settings_.debug)
        out() << msg::kExecutionTimeLabel
              << boost::posix_time::to_simple_string(
                     boost::posix_time::microsec_clock::local_time() - startTime_)
              << std::endl;
    out() << msg::kProgressCompleted << std::endl;
}

} // namespace driver
