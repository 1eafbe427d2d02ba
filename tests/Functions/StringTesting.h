// Generated texts, and plain forms of the questions that the string functions answer.
#pragma once

#include "Functions/FunctionsTesting.h"

#include <random>
#include <string>

namespace xquery::functiontest {

inline Value typedText(std::u16string_view text) {
  return XQueryString::stringWithString(*NSString::stringWithUTF16(text));
}
inline Value untypedText(std::u16string_view text) {
  return NSString::stringWithUTF16(text);
}

// The units of the answer, which must be an xs:string.
inline std::u16string unitsOf(const Value& value) {
  EXPECT_EQ(XQueryObjectTypeID(value.get()), XQueryTypeString);
  return isa<NSString>(value) ? cast<NSString>(value)->view().utf16() : u"?";
}

inline std::string units(std::u16string_view text) {
  return NSString::stringWithUTF16(text)->utf8();
}

// Texts over few units, so that parts of one occur in another. Half of them are 8-bit.
class Texts {
 public:
  explicit Texts(unsigned seed) : _random(seed) {}

  std::u16string next(size_t longest) {
    const bool wide = _random() % 2 != 0;
    const std::u16string_view alphabet = wide ? u"ab \u00E9\xD83D\xDE00" : u"ab \n";
    std::u16string text(_random() % (longest + 1), u' ');
    for (char16_t& unit : text) unit = alphabet[_random() % alphabet.size()];
    return text;
  }
  // Untyped or typed.
  Value value(std::u16string_view text) {
    return _random() % 2 ? typedText(text) : untypedText(text);
  }
  std::mt19937& random() { return _random; }

 private:
  std::mt19937 _random;
};

inline Value answerOf(XQueryProcedure procedure, const std::vector<Value>& arguments) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  return procedure(arguments.data(), arguments.size(), *context);
}

}  // namespace xquery::functiontest
