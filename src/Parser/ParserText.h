// Text that the grammar collects character by character.
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"

namespace xquery {

// A run of text in an attribute value, or the text of a comment, processing instruction or CDATA
// section.
class XQueryParserText : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::ParserText; }

  [[nodiscard]] static Ref<XQueryParserText> textWithChar(char16_t unit) {
    Ref<XQueryParserText> text = make<XQueryParserText>();
    text->addChar(unit);
    return text;
  }
  void addChar(char16_t unit) { _string.append(unit); }
  Ref<NSString> string() const { return _string.string(); }

 protected:
  XQueryParserText() : NSCounted(Kind::ParserText) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  NSMutableString _string;
};

}  // namespace xquery
