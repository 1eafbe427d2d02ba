#include "Platform/Reading/ReadTree.h"

#include "Platform/Reading/LibXML.h"
#include "Platform/Reading/XMLCharacters.h"
#include "Platform/Text/UTF8.h"
#include "Platform/Tree/Names.h"

#include <algorithm>
#include <cstring>
#include <limits>

namespace xquery {

namespace {

// Of a longer text it is counted first what it comes to.
constexpr size_t longestWidened = size_t{1} << 16;
// A longer text surely lies apart from its node: a unit takes no more than three bytes.
constexpr size_t longestBehind = 3 * NSXMLTreeBuilder::longestTextBehind / sizeof(char16_t);
constexpr const char* notText = "a text is not well formed";

void checkLength(size_t count) {
  constexpr size_t most = std::numeric_limits<uint32_t>::max() - 1;
  if (count > most) throw LibXMLStop{"a text is too long"};
}

// As much of a long text as is widened at once: whole characters, if they are any.
std::string_view firstPart(std::string_view text) {
  if (text.size() <= longestWidened) return text;
  constexpr size_t longestCharacter = 4;
  size_t end = longestWidened;
  while (end > longestWidened - longestCharacter && (text[end] & 0xC0) == 0x80) --end;
  return text.substr(0, end);
}

}  // namespace

ReadText::ReadText(std::string_view all) : bytes(all), isASCII(xquery::isASCII(all)) {}

ReadTree::ReadTree(uint32_t options, size_t expectedBytes)
    : _alwaysKeepsWhitespace((options & NSXMLNodePreserveWhitespace) != 0),
      _keepsWhitespace(_alwaysKeepsWhitespace),
      _keepsCDATA((options & NSXMLNodePreserveCDATA) != 0),
      _builder(std::max(expectedBytes, size_t{256}), std::max(expectedBytes / 2, size_t{128})),
      _log(std::make_unique<NSXMLElementLog>()) {
  _builder.tree().becomeOld();
  _builder.openDocument();
}

// What is known of the tree is put down while the builder still owns it: there may be no memory.
NSXMLDocument* ReadTree::finish() {
  _builder.endOpenNodes();
  NSXMLTreeIndexes::begin(_builder.current()->rootNode(), std::move(_log), _counts);
  return cast<NSXMLDocument>(_builder.finish());
}

void ReadTree::abandon() {
  _builder.endOpenNodes();
  static_cast<void>(_builder.finish());
}

// --- texts -----------------------------------------------------------------------------------

template <class Add>
auto ReadTree::withStorable(const ReadText& text, Add add) {
  if (text.isASCII) {
    checkLength(text.bytes.size());
    return add(NSStringView::ascii(text.bytes));
  }
  if (text.bytes.size() > longestWidened) return add(storedAlone(text.bytes));
  if (text.bytes.size() > longestBehind) {
    if (const NSStringView* const stored = storedInHand(text.bytes)) return add(stored);
  }
  return add(widened(text.bytes));
}

NSStringView ReadTree::widened(std::string_view text) {
  if (_units.size() < text.size()) _units.resize(std::min(2 * text.size(), longestWidened));
  const char16_t* const end = widenXML(text, _units.data());
  if (!end) throw LibXMLStop{notText};
  return {_units.data(), static_cast<uint32_t>(end - _units.data())};
}

// Widened where it stays; null if there is no room in hand.
const NSStringView* ReadTree::storedInHand(std::string_view text) {
  char16_t* const units = _builder.unitsInHand(text.size());
  if (!units) return nullptr;
  const char16_t* const end = widenXML(text, units);
  if (!end) throw LibXMLStop{notText};
  return _builder.storeUnitsInHand(static_cast<size_t>(end - units));
}

const NSStringView* ReadTree::storedAlone(std::string_view text) {
  const size_t count = countXMLUnits(text);
  checkLength(count);
  char16_t* const units = _builder.roomForUnits(count);
  size_t filled = 0;
  while (!text.empty()) {
    const std::string_view part = firstPart(text);
    const NSStringView some = widened(part);
    if (some.length() > count - filled) throw LibXMLStop{notText};
    std::memcpy(units + filled, some.wideUnits(), some.length() * sizeof(char16_t));
    filled += some.length();
    text.remove_prefix(part.size());
  }
  return _builder.storeFilled({units, static_cast<uint32_t>(filled)});
}

const NSStringView* ReadTree::stored(const ReadText& text) {
  struct Storing {
    NSXMLTreeBuilder& builder;
    const NSStringView* operator()(NSStringView view) const { return builder.store(view); }
    const NSStringView* operator()(const NSStringView* stored) const { return stored; }
  };
  return withStorable(text, Storing{_builder});
}

const NSStringView* ReadTree::storedLasting(const ReadText& text) {
  struct Storing {
    NSXMLTreeBuilder& builder;
    const NSStringView* operator()(NSStringView view) const { return builder.storeLasting(view); }
    const NSStringView* operator()(const NSStringView* stored) const {
      return builder.storeLasting(*stored);
    }
  };
  return withStorable(text, Storing{_builder});
}

void ReadTree::checkWide(std::string_view text) {
  while (!text.empty()) {
    const std::string_view part = firstPart(text);
    static_cast<void>(widened(part));
    text.remove_prefix(part.size());
  }
}

void ReadTree::dropOpenElement() {
  endSpaceChange();
  _log->giveUp();
  _builder.dropOpenElement();
}

void ReadTree::backTo(const NSXMLTreeBuilder::Mark& mark) {
  _pending.clear();
  _pendingIsExact = false;
  _log->giveUp();
  _builder.backTo(mark);
}

NSXMLNode* ReadTree::addLeaf(Kind kind, const ReadText& text) {
  return withStorable(text, [&](auto storable) { return _builder.addLeaf(kind, storable); });
}

bool ReadTree::isKept(std::string_view text) const {
  return _keepsWhitespace || text.find_first_not_of(whiteSpaceOfXML) != std::string::npos;
}

void ReadTree::addWholeText(const ReadText& text) {
  if (isKept(text.bytes)) addLeaf(Kind::Text, text);
}

void ReadTree::addText(std::string_view text) {
  appendInBlocks(_pending, text);
}

void ReadTree::addPending(bool isSection) {
  NSXMLNode* const node = addLeaf(Kind::Text, ReadText(_pending));
  if (isSection) NSXMLTree::setCDATA(node);
  // A huge text must not hold its memory a second time until the end.
  constexpr size_t kept = size_t{1} << 20;
  if (_pending.capacity() > kept) ValueText<char>().swap(_pending);
  _pending.clear();
  _pendingIsExact = false;
}

void ReadTree::flush() {
  if (_pending.empty()) return;
  if (_pendingIsExact || isKept(_pending)) {
    addPending(false);
  } else {
    _pending.clear();
  }
}

void ReadTree::addSection(std::string_view text) {
  if (text.empty()) return;
  if (_keepsCDATA) {
    flush();
    addText(text);
    addPending(true);
  } else {
    addText(text);
    _pendingIsExact = true;
  }
}

// --- markup ----------------------------------------------------------------------------------

void ReadTree::openElement(const NSXMLName* name, NSXMLElementLog::Number& number) {
  flush();
  const NSXMLNode& parent = *_builder.current();
  _log->open(_builder.openElement(name), name, number, parent);
}

void ReadTree::addNamespace(const NSXMLName* prefix, const NSStringView* storedURI) {
  ++_counts.namespaces;
  if (storedURI) {
    _builder.addProperty(Kind::Namespace, prefix, storedURI);
  } else {
    _builder.addProperty(Kind::Namespace, prefix, NSStringView());
  }
}

void ReadTree::addAttribute(const NSXMLName* name, const ReadText& value) {
  ++_counts.attributes;
  withStorable(
      value, [&](auto storable) { return _builder.addProperty(Kind::Attribute, name, storable); });
  if (name->prefixLength) hearSpace(name, value.bytes);
}

void ReadTree::hearSpace(const NSXMLName* name, std::string_view value) {
  if (name->text != "xml:space" || (value != "preserve" && value != "default")) return;
  // The option to preserve is not overruled by a document.
  const bool keeps = value == "preserve" || _alwaysKeepsWhitespace;
  if (keeps == _keepsWhitespace) return;
  _spaceChanges.push_back({_builder.current(), _keepsWhitespace});
  _keepsWhitespace = keeps;
}

void ReadTree::endSpaceChange() {
  if (!_spaceChanges.empty() && _spaceChanges.back().element == _builder.current()) {
    _keepsWhitespace = _spaceChanges.back().keepsOutside;
    _spaceChanges.pop_back();
  }
}

void ReadTree::closeElement() {
  flush();
  endSpaceChange();
  _log->close();
  _builder.close();
}

void ReadTree::addComment(const ReadText& text) {
  flush();
  ++_counts.comments;
  addLeaf(Kind::Comment, text);
}

void ReadTree::addInstruction(const NSXMLName* target, const ReadText& text) {
  flush();
  _log->addInstruction();
  ++_counts.instructions;
  withStorable(text, [&](auto storable) { return _builder.addInstruction(target, storable); });
}

}  // namespace xquery
