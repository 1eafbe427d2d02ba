#include "Functions/String.h"

#include "Expr/XQuerySequence.h"
#include "Functions/XQueryTextArgument.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/Blocks.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryIntegerText.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryString.h"
#include "Types/XQueryUntypedText.h"

#include <array>
#include <cstring>
#include <new>
#include <optional>
#include <string>

namespace xquery {
namespace {

// The text of one argument of `concat`; null for the empty sequence. Any atomic value has one, a
// string's being the string itself.
Value textToConcat(const Value& argument, XQueryContext& context) {
  Value item = XQueryAtomizationCheckingOccurrence(argument, XQueryOccurrenceAnyAlso, context);
  if (isNull(item) || isa<NSString>(item)) return item;
  return XQueryCastAsTypeForContext(item, XQueryTypeString, context);
}

// A text that is put together where it lies, without memory of its own while it is short and 8-bit.
class ShortText {
 public:
  void append(NSStringView piece) {
    if (_isLong || piece.isWide() || piece.length() > _units.size() - _length) {
      appendToLong(piece);
      return;
    }
    // An empty piece may lie nowhere.
    if (piece.length() == 0) return;
    std::memcpy(_units.data() + _length, piece.asciiUnits(), piece.length());
    _length += piece.length();
  }
  Ref<NSString> string() const {
    return _isLong ? _long.string() : NSString::stringWithView(here());
  }

 private:
  NSStringView here() const { return NSStringView::ascii({_units.data(), _length}); }
  void appendToLong(NSStringView piece) {
    if (!_isLong) _long.append(here());
    _isLong = true;
    _long.append(piece);
  }

  std::array<char, 256> _units;
  size_t _length = 0;
  bool _isLong = false;
  NSMutableString _long;
};

// The length of the joined strings where all of them and the separator are 8-bit.
std::optional<size_t> narrowJoinedLength(const NSArray& items, NSStringView separator) {
  if (separator.isWide() || items.count() == 0) return std::nullopt;
  size_t length = (items.count() - 1) * size_t{separator.length()};
  WorkPacer pacer;
  for (const Value& item : items.objects()) {
    pacer.turn();
    const auto* string = dyn_cast<NSString>(item);
    if (!string || string->view().isWide()) return std::nullopt;
    length += string->length();
  }
  return length;
}

Value joined(const NSArray& items, NSStringView separator, XQueryContext& context) {
  NSMutableString text;
  WorkPacer pacer;
  for (size_t index = 0; index < items.count(); ++index) {
    pacer.turn();
    if (index > 0) text.append(separator);
    text.append(XQueryTextArgument(items.objects()[index], context).view());
  }
  return XQueryString::stringWithView(text.view());
}

// The same for strings that are 8-bit all of them, whose length is known beforehand.
Value joinedNarrow(const NSArray& items, NSStringView separator, size_t length) {
  if (length >= NSStringView::notFound) throw std::bad_alloc();
  ValueText<char> text;
  text.reserve(length);
  const auto append = [&text](NSStringView piece) {
    appendInBlocks(text, std::string_view(piece.asciiUnits(), piece.length()));
  };
  WorkPacer pacer;
  for (size_t index = 0; index < items.count(); ++index) {
    pacer.turn();
    if (index > 0) append(separator);
    append(cast<NSString>(items.objects()[index])->view());
  }
  return XQueryString::stringWithView(viewOf(text));
}

}  // namespace

Value fn_compare(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 2 || count > 3) return Value();
  XQueryCheckCollation(arguments, count, 2, context);
  for (size_t index = 0; index < 2; ++index) {
    if (XQueryItemList(arguments[index].get()).count() == 0) return NSNull::null();
  }
  const XQueryTextArgument a(arguments[0], context);
  const XQueryTextArgument b(arguments[1], context);
  return XQueryNumber::integerWithInt64(a.view().compare(b.view()));
}

// The answer is a plain string, which is an untyped value.
Value fn_concat(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 2) return Value();
  ShortText text;
  for (size_t index = 0; index < count; ++index) {
    const Value& argument = arguments[index];
    // The text of a node, too, is that of its value.
    if (XQueryIsNode(argument.get()) || isa<NSString>(argument)) {
      text.append(XQueryUntypedText(*argument).view());
      continue;
    }
    const auto* number = dyn_cast<XQueryNumber>(argument);
    if (number && XQueryIntegerText::isFor(*number)) {
      text.append(XQueryIntegerText(*number).view());
      continue;
    }
    const Value item = textToConcat(argument, context);
    if (isNull(item)) continue;
    if (!isa<NSString>(item)) return item;
    text.append(cast<NSString>(item)->view());
  }
  return text.string();
}

Value fn_string_join(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 2) return Value();
  const XQueryTextArgument separator(arguments[1], context);
  if (const auto* items = dyn_cast<NSArray>(arguments[0])) {
    const auto length = narrowJoinedLength(*items, separator.view());
    return length ? joinedNarrow(*items, separator.view(), *length)
                  : joined(*items, separator.view(), context);
  }
  return XQueryPromoteToString(arguments[0], context);
}

Value fn_string_length(const Value* arguments, size_t count, XQueryContext& context) {
  const Value item = XQueryArgumentOrContextItem(arguments, count, context);
  if (!item) return Value();
  return XQueryNumber::integerWithInt64(XQueryTextArgument(item, context).view().length());
}

}  // namespace xquery
