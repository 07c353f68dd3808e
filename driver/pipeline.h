#pragma once
// The run driver: its state for the whole run and its stages, each run once,
// in a fixed order. Anything that ends the run early is thrown and reported
// by the caller (driver/run.h).

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <boost/date_time/posix_time/ptime.hpp>

#include "config/config_node.h"
#include "driver/command_line.h"
#include "driver/run_settings.h"
#include "driver/stage_timer.h"
#include "image/bayer_image.h"
#include "lsc/fit_result.h"
#include "lsc/shading_sample.h"
#include "lsc/shading_settings.h"
#include "prep/capture_evidence.h"
#include "prep/image_checks.h"
#include "prep/mosaic_preparation.h"
#include "report/run_report.h"

namespace driver {

class Pipeline {
public:
    Pipeline();
    // Runs every stage; returns the exit status of a completed run.
    int run(int argc, const char* const argv[]);

private:
    void runStages();
    void beginStage(const char* name) { stage_ = name; }
    void recordFailure();
    void writeReport();
    void writeResult();
    void readConfiguration();
    void openMessages();
    void loadInput();
    bool needsInputImage() const;
    bool identityTest() const;
    prep::MosaicPreparation preparation() const;
    void decideBitDepth();
    void checkSettingsAgainstImage();
    void applySensorGuid();
    void inspectInput();
    void prepareImage();
    void checkPreparedImage();
    void lookForSetUpMistakes();
    // Prints "WARNING: <text>" and keeps the text for the report and the result.
    void warn(const std::string& text);
    void writePreparedImage();
    lsc::ShadingSettings readShadingSettings();
    lsc::PatchLayout choosePatchLayout();
    // The samples and, when they were taken from the image, the levelled
    // image they were measured on (empty for a sample file: the fit then
    // measures on the prepared image).
    struct SamplesTaken {
        lsc::SampleSet set;
        img::BayerImage measuredOn;
        bool fromImage = false;
    };
    SamplesTaken obtainSamples();
    lsc::FitResult fitSurface(const SamplesTaken& samples);
    void recordFitError();
    void writeRegisterFile(const lsc::FitResult& fit);
    // Returns the correction as the binary data store it.
    lsc::ShadingCorrection writeBinaryData(const lsc::FitResult& fit);
    img::BayerImage correct(const lsc::ShadingCorrection& correction);
    void balanceWhite(img::BayerImage& flattened, const lsc::FitResult& fit);
    std::optional<float> measureLuminance(const img::BayerImage& balanced);
    // Turns the flattened image into display values (see evaluateDeltaAb).
    void measureColourError(img::BayerImage& flattened);
    void writeFlattenedImages(img::BayerImage flattened);
    void writeCheck(const lsc::ShadingCorrection& correction, const lsc::FitResult& fit);
    void finish();
    // When `path` is set: the message line, store(path), the timer line.
    void saveIfAsked(const char* option, const std::string& path, const char* message,
                     const char* timerLabel, const std::function<void(const std::string&)>& store);
    // An output this run has finished writing, for the result file.
    void noteOutput(const char* option, const std::string& path) {
        report_.outputs.emplace_back(option, path);
    }

    boost::posix_time::ptime startTime_;
    StageTimer timer_;
    CommandLine commandLine_;
    RunSettings settings_;
    std::shared_ptr<config::config_node_impl> root_;
    config::config_node_impl* config_ = nullptr;

    int depth_ = 0;               // bit depth of the run
    std::uint32_t fullScale_ = 0; // 2^depth - 1
    img::BayerImage input_;
    img::BayerImage prepared_;
    // The capture went through the preparation as it was read: input_ holds
    // its header and capture data only.
    bool preparedWhileLoading_ = false;
    prep::SampleStatistics inputStatistics_; // of such a capture, in debug mode
    lsc::ShadingSettings shading_;           // from the configuration, with the layout the run uses
    lsc::FitDeviations deviations_;          // set by the fit, also when a bound then ends the run
    // The register file as this run wrote it; the binary data are built from it.
    std::string registerText_;

    // The calibration report (--report): filled as the stages go.
    std::vector<std::string> frames_; // --input, in order
    std::string checkPath_;           // --check
    // The capture's rows pass it as they are read (or after a whole load).
    prep::NoiseSampler noise_;
    std::string reportPath_;
    std::string resultPath_; // --json
    report::RunReport report_;
    const char* stage_ = "";
};

} // namespace driver
