#include "Functions/Boolean.h"

#include "Types/XQueryAtomization.h"
#include "xquery/Error.h"

namespace xquery {

Value fn_true(const Value*, size_t count, XQueryContext&) {
  return count == 0 ? Value(NSNumber::trueValue()) : Value();
}

Value fn_false(const Value*, size_t count, XQueryContext&) {
  return count == 0 ? Value(NSNumber::falseValue()) : Value();
}

Value fn_boolean(const Value* arguments, size_t count, XQueryContext& context) {
  return count == 1 ? XQueryEffectiveBooleanValue(arguments[0], context) : Value();
}

Value fn_not(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 1) return Value();
  Value truth = XQueryEffectiveBooleanValue(arguments[0], context);
  if (isa<XQueryError>(truth)) return truth;
  return NSNumber::numberWithBool(!XQueryIsTrue(truth));
}

}  // namespace xquery
