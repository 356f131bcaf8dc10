#include "tools/svg_plot.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>

#include "tools/text_escape.h"

namespace cwtool {
namespace {

constexpr int kWidth = 1000;
constexpr int kHeight = 400;
constexpr int kLeft = 40;
constexpr int kRight = 20;
constexpr int kPlotWidth = kWidth - kLeft - kRight;
constexpr double kWaveTop = 40, kWaveBottom = 200;
constexpr double kOnsetTop = 215, kOnsetBottom = 355;

template <typename... Args>
std::string Format(const char* format, Args... args) {
  char text[160];
  snprintf(text, sizeof(text), format, args...);
  return text;
}

double X(double seconds, double duration) {
  return kLeft + kPlotWidth * (duration > 0 ? seconds / duration : 0);
}

// Min and max of the channel mean per pixel column, as an outline that runs
// right along the maxima and back along the minima.
std::string Envelope(const DecodedAudio& audio) {
  const int64_t frames = audio.frames();
  const int channels = audio.channels;
  const double middle = (kWaveTop + kWaveBottom) / 2;
  const double half = (kWaveBottom - kWaveTop) / 2;
  std::vector<double> low(kPlotWidth), high(kPlotWidth);
  for (int column = 0; column < kPlotWidth; ++column) {
    const int64_t begin = frames * column / kPlotWidth;
    const int64_t end = std::max(begin + 1, frames * (column + 1) / kPlotWidth);
    double lo = 0, hi = 0;
    for (int64_t f = begin; f < end && f < frames; ++f) {
      double sum = 0;
      for (int c = 0; c < channels; ++c) sum += audio.samples[static_cast<size_t>(f * channels + c)];
      const double v = sum / channels / 32768.0;
      lo = std::min(lo, v);
      hi = std::max(hi, v);
    }
    low[static_cast<size_t>(column)] = middle - lo * half;
    high[static_cast<size_t>(column)] = middle - hi * half;
  }
  std::string path;
  for (int column = 0; column < kPlotWidth; ++column) {
    path += Format(column == 0 ? "M%.1f %.1f" : " L%.1f %.1f", kLeft + column + 0.5,
                   high[static_cast<size_t>(column)]);
  }
  for (int column = kPlotWidth - 1; column >= 0; --column) {
    path += Format(" L%.1f %.1f", kLeft + column + 0.5, low[static_cast<size_t>(column)]);
  }
  return "<path class=\"wave\" d=\"" + path + " Z\"/>\n";
}

// The largest onset value per pixel column, scaled to the panel.
std::string OnsetLine(const std::vector<float>& onset, double fps,
                      double duration) {
  if (onset.empty() || fps <= 0 || duration <= 0) return std::string();
  const float largest = *std::max_element(onset.begin(), onset.end());
  const double scale = largest > 0 ? 1.0 / largest : 0.0;
  const int64_t n = static_cast<int64_t>(onset.size());
  std::string points;
  for (int column = 0; column < kPlotWidth; ++column) {
    const double t0 = duration * column / kPlotWidth;
    const double t1 = duration * (column + 1) / kPlotWidth;
    const int64_t first = std::min<int64_t>(static_cast<int64_t>(t0 * fps), n - 1);
    const int64_t last = std::clamp<int64_t>(static_cast<int64_t>(t1 * fps), first + 1, n);
    const float value = *std::max_element(onset.begin() + first, onset.begin() + last);
    points += Format("%.1f,%.1f ", kLeft + column + 0.5,
                     kOnsetBottom - (kOnsetBottom - kOnsetTop) * value * scale);
  }
  return "<polyline class=\"onset\" points=\"" + points + "\"/>\n";
}

std::string BeatMarkers(const std::vector<float>& beats, double duration) {
  std::string out = "<g class=\"beats\">\n";
  for (const float beat : beats) {
    const double x = X(beat, duration);
    out += Format("<line x1=\"%.1f\" y1=\"%.0f\" x2=\"%.1f\" y2=\"%.0f\"/>\n", x,
                  kWaveTop, x, kOnsetBottom);
  }
  return out + "</g>\n";
}

// About ten labelled ticks, on round numbers of seconds.
std::string TimeAxis(double duration) {
  static constexpr double kSteps[] = {0.1, 0.2, 0.5, 1,  2,   5,   10,
                                      20,  30,  60,  120, 300, 600, 1200};
  double step = kSteps[0];
  for (const double s : kSteps) {
    step = s;
    if (duration / s <= 10) break;
  }
  std::string out = "<g class=\"axis\">\n";
  out += Format("<line x1=\"%d\" y1=\"%.0f\" x2=\"%d\" y2=\"%.0f\"/>\n", kLeft,
                kOnsetBottom, kLeft + kPlotWidth, kOnsetBottom);
  for (int i = 0; i * step <= duration + 1e-9; ++i) {
    const double t = i * step;
    const double x = X(t, duration);
    out += Format("<line x1=\"%.1f\" y1=\"%.0f\" x2=\"%.1f\" y2=\"%.0f\"/>", x,
                  kOnsetBottom, x, kOnsetBottom + 5);
    out += Format(step < 1 ? "<text x=\"%.1f\" y=\"%.0f\">%.1f</text>\n"
                           : "<text x=\"%.1f\" y=\"%.0f\">%.0f</text>\n",
                  x, kOnsetBottom + 18, t);
  }
  out += Format("<text x=\"%d\" y=\"%.0f\" class=\"unit\">s</text>\n",
                kLeft + kPlotWidth, kOnsetBottom + 34);
  return out + "</g>\n";
}

std::string Title(const BeatPlot& plot) {
  const std::string tempo =
      plot.bpm > 0 ? Format("%.1f BPM", plot.bpm) : std::string("tempo unknown");
  return XmlText(plot.name) + " \xE2\x80\x94 " + tempo + ", " +
         std::to_string(plot.beats->size()) + " beats";
}

}  // namespace

std::string BeatPlotSvg(const BeatPlot& plot) {
  const double duration = plot.audio->seconds();
  std::string svg =
      "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
      "<svg xmlns=\"http://www.w3.org/2000/svg\" width=\"" + std::to_string(kWidth) +
      "\" height=\"" + std::to_string(kHeight) + "\" viewBox=\"0 0 " +
      std::to_string(kWidth) + " " + std::to_string(kHeight) + "\">\n"
      "<style>\n"
      "text { font: 12px sans-serif; fill: #333; }\n"
      ".title { font-size: 16px; }\n"
      ".wave { fill: #8aa8c8; stroke: none; }\n"
      ".onset { fill: none; stroke: #2a7a3a; stroke-width: 1; }\n"
      ".beats line { stroke: #d0302a; stroke-width: 1; stroke-opacity: 0.6; }\n"
      ".axis line { stroke: #333; }\n"
      ".axis text { text-anchor: middle; }\n"
      "</style>\n"
      "<rect width=\"100%\" height=\"100%\" fill=\"white\"/>\n";
  svg += "<text class=\"title\" x=\"" + std::to_string(kLeft) + "\" y=\"24\">" +
         Title(plot) + "</text>\n";
  svg += Envelope(*plot.audio);
  svg += OnsetLine(*plot.onset, plot.frames_per_second, duration);
  svg += BeatMarkers(*plot.beats, duration);
  svg += TimeAxis(duration);
  svg += Format("<text x=\"%d\" y=\"%.0f\">waveform</text>\n", kLeft + 4, kWaveTop + 12);
  svg += Format("<text x=\"%d\" y=\"%.0f\">onset strength</text>\n", kLeft + 4,
                kOnsetTop + 12);
  return svg + "</svg>\n";
}

bool WriteBeatPlot(const std::string& path, const BeatPlot& plot,
                   std::string* error) {
  const std::string svg = BeatPlotSvg(plot);
  FILE* file = fopen(path.c_str(), "w");
  if (file == nullptr) {
    *error = std::string("cannot write: ") + std::strerror(errno);
    return false;
  }
  const bool written = fwrite(svg.data(), 1, svg.size(), file) == svg.size();
  const int saved_errno = errno;
  if (fclose(file) != 0 || !written) {
    *error = std::string("cannot write: ") + std::strerror(written ? errno : saved_errno);
    return false;
  }
  return true;
}

}  // namespace cwtool
