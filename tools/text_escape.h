// Making arbitrary text (file names above all) safe inside the output
// formats.
#ifndef CLIPWEAVER_TOOLS_TEXT_ESCAPE_H_
#define CLIPWEAVER_TOOLS_TEXT_ESCAPE_H_

#include <string>

namespace cwtool {

// Replaces every byte that is not part of valid UTF-8 with U+FFFD, since
// file names need not be UTF-8 but JSON and XML must be.
std::string ValidUtf8(const std::string& text);

// A JSON string literal, quotes included.
std::string JsonString(const std::string& text);

// Text for XML content or attribute values.
std::string XmlText(const std::string& text);

// Text for a terminal or a log: control characters and bytes that are not
// UTF-8 become C-style escapes (\n, \x1B), so that a file name can neither
// split a line nor steer the terminal.
std::string TerminalText(const std::string& text);

// One CSV field, quoted when it has to be.
std::string CsvField(const std::string& text);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_TEXT_ESCAPE_H_
