// The two binary types: bytes with a text encoding.
#pragma once

#include "xquery/Data.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <string>

namespace xquery {

class XQueryBinary : public NSCounted {
 public:
  static bool classof(const NSObject& object) {
    return object.kind() == Kind::HexBinary || object.kind() == Kind::Base64Binary;
  }

  const Ref<NSData>& data() const { return _data; }
  // Values of one class are equal when their bytes are.
  bool isEqual(const XQueryBinary& other) const {
    return kind() == other.kind() && _data->isEqualToData(*other._data);
  }
  uint32_t hash() const;

 protected:
  XQueryBinary(Kind kind, Ref<NSData> data) : NSCounted(kind), _data(std::move(data)) {}

 private:
  Ref<NSData> _data;
};

class XQueryHexBinary : public XQueryBinary {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::HexBinary; }

  [[nodiscard]] static Ref<XQueryHexBinary> binaryWithData(const Ref<NSData>& data);
  // White space may stand anywhere. Null for any other character that is no hexadecimal digit, and
  // for a digit without its pair.
  [[nodiscard]] static Ref<XQueryHexBinary> binaryWithString(NSStringView text);
  Ref<NSString> stringValue() const;
  Ref<NSString> XQueryStringValue() const { return stringValue(); }

 protected:
  explicit XQueryHexBinary(Ref<NSData> data) : XQueryBinary(Kind::HexBinary, std::move(data)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

class XQueryBase64Binary : public XQueryBinary {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Base64Binary; }

  [[nodiscard]] static Ref<XQueryBase64Binary> binaryWithData(const Ref<NSData>& data);
  // Null for text that Base64Decode refuses.
  [[nodiscard]] static Ref<XQueryBase64Binary> binaryWithString(NSStringView text);
  Ref<NSString> stringValue() const;
  Ref<NSString> XQueryStringValue() const { return stringValue(); }

 protected:
  explicit XQueryBase64Binary(Ref<NSData> data)
      : XQueryBinary(Kind::Base64Binary, std::move(data)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

// Two upper-case digits per byte.
std::string XQueryHexEncode(std::string_view bytes);
// The alphabet of RFC 4648, padded, without line breaks.
std::string Base64Encode(std::string_view bytes);
// False for text that is not ASCII, and when the number of characters of the alphabet ("=" counts)
// is no multiple of four. Any other character is skipped.
bool Base64Decode(NSStringView text, std::string& bytes);

}  // namespace xquery
