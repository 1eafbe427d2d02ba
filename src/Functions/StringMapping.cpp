// 8-bit text, which is plain ASCII, is rewritten in place of widening it: every normalisation form
// leaves it alone, its case mapping is one unit for one, and it needs no encoding before it is
// escaped.
#include "Functions/StringMapping.h"

#include "Functions/XQueryTextArgument.h"
#include "Platform/Text/Blocks.h"
#include "Platform/Text/ICUText.h"
#include "Platform/Text/UTF16.h"
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

Value asString(const Value& value, XQueryContext& context) {
  return XQueryCastAsTypeForContext(value, XQueryTypeString, context);
}

// --- case ----------------------------------------------------------------------------------------

// The text with the letters from `first` on, 26 of them, in the other case.
std::string otherCase(std::string_view text, char first) {
  std::string mapped;
  mapped.reserve(text.size());
  inBlocks(text, [&](std::string_view block) {
    const size_t start = mapped.size();
    mapped.append(block);
    for (size_t index = start; index < mapped.size(); ++index) {
      const bool letter = static_cast<unsigned char>(mapped[index] - first) < 26;
      mapped[index] = static_cast<char>(mapped[index] ^ (letter ? 'a' ^ 'A' : 0));
    }
  });
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
  return XQueryString::stringWithView(viewOf(otherCase({text.asciiUnits(), text.length()}, first)));
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
    // Of several entries for one unit the first holds, so the table is small however long the map.
    std::vector<bool> met(map.isWide() ? 0x10000 : _ascii.size());
    WorkPacer pacer;
    for (uint32_t index = 0; index < map.length(); ++index) {
      pacer.turn();
      const char16_t unit = map[index];
      if (met[unit]) continue;
      met[unit] = true;
      const int32_t target = index < translation.length() ? translation[index] : removed;
      if (unit < _ascii.size()) {
        _ascii[unit] = target;
      } else {
        _others.push_back({unit, target});
      }
    }
    std::sort(_others.begin(), _others.end(),
              [](const Entry& a, const Entry& b) { return a.unit < b.unit; });
  }

  // The text in units that hold every unit of the text and of the translation.
  template <class Unit, class TextUnit>
  std::basic_string<Unit> translated(std::basic_string_view<TextUnit> text) const {
    std::basic_string<Unit> out;
    out.reserve(text.size());
    inBlocks(text, [&](std::basic_string_view<TextUnit> block) {
      for (const TextUnit textUnit : block) {
        const char16_t unit = textUnit;
        const int32_t target = unit < _ascii.size() ? _ascii[unit] : targetOfOther(unit);
        if (target != removed) out += static_cast<Unit>(target == kept ? unit : target);
      }
    });
    return out;
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
  inBlocks(utf8, [&](std::string_view block) {
    for (const char unit : block) {
      if (unescaped.contains(unit)) {
        out += unit;
      } else {
        const auto byte = static_cast<unsigned char>(unit);
        out += {'%', digits[byte >> 4], digits[byte & 0xF]};
      }
    }
  });
  return out;
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
  return withUnitsOf(text.view(), [&]<class Unit>(std::basic_string_view<Unit> units) {
    if (translation.view().isWide()) {
      return Value(XQueryString::stringWithView(viewOf(table.translated<char16_t>(units))));
    }
    return Value(XQueryString::stringWithView(viewOf(table.translated<Unit>(units))));
  });
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
  return XQueryString::stringWithView(viewOf(escaped));
}

}  // namespace xquery
