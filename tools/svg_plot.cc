#include "tools/svg_plot.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdio>
#include <utility>
#include <vector>

#include "tools/text_escape.h"
#include "tools/text_file.h"

namespace cwtool {
namespace {

constexpr int kWidth = 1000;
constexpr int kLeft = 50;
constexpr int kRight = 40;  // room for the last time label
constexpr int kPlotWidth = kWidth - kLeft - kRight;
// 91 pixels a second: beats at 240 BPM are still over 20 pixels apart.
constexpr double kRowSeconds = 10;
constexpr double kOverviewTop = 48, kOverviewBottom = 108;
constexpr double kFirstRowTop = 154;
constexpr double kRowHeight = 150;
// Within a row.
constexpr double kWaveTop = 0, kWaveBottom = 70;
constexpr double kOnsetTop = 76, kOnsetBottom = 114;

template <typename... Args>
std::string Format(const char* format, Args... args) {
  char text[160];
  snprintf(text, sizeof(text), format, args...);
  return text;
}

// A stretch of the track drawn across `columns` pixels from x = kLeft.
struct Span {
  double start;    // seconds
  double seconds;  // per kPlotWidth pixels
  int columns;

  double X(double t) const { return kLeft + kPlotWidth * (t - start) / seconds; }
  // Indices [first, last) of the values at `per_second` under one column.
  std::pair<size_t, size_t> Under(int column, double per_second, size_t count) const {
    const double t0 = start + seconds * column / kPlotWidth;
    const double t1 = start + seconds * (column + 1) / kPlotWidth;
    const size_t first = std::min(count, static_cast<size_t>(t0 * per_second));
    const size_t last = std::min(count, std::max(first + 1, static_cast<size_t>(t1 * per_second)));
    return {first, last};
  }
};

// Outline along the highs and back along the lows, `peak` reaching the
// panel's edges.
std::string Envelope(const BeatView& view, const Span& span, float peak, double top,
                     double bottom) {
  const double middle = (top + bottom) / 2;
  const double scale = peak > 0 ? (bottom - top) / 2 / peak : 0;
  std::vector<double> low(static_cast<size_t>(span.columns), middle);
  std::vector<double> high(low);
  for (int c = 0; c < span.columns; ++c) {
    const auto [first, last] =
        span.Under(c, view.envelope_per_second, view.envelope_low.size());
    double& lo = low[static_cast<size_t>(c)];
    double& hi = high[static_cast<size_t>(c)];
    for (size_t i = first; i < last; ++i) {
      lo = std::max(lo, middle - view.envelope_low[i] * scale);
      hi = std::min(hi, middle - view.envelope_high[i] * scale);
    }
  }
  std::string path;
  for (int c = 0; c < span.columns; ++c) {
    path += Format(c == 0 ? "M%d.5 %.1f" : " L%d.5 %.1f", kLeft + c, high[static_cast<size_t>(c)]);
  }
  for (int c = span.columns - 1; c >= 0; --c) {
    path += Format(" L%d.5 %.1f", kLeft + c, low[static_cast<size_t>(c)]);
  }
  return "<path class=\"wave\" d=\"" + path + " Z\"/>\n";
}

// The largest onset value under each column, relative to the track's largest.
std::string OnsetLine(const BeatView& view, const Span& span, float largest) {
  if (view.onset.empty() || view.onset_per_second <= 0 || largest <= 0) return std::string();
  std::string points;
  for (int c = 0; c < span.columns; ++c) {
    const auto [first, last] = span.Under(c, view.onset_per_second, view.onset.size());
    if (first == last) break;
    const float value = *std::max_element(view.onset.begin() + static_cast<ptrdiff_t>(first),
                                          view.onset.begin() + static_cast<ptrdiff_t>(last));
    points += Format("%d.5,%.1f ", kLeft + c,
                     kOnsetBottom - (kOnsetBottom - kOnsetTop) * value / largest);
  }
  return "<polyline class=\"onset\" points=\"" + points + "\"/>\n";
}

std::string BeatMarks(const BeatView& view, const Span& span, double top, double bottom) {
  std::string out = "<g class=\"beats\">\n";
  const double end = span.start + span.seconds * span.columns / kPlotWidth;
  for (const float beat : view.beats) {
    if (beat < span.start || beat >= end) continue;
    const double x = span.X(beat);
    out += Format("<line x1=\"%.1f\" y1=\"%.0f\" x2=\"%.1f\" y2=\"%.0f\"/>\n", x, top, x, bottom);
  }
  return out + "</g>\n";
}

std::string TimeLabel(double t, bool minutes) {
  if (!minutes) return Format("%g", t);
  const int whole = static_cast<int>(std::lround(t));
  return Format("%d:%02d", whole / 60, whole % 60);
}

// Ticks and labels every `step` seconds along y = `at`.
std::string TimeAxis(const Span& span, double step, double at, bool minutes) {
  const double end = span.start + span.seconds * span.columns / kPlotWidth;
  std::string out = "<g class=\"axis\">\n";
  out += Format("<line x1=\"%d\" y1=\"%.0f\" x2=\"%d\" y2=\"%.0f\"/>\n", kLeft, at,
                kLeft + span.columns, at);
  for (int i = static_cast<int>(std::ceil(span.start / step - 1e-9)); i * step <= end + 1e-9; ++i) {
    const double x = span.X(i * step);
    out += Format("<line x1=\"%.1f\" y1=\"%.0f\" x2=\"%.1f\" y2=\"%.0f\"/>", x, at, x, at + 4);
    out += Format("<text x=\"%.1f\" y=\"%.0f\">", x, at + 16) +
           TimeLabel(i * step, minutes) + "</text>\n";
  }
  return out + "</g>\n";
}

// Round steps giving about ten labels over the whole track.
double OverviewStep(double duration) {
  static constexpr double kSteps[] = {0.5, 1, 2, 5, 10, 15, 30, 60, 120, 300, 600, 1200};
  for (const double s : kSteps) {
    if (duration / s <= 12) return s;
  }
  return 3600;
}

std::string Tempo(double bpm) {
  return KnownTempo(bpm) ? Format("%.1f BPM", bpm) : std::string("unknown");
}

std::string Title(const BeatView& view) {
  return XmlText(view.file) + " \xE2\x80\x94 tempo " + Tempo(view.tempo) +
         " (tracker " + Tempo(view.tracker_tempo) + "), " +
         std::to_string(view.beats.size()) + " beats in " + Format("%.1f s", view.duration);
}

}  // namespace

bool WriteBeatPlot(const std::string& path, const BeatView& view, std::string* error) {
  // Written as it is drawn: hours of rows make tens of megabytes.
  TextFile svg;
  if (!svg.Create(path, error)) return false;
  const double duration = view.duration;
  const int rows = std::max(1, static_cast<int>(std::ceil(duration / kRowSeconds - 1e-9)));
  const int height = static_cast<int>(kFirstRowTop + rows * kRowHeight);
  const bool minutes = duration >= 60;
  const float largest_onset =
      view.onset.empty() ? 0.0f : *std::max_element(view.onset.begin(), view.onset.end());
  // The loudest moment fills the panels, so that quiet tracks stay readable.
  float peak = 0;
  for (size_t i = 0; i < view.envelope_low.size(); ++i) {
    peak = std::max({peak, -view.envelope_low[i], view.envelope_high[i]});
  }

  svg.Write(
      "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
      "<svg xmlns=\"http://www.w3.org/2000/svg\" width=\"" + std::to_string(kWidth) +
      "\" height=\"" + std::to_string(height) + "\" viewBox=\"0 0 " +
      std::to_string(kWidth) + " " + std::to_string(height) + "\">\n"
      "<style>\n"
      "text { font: 11px sans-serif; fill: #333; }\n"
      ".title { font-size: 15px; }\n"
      ".wave { fill: #8aa8c8; stroke: none; }\n"
      ".onset { fill: none; stroke: #2a7a3a; stroke-width: 1; }\n"
      ".beats line { stroke: #d0302a; stroke-width: 1.5; }\n"
      ".overview .beats line { stroke-width: 1; stroke-opacity: 0.7; }\n"
      ".axis line { stroke: #555; }\n"
      ".axis text { text-anchor: middle; }\n"
      ".legend { fill: #666; }\n"
      "</style>\n"
      "<rect width=\"100%\" height=\"100%\" fill=\"white\"/>\n");
  svg.Write(Format("<text class=\"title\" x=\"%d\" y=\"22\">", kLeft) + Title(view) + "</text>\n");
  svg.Write(Format("<text class=\"legend\" x=\"%d\" y=\"38\">", kLeft) +
            "blue: waveform \xC2\xB7 green: onset strength \xC2\xB7 red: beats</text>\n");

  const Span whole{0, duration, kPlotWidth};
  svg.Write("<g class=\"overview\">\n");
  svg.Write(Envelope(view, whole, peak, kOverviewTop, kOverviewBottom - 10));
  svg.Write(BeatMarks(view, whole, kOverviewBottom - 8, kOverviewBottom));
  svg.Write(TimeAxis(whole, OverviewStep(duration), kOverviewBottom, minutes));
  svg.Write("</g>\n");

  for (int r = 0; r < rows; ++r) {
    const double start = r * kRowSeconds;
    const int columns = static_cast<int>(
        std::ceil(kPlotWidth * std::min(1.0, (duration - start) / kRowSeconds)));
    const Span span{start, kRowSeconds, std::max(1, columns)};
    svg.Write(Format("<g class=\"row\" transform=\"translate(0,%.0f)\">\n",
                     kFirstRowTop + r * kRowHeight));
    svg.Write(Envelope(view, span, peak, kWaveTop, kWaveBottom));
    svg.Write(OnsetLine(view, span, largest_onset));
    svg.Write(BeatMarks(view, span, kWaveTop, kOnsetBottom));
    svg.Write(TimeAxis(span, 1, kOnsetBottom, minutes));
    svg.Write("</g>\n");
  }
  svg.Write("</svg>\n");
  return svg.Commit(error);
}

}  // namespace cwtool
