// The viewer page's template, compiled in from html_template.html. It holds
// the placeholders {{title}}, {{audio}} and {{data}}.
#ifndef CLIPWEAVER_TOOLS_HTML_TEMPLATE_H_
#define CLIPWEAVER_TOOLS_HTML_TEMPLATE_H_

#include <string_view>

namespace cwtool {

extern const std::string_view kHtmlTemplate;

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_HTML_TEMPLATE_H_
