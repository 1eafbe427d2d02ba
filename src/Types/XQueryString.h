// Typed strings: xs:string and the types derived from it.
#pragma once

#include "Types/XQueryTypeTable.h"
#include "xquery/String.h"

namespace xquery {

class XQueryString : public NSString {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::TypedString; }

  XQueryTypeID typeID() const { return static_cast<XQueryTypeID>(_aux); }

  static bool isNormalizedString(NSStringView text);
  static bool isToken(NSStringView text);
  static bool isLanguage(NSStringView text);
  static bool isName(NSStringView text);
  static bool isNCName(NSStringView text);
  static bool isID(NSStringView text);
  static bool isIDRef(NSStringView text);
  static bool isEntity(NSStringView text);
  static bool isNMToken(NSStringView text);

  // Each answers null for a text that its validator rejects; the text is never rewritten.
  [[nodiscard]] static Ref<XQueryString> stringWithString(const NSString& text);
  [[nodiscard]] static Ref<XQueryString> normalizedStringWithString(const NSString& text);
  [[nodiscard]] static Ref<XQueryString> tokenWithString(const NSString& text);
  [[nodiscard]] static Ref<XQueryString> languageWithString(const NSString& text);
  [[nodiscard]] static Ref<XQueryString> nameWithString(const NSString& text);
  [[nodiscard]] static Ref<XQueryString> ncNameWithString(const NSString& text);
  [[nodiscard]] static Ref<XQueryString> idWithString(const NSString& text);
  [[nodiscard]] static Ref<XQueryString> idRefWithString(const NSString& text);
  [[nodiscard]] static Ref<XQueryString> entityWithString(const NSString& text);
  [[nodiscard]] static Ref<XQueryString> nmTokenWithString(const NSString& text);
  // Of xs:string or a type derived from it; null for the lists, too.
  [[nodiscard]] static Ref<XQueryString> stringOfType(XQueryTypeID type, const NSString& text);
  // For a caller that has checked already.
  [[nodiscard]] static Ref<XQueryString> stringWithView(NSStringView text);

 protected:
  XQueryString(const NSString& text, XQueryTypeID type)
      : NSString(Kind::TypedString, static_cast<uint16_t>(type), text) {}
  XQueryString(NSStringView text, XQueryTypeID type)
      : NSString(Kind::TypedString, static_cast<uint16_t>(type), text) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

}  // namespace xquery
