// A profile as a page: page.html with page.css, page.js and the profile as JSON put in, and for
// whoever reads it without scripts the profile as text.
#include "Plan/Profile/ProfileWriters.h"
#include "XQueryProfilePageParts.h"

#include <array>
#include <utility>

namespace xquery {

std::string XQueryProfilePage(const XQueryProfileData& profile,
                              const XQueryProfileSurroundings& surroundings) {
  const std::string title = surroundings.name.empty() ? "query" : surroundings.name;
  const std::array<std::pair<std::string_view, std::string>, 5> parts = {{
      {"<!--title-->", XQueryEscapedHTML(XQueryVisibleText(title))},
      {"/*style*/", XQueryProfilePageStyle},
      {"/*script*/", XQueryProfilePageScript},
      {"\"profile\"", XQueryProfileJSON(profile, surroundings)},
      {"<!--text-->", XQueryEscapedHTML(XQueryProfileText(profile, surroundings))},
  }};
  std::string page;
  std::string_view rest = XQueryProfilePageFrame;
  while (!rest.empty()) {
    size_t at = rest.size();
    const std::pair<std::string_view, std::string>* next = nullptr;
    for (const auto& part : parts) {
      const size_t found = rest.find(part.first);
      if (found >= at) continue;
      at = found;
      next = &part;
    }
    page += rest.substr(0, at);
    rest.remove_prefix(at + (next ? next->first.size() : 0));
    if (next) page += next->second;
  }
  return page;
}

}  // namespace xquery
