#include "Platform/URIParser.h"
#include "xquery/URL.h"

namespace xquery {

Ref<NSURL> NSURL::URLWithString(const Ref<NSString>& text) {
  // Every character of a URI is ASCII.
  if (!text || text->view().isWide()) return nullptr;
  const NSStringView view = text->view();
  if (!isURIReference({view.asciiUnits(), view.length()})) return nullptr;
  return make<NSURL>(text);
}

Ref<NSURL> NSURL::URLWithString(const Ref<NSString>& text, const NSURL& base) {
  if (!text || text->view().isWide()) return nullptr;
  const NSStringView reference = text->view();
  const NSStringView baseText = base._text->view();
  const std::optional<std::string> resolved = resolveURIReference(
      {reference.asciiUnits(), reference.length()}, {baseText.asciiUnits(), baseText.length()});
  if (!resolved) return nullptr;
  return make<NSURL>(NSString::stringWithASCII(*resolved));
}

}  // namespace xquery
