// From the parser's events to a tree.
//
// Text arrives in pieces and is collected until markup ends it; then it is stored in the arena,
// 8-bit if it can be, and becomes a text node unless it is white space that is not to be kept.
// Names are looked up by the addresses of libxml2's texts, which are equal for equal names within
// one document, so that the process's table of names is asked once per name and document.
#include "Platform/Base/CountedBytes.h"
#include "Platform/Base/Stack.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Reading/LibXML.h"
#include "Platform/Reading/Tidy.h"
#include "Platform/Text/Blocks.h"
#include "Platform/Text/UTF8.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeBuilder.h"
#include "xquery/XMLNode.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <limits>
#include <unistd.h>
#include <unordered_map>
#include <vector>

namespace xquery {

namespace {

constexpr std::string_view whiteSpace = " \t\r\n";

constexpr size_t mostUnits = std::numeric_limits<uint32_t>::max() - 1;
constexpr const char* tooLong = "a text is too long";

// libxml2 hands out well-formed UTF-8 only: every byte but a continuation begins a unit, and a
// first byte of a four-byte form another.
size_t unitCount(std::string_view text) {
  size_t count = 0;
  inBlocks(text, [&count](std::string_view block) {
    for (const char byte : block) {
      const auto bits = static_cast<unsigned char>(byte);
      count += ((bits & 0xC0U) != 0x80U) + (bits >= 0xF0U);
    }
  });
  return count;
}

void widen(std::string_view text, char16_t* units) {
  const auto* at = reinterpret_cast<const unsigned char*>(text.data());
  const unsigned char* end = at + text.size();
  WorkPacer pacer;
  while (at < end) {
    pacer.turn();
    const char32_t point = readUTF8(at, end);
    if (point < 0x10000) {
      *units++ = static_cast<char16_t>(point);
    } else {
      *units++ = static_cast<char16_t>(0xD7C0 + (point >> 10));
      *units++ = static_cast<char16_t>(0xDC00 + (point & 0x3FF));
    }
  }
}

// The text of a name or URI in the form names are interned in.
class NameText {
 public:
  NameText(LibXMLText prefix, LibXMLText text) {
    if (prefix) _bytes.append(reinterpret_cast<const char*>(prefix)).push_back(':');
    if (text) _bytes.append(reinterpret_cast<const char*>(text));
    if (isASCII(_bytes)) return;
    _units.resize(unitCount(_bytes));
    widen(_bytes, _units.data());
  }
  NSStringView view() const {
    if (_units.empty()) return NSStringView::ascii(_bytes);
    return {_units.data(), static_cast<uint32_t>(_units.size())};
  }

 private:
  std::string _bytes;
  std::u16string _units;
};

// Names met in one document, by the addresses of their texts.
class NameCache {
 public:
  explicit NameCache(NSXMLTree& tree) : _tree(tree), _slots(64) {}

  const NSXMLName* name(const LibXMLName& key) {
    for (size_t at = hash(key);; ++at) {
      const Slot& slot = _slots[at & (_slots.size() - 1)];
      if (!slot.name) return add(key);
      if (slot.key.localName == key.localName && slot.key.prefix == key.prefix &&
          slot.key.URI == key.URI) {
        return slot.name;
      }
    }
  }

 private:
  struct Slot {
    LibXMLName key;
    const NSXMLName* name = nullptr;
  };

  static size_t hash(const LibXMLName& key) {
    constexpr uint64_t multiplier = 0x9E3779B97F4A7C15ULL;
    const uint64_t mixed =
        (reinterpret_cast<uintptr_t>(key.localName) + reinterpret_cast<uintptr_t>(key.prefix) * 3 +
         reinterpret_cast<uintptr_t>(key.URI) * 5) *
        multiplier;
    return mixed >> 32;
  }

  const NSXMLName* add(const LibXMLName& key) {
    if (_count * 2 >= _slots.size()) grow();
    const NSXMLName* name = NSXMLInternName(NameText(key.prefix, key.localName).view(),
                                            NameText(nullptr, key.URI).view());
    _tree.adopt(name);
    insert({key, name});
    ++_count;
    return name;
  }

  void insert(const Slot& entry) {
    size_t at = hash(entry.key);
    while (_slots[at & (_slots.size() - 1)].name) ++at;
    _slots[at & (_slots.size() - 1)] = entry;
  }

  void grow() {
    std::vector<Slot> old(_slots.size() * 2);
    old.swap(_slots);
    for (const Slot& slot : old) {
      if (slot.name) insert(slot);
    }
  }

  NSXMLTree& _tree;
  std::vector<Slot> _slots;  // a power of two
  size_t _count = 0;
};

// --- the handler -----------------------------------------------------------------------------

class TreeHandler final : public LibXMLHandler {
 public:
  TreeHandler(uint32_t options, size_t expectedBytes)
      : _alwaysKeepsWhitespace((options & NSXMLNodePreserveWhitespace) != 0),
        _keepsWhitespace(_alwaysKeepsWhitespace),
        _keepsCDATA((options & NSXMLNodePreserveCDATA) != 0),
        _builder(std::max(expectedBytes, size_t{256}), std::max(expectedBytes / 2, size_t{128})),
        _names(_builder.tree()) {
    _builder.tree().becomeOld();
    _builder.openDocument();
  }

  NSXMLDocument* finish() { return cast<NSXMLDocument>(_builder.finish()); }

  void startElement(const LibXMLName& name, const LibXMLNamespaces& namespaces,
                    const LibXMLAttributes& attributes) override;
  void endElement() override;
  void characters(std::string_view text) override;
  void CDATA(std::string_view text) override;
  void comment(std::string_view text) override;
  void processingInstruction(LibXMLText target, std::string_view text) override;

 private:
  // An element under which xml:space changes what is kept.
  struct SpaceChange {
    const NSXMLNode* element;
    bool keepsOutside;
  };

  void flush();
  bool isPendingKept() const;
  void gather(std::string_view text);
  void addText(bool isCDATA);
  void setText(NSXMLNode* node, std::string_view text);
  // The text in the arena.
  NSStringView stored(std::string_view text);
  // The same, once for all declarations of one URI.
  NSStringView storedURI(LibXMLText URI);
  void hearSpace(const LibXMLName& name, std::string_view value);

  bool _alwaysKeepsWhitespace;
  bool _keepsWhitespace;  // at this place
  bool _keepsCDATA;
  NSXMLTreeBuilder _builder;
  NameCache _names;
  std::unordered_map<LibXMLText, NSStringView> _URIs;
  std::vector<SpaceChange> _spaceChanges;
  ValueText<char> _pending;      // text not yet stored, UTF-8
  bool _pendingIsExact = false;  // some of it came from a CDATA section: kept whatever it is
};

void TreeHandler::setText(NSXMLNode* node, std::string_view text) {
  NSXMLTree::setStoredText(node, stored(text));
}

NSStringView TreeHandler::stored(std::string_view text) {
  const bool isNarrow = isASCII(text);
  const size_t count = isNarrow ? text.size() : unitCount(text);
  if (count > mostUnits) throw LibXMLStop{tooLong};
  void* units = _builder.tree().allocateText(isNarrow ? count : count * sizeof(char16_t));
  if (isNarrow) {
    auto* to = static_cast<char*>(units);
    inBlocks(text, [&to](std::string_view block) {
      if (!block.empty()) std::memcpy(to, block.data(), block.size());
      to += block.size();
    });
    return {static_cast<const char*>(units), static_cast<uint32_t>(count)};
  }
  widen(text, static_cast<char16_t*>(units));
  return {static_cast<const char16_t*>(units), static_cast<uint32_t>(count)};
}

NSStringView TreeHandler::storedURI(LibXMLText URI) {
  if (!URI) return {};
  const auto [place, isNew] = _URIs.try_emplace(URI);
  if (isNew) place->second = stored(reinterpret_cast<const char*>(URI));
  return place->second;
}

void TreeHandler::gather(std::string_view text) {
  appendInBlocks(_pending, text);
}

bool TreeHandler::isPendingKept() const {
  return _keepsWhitespace || _pendingIsExact ||
         _pending.find_first_not_of(whiteSpace) != std::string::npos;
}

void TreeHandler::addText(bool isCDATA) {
  NSXMLNode* node = _builder.addLeaf(Kind::Text);
  setText(node, _pending);
  if (isCDATA) NSXMLTree::setCDATA(node);
  // A huge text must not hold its memory a second time until the end.
  constexpr size_t kept = size_t{1} << 20;
  if (_pending.capacity() > kept) {
    ValueText<char>().swap(_pending);
  }
  _pending.clear();
  _pendingIsExact = false;
}

void TreeHandler::flush() {
  if (_pending.empty()) return;
  if (isPendingKept()) {
    addText(false);
  } else {
    _pending.clear();
  }
}

void TreeHandler::hearSpace(const LibXMLName& name, std::string_view value) {
  if (!name.prefix || std::strcmp(reinterpret_cast<const char*>(name.prefix), "xml") != 0 ||
      std::strcmp(reinterpret_cast<const char*>(name.localName), "space") != 0) {
    return;
  }
  if (value != "preserve" && value != "default") return;
  // The option to preserve is not overruled by a document.
  const bool keeps = value == "preserve" || _alwaysKeepsWhitespace;
  if (keeps == _keepsWhitespace) return;
  _spaceChanges.push_back({_builder.current(), _keepsWhitespace});
  _keepsWhitespace = keeps;
}

void TreeHandler::startElement(const LibXMLName& name, const LibXMLNamespaces& namespaces,
                               const LibXMLAttributes& attributes) {
  flush();
  _builder.openElement(_names.name(name));
  for (int index = 0; index < namespaces.count(); ++index) {
    // A namespace node's name is its prefix, "" for the default namespace.
    const NSXMLName* prefix = _names.name({namespaces.prefix(index), nullptr, nullptr});
    NSXMLNode* declaration = _builder.addProperty(Kind::Namespace, prefix);
    NSXMLTree::setStoredText(declaration, storedURI(namespaces.URI(index)));
  }
  for (int index = 0; index < attributes.count(); ++index) {
    const LibXMLName attribute = attributes.name(index);
    const std::string_view value = attributes.value(index);
    setText(_builder.addProperty(Kind::Attribute, _names.name(attribute)), value);
    if (attribute.prefix) hearSpace(attribute, value);
  }
}

void TreeHandler::endElement() {
  flush();
  if (!_spaceChanges.empty() && _spaceChanges.back().element == _builder.current()) {
    _keepsWhitespace = _spaceChanges.back().keepsOutside;
    _spaceChanges.pop_back();
  }
  _builder.close();
}

void TreeHandler::characters(std::string_view text) {
  gather(text);
}

void TreeHandler::CDATA(std::string_view text) {
  if (text.empty()) return;
  if (_keepsCDATA) {
    flush();
    gather(text);
    addText(true);
  } else {
    gather(text);
    _pendingIsExact = true;
  }
}

void TreeHandler::comment(std::string_view text) {
  flush();
  setText(_builder.addLeaf(Kind::Comment), text);
}

void TreeHandler::processingInstruction(LibXMLText target, std::string_view text) {
  flush();
  const NSXMLName* name = _names.name({target, nullptr, nullptr});
  setText(_builder.addLeaf(Kind::ProcessingInstruction, name), text);
}

// --- documents -------------------------------------------------------------------------------

Ref<NSXMLDocument> parse(const LibXMLReader& read, uint32_t options, size_t expectedBytes,
                         NSXMLParseError& error) {
  Ref<NSXMLDocument> document;
  withStack(LibXMLStackBytes, [&] {
    TreeHandler handler(options, expectedBytes);
    if (parseWithLibXML(read, handler, error)) document = handler.finish();
  });
  return document;
}

Ref<NSXMLDocument> parseHTML(std::string_view bytes, uint32_t options, NSXMLParseError& error) {
  std::string failure;
  const auto XHTML = XHTMLFromHTML(bytes, failure);
  if (!XHTML) {
    error = {failure, 0, 0};
    return nullptr;
  }
  const CountedBytes counted(XHTML->capacity());
  return NSXMLDocument::documentWithData(*XHTML, options & ~uint32_t{NSXMLDocumentTidyHTML},
                                         &error);
}

std::string readAll(const LibXMLReader& read) {
  std::string bytes;
  std::vector<char> piece(size_t{64} * 1024);
  for (ptrdiff_t count = 0; (count = read(piece.data(), piece.size())) > 0;) {
    bytes.append(piece.data(), static_cast<size_t>(count));
  }
  return bytes;
}

// An open file, closed at the end unless it is standard input.
class InputFile {
 public:
  explicit InputFile(const std::string& path)
      : _descriptor(path == "-" ? STDIN_FILENO : ::open(path.c_str(), O_RDONLY | O_CLOEXEC)) {}
  ~InputFile() {
    if (_descriptor > STDIN_FILENO) ::close(_descriptor);
  }
  InputFile(const InputFile&) = delete;
  InputFile& operator=(const InputFile&) = delete;

  bool isOpen() const { return _descriptor >= 0; }
  ptrdiff_t read(char* buffer, size_t size) {
    ptrdiff_t count = 0;
    do {
      count = ::read(_descriptor, buffer, size);
    } while (count < 0 && errno == EINTR);
    if (count < 0) _failure = errno;
    return count;
  }
  int failure() const { return _failure; }

 private:
  int _descriptor;
  int _failure = 0;
};

// Large pieces for the system, small ones for the parser.
class PieceReader {
 public:
  explicit PieceReader(InputFile& file) : _file(file), _buffer(size_t{64} * 1024) {}
  ptrdiff_t read(char* buffer, size_t size) {
    if (_at == _end) {
      const ptrdiff_t count = _file.read(_buffer.data(), _buffer.size());
      if (count <= 0) return count;
      _at = 0;
      _end = static_cast<size_t>(count);
    }
    const size_t count = std::min(size, _end - _at);
    std::memcpy(buffer, _buffer.data() + _at, count);
    _at += count;
    return static_cast<ptrdiff_t>(count);
  }

 private:
  InputFile& _file;
  std::vector<char> _buffer;
  size_t _at = 0;
  size_t _end = 0;
};

Ref<NSXMLDocument> unreadable(const std::string& path, int failure, NSXMLParseError& error) {
  error = {path + ": " + std::strerror(failure), 0, 0};
  return nullptr;
}

}  // namespace

Ref<NSXMLDocument> NSXMLDocument::documentWithData(std::string_view bytes, uint32_t options,
                                                   NSXMLParseError* error) {
  NSXMLParseError ignored;
  if (options & NSXMLDocumentTidyHTML) return parseHTML(bytes, options, error ? *error : ignored);
  size_t at = 0;
  const LibXMLReader read = [&](char* buffer, size_t size) {
    const size_t count = std::min(size, bytes.size() - at);
    if (count) std::memcpy(buffer, bytes.data() + at, count);
    at += count;
    return static_cast<ptrdiff_t>(count);
  };
  return parse(read, options, bytes.size(), error ? *error : ignored);
}

Ref<NSXMLDocument> NSXMLDocument::documentWithFile(const std::string& path, uint32_t options,
                                                   NSXMLParseError* error) {
  NSXMLParseError ignored;
  NSXMLParseError& reported = error ? *error : ignored;
  InputFile file(path);
  if (!file.isOpen()) return unreadable(path, errno, reported);
  PieceReader pieces(file);
  const LibXMLReader read = [&](char* buffer, size_t size) { return pieces.read(buffer, size); };
  if (options & NSXMLDocumentTidyHTML) {
    const std::string bytes = readAll(read);
    if (file.failure()) return unreadable(path, file.failure(), reported);
    return parseHTML(bytes, options, reported);
  }
  constexpr size_t firstBlock = 4096;
  Ref<NSXMLDocument> document = parse(read, options, firstBlock, reported);
  if (!document && file.failure()) return unreadable(path, file.failure(), reported);
  return document;
}

}  // namespace xquery
