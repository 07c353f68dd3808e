#include "driver/run_settings.h"

namespace driver {

using config::config_node;

RunSettings readRunSettings(const CommandLine& line, const config_node& config) {
    RunSettings s;
    s.input = line.value("input");
    s.inputAsJpeg = line.value("inputasjpeg");
    s.inputAsBmp = line.value("inputasbmp");
    s.raw = line.value("raw");
    s.translate = line.value("translate");
    s.preproc = line.value("preproc");
    s.log = line.value("log");
    s.autofocus = line.value("autofocus");
    s.calibrate = line.value("calibrate");
    s.samples = line.value("samples");
    s.outSamples = line.value("outsamples");
    s.flat = line.value("flat");
    s.jpeg = line.value("jpeg");
    s.bmp = line.value("bmp");
    s.delta = line.value("delta");
    s.stats = line.value("stats");
    s.binary = line.value("binary");
    s.quiet = line.given("quiet");
    s.xtest = line.given("xtest");
    s.noDelta = line.given("nodelta");

    s.medianFilter = config.find_path("proc.median_filter_flag").as_bool();
    s.medianFilterSize = config.find_path("proc.median_filter_size").as_int();
    s.procSamplingFactor = config.find_path("shared.proc_sampling_factor").as_int();
    s.sensorGuid = config.find_path("shared.sensor_guid").as_string();
    s.minPixel = config.find_path("proc.min_pixel_val").as_float();
    s.maxPixel = config.find_path("proc.max_pixel_val").as_float();
    s.peakPixelMin = config.find_path("proc.peak_pixel_min").as_float();
    s.jpegQuality = config.find_path("shared.jpeg_quality").as_int();
    s.blockNumFlag = config.find_path("shared.block_num_flag").as_bool();
    s.blockNum = config.find_path("shared.block_num").as_int();
    s.blockName = config.find_path("shared.block_name").as_string();
    s.avgLuma = config.find_path("lsc.avg_luma").as_int();
    s.bitRes = config.find_path("shared.bit_res").as_int();
    if (s.blockNumFlag)
        s.controlPointInfix = ".ctrlPoints[" + std::to_string(s.blockNum) + "]";
    return s;
}

} // namespace driver
