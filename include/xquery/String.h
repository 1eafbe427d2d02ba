// Immutable text. A string holds either 8-bit text, in which every unit is below 0x80, or UTF-16
// code units; the form is chosen at construction and a text that fits 8 bits is always stored so.
// Positions and lengths are UTF-16 units in both forms. Lone surrogates are representable; writing
// them as UTF-8 gives U+FFFD. Ordering is by code point, equality by code unit.
#pragma once

#include "xquery/Object.h"

#include <cstdint>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>

namespace xquery {

// Borrowed text in either form; valid while its owner lives. Copying it costs two words.
class XQUERY_EXPORT NSStringView {
 public:
  static constexpr uint32_t notFound = UINT32_MAX;

  constexpr NSStringView() = default;
  // 8-bit text: the caller guarantees that every unit is below 0x80.
  constexpr NSStringView(const char* ascii, uint32_t length) : _units(ascii), _length(length) {}
  constexpr NSStringView(const char16_t* units, uint32_t length)
      : _units(units), _length(length), _wide(true) {}
  static constexpr NSStringView ascii(std::string_view text) {
    return {text.data(), static_cast<uint32_t>(text.size())};
  }

  constexpr uint32_t length() const { return _length; }
  constexpr bool isEmpty() const { return _length == 0; }
  constexpr bool isWide() const { return _wide; }
  const char* asciiUnits() const { return static_cast<const char*>(_units); }
  const char16_t* wideUnits() const { return static_cast<const char16_t*>(_units); }
  char16_t operator[](uint32_t index) const {
    return _wide ? wideUnits()[index] : static_cast<unsigned char>(asciiUnits()[index]);
  }

  // The units from `from` (clamped), at most `count` of them.
  NSStringView substring(uint32_t from, uint32_t count = UINT32_MAX) const;
  // The position of the first occurrence at or after `from`, or notFound. An empty text is found
  // at `from`.
  uint32_t find(NSStringView text, uint32_t from = 0) const;
  uint32_t find(char16_t unit, uint32_t from = 0) const;
  bool startsWith(NSStringView text) const;
  bool endsWith(NSStringView text) const;

  // -1, 0 or 1 by code point (a surrogate pair is one point, above every BMP character).
  int compare(NSStringView other) const;
  bool equals(NSStringView other) const;
  uint32_t hash() const;

  // UTF-8; a lone surrogate becomes U+FFFD.
  std::string utf8() const;
  void appendUTF8To(std::string& out) const;
  std::u16string utf16() const;

  friend bool operator==(NSStringView a, NSStringView b) { return a.equals(b); }
  friend bool operator==(NSStringView a, std::string_view ascii) {
    return a.equals(NSStringView::ascii(ascii));
  }

 private:
  const void* _units = nullptr;
  uint32_t _length = 0;
  bool _wide = false;
};

class NSXMLNode;

// As an item a plain NSString is an xdt:untypedAtomic value.
class XQUERY_EXPORT NSString : public NSCounted {
 public:
  static bool classof(const NSObject& object) {
    return object.kind() == Kind::String || object.kind() == Kind::TypedString;
  }

  // UTF-8 text (RFC 3629). Null when it is not well formed.
  [[nodiscard]] static Ref<NSString> stringWithUTF8(std::string_view text);
  // The same, but each byte that starts no well-formed sequence becomes U+FFFD; for messages.
  [[nodiscard]] static Ref<NSString> stringWithUTF8Replacing(std::string_view text);
  // For literals in code; the text must be ASCII.
  [[nodiscard]] static Ref<NSString> stringWithASCII(std::string_view text);
  [[nodiscard]] static Ref<NSString> stringWithUTF16(std::u16string_view text);
  // Copies the text.
  [[nodiscard]] static Ref<NSString> stringWithView(NSStringView text);
  // References text that lives in the tree of `owner`; the tree is kept alive. Short text is
  // copied.
  [[nodiscard]] static Ref<NSString> stringInTreeOf(const NSXMLNode* owner, NSStringView text);
  // The shared empty string.
  static const Ref<NSString>& empty();

  NSStringView view() const {
    return isWide() ? NSStringView(static_cast<const char16_t*>(units()), _length)
                    : NSStringView(static_cast<const char*>(units()), _length);
  }
  uint32_t length() const { return _length; }
  char16_t characterAtIndex(uint32_t index) const { return view()[index]; }
  std::string utf8() const { return view().utf8(); }
  int compare(const NSString& other) const { return view().compare(other.view()); }
  bool isEqualToString(const NSString& other) const { return view().equals(other.view()); }
  uint32_t hash() const { return view().hash(); }

 protected:
  // `kind` String or TypedString; `aux` is the type identifier of a typed string.
  NSString(Kind kind, uint16_t aux, NSStringView text, const NSXMLNode* owner = nullptr);
  // Shares or copies the text of another string.
  NSString(Kind kind, uint16_t aux, const NSString& text);
  ~NSString() override;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  static constexpr uint32_t inlineBytes = 24;
  enum Flags : uint8_t { Wide = 1, Inline = 2, InTree = 4, Shared = 8 };
  struct External {
    const void* units;
    const NSObject* owner;  // the node whose tree, or the string whose buffer, holds the units
  };

  bool isWide() const { return (_flags & Wide) != 0; }
  const void* units() const { return (_flags & Inline) ? _inline : _external.units; }
  void copyUnits(NSStringView text);

  uint32_t _length = 0;
  union {
    alignas(8) unsigned char _inline[inlineBytes];
    External _external;
  };
};

// Collects text piece by piece; starts 8-bit and widens when it must.
class XQUERY_EXPORT NSMutableString {
 public:
  void append(NSStringView text);
  void append(char16_t unit);
  void appendASCII(std::string_view text) { append(NSStringView::ascii(text)); }
  // A code point above 0xFFFF becomes a surrogate pair.
  void appendCodePoint(char32_t point);
  uint32_t length() const;
  NSStringView view() const;
  void clear();
  [[nodiscard]] Ref<NSString> string() const { return NSString::stringWithView(view()); }

 private:
  void widen();

  template <class Unit>
  using Units = std::basic_string<Unit, std::char_traits<Unit>, ValueAllocator<Unit>>;

  Units<char> _ascii;
  Units<char16_t> _wide;
  bool _isWide = false;
};

}  // namespace xquery
