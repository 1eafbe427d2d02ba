#include "Expr/Constructors/XQueryContentText.h"

#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "xquery/XMLNode.h"

namespace xquery {

// What a cast to a string makes of a string is the same text.
void XQueryAppendAtomic(const Value& item, NSMutableString& text, XQueryContext& context) {
  if (const auto* string = dyn_cast<NSString>(item)) {
    text.append(string->view());
    return;
  }
  const Value cast = XQueryCastAs(item, XQueryTypeString, context);
  text.append(xquery::cast<NSString>(cast)->view());
}

bool XQueryAppendText(const Value& value, NSMutableString& text, XQueryContext& context) {
  if (const auto* node = dyn_cast<NSXMLNode>(value)) {
    node->appendStringValueTo(text);
    return true;
  }
  if (const auto* string = dyn_cast<NSString>(value)) {
    text.append(string->view());
    return true;
  }
  const Value atomized = XQueryAtomization(value, context);
  const XQueryItemList items(atomized.get());
  for (size_t index = 0; index < items.count(); ++index) {
    checkWork();
    if (index > 0) text.append(u' ');
    XQueryAppendAtomic(items[index], text, context);
  }
  return items.count() > 0;
}

}  // namespace xquery
