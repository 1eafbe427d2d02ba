// From the events of libxml2 to a tree.
//
// Names are looked up by the addresses of libxml2's texts, which are equal for equal names within
// one document, so that the process's table of names is asked once per name and document.
#include "Platform/Base/Stack.h"
#include "Platform/Reading/LibXML.h"
#include "Platform/Reading/ReadTree.h"
#include "Platform/Reading/XMLCharacters.h"
#include "Platform/Reading/XMLDocuments.h"
#include "Platform/Text/UTF8.h"
#include "Platform/Tree/Names.h"

#include <unordered_map>
#include <vector>

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
      : _tree(options, expectedBytes), _names(_tree.tree()) {}

  NSXMLDocument* finish() { return _tree.finish(); }

  void startElement(const LibXMLName& name, const LibXMLNamespaces& namespaces,
                    const LibXMLAttributes& attributes) override;
  void endElement() override { _tree.closeElement(); }
  void characters(std::string_view text) override { _tree.addText(text); }
  void CDATA(std::string_view text) override { _tree.addSection(text); }
  void comment(std::string_view text) override { _tree.addComment(ReadText(text)); }
  void processingInstruction(LibXMLText target, std::string_view text) override {
    _tree.addInstruction(_names.name({target, nullptr, nullptr}), ReadText(text));
  }

 private:
  // In the tree, once for all declarations of one URI.
  const NSStringView* storedURI(LibXMLText URI);

  ReadTree _tree;
  NameCache _names;
  std::unordered_map<LibXMLText, const NSStringView*> _URIs;
};

const NSStringView* TreeHandler::storedURI(LibXMLText URI) {
  if (!URI) return nullptr;
  const auto [place, isNew] = _URIs.try_emplace(URI);
  if (isNew) place->second = _tree.stored(ReadText(reinterpret_cast<const char*>(URI)));
  return place->second;
}

void TreeHandler::startElement(const LibXMLName& name, const LibXMLNamespaces& namespaces,
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

}  // namespace

Ref<NSXMLDocument> readWithLibXML(const TextInput& input, uint32_t options, size_t expectedBytes,
                                  NSXMLParseError& error) {
  Ref<NSXMLDocument> document;
  withStack(LibXMLStackBytes, [&] {
    TreeHandler handler(options, expectedBytes);
    if (parseWithLibXML(input, handler, error)) document = handler.finish();
  });
  return document;
}

}  // namespace xquery
