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

// --- namespaces ------------------------------------------------------------------------------

const NSStringView* LibXMLURIs::storedIn(ReadTree& tree, LibXMLText URI) {
  if (!URI) return nullptr;
  const auto [place, isNew] = _URIs.try_emplace(URI);
  if (isNew) {
    const ReadText text(reinterpret_cast<const char*>(URI));
    place->second = _goesBack ? tree.storedLasting(text) : tree.stored(text);
  }
  return place->second;
}

void LibXMLURIs::addTo(ReadTree& tree, LibXMLNames& names, const LibXMLNamespaces& namespaces) {
  for (int index = 0; index < namespaces.count(); ++index) {
    // A namespace node's name is its prefix, "" for the default namespace.
    const NSXMLName* prefix = names.name({namespaces.prefix(index), nullptr, nullptr});
    tree.addNamespace(prefix, storedIn(tree, namespaces.URI(index)));
  }
}

// --- the handlers ----------------------------------------------------------------------------

void LibXMLTreeHandler::startElement(const LibXMLName& name, const LibXMLNamespaces& namespaces,
                                     const LibXMLAttributes& attributes) {
  _tree.openElement(_names.name(name));
  _URIs.addTo(_tree, _names, namespaces);
  for (int index = 0; index < attributes.count(); ++index) {
    _tree.addAttribute(_names.name(attributes.name(index)), ReadText(attributes.value(index)));
  }
}

namespace {

std::string_view bytesOf(LibXMLText text) {
  return text ? reinterpret_cast<const char*>(text) : std::string_view();
}

// As xml:space, which is heard whatever is needed.
bool isOfXML(const LibXMLName& attribute) {
  return bytesOf(attribute.prefix) == "xml";
}

}  // namespace

LibXMLProjectionHandler::States::NameID LibXMLProjectionHandler::selected(LibXMLText localName) {
  const auto [place, isNew] = _selected.try_emplace(localName, States::otherName);
  if (isNew) place->second = _projected.nameOf(bytesOf(localName));
  return place->second;
}

void LibXMLProjectionHandler::buildAbove() {
  _projected.buildAbove([this](const LibXMLName& name) { _tree.openElement(_names.name(name)); });
}

void LibXMLProjectionHandler::startElement(const LibXMLName& name,
                                           const LibXMLNamespaces& namespaces,
                                           const LibXMLAttributes& attributes) {
  const auto isNeeded = [&](const States::State& state) {
    bool says = namespaces.count() > 0;
    for (int index = 0; index < attributes.count() && !says; ++index) {
      const LibXMLName attribute = attributes.name(index);
      says = isOfXML(attribute) ||
             (state.needsAnyAttribute() && state.needsAttribute(selected(attribute.localName)));
    }
    return says;
  };
  const auto build = [this](const LibXMLName& each) { _tree.openElement(_names.name(each)); };
  if (!_projected.open(selected(name.localName), name, isNeeded, build)) return;
  _tree.openElement(_names.name(name));
  _URIs.addTo(_tree, _names, namespaces);
  const States::State& state = _projected.state();
  for (int index = 0; index < attributes.count(); ++index) {
    const LibXMLName attribute = attributes.name(index);
    if (!isOfXML(attribute) && !state.needsAttribute(selected(attribute.localName))) continue;
    _tree.addAttribute(_names.name(attribute), ReadText(attributes.value(index)));
  }
}

void LibXMLProjectionHandler::characters(std::string_view text) {
  if (!_projected.needsTexts()) return;
  buildAbove();
  _tree.addText(text);
}

void LibXMLProjectionHandler::CDATA(std::string_view text) {
  if (!_projected.needsTexts()) return;
  buildAbove();
  _tree.addSection(text);
}

void LibXMLProjectionHandler::comment(std::string_view text) {
  if (!_projected.needsComments()) return _tree.endText();
  _tree.addComment(ReadText(text));
}

void LibXMLProjectionHandler::processingInstruction(LibXMLText target, std::string_view text) {
  if (!_projected.needsInstructions()) return _tree.endText();
  buildAbove();
  _tree.addInstruction(_names.name({target, nullptr, nullptr}), ReadText(text));
}

Ref<NSXMLDocument> readWithLibXML(const TextInput& input, uint32_t options, size_t expectedBytes,
                                  NSXMLParseError& error, const XMLProjection* projection) {
  Ref<NSXMLDocument> document;
  withStack(LibXMLStackBytes, [&] {
    ReadTree tree(options, projection ? 0 : expectedBytes);
    if (projection) {
      LibXMLProjectionHandler handler(tree, *projection);
      if (parseWithLibXML(input, handler, error)) document = tree.finish();
    } else {
      LibXMLTreeHandler handler(tree);
      if (parseWithLibXML(input, handler, error)) document = tree.finish();
    }
  });
  return document;
}

}  // namespace xquery
