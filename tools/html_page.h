// The self-contained beat viewer page: the page template with the view's
// data as JSON and its audio as a data URL filled in.
#ifndef CLIPWEAVER_TOOLS_HTML_PAGE_H_
#define CLIPWEAVER_TOOLS_HTML_PAGE_H_

#include <string>

#include "tools/beat_view.h"

namespace cwtool {

// Written as it is made; on failure *error says why, and nothing is left
// under path.
bool WriteBeatPage(const std::string& path, const BeatView& view, std::string* error);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_HTML_PAGE_H_
