// NOTATION values: a lexical name that is never resolved.
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"

namespace xquery {

class XQueryNotation : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Notation; }

  // Null when the name has no local part.
  [[nodiscard]] static Ref<XQueryNotation> notationWithString(const Ref<NSString>& text);

  const Ref<NSString>& XQueryStringValue() const { return _string; }
  bool isEqual(const XQueryNotation& other) const {
    return _string->isEqualToString(*other._string);
  }
  uint32_t hash() const { return _string->hash(); }

 protected:
  explicit XQueryNotation(Ref<NSString> string)
      : NSCounted(Kind::Notation), _string(std::move(string)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _string;
};

}  // namespace xquery
