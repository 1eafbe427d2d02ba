// 8-bit text, which is plain ASCII, is rewritten in place of widening it: every normalisation form
// leaves it alone, its case mapping is one unit for one, and it needs no encoding before it is
// escaped.
#include "Functions/FunctionsStringMapping.h"

#include "Functions/XQueryTextArgument.h"
#include "Platform/ICUText.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryString.h"
#include "Types/XQueryStringFunctions.h"

#include <algorithm>
#include <array>
#include <optional>
#include <vector>

namespace xquery {
namespace {

NSStringView viewOf(const std::u16string& text) {
  return {text.data(), static_cast<uint32_t>(text.size())};
}

Value asString(const Value& value, XQueryContext& context) {
  return XQueryCastAsTypeForContext(value, XQueryTypeString, context);
}

// --- case ----------------------------------------------------------------------------------------

// The text with the letters from `first` on, 26 of them, in the other case.
std::string otherCase(NSStringView text, char first) {
  std::string mapped(text.asciiUnits(), text.length());
  for (char& unit : mapped) {
    const bool letter = static_cast<unsigned char>(unit - first) < 26;
    unit = static_cast<char>(unit ^ (letter ? 'a' ^ 'A' : 0));
  }
  return mapped;
}

Value caseMapped(const Value* arguments, size_t count, XQueryContext& context, char first,
                 std::u16string (*mapWide)(std::u16string_view)) {
  if (count != 1) return Value();
  const XQueryTextArgument argument(arguments[0], context);
  const NSStringView text = argument.view();
  if (text.isWide()) {
    return XQueryString::stringWithView(viewOf(mapWide({text.wideUnits(), text.length()})));
  }
  return XQueryString::stringWithView(NSStringView::ascii(otherCase(text, first)));
}

// --- normalisation forms -------------------------------------------------------------------------

struct FormRow {
  std::string_view name;
  NSNormalizationForm form;
};

constexpr FormRow forms[] = {
    {"NFC", NSNormalizationForm::C},
    {"NFD", NSNormalizationForm::D},
    {"NFKC", NSNormalizationForm::KC},
    {"NFKD", NSNormalizationForm::KD},
};

std::optional<NSNormalizationForm> formNamed(NSStringView name) {
  for (const FormRow& row : forms) {
    if (name == row.name) return row.form;
  }
  return std::nullopt;
}

// --- translate -----------------------------------------------------------------------------------

// What becomes of each unit, built once for a call: units of ASCII have a slot each, the others
// stand in an ordered list.
class TranslationTable {
 public:
  TranslationTable(NSStringView map, NSStringView translation) {
    _ascii.fill(kept);
    for (uint32_t index = 0; index < map.length(); ++index) {
      const char16_t unit = map[index];
      const int32_t target = index < translation.length() ? translation[index] : removed;
      if (unit >= _ascii.size()) {
        _others.push_back({unit, target});
      } else if (_ascii[unit] == kept) {
        _ascii[unit] = target;
      }
    }
    // Of several entries for one unit the first holds; a stable sort leaves it first.
    std::stable_sort(_others.begin(), _others.end(),
                     [](const Entry& a, const Entry& b) { return a.unit < b.unit; });
  }

  void appendTo(std::string& out, NSStringView text) const {
    const char* units = text.asciiUnits();
    for (uint32_t index = 0; index < text.length(); ++index) {
      const auto unit = static_cast<unsigned char>(units[index]);
      const int32_t target = _ascii[unit];
      if (target != removed) out += static_cast<char>(target == kept ? unit : target);
    }
  }

  void appendTo(std::u16string& out, NSStringView text) const {
    for (uint32_t index = 0; index < text.length(); ++index) {
      const char16_t unit = text[index];
      const int32_t target = unit < _ascii.size() ? _ascii[unit] : targetOfOther(unit);
      if (target != removed) out += target == kept ? unit : static_cast<char16_t>(target);
    }
  }

 private:
  static constexpr int32_t kept = -1;
  static constexpr int32_t removed = -2;
  struct Entry {
    char16_t unit;
    int32_t target;
  };

  int32_t targetOfOther(char16_t unit) const {
    const auto found =
        std::lower_bound(_others.begin(), _others.end(), unit,
                         [](const Entry& entry, char16_t wanted) { return entry.unit < wanted; });
    return found != _others.end() && found->unit == unit ? found->target : kept;
  }

  std::array<int32_t, 0x80> _ascii;
  std::vector<Entry> _others;
};

// --- escape-uri ----------------------------------------------------------------------------------

// The characters that may stand in a URI.
constexpr std::string_view legalInURI =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-_.!~*'();/?:@&=+$,";
constexpr std::string_view reservedInURI = ";/?:@&=+$,#[]";

class UnescapedSet {
 public:
  constexpr UnescapedSet(std::string_view alsoUnescaped, std::string_view escaped) {
    for (const char unit : legalInURI) set(unit, true);
    for (const char unit : alsoUnescaped) set(unit, true);
    for (const char unit : escaped) set(unit, false);
  }
  bool contains(char unit) const {
    const auto byte = static_cast<unsigned char>(unit);
    return byte < _members.size() && _members[byte];
  }

 private:
  constexpr void set(char unit, bool member) {
    _members[static_cast<unsigned char>(unit)] = member;
  }
  std::array<bool, 0x80> _members{};
};

constexpr UnescapedSet unescapedWithReserved("%", reservedInURI);
constexpr UnescapedSet unescapedWithoutReserved("#[]%", "");

std::string percentEscaped(std::string_view utf8, const UnescapedSet& unescaped) {
  constexpr char digits[] = "0123456789ABCDEF";
  std::string out;
  out.reserve(utf8.size());
  for (const char unit : utf8) {
    if (unescaped.contains(unit)) {
      out += unit;
    } else {
      const auto byte = static_cast<unsigned char>(unit);
      out += {'%', digits[byte >> 4], digits[byte & 0xF]};
    }
  }
  return out;
}

bool hasLoneSurrogate(NSStringView text) {
  if (!text.isWide()) return false;
  for (uint32_t index = 0; index < text.length(); ++index) {
    const char16_t unit = text[index];
    if (unit < 0xD800 || unit > 0xDFFF) continue;
    const char16_t next = index + 1 < text.length() ? text[index + 1] : u'\0';
    if (unit > 0xDBFF || next < 0xDC00 || next > 0xDFFF) return true;
    ++index;
  }
  return false;
}

}  // namespace

Value fn_normalize_space(const Value* arguments, size_t count, XQueryContext& context) {
  const Value item = XQueryArgumentOrContextItem(arguments, count, context);
  if (!item) return Value();
  const Value text = XQueryPromoteToString(item, context);
  return asString(XQueryNormalizeString(cast<NSString>(text)), context);
}

Value fn_normalize_unicode(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 1 || count > 2) return Value();
  const Value input = XQueryPromoteToString(arguments[0], context);
  auto form = std::optional(NSNormalizationForm::C);
  if (count == 2) {
    const XQueryTextArgument name(arguments[1], context);
    if (name.view().isEmpty()) return input;
    form = formNamed(name.view());
    if (!form) return XQueryErrors::unsupportedNormalizationForm.error();
  }
  const NSStringView text = cast<NSString>(input)->view();
  if (!text.isWide()) return asString(input, context);
  const std::u16string normalized = normalizedText({text.wideUnits(), text.length()}, *form);
  return XQueryString::stringWithView(viewOf(normalized));
}

Value fn_upper_case(const Value* arguments, size_t count, XQueryContext& context) {
  return caseMapped(arguments, count, context, 'a', upperCasedText);
}

Value fn_lower_case(const Value* arguments, size_t count, XQueryContext& context) {
  return caseMapped(arguments, count, context, 'A', lowerCasedText);
}

Value fn_translate(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 3) return Value();
  const XQueryTextArgument text(arguments[0], context);
  const XQueryTextArgument map(arguments[1], context);
  const XQueryTextArgument translation(arguments[2], context);
  const TranslationTable table(map.view(), translation.view());
  if (!text.view().isWide() && !translation.view().isWide()) {
    std::string translated;
    translated.reserve(text.view().length());
    table.appendTo(translated, text.view());
    return XQueryString::stringWithView(NSStringView::ascii(translated));
  }
  std::u16string translated;
  translated.reserve(text.view().length());
  table.appendTo(translated, text.view());
  return XQueryString::stringWithView(viewOf(translated));
}

Value fn_escape_uri(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 2) return Value();
  const XQueryTextArgument argument(arguments[0], context);
  const Value escapeReserved = XQueryEffectiveBooleanValue(arguments[1], context);
  const NSStringView text = argument.view();
  if (!isa<NSNumber>(escapeReserved) || hasLoneSurrogate(text)) return Value();
  const UnescapedSet& unescaped =
      XQueryIsTrue(escapeReserved) ? unescapedWithReserved : unescapedWithoutReserved;
  const std::string escaped = text.isWide()
                                  ? percentEscaped(text.utf8(), unescaped)
                                  : percentEscaped({text.asciiUnits(), text.length()}, unescaped);
  return XQueryString::stringWithView(NSStringView::ascii(escaped));
}

}  // namespace xquery
