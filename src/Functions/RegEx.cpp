#include "Functions/RegEx.h"

#include "Context/XQueryContextInternal.h"
#include "Functions/XQueryRegExCache.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryTypeTable.h"

#include <array>
#include <memory>

namespace xquery {
namespace {

// The arguments as strings, an omitted last one as the empty string.
template <size_t most>
class Strings {
 public:
  Strings(const Value* arguments, size_t count, XQueryContext& context) {
    for (size_t index = 0; index < count; ++index) {
      _values[index] = XQueryPromoteToString(arguments[index], context);
    }
    if (count < most) _values[most - 1] = NSString::empty();
  }

  const NSString* operator[](size_t index) const { return cast<NSString>(_values[index].get()); }
  NSStringView view(size_t index) const { return (*this)[index]->view(); }

 private:
  std::array<Value, most> _values;
};

Ref<XQueryRegEx> compiled(NSStringView pattern, NSStringView flags, XQueryContext& context) {
  std::shared_ptr<XQueryRegExCache>& cache = context._internal().regExCache();
  if (!cache) cache = std::make_shared<XQueryRegExCache>();
  return cache->regExp(pattern, flags);
}

}  // namespace

Value fn_matches(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 2 || count > 3) return Value();
  const Strings<3> strings(arguments, count, context);
  const auto regEx = compiled(strings.view(1), strings.view(2), context);
  return regEx ? regEx->hasMatch(strings[0]) : Value();
}

Value fn_replace(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 3 || count > 4) return Value();
  const Strings<4> strings(arguments, count, context);
  const auto regEx = compiled(strings.view(1), strings.view(3), context);
  return regEx ? regEx->replace(strings[0], strings.view(2)) : Value();
}

// The empty input is answered before the pattern is looked at.
Value fn_tokenize(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 2 || count > 3) return Value();
  const Strings<3> strings(arguments, count, context);
  if (strings.view(0).isEmpty()) {
    return XQueryCastAsTypeForContext(NSString::empty(), XQueryTypeString, context);
  }
  const auto regEx = compiled(strings.view(1), strings.view(2), context);
  return regEx ? regEx->tokenize(strings[0]) : Value();
}

}  // namespace xquery
