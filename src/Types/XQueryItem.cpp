// The public questions about a result and its items.
#include "Types/XQueryBinary.h"
#include "Types/XQueryNodeFunctions.h"
#include "Types/XQueryValues.h"
#include "xquery/XQuery.h"

#include <algorithm>

namespace xquery {

Ref<NSError> XQueryFirstError(const Ref<NSArray>& items, const Ref<XQueryError>& error) {
  if (error || !items) return error;
  const auto& objects = items->objects();
  const auto found = std::find_if(objects.begin(), objects.end(),
                                  [](const Value& item) { return isa<NSError>(item); });
  return found == objects.end() ? nullptr : cast<NSError>(*found);
}

std::string XQueryItemStringValue(const NSObject& item) {
  if (item.isNode()) return XQueryNodeStringValue(cast<NSXMLNode>(&item))->utf8();
  if (const NSData* data = dyn_cast<NSData>(&item)) return XQueryHexEncode(data->bytes());
  if (const NSError* error = dyn_cast<NSError>(&item)) return error->description()->utf8();
  const Ref<NSString> text = XQueryStringValue(item);
  return text ? text->utf8() : std::string();
}

}  // namespace xquery
