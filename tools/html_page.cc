#include "tools/html_page.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <string_view>

#include "tools/html_template.h"
#include "tools/text_escape.h"
#include "tools/text_file.h"

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

std::string Base64(std::string_view bytes) {
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

// In pieces of whole 3-byte groups, which encode as the whole does, so that
// the encoded audio (tens of megabytes on hours) is never held.
void WriteBase64(std::string_view bytes, TextFile* out) {
  constexpr size_t kPiece = 3 << 14;
  for (size_t at = 0; at < bytes.size(); at += kPiece) {
    out->Write(Base64(bytes.substr(at, kPiece)));
  }
}

}  // namespace

bool WriteBeatPage(const std::string& path, const BeatView& view, std::string* error) {
  TextFile page;
  if (!page.Create(path, error)) return false;
  // Values go out in their placeholders' places, never searched for later
  // placeholders.
  std::string_view rest = kHtmlTemplate;
  const auto fill = [&](std::string_view placeholder, const auto& write_value) {
    const size_t at = rest.find(placeholder);
    if (at == std::string_view::npos) return;
    page.Write(rest.substr(0, at));
    write_value();
    rest.remove_prefix(at + placeholder.size());
  };
  fill("{{title}}", [&] { page.Write(XmlText(view.file)); });
  fill("{{audio}}", [&] {
    if (view.audio.empty()) return;
    page.Write("data:" + view.audio_mime + ";base64,");
    WriteBase64(view.audio, &page);
  });
  fill("{{data}}", [&] { page.Write(DataJson(view)); });
  page.Write(rest);
  return page.Commit(error);
}

}  // namespace cwtool
