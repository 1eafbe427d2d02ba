#include "Functions/XQueryTextArgument.h"

#include "Context/XQueryContextInternal.h"
#include "Types/XQueryAtomization.h"
#include "xquery/Collection.h"

namespace xquery {

XQueryTextArgument::XQueryTextArgument(const Value& argument, XQueryContext& context) {
  if (XQueryIsNode(argument.get()) || isa<NSString>(argument)) {
    _text = XQueryUntypedText(*argument);
  } else {
    _promoted = Ref<NSString>(cast<NSString>(XQueryPromoteToString(argument, context)));
  }
}

void XQueryCheckCollation(const Value* arguments, size_t count, size_t index,
                          XQueryContext& context) {
  if (index < count) XQueryPromoteToString(arguments[index], context);
}

Value XQueryArgumentOrContextItem(const Value* arguments, size_t count, XQueryContext& context) {
  if (count > 1) return Value();
  return count == 1 ? arguments[0] : _internal(context).contextItem();
}

}  // namespace xquery
