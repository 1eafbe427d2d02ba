// Storage of strings and the string builder. What can be asked of a text is in NSStringView.cpp.
//
// The units of an NSString are, by its flags:
//   Inline   in the object itself: up to 24 bytes
//   InTree   in the arena of a tree, which `owner` keeps alive
//   Shared   in the buffer of another string, which `owner` keeps alive
//   none     in a buffer of its own
#include "Platform/Text/UTF16.h"
#include "Platform/Text/UTF8.h"
#include "xquery/String.h"
#include "xquery/XMLNode.h"

#include <memory>
#include <new>

namespace xquery {

namespace {

constexpr char16_t replacementCharacter = 0xFFFD;

size_t byteCount(NSStringView text) {
  return text.isWide() ? size_t{text.length()} * sizeof(char16_t) : text.length();
}

const void* unitsOf(NSStringView text) {
  return text.isWide() ? static_cast<const void*>(text.wideUnits()) : text.asciiUnits();
}

// A length that 32 bits do not hold is as good as memory that is not there.
uint32_t checkedLength(size_t length) {
  if (length >= NSStringView::notFound) throw std::bad_alloc();
  return static_cast<uint32_t>(length);
}

// False when the text is not well formed and `replacing` is not asked for.
bool decodeUTF8(std::string_view text, bool replacing, std::u16string& out) {
  out.reserve(text.size());
  const auto* next = reinterpret_cast<const unsigned char*>(text.data());
  const auto* const end = next + text.size();
  while (next < end) {
    const char32_t point = readUTF8(next, end);
    if (point != invalidCodePoint) {
      appendUTF16(out, point);
    } else if (replacing) {
      out += replacementCharacter;
    } else {
      return false;
    }
  }
  return true;
}

Ref<NSString> decoded(std::string_view text, bool replacing) {
  if (isASCII(text)) return NSString::stringWithASCII(text);
  std::u16string wide;
  if (!decodeUTF8(text, replacing, wide)) return nullptr;
  return NSString::stringWithUTF16(wide);
}

}  // namespace

NSString::NSString(Kind kind, uint16_t aux, NSStringView text, const NSXMLNode* owner)
    : NSCounted(kind) {
  _aux = aux;
  _length = text.length();
  if (!owner || byteCount(text) <= inlineBytes || (text.isWide() && isNarrow(text))) {
    copyUnits(text);
    return;
  }
  _flags = static_cast<uint8_t>(InTree | (text.isWide() ? Wide : 0));
  _external = {unitsOf(text), owner};
  retainTreeOf(owner);
}

NSString::NSString(Kind kind, uint16_t aux, const NSString& text) : NSCounted(kind) {
  _aux = aux;
  _length = text._length;
  _flags = text._flags;
  if (_flags & Inline) {
    std::memcpy(_inline, text._inline, inlineBytes);
    return;
  }
  _external = text._external;
  if (_flags & InTree) {
    retainTreeOf(static_cast<const NSXMLNode*>(_external.owner));
    return;
  }
  if (!(_flags & Shared)) _external.owner = &text;
  _flags |= Shared;
  static_cast<const NSString*>(_external.owner)->retain();
}

NSString::~NSString() {
  if (_flags & Inline) return;
  if (_flags & InTree) {
    releaseTreeOf(static_cast<const NSXMLNode*>(_external.owner));
  } else if (_flags & Shared) {
    static_cast<const NSString*>(_external.owner)->release();
  } else {
    freeValueMemory(const_cast<void*>(_external.units), byteCount(view()));
  }
}

void NSString::copyUnits(NSStringView text) {
  const bool narrow = isNarrow(text);
  const size_t bytes = narrow ? _length : size_t{_length} * sizeof(char16_t);
  _flags = narrow ? 0 : Wide;
  void* units = _inline;
  if (bytes <= inlineBytes) {
    _flags |= Inline;
  } else {
    units = allocateValueMemory(bytes);
    _external = {units, nullptr};
  }
  if (_length == 0) return;
  if (narrow == !text.isWide()) {
    std::memcpy(units, unitsOf(text), bytes);
    return;
  }
  auto* out = static_cast<char*>(units);
  const char16_t* in = text.wideUnits();
  for (uint32_t index = 0; index < _length; ++index) out[index] = static_cast<char>(in[index]);
}

Ref<NSString> NSString::stringWithUTF8(std::string_view text) {
  return decoded(text, false);
}

Ref<NSString> NSString::stringWithUTF8Replacing(std::string_view text) {
  return decoded(text, true);
}

Ref<NSString> NSString::stringWithASCII(std::string_view text) {
  return stringWithView({text.data(), checkedLength(text.size())});
}

Ref<NSString> NSString::stringWithUTF16(std::u16string_view text) {
  return stringWithView({text.data(), checkedLength(text.size())});
}

Ref<NSString> NSString::stringWithView(NSStringView text) {
  return make<NSString>(Kind::String, uint16_t{0}, text);
}

Ref<NSString> NSString::stringInTreeOf(const NSXMLNode* owner, NSStringView text) {
  return make<NSString>(Kind::String, uint16_t{0}, text, owner);
}

const Ref<NSString>& NSString::empty() {
  // The reference itself is never destroyed, so that destructors run at exit may still use it.
  alignas(Ref<NSString>) static unsigned char storage[sizeof(Ref<NSString>)];
  static const Ref<NSString>* const shared = [] {
    auto* reference = ::new (storage) Ref<NSString>(stringWithView({}));
    (*reference)->makeImmortal();
    return reference;
  }();
  return *shared;
}

void NSMutableString::append(NSStringView text) {
  if (text.isEmpty()) return;
  checkedLength(size_t{length()} + text.length());
  if (!_isWide) {
    if (!text.isWide()) {
      _ascii.append(text.asciiUnits(), text.length());
      return;
    }
    if (isNarrow(text)) {
      _ascii.append(text.wideUnits(), text.wideUnits() + text.length());
      return;
    }
    widen();
  }
  if (text.isWide()) {
    _wide.append(text.wideUnits(), text.length());
  } else {
    _wide.append(text.asciiUnits(), text.asciiUnits() + text.length());
  }
}

void NSMutableString::append(char16_t unit) {
  checkedLength(size_t{length()} + 1);
  if (!_isWide) {
    if (unit < 0x80) {
      _ascii += static_cast<char>(unit);
      return;
    }
    widen();
  }
  _wide += unit;
}

void NSMutableString::appendCodePoint(char32_t point) {
  if (point < 0x80) {
    append(static_cast<char16_t>(point));
    return;
  }
  checkedLength(size_t{length()} + 2);
  if (!_isWide) widen();
  appendUTF16(_wide, point);
}

void NSMutableString::widen() {
  _wide.assign(_ascii.begin(), _ascii.end());
  _ascii.clear();
  _isWide = true;
}

uint32_t NSMutableString::length() const {
  return static_cast<uint32_t>(_isWide ? _wide.size() : _ascii.size());
}

NSStringView NSMutableString::view() const {
  return _isWide ? NSStringView(_wide.data(), length()) : NSStringView(_ascii.data(), length());
}

void NSMutableString::clear() {
  _ascii.clear();
  _wide.clear();
  _isWide = false;
}

}  // namespace xquery
