#include "Types/XQueryNotation.h"

#include "Types/XQueryQName.h"

namespace xquery {

Ref<XQueryNotation> XQueryNotation::notationWithString(const Ref<NSString>& text) {
  XQueryQName::Range prefix;
  XQueryQName::Range localPart;
  XQueryQName::parseQNameString(text->view(), prefix, localPart);
  return localPart.length == 0 ? nullptr : make<XQueryNotation>(text);
}

}  // namespace xquery
