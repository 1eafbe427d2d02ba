#include "Platform/Reading/ReadNames.h"

#include "Platform/Base/KeyedHash.h"
#include "Platform/Reading/NotTaken.h"
#include "Platform/Reading/XMLCharacters.h"
#include "Platform/Text/UTF8.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/ReservedNamespaces.h"

#include <algorithm>
#include <bit>

namespace xquery {

namespace {

static_assert(std::endian::native == std::endian::little, "the first byte is the lowest");

constexpr size_t headBytes = 2 * sizeof(uint64_t);

// The first bytes of a name, and zeros behind it.
struct Head {
  Head(const char* begin, size_t length, const char* textEnd) {
    if (static_cast<size_t>(textEnd - begin) >= headBytes) [[likely]] {
      std::memcpy(words, begin, headBytes);
      if (length < headBytes) cut(length);
    } else if (length) {
      std::memcpy(words, begin, std::min(length, headBytes));
    }
  }
  bool operator==(const uint64_t (&other)[2]) const {
    return words[0] == other[0] && words[1] == other[1];
  }

  uint64_t words[2] = {};

 private:
  void cut(size_t length) {
    constexpr size_t half = sizeof(uint64_t);
    const uint64_t kept = (uint64_t{1} << (length % half * 8)) - 1;
    if (length < half) {
      words[0] &= kept;
      words[1] = 0;
    } else {
      words[1] &= kept;
    }
  }
};

uint64_t hashOf(std::string_view bytes, const Head& head) {
  const HashSecrets& secrets = hashSecrets();
  uint64_t hash = mixedHash(secrets, secrets.start ^ bytes.size(), head.words[0], head.words[1]);
  while (bytes.size() > headBytes) {
    bytes.remove_prefix(headBytes);
    const Head next(bytes.data(), bytes.size(), bytes.data() + bytes.size());
    hash = mixedHash(secrets, hash, next.words[0], next.words[1]);
  }
  return hash;
}

uint64_t hashOf(std::string_view bytes) {
  return hashOf(bytes, Head(bytes.data(), bytes.size(), bytes.data() + bytes.size()));
}

// A name or URI in the form in which it is interned.
class InternText {
 public:
  explicit InternText(std::string_view bytes) : _bytes(bytes) {
    if (isASCII(bytes)) return;
    _units.resize(bytes.size());
    char16_t* const end = widenXML(bytes, _units.data());
    take(end != nullptr);
    _units.resize(static_cast<size_t>(end - _units.data()));
  }
  NSStringView view() const {
    if (_units.empty()) return NSStringView::ascii(_bytes);
    return {_units.data(), static_cast<uint32_t>(_units.size())};
  }

 private:
  std::string_view _bytes;
  std::u16string _units;
};

}  // namespace

ReadNames::ReadNames(NSXMLTree& tree) : _tree(tree), _noPrefix(prefixOf({})) {
  auto* const URI = _memory.make<ReadNamespace>();
  URI->bytes = namespaceOfXML;
  static constexpr NSStringView text = NSStringView::ascii(namespaceOfXML);
  URI->text = &text;
  prefixOf("xml")->bound = URI;
}

// --- names as they are written ---------------------------------------------------------------

ReadName* ReadNames::find(const char* begin, const char* end, const char* textEnd) {
  const auto length = static_cast<size_t>(end - begin);
  take(length - 1 < longestNameTaken);
  const Head head(begin, length, textEnd);
  const std::string_view bytes(begin, length);
  const uint64_t hash = hashOf(bytes, head);
  ReadName* const found = _names.find(hash, [&](const ReadName& name) {
    return head == name.head && name.bytes.size() == length && isRest(name, begin, textEnd);
  });
  _last->follower = found ? found : add(bytes, hash, head.words);
  return _last = _last->follower;
}

bool ReadNames::isAtEnd(const ReadName& name, const char* place, const char* textEnd) {
  return std::string_view(place, static_cast<size_t>(textEnd - place)).starts_with(name.bytes);
}

// Of one whose first bytes stand there.
bool ReadNames::isRest(const ReadName& name, const char* place, const char* textEnd) {
  const size_t length = name.bytes.size();
  return length <= headBytes ||
         (static_cast<size_t>(textEnd - place) >= length &&
          std::memcmp(place + headBytes, name.bytes.data() + headBytes, length - headBytes) == 0);
}

ReadName* ReadNames::add(std::string_view bytes, uint64_t hash, const uint64_t (&head)[2]) {
  const XMLNameShape shape = shapeOfXMLName(bytes);
  take(shape.isName);
  auto* const name = _memory.make<ReadName>();
  name->hash = hash;
  name->head[0] = head[0];
  name->head[1] = head[1];
  const auto ones = [&](size_t from) {
    const size_t count = std::min(bytes.size() - std::min(bytes.size(), from), sizeof(uint64_t));
    return count == sizeof(uint64_t) ? ~uint64_t{0} : (uint64_t{1} << 8 * count) - 1;
  };
  name->masks[0] = ones(0);
  name->masks[1] = ones(sizeof(uint64_t));
  name->bytes = _memory.copy(bytes);
  name->hasPrefix = shape.colon != 0;
  name->isOfXML = bytes.starts_with("xml:");
  if (_selection) {
    name->selected = _selection(name->hasPrefix ? bytes.substr(shape.colon + 1) : bytes);
  }
  name->prefix = name->hasPrefix ? prefixOf(bytes.substr(0, shape.colon)) : _noPrefix;
  if (bytes == "xmlns") {
    name->declares = _noPrefix;
  } else if (bytes.starts_with("xmlns:")) {
    name->declares = prefixOf(bytes.substr(shape.colon + 1));
  }
  _names.insert(name);
  return name;
}

ReadPrefix* ReadNames::prefixOf(std::string_view bytes) {
  const uint64_t hash = hashOf(bytes);
  ReadPrefix* prefix =
      _prefixes.find(hash, [=](const ReadPrefix& each) { return each.bytes == bytes; });
  if (prefix) return prefix;
  prefix = _memory.make<ReadPrefix>();
  prefix->hash = hash;
  prefix->bytes = _memory.copy(bytes);
  _prefixes.insert(prefix);
  return prefix;
}

// --- names as they are interned --------------------------------------------------------------

const NSXMLName* ReadNames::interned(std::string_view bytes, NSStringView URI) {
  const NSXMLName* const name = NSXMLInternName(InternText(bytes).view(), URI);
  _tree.adopt(name);
  return name;
}

ReadName::Interned& ReadNames::element(ReadName& name) {
  const ReadNamespace* const URI = name.prefix->bound;
  if (!name.element.name || name.element.URI != URI) [[unlikely]] {
    static_cast<void>(resolve(name, URI, name.element));
  }
  return name.element;
}

const NSXMLName* ReadNames::attributeName(ReadName& name) {
  const ReadNamespace* const URI = name.hasPrefix ? name.prefix->bound : nullptr;
  if (name.attribute.name && name.attribute.URI == URI) [[likely]] {
    return name.attribute.name;
  }
  return resolve(name, URI, name.attribute);
}

const NSXMLName* ReadNames::resolve(ReadName& name, const ReadNamespace* URI,
                                    ReadName::Interned& last) {
  take(URI || !name.hasPrefix);  // a prefix that is not declared
  const HashSecrets& secrets = hashSecrets();
  const uint64_t hash = mixedHash(secrets, secrets.start, reinterpret_cast<uintptr_t>(&name),
                                  reinterpret_cast<uintptr_t>(URI));
  const Resolved* found = _resolved.find(
      hash, [&](const Resolved& each) { return each.written == &name && each.URI == URI; });
  if (!found) {
    auto* const resolved = _memory.make<Resolved>();
    *resolved = {hash, &name, URI, interned(name.bytes, URI ? *URI->text : NSStringView())};
    _resolved.insert(resolved);
    found = resolved;
  }
  last = {URI, found->name};
  return found->name;
}

ReadName* ReadNames::targetEntry(std::string_view bytes) {
  take(!bytes.empty() && bytes.size() <= longestNameTaken);
  ReadName* const name =
      find(bytes.data(), bytes.data() + bytes.size(), bytes.data() + bytes.size());
  take(!name->hasPrefix);
  return name;
}

const NSXMLName* ReadNames::target(std::string_view bytes) {
  return attributeName(*targetEntry(bytes));
}

// --- declarations ----------------------------------------------------------------------------

namespace {

// Others are rare or forbidden.
bool mayBind(std::string_view prefix, std::string_view URI) {
  if (prefix == "xml" || prefix == "xmlns") return false;
  if (URI == namespaceOfXML || URI == namespaceOfDeclarations) return false;
  return prefix.empty() || !URI.empty();
}

}  // namespace

const NSStringView* ReadNames::declare(ReadPrefix& prefix, std::string_view URI, size_t depth,
                                       const Store& store) {
  take(mayBind(prefix.bytes, URI));
  take(prefix.declaredIn != _tag);
  prefix.declaredIn = _tag;
  const ReadNamespace* const bound = URI.empty() ? nullptr : namespaceOf(URI, store);
  _bindings.push_back({depth, &prefix, prefix.bound});
  prefix.bound = bound;
  return bound ? bound->text : nullptr;
}

void ReadNames::unbind() {
  const Binding& binding = _bindings.back();
  binding.prefix->bound = binding.before;
  _bindings.pop_back();
}

ReadNamespace* ReadNames::namespaceOf(std::string_view URI, const Store& store) {
  take(URI.size() <= longestURITaken);
  const uint64_t hash = hashOf(URI);
  ReadNamespace* entry =
      _namespaces.find(hash, [=](const ReadNamespace& each) { return each.bytes == URI; });
  if (entry) return entry;
  entry = _memory.make<ReadNamespace>();
  entry->hash = hash;
  entry->bytes = _memory.copy(URI);
  entry->text = store(URI);
  _namespaces.insert(entry);
  return entry;
}

const NSXMLName* ReadNames::declarationName(ReadPrefix& prefix) {
  if (!prefix.node) prefix.node = interned(prefix.bytes, {});
  return prefix.node;
}

}  // namespace xquery
