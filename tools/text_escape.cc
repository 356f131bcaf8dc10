#include "tools/text_escape.h"

#include <algorithm>
#include <cstdint>
#include <cstdio>

namespace cwtool {
namespace {

constexpr char kReplacement[] = "\xEF\xBF\xBD";

// Length of the valid UTF-8 sequence starting at text[i], or 0.
size_t SequenceLength(const std::string& text, size_t i) {
  const auto byte = [&](size_t k) { return static_cast<uint8_t>(text[k]); };
  const uint8_t lead = byte(i);
  if (lead < 0x80) return 1;
  size_t length;
  uint32_t code;
  if ((lead & 0xE0) == 0xC0) {
    length = 2;
    code = lead & 0x1F;
  } else if ((lead & 0xF0) == 0xE0) {
    length = 3;
    code = lead & 0x0F;
  } else if ((lead & 0xF8) == 0xF0) {
    length = 4;
    code = lead & 0x07;
  } else {
    return 0;
  }
  if (i + length > text.size()) return 0;
  for (size_t k = 1; k < length; ++k) {
    if ((byte(i + k) & 0xC0) != 0x80) return 0;
    code = (code << 6) | (byte(i + k) & 0x3F);
  }
  static constexpr uint32_t kSmallest[] = {0, 0, 0x80, 0x800, 0x10000};
  const bool overlong = code < kSmallest[length];
  const bool surrogate = code >= 0xD800 && code <= 0xDFFF;
  return overlong || surrogate || code > 0x10FFFF ? 0 : length;
}

}  // namespace

std::string ValidUtf8(const std::string& text) {
  std::string out;
  out.reserve(text.size());
  for (size_t i = 0; i < text.size();) {
    const size_t length = SequenceLength(text, i);
    if (length == 0) {
      out += kReplacement;
      ++i;
    } else {
      out.append(text, i, length);
      i += length;
    }
  }
  return out;
}

std::string JsonString(const std::string& text) {
  std::string out = "\"";
  for (const char c : ValidUtf8(text)) {
    switch (c) {
      case '"': out += "\\\""; break;
      case '\\': out += "\\\\"; break;
      case '\n': out += "\\n"; break;
      case '\r': out += "\\r"; break;
      case '\t': out += "\\t"; break;
      default:
        if (static_cast<uint8_t>(c) < 0x20) {
          char escaped[8];
          snprintf(escaped, sizeof(escaped), "\\u%04x", c);
          out += escaped;
        } else {
          out += c;
        }
    }
  }
  return out + "\"";
}

std::string XmlText(const std::string& text) {
  std::string out;
  for (const char c : ValidUtf8(text)) {
    switch (c) {
      case '&': out += "&amp;"; break;
      case '<': out += "&lt;"; break;
      case '>': out += "&gt;"; break;
      case '"': out += "&quot;"; break;
      case '\'': out += "&apos;"; break;
      default:
        // XML 1.0 cannot hold these even as references.
        out += static_cast<uint8_t>(c) < 0x20 && c != '\t' && c != '\n' &&
                       c != '\r'
                   ? '?'
                   : c;
    }
  }
  return out;
}

std::string TerminalText(const std::string& text) {
  std::string out;
  const auto escape = [&](uint8_t byte) {
    char escaped[8];
    snprintf(escaped, sizeof(escaped), "\\x%02X", byte);
    out += escaped;
  };
  for (size_t i = 0; i < text.size();) {
    const size_t length = SequenceLength(text, i);
    const auto lead = static_cast<uint8_t>(text[i]);
    // C1 controls (U+0080..U+009F) steer terminals as the C0 ones do.
    const bool c1 = length == 2 && lead == 0xC2 && static_cast<uint8_t>(text[i + 1]) < 0xA0;
    if (length == 0 || lead < 0x20 || lead == 0x7F || c1) {
      switch (text[i]) {
        case '\n': out += "\\n"; break;
        case '\r': out += "\\r"; break;
        case '\t': out += "\\t"; break;
        default:
          for (size_t k = 0; k < std::max<size_t>(length, 1); ++k) {
            escape(static_cast<uint8_t>(text[i + k]));
          }
      }
      i += std::max<size_t>(length, 1);
    } else {
      out.append(text, i, length);
      i += length;
    }
  }
  return out;
}

std::string CsvField(const std::string& text) {
  if (text.find_first_of(",\"\r\n") == std::string::npos) return text;
  std::string out = "\"";
  for (const char c : text) {
    if (c == '"') out += '"';
    out += c;
  }
  return out + "\"";
}

}  // namespace cwtool
