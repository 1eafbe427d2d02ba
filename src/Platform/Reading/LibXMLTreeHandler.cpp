#include "Platform/Reading/LibXMLTreeHandler.h"

#include "Platform/Base/Stack.h"
#include "Platform/Reading/XMLCharacters.h"
#include "Platform/Reading/XMLDocuments.h"
#include "Platform/Text/UTF8.h"
#include "Platform/Tree/Names.h"

namespace xquery {

namespace {

// The text of a name or URI in the form names are interned in.
class NameText {
 public:
  NameText(LibXMLText prefix, LibXMLText text) {
    if (prefix) _bytes.append(reinterpret_cast<const char*>(prefix)).push_back(':');
    if (text) _bytes.append(reinterpret_cast<const char*>(text));
    if (isASCII(_bytes)) return;
    _units.resize(_bytes.size());
    const char16_t* const end = widenXML(_bytes, _units.data());
    if (!end) throw LibXMLStop{"a name is not well formed"};
    _units.resize(static_cast<size_t>(end - _units.data()));
  }
  NSStringView view() const {
    if (_units.empty()) return NSStringView::ascii(_bytes);
    return {_units.data(), static_cast<uint32_t>(_units.size())};
  }

 private:
  std::string _bytes;
  std::u16string _units;
};

size_t hashOf(const LibXMLName& key) {
  constexpr uint64_t multiplier = 0x9E3779B97F4A7C15ULL;
  const uint64_t mixed =
      (reinterpret_cast<uintptr_t>(key.localName) + reinterpret_cast<uintptr_t>(key.prefix) * 3 +
       reinterpret_cast<uintptr_t>(key.URI) * 5) *
      multiplier;
  return mixed >> 32;
}

}  // namespace

// --- names -----------------------------------------------------------------------------------

const NSXMLName* LibXMLNames::name(const LibXMLName& key) {
  for (size_t at = hashOf(key);; ++at) {
    const Slot& slot = _slots[at & (_slots.size() - 1)];
    if (!slot.name) return add(key);
    if (slot.key.localName == key.localName && slot.key.prefix == key.prefix &&
        slot.key.URI == key.URI) {
      return slot.name;
    }
  }
}

const NSXMLName* LibXMLNames::add(const LibXMLName& key) {
  if (_count * 2 >= _slots.size()) grow();
  const NSXMLName* name = NSXMLInternName(NameText(key.prefix, key.localName).view(),
                                          NameText(nullptr, key.URI).view());
  _tree.adopt(name);
  insert({key, name});
  ++_count;
  return name;
}

void LibXMLNames::insert(const Slot& entry) {
  size_t at = hashOf(entry.key);
  while (_slots[at & (_slots.size() - 1)].name) ++at;
  _slots[at & (_slots.size() - 1)] = entry;
}

void LibXMLNames::grow() {
  std::vector<Slot> old(_slots.size() * 2);
  old.swap(_slots);
  for (const Slot& slot : old) {
    if (slot.name) insert(slot);
  }
}

// --- the handler -----------------------------------------------------------------------------

const NSStringView* LibXMLTreeHandler::storedURI(LibXMLText URI) {
  if (!URI) return nullptr;
  const auto [place, isNew] = _URIs.try_emplace(URI);
  if (isNew) {
    const ReadText text(reinterpret_cast<const char*>(URI));
    place->second = _goesBack ? _tree.storedLasting(text) : _tree.stored(text);
  }
  return place->second;
}

void LibXMLTreeHandler::startElement(const LibXMLName& name, const LibXMLNamespaces& namespaces,
                                     const LibXMLAttributes& attributes) {
  _tree.openElement(_names.name(name));
  for (int index = 0; index < namespaces.count(); ++index) {
    // A namespace node's name is its prefix, "" for the default namespace.
    const NSXMLName* prefix = _names.name({namespaces.prefix(index), nullptr, nullptr});
    _tree.addNamespace(prefix, storedURI(namespaces.URI(index)));
  }
  for (int index = 0; index < attributes.count(); ++index) {
    _tree.addAttribute(_names.name(attributes.name(index)), ReadText(attributes.value(index)));
  }
}

Ref<NSXMLDocument> readWithLibXML(const TextInput& input, uint32_t options, size_t expectedBytes,
                                  NSXMLParseError& error) {
  Ref<NSXMLDocument> document;
  withStack(LibXMLStackBytes, [&] {
    ReadTree tree(options, expectedBytes);
    LibXMLTreeHandler handler(tree);
    if (parseWithLibXML(input, handler, error)) document = tree.finish();
  });
  return document;
}

}  // namespace xquery
