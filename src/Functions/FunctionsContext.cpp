#include "Functions/FunctionsContext.h"

#include "Eval/XQueryContextInternal.h"
#include "Types/XQueryNumber.h"

namespace xquery {
namespace {

// A position or a size of 0 was never set.
Value countInFocus(int64_t number) {
  return number == 0 ? Value() : Value(XQueryNumber::integerWithInt64(number));
}

}  // namespace

Value fn_position(const Value*, size_t count, XQueryContext& context) {
  return count == 0 ? countInFocus(context._internal().position()) : Value();
}

Value fn_last(const Value*, size_t count, XQueryContext& context) {
  return count == 0 ? countInFocus(context._internal().last()) : Value();
}

}  // namespace xquery
