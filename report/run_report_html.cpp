#include "report/run_report_html.h"

#include <cstdio>
#include <stdexcept>

#include "image/output_file.h"
#include "report/report_messages.h"
#include "report/report_sections.h"
#include "report/report_text.h"

namespace report {

using img::OutputFile;

namespace {

// Sizes in mm and pt so print and screen agree; colours that print well in
// black and white, with the figure colours kept when printing.
constexpr char kStyle[] = R"css(
@page { size: A4; margin: 11mm 12mm 12mm; }
html { -webkit-print-color-adjust: exact; print-color-adjust: exact; }
body { font: 9pt/1.3 "DejaVu Sans", "Liberation Sans", Arial, Helvetica, sans-serif;
       color: #111; background: #fff; max-width: 186mm; margin: 6mm auto; }
h1 { font-size: 15pt; margin: 0 0 1mm; }
h2 { font-size: 11pt; margin: 4mm 0 1.5mm; padding-bottom: 0.5mm; border-bottom: 0.6pt solid #777; }
.subtitle { margin: 0 0 2mm; color: #444; word-break: break-all; }
.verdict { border: 1pt solid; border-radius: 1.5mm; padding: 2mm 3mm; margin: 2mm 0; font-size: 11pt; }
.verdict .badge { font-weight: bold; margin-right: 2mm; }
.verdict.pass { border-color: #1a7f37; background: #e8f5ec; color: #0b4d1e; }
.verdict.fail { border-color: #b3261e; background: #fcebea; color: #7a1410; }
.message { white-space: pre-wrap; word-break: break-word; font: 9pt/1.3 "DejaVu Sans Mono", monospace;
           margin: 1.5mm 0 0; color: #111; }
table { border-collapse: collapse; margin: 1mm 0; }
th, td { text-align: left; vertical-align: top; padding: 0.3mm 2.5mm 0.3mm 0; border-bottom: 0.4pt solid #ccc; }
thead th { border-bottom: 0.8pt solid #777; font-weight: bold; }
th[scope=row] { font-weight: normal; color: #444; white-space: nowrap; }
table.numbers td { text-align: right; font-variant-numeric: tabular-nums; padding-left: 4mm; }
table.numbers thead th + th { text-align: right; padding-left: 4mm; }
code { font: 8pt "DejaVu Sans Mono", monospace; word-break: break-all; }
h3 { font-size: 9pt; margin: 2mm 0 1mm; }
.settings ul { columns: 3; column-gap: 5mm; list-style: none; margin: 0; padding: 0; }
.settings li { break-inside: avoid; font-size: 7pt; line-height: 1.3; }
.settings code { font-size: 7pt; }
.columns { display: grid; grid-template-columns: 1fr 1fr; gap: 6mm; align-items: start; }
.figures { display: grid; grid-template-columns: repeat(2, 78mm); justify-content: space-around;
           gap: 2mm 6mm; align-items: start; }
.figures table { width: 100%; }
figure { margin: 0 0 2mm; break-inside: avoid; page-break-inside: avoid; }
figure svg { display: block; max-width: 100%; height: auto; }
figcaption { margin-top: 0.8mm; }
svg text { fill: #222; font-family: "DejaVu Sans", "Liberation Sans", Arial, sans-serif; }
svg.definitions { position: absolute; width: 0; height: 0; overflow: hidden; }
.num { font-variant-numeric: tabular-nums; }
.note { color: #444; margin: 1mm 0; }
.ok { color: #0b4d1e; }
.bad { color: #a1150f; font-weight: bold; }
h2, h3 { break-after: avoid; page-break-after: avoid; }
.verdict, table.numbers, table.facts { break-inside: avoid; page-break-inside: avoid; }
@media print { body { margin: 0; max-width: none; } }
)css";

std::string fileName(const std::string& path) {
    const std::size_t slash = path.find_last_of('/');
    return slash == std::string::npos ? path : path.substr(slash + 1);
}

} // namespace

std::string runReportHtml(const RunReport& report) {
    const std::string input = report.inputPath.empty() ? "no input" : report.inputPath;
    std::string page = "<!DOCTYPE html>\n<html lang=\"en\">\n<head>\n<meta charset=\"utf-8\">\n"
                       "<meta name=\"viewport\" content=\"width=device-width, initial-scale=1\">\n";
    page += "<title>Lens shading calibration report: " + htmlEscape(fileName(input)) +
            "</title>\n<style>" + kStyle + "</style>\n</head>\n<body>\n";
    page += "<header><h1>Lens shading calibration report</h1><p class=\"subtitle\">" +
            htmlEscape(input) + "</p>\n" + verdictSection(report) + "</header>\n<main>\n";
    page += runSection(report);
    page += surfacesSection(report);
    page += shadingSection(report);
    page += colourSection(report);
    page += fitErrorSection(report);
    page += "</main>\n</body>\n</html>\n";
    return page;
}

void writeRunReport(const std::string& path, const RunReport& report) {
    const std::string page = runReportHtml(report);
    OutputFile file;
    if (!file.open(path))
        throw std::runtime_error(msg::kCannotWriteReport + path);
    if (std::fwrite(page.data(), 1, page.size(), file.stream()) != page.size() || !file.commit())
        throw std::runtime_error(msg::kCannotWriteReport + path);
}

} // namespace report
