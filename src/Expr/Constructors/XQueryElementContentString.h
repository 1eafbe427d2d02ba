// A run of characters in the content of a direct element constructor.
//
// White space between constructors counts only when the prolog says so, and only a run of nothing
// but white space is such: a run keeps whether it is.
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"

namespace xquery {

class XQueryElementContentString : public NSCounted {
 public:
  static bool classof(const NSObject& object) {
    return object.kind() == Kind::ElementContentString;
  }

  [[nodiscard]] static Ref<XQueryElementContentString> stringWithChar(char16_t unit) {
    return make<XQueryElementContentString>(unit, false);
  }
  [[nodiscard]] static Ref<XQueryElementContentString> stringWithWhiteSpace(char16_t unit) {
    return make<XQueryElementContentString>(unit, true);
  }
  // The run becomes ordinary text.
  void addChar(char16_t unit) {
    _string.append(unit);
    _isXMLSpace = false;
  }
  void addWhiteSpace(char16_t unit) { _string.append(unit); }

  Ref<NSString> string() const { return _string.string(); }
  NSStringView view() const { return _string.view(); }
  bool isXMLSpace() const { return _isXMLSpace; }

 protected:
  XQueryElementContentString(char16_t unit, bool isXMLSpace)
      : NSCounted(Kind::ElementContentString), _isXMLSpace(isXMLSpace) {
    _string.append(unit);
  }
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  NSMutableString _string;
  bool _isXMLSpace;
};

}  // namespace xquery
