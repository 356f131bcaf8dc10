#include "tools/report.h"

#include <cmath>
#include <cstdio>

#include "tools/text_escape.h"

namespace cwtool {
namespace {

constexpr int kBeatsPerTextLine = 8;

std::string Number(const char* format, double value) {
  char text[32];
  snprintf(text, sizeof(text), format, value);
  return text;
}

bool Known(double tempo) { return std::isfinite(tempo) && tempo > 0; }

std::string Text(const BeatResult& r) {
  std::string out = TerminalText(r.path) + ": ";
  out += Known(r.tempo) ? Number("%.2f BPM", r.tempo) : "tempo unknown";
  out += ", " + std::to_string(r.beats.size()) + " beats in " +
         Number("%.2f s", r.duration) + " (" + std::to_string(r.sample_rate) +
         " Hz, " + std::to_string(r.channels) +
         (r.channels == 1 ? " channel)\n" : " channels)\n");
  for (size_t i = 0; i < r.beats.size(); ++i) {
    out += Number(i % kBeatsPerTextLine == 0 ? "  %8.3f" : " %8.3f", r.beats[i]);
    if (i % kBeatsPerTextLine == kBeatsPerTextLine - 1 || i + 1 == r.beats.size()) {
      out += '\n';
    }
  }
  return out;
}

std::string Csv(const BeatResult& r) {
  std::string out;
  const std::string prefix =
      CsvField(r.path) + "," + (Known(r.tempo) ? Number("%.3f", r.tempo) : "") + ",";
  for (size_t i = 0; i < r.beats.size(); ++i) {
    out += prefix + std::to_string(i + 1) + "," + Number("%.3f", r.beats[i]) + "\n";
  }
  return out;
}

std::string Json(const BeatResult& r) {
  std::string out = "{\"file\":" + JsonString(r.path) +
                    ",\"duration\":" + Number("%.3f", r.duration) +
                    ",\"sample_rate\":" + std::to_string(r.sample_rate) +
                    ",\"channels\":" + std::to_string(r.channels) +
                    ",\"tempo\":" + (Known(r.tempo) ? Number("%.3f", r.tempo) : "null") +
                    ",\"tracker_tempo\":" + (Known(r.bpm) ? Number("%.3f", r.bpm) : "null") +
                    ",\"beats\":[";
  for (size_t i = 0; i < r.beats.size(); ++i) {
    if (i > 0) out += ',';
    out += Number("%.3f", r.beats[i]);
  }
  return out + "]}\n";
}

}  // namespace

std::string Report::Header() const {
  return format_ == ReportFormat::kCsv ? "file,tempo_bpm,beat,time_s\n" : "";
}

std::string Report::Result(const BeatResult& result) const {
  switch (format_) {
    case ReportFormat::kText:
      return Text(result);
    case ReportFormat::kCsv:
      return Csv(result);
    case ReportFormat::kJson:
      return Json(result);
  }
  return std::string();
}

std::string Report::Failure(const std::string& path,
                            const std::string& reason) const {
  if (format_ != ReportFormat::kJson) return std::string();
  return "{\"file\":" + JsonString(path) + ",\"error\":" + JsonString(reason) + "}\n";
}

}  // namespace cwtool
