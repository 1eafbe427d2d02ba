#include "Functions/Constructors.h"

#include "Types/XQueryCasting.h"

namespace xquery {

Value XQueryConstruct(XQueryTypeID type, const Value* arguments, size_t count,
                      XQueryContext& context) {
  return count == 1 ? XQueryCastAsTypeForContext(arguments[0], type, context) : Value();
}

}  // namespace xquery
