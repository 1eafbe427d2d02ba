// The string functions, regular expressions apart.
#include "arguments/Driver.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>

namespace xquery::arguments {
namespace {

// The strings of the first `count` arguments; of the rest only that they are strings.
std::vector<std::string> strings(const Call& call, size_t count) {
  Attempts attempt;
  std::vector<std::string> texts;
  for (size_t i = 0; i < call.count(); ++i) {
    texts.push_back(attempt([&] { return stringOf(call[i]); }));
  }
  attempt.finish();
  texts.resize(count);
  return texts;
}

// A text that is the argument's own may come with the argument's type.
Sequence given(const Call& call, const std::string& text, const Item& argument) {
  if (text == argument.text) {
    call.orElse(std::to_string(promotedToString({argument}).type) + " " + text);
  }
  return one(string(text));
}

// --- code points ---------------------------------------------------------------------------------

Sequence codepointsToString(const Call& call) {
  std::string text;
  bool isRefused = false;
  for (const Item& item : atomized(call[0])) {
    const int type = primitiveType(item.type);
    if (type != 8 && (type < 11 || type > 13)) throw Refused();
    const double point = numericValue(castItem(item, 42));
    const bool isSurrogate = point >= 0xD800 && point < 0xE000;
    if (point < 0 || point > 0x10FFFF || isSurrogate) {
      isRefused = true;
      continue;
    }
    std::u16string unit;
    if (point < 0x10000) {
      unit += static_cast<char16_t>(point);
    } else {
      unit += static_cast<char16_t>(0xD7C0 + (static_cast<uint32_t>(point) >> 10));
      unit += static_cast<char16_t>(0xDC00 + (static_cast<uint32_t>(point) & 0x3FF));
    }
    text += utf8(unit);
  }
  if (isRefused) throw Refused();
  return one(string(text));
}

Sequence stringToCodepoints(const Call& call) {
  const std::u16string text = units(stringOf(call[0]));
  Sequence points;
  for (size_t i = 0; i < text.size(); ++i) {
    int64_t point = text[i];
    if (point >= 0xD800 && point < 0xDC00 && i + 1 < text.size()) {
      point = 0x10000 + ((point - 0xD800) << 10) + (text[++i] - 0xDC00);
    }
    points.push_back(integer(point));
  }
  return points;
}

// --- joining -------------------------------------------------------------------------------------

Sequence compare(const Call& call) {
  const bool isEmpty = call[0].empty() || call[1].empty();
  Attempts attempt;
  const std::vector<std::string> texts = attempt([&] { return strings(call, 2); });
  if (isEmpty) {
    // Whether the other arguments are looked at then is open.
    if (attempt.haveFailed()) call.orElse("error 6 not a*");
    if (attempt.haveFailed()) call.orElse("error 6 invalid type*");
    return {};
  }
  attempt.finish();
  const int order = texts[0].compare(texts[1]);
  return one(integer(order < 0 ? -1 : order > 0));
}

Sequence concat(const Call& call) {
  Attempts attempt;
  std::string text;
  for (size_t i = 0; i < call.count(); ++i) {
    if (call[i].empty()) continue;
    text += attempt([&] {
      const Sequence items = atomized(call[i]);
      return castTo(items, 9).text;
    });
  }
  attempt.finish();
  return one(untyped(text));
}

// A single item is its own string.
Sequence stringJoin(const Call& call) {
  Attempts attempt;
  const std::string separator = attempt([&] { return stringOf(call[1]); });
  std::string text;
  for (size_t i = 0; i < call[0].size(); ++i) {
    text += (i ? separator : "") + attempt([&] { return stringOf({call[0][i]}); });
  }
  attempt.finish();
  if (call[0].size() == 1) return one(promotedToString(call[0]));
  return one(string(text));
}

// --- parts ---------------------------------------------------------------------------------------

double rounded(double value) {
  return std::floor(value + 0.5);
}

Sequence substring(const Call& call) {
  Attempts attempt;
  const Item source = attempt([&] { return promotedToString(call[0]); });
  const auto startItem = attempt([&] { return promotedToNumeric(call[1]); });
  std::optional<Item> lengthItem = number(INFINITY);
  if (call.count() > 2) lengthItem = attempt([&] { return promotedToNumeric(call[2]); });
  if (attempt.haveFailed()) {
    // Some of the arguments end it before others are looked at.
    const bool isNothing = call[1].empty() || (call.count() > 2 && call[2].empty());
    const bool isNaN = startItem && (startItem->text == "NaN" || startItem->text == "-INF");
    if (isNothing || isNaN || source.text.empty()) call.orElse("9 ");
    attempt.finish();
  }
  if (!startItem || !lengthItem) return one(string(""));
  const std::u16string text = units(source.text);
  const auto size = static_cast<double>(text.size());
  double from = numericValue(*startItem);
  const double length = numericValue(*lengthItem);
  if (std::isnan(from) || from == -INFINITY || std::isnan(length)) return one(string(""));
  from = rounded(from) - 1;
  if (from >= size) return one(string(""));
  if (length == INFINITY) {
    const auto index = static_cast<size_t>(std::max(from, 0.0));
    return given(call, utf8(text.substr(index)), source);
  }
  const double n = rounded(length);
  if (n <= 0 || from + n < 1 || from + n < from) return one(string(""));
  double count = std::min(n, size - from);
  if (from < 0) {
    count += from;
    from = 0;
  }
  if (count <= 0) return one(string(""));
  return given(call, utf8(text.substr(static_cast<size_t>(from), static_cast<size_t>(count))),
               source);
}

// The argument, or the context item; none is no use.
const Sequence& argumentOrFocus(const Call& call) {
  if (call.count()) return call[0];
  if (!call.contextItem) throw Refused();
  return call.contextItem->items;
}

Sequence stringLength(const Call& call) {
  return one(integer(static_cast<int64_t>(units(stringOf(argumentOrFocus(call))).size())));
}

Sequence normalizeSpace(const Call& call) {
  return one(string(normalizedSpace(stringOf(argumentOrFocus(call)))));
}

// What comes before and after is of the first occurrence.
Sequence substringBefore(const Call& call) {
  const std::vector<std::string> texts = strings(call, 2);
  const size_t at = texts[1].empty() ? 0 : texts[0].find(texts[1]);
  return one(string(at == std::string::npos ? "" : texts[0].substr(0, at)));
}

Sequence substringAfter(const Call& call) {
  const std::vector<std::string> texts = strings(call, 2);
  if (texts[1].empty()) return given(call, texts[0], promotedToString(call[0]));
  const size_t at = texts[0].find(texts[1]);
  if (at == std::string::npos) return one(string(""));
  return one(string(texts[0].substr(at + texts[1].size())));
}

Rule asksFor(bool (*test)(const std::string&, const std::string&)) {
  return [=](const Call& call) {
    const std::vector<std::string> texts = strings(call, 2);
    return one(boolean(texts[1].empty() || (!texts[0].empty() && test(texts[0], texts[1]))));
  };
}

// --- changing ------------------------------------------------------------------------------------

// The one text of the samples outside ASCII is a letter with an accent and an emoji.
std::string replaced(std::string text, const std::string& from, const std::string& to) {
  const size_t at = text.find(from);
  return at == std::string::npos ? text : text.replace(at, from.size(), to);
}

Sequence normalizeUnicode(const Call& call) {
  Attempts attempt;
  const Item input = attempt([&] { return promotedToString(call[0]); });
  std::string form = "NFC";
  if (call.count() > 1) form = attempt([&] { return stringOf(call[1]); });
  attempt.finish();
  if (form.empty()) return given(call, input.text, input);
  if (form != "NFC" && form != "NFD") fail(0, "err:FOCH0003 - unsupported normalization form");
  const bool composes = form == "NFC";
  return one(string(composes ? input.text : replaced(input.text, "\u00e9", "e\u0301")));
}

std::string inCase(std::string text, bool isUpper) {
  for (char& c : text) {
    if (isUpper && c >= 'a' && c <= 'z') c = static_cast<char>(c - 32);
    if (!isUpper && c >= 'A' && c <= 'Z') c = static_cast<char>(c + 32);
  }
  return isUpper ? replaced(text, "\u00e9", "\u00c9") : replaced(text, "\u00c9", "\u00e9");
}

Sequence translate(const Call& call) {
  const std::vector<std::string> texts = strings(call, 3);
  const std::u16string map = units(texts[1]);
  const std::u16string to = units(texts[2]);
  std::u16string result;
  for (const char16_t unit : units(texts[0])) {
    const size_t at = map.find(unit);
    if (at == map.npos) {
      result += unit;
    } else if (at < to.size()) {
      result += to[at];
    }
  }
  return one(string(utf8(result)));
}

Sequence escapeURI(const Call& call) {
  Attempts attempt;
  const std::string text = attempt([&] { return stringOf(call[0]); });
  const bool escapesReserved = effectiveBooleanValue(call[1]);
  attempt.finish();
  std::string result;
  for (const unsigned char c : text) {
    bool isEscaped =
        c <= ' ' || c >= 0x7F || std::string_view("\"<>\\^`{|}").find(c) != std::string_view::npos;
    if (escapesReserved && std::string_view(";/?:@&=+$,#[]").find(c) != std::string_view::npos) {
      isEscaped = true;
    }
    char escape[4];
    std::snprintf(escape, sizeof escape, "%%%02X", c);
    result += isEscaped ? std::string(escape) : std::string(1, static_cast<char>(c));
  }
  return one(string(result));
}

}  // namespace

const std::vector<Function>& stringFunctions() {
  static const std::vector<Function> functions = {
      {"fn:codepoints-to-string", 1, 1, codepointsToString},
      {"fn:string-to-codepoints", 1, 1, stringToCodepoints},
      {"fn:compare", 2, 3, compare},
      {"fn:concat", 2, 5, concat},
      {"fn:string-join", 2, 2, stringJoin},
      {"fn:substring", 2, 3, substring},
      {"fn:string-length", 0, 1, stringLength},
      {"fn:normalize-space", 0, 1, normalizeSpace},
      {"fn:normalize-unicode", 1, 2, normalizeUnicode},
      {"fn:upper-case", 1, 1,
       [](const Call& c) { return one(string(inCase(stringOf(c[0]), true))); }},
      {"fn:lower-case", 1, 1,
       [](const Call& c) { return one(string(inCase(stringOf(c[0]), false))); }},
      {"fn:translate", 3, 3, translate},
      {"fn:escape-uri", 2, 2, escapeURI},
      {"fn:contains", 2, 3,
       asksFor([](const std::string& a, const std::string& b) { return a.find(b) != a.npos; })},
      {"fn:starts-with", 2, 3,
       asksFor([](const std::string& a, const std::string& b) { return a.starts_with(b); })},
      {"fn:ends-with", 2, 3,
       asksFor([](const std::string& a, const std::string& b) { return a.ends_with(b); })},
      {"fn:substring-before", 2, 3, substringBefore},
      {"fn:substring-after", 2, 3, substringAfter},
  };
  return functions;
}

TEST(StringArguments, EndAsTheRulesSay) {
  expectRules(stringFunctions());
}

}  // namespace xquery::arguments
