#include "tools/html_page.h"

#include <algorithm>
#include <cmath>
#include <cstdio>

#include "tools/html_template.h"
#include "tools/text_escape.h"

namespace cwtool {
namespace {

std::string Number(const char* format, double value) {
  char text[32];
  snprintf(text, sizeof(text), format, value);
  return text;
}

// Thousandths of full scale (or of the largest value) as integers keep the
// arrays short without a visible loss at any zoom.
std::string Milli(const std::vector<float>& values, float full_scale) {
  std::string out = "[";
  for (size_t i = 0; i < values.size(); ++i) {
    if (i > 0) out += ',';
    out += std::to_string(full_scale > 0 ? std::lround(1000.0 * values[i] / full_scale) : 0);
  }
  return out + "]";
}

std::string Tempo(double bpm) { return KnownTempo(bpm) ? Number("%.3f", bpm) : "null"; }

// Beats and figures written as the JSON report writes them, so that the two
// can be compared as they are.
std::string DataJson(const BeatView& view) {
  std::string out = "{\"file\":" + JsonString(view.file) +
                    ",\"duration\":" + Number("%.3f", view.duration) +
                    ",\"sample_rate\":" + std::to_string(view.sample_rate) +
                    ",\"channels\":" + std::to_string(view.channels) +
                    ",\"tempo\":" + Tempo(view.tempo) +
                    ",\"tracker_tempo\":" + Tempo(view.tracker_tempo) + ",\"beats\":[";
  for (size_t i = 0; i < view.beats.size(); ++i) {
    if (i > 0) out += ',';
    out += Number("%.3f", view.beats[i]);
  }
  const float largest_onset =
      view.onset.empty() ? 0.0f : *std::max_element(view.onset.begin(), view.onset.end());
  out += "],\"envelope_per_second\":" + std::to_string(view.envelope_per_second) +
         ",\"envelope_low\":" + Milli(view.envelope_low, 1) +
         ",\"envelope_high\":" + Milli(view.envelope_high, 1) +
         ",\"onset_per_second\":" + Number("%.10g", view.onset_per_second) +
         ",\"onset\":" + Milli(view.onset, largest_onset) + "}";
  // A file name holding "</script>" must not end the element early.
  std::string safe;
  for (const char c : out) {
    if (c == '<') {
      safe += "\\u003c";
    } else {
      safe += c;
    }
  }
  return safe;
}

std::string Base64(const std::string& bytes) {
  static constexpr char kDigits[] =
      "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  std::string out;
  out.reserve((bytes.size() + 2) / 3 * 4);
  for (size_t i = 0; i < bytes.size(); i += 3) {
    const size_t n = std::min<size_t>(3, bytes.size() - i);
    uint32_t word = 0;
    for (size_t k = 0; k < 3; ++k) {
      word = word << 8 | (k < n ? static_cast<unsigned char>(bytes[i + k]) : 0u);
    }
    for (size_t k = 0; k < 4; ++k) {
      out += k <= n ? kDigits[(word >> (18 - 6 * k)) & 63] : '=';
    }
  }
  return out;
}

// Fills the first placeholder after *from and moves *from past the value,
// so that a value is never searched for later placeholders.
void Fill(std::string* text, size_t* from, const std::string& placeholder,
          const std::string& value) {
  const size_t at = text->find(placeholder, *from);
  if (at == std::string::npos) return;
  text->replace(at, placeholder.size(), value);
  *from = at + value.size();
}

}  // namespace

std::string BeatPageHtml(const BeatView& view) {
  std::string page(kHtmlTemplate);
  size_t from = 0;
  Fill(&page, &from, "{{title}}", XmlText(view.file));
  Fill(&page, &from, "{{audio}}",
       view.audio.empty() ? std::string()
                          : "data:" + view.audio_mime + ";base64," + Base64(view.audio));
  Fill(&page, &from, "{{data}}", DataJson(view));
  return page;
}

}  // namespace cwtool
