// URI references of RFC 3986.
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"

#include <string>
#include <string_view>

namespace xquery {

// As an item an xs:anyURI value.
class XQUERY_EXPORT NSURL : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::URL; }

  // Absolute or relative, the empty text included. Null when the text holds a character or a form
  // that RFC 3986 does not allow.
  [[nodiscard]] static Ref<NSURL> URLWithString(const Ref<NSString>& text);
  // RFC 3986 resolution against an absolute base. Null when either does not parse.
  [[nodiscard]] static Ref<NSURL> URLWithString(const Ref<NSString>& text, const NSURL& base);

  // The URL of a file or folder. A relative path is one below the working folder; a folder's URL
  // ends with "/" if its path does, as "./" does. Null when there is no working folder.
  [[nodiscard]] static Ref<NSURL> fileURLWithPath(std::string_view path);

  // The text as given (for a resolved reference: the resolved text).
  const Ref<NSString>& absoluteString() const { return _text; }
  // In lower case; empty for a relative reference.
  std::string scheme() const;
  // The host as written; empty when there is none.
  std::string host() const;
  // Escapes decoded, so that it may hold any bytes.
  std::string path() const;
  // The path of the reference as it was given, before it was resolved.
  std::string relativePath() const;
  bool isEqual(const NSURL& other) const { return _text->isEqualToString(*other._text); }
  uint32_t hash() const { return _text->hash(); }

 protected:
  explicit NSURL(Ref<NSString> text) : NSURL(text, text) {}
  NSURL(Ref<NSString> text, Ref<NSString> reference)
      : NSCounted(Kind::URL), _text(std::move(text)), _reference(std::move(reference)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _text;
  Ref<NSString> _reference;
};

}  // namespace xquery
