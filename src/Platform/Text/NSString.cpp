// Storage of strings and the string builder. What can be asked of a text is in NSStringView.cpp.
//
// The units of an NSString are, by its flags:
//   Inline   in the object itself: up to 24 bytes
//   InTree   in the arena of a tree, which `owner` keeps alive
//   Shared   in the buffer of another string, which `owner` keeps alive
//   none     in a buffer of its own
#include "Platform/Base/Counting.h"
#include "Platform/Base/LastingObjects.h"
#include "Platform/Text/Blocks.h"
#include "Platform/Text/UTF16.h"
#include "Platform/Text/UTF8.h"
#include "xquery/String.h"
#include "xquery/XMLNode.h"

#include <algorithm>
#include <memory>
#include <new>
#include <type_traits>
#include <utility>

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
bool decodeUTF8(std::string_view text, bool replacing, ValueText<char16_t>& out) {
  out.reserve(text.size());
  const auto* next = reinterpret_cast<const unsigned char*>(text.data());
  const auto* const end = next + text.size();
  WorkPacer pacer;
  while (next < end) {
    pacer.turn();
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

bool isASCIIInBlocks(std::string_view text) {
  bool narrow = true;
  inBlocks(text, [&narrow](std::string_view block) { narrow = narrow && isASCII(block); });
  return narrow;
}

Ref<NSString> decoded(std::string_view text, bool replacing) {
  if (isASCIIInBlocks(text)) return NSString::stringWithASCII(text);
  ValueText<char16_t> wide;
  if (!decodeUTF8(text, replacing, wide)) return nullptr;
  return NSString::stringWithUTF16(wide);
}

// Memory for units, until somebody keeps it.
class UnitBlock {
 public:
  explicit UnitBlock(size_t bytes) : _units(allocateValueMemory(bytes)), _bytes(bytes) {}
  ~UnitBlock() {
    if (_units) freeValueMemory(_units, _bytes);
  }
  UnitBlock(const UnitBlock&) = delete;
  UnitBlock& operator=(const UnitBlock&) = delete;
  void* units() const { return _units; }
  void* keep() { return std::exchange(_units, nullptr); }

 private:
  void* _units;
  size_t _bytes;
};

// To memory that has room for the units, in the width that they are given.
template <class Unit, class TextUnit>
void copyInBlocks(std::basic_string_view<TextUnit> text, void* to) {
  auto* out = static_cast<Unit*>(to);
  inBlocks(text, [&out](std::basic_string_view<TextUnit> block) {
    if constexpr (std::is_same_v<Unit, TextUnit>) {
      if (!block.empty()) std::memcpy(out, block.data(), block.size() * sizeof(Unit));
    } else {
      std::transform(block.begin(), block.end(), out,
                     [](TextUnit unit) { return static_cast<Unit>(unit); });
    }
    out += block.size();
  });
}

// A wide text may be given narrow; the other way there is none.
void copyUnitsOf(NSStringView text, bool narrow, void* to) {
  withUnitsOf(text, [&]<class Unit>(std::basic_string_view<Unit> units) {
    if (narrow) {
      copyInBlocks<char>(units, to);
    } else {
      copyInBlocks<Unit>(units, to);
    }
  });
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
  NSCounting::retain(*static_cast<const NSString*>(_external.owner));
}

NSString::~NSString() {
  if (_flags & Inline) return;
  if (_flags & InTree) {
    releaseTreeOf(static_cast<const NSXMLNode*>(_external.owner));
  } else if (_flags & Shared) {
    NSCounting::release(*static_cast<const NSString*>(_external.owner));
  } else {
    freeValueMemory(const_cast<void*>(_external.units), byteCount(view()));
  }
}

void NSString::copyUnits(NSStringView text) {
  const bool narrow = isNarrow(text);
  const size_t bytes = narrow ? _length : size_t{_length} * sizeof(char16_t);
  _flags = narrow ? 0 : Wide;
  if (bytes <= inlineBytes) {
    _flags |= Inline;
    copyUnitsOf(text, narrow, _inline);
    return;
  }
  UnitBlock block(bytes);
  copyUnitsOf(text, narrow, block.units());
  _external = {block.keep(), nullptr};
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
    const LastingObjects lasting;
    auto* reference = ::new (storage) Ref<NSString>(stringWithView({}));
    NSCounting::makeImmortal(**reference);
    return reference;
  }();
  return *shared;
}

void NSMutableString::append(NSStringView text) {
  if (text.isEmpty()) return;
  checkedLength(size_t{length()} + text.length());
  if (!_isWide && !isNarrow(text)) widen();
  withUnitsOf(text, [this](auto units) {
    if (_isWide) {
      appendInBlocks(_wide, units);
    } else {
      appendInBlocks(_ascii, units);
    }
  });
}

void NSMutableString::append(char16_t unit) {
  checkedLength(size_t{length()} + 1);
  if (!_isWide) {
    if (unit < 0x80) {
      makeRoom(_ascii, 1);
      _ascii += static_cast<char>(unit);
      return;
    }
    widen();
  }
  makeRoom(_wide, 1);
  _wide += unit;
}

void NSMutableString::appendCodePoint(char32_t point) {
  if (point < 0x80) {
    append(static_cast<char16_t>(point));
    return;
  }
  checkedLength(size_t{length()} + 2);
  if (!_isWide) widen();
  makeRoom(_wide, 2);
  appendUTF16(_wide, point);
}

void NSMutableString::widen() {
  _wide.clear();
  _wide.reserve(_ascii.size());
  appendInBlocks(_wide, std::string_view(_ascii));
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
