// The self-contained beat viewer page: the page template with the view's
// data as JSON and its audio as a data URL filled in.
#ifndef CLIPWEAVER_TOOLS_HTML_PAGE_H_
#define CLIPWEAVER_TOOLS_HTML_PAGE_H_

#include <string>

#include "tools/beat_view.h"

namespace cwtool {

std::string BeatPageHtml(const BeatView& view);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_HTML_PAGE_H_
