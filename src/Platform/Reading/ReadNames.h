// The names of a document while it is read: from the bytes of a name in a tag to the interned name
// that it stands for at this place.
//
// Each name that is written has one entry, found by its bytes and checked when it is met first. The
// entry knows its prefix, the prefix knows the namespace that it is bound to at this place, and the
// entry keeps what the name was interned as there. So where the namespaces stay, a name is found at
// the cost of one look into one table, however many of them are in scope; declaring one changes its
// prefix alone, and the end of the element changes it back.
#pragma once

#include "Platform/Reading/EntryTable.h"
#include "Platform/Reading/NotTaken.h"
#include "Platform/Tree/Names.h"

#include <cstring>
#include <functional>

namespace xquery {

class NSXMLTree;

struct ReadNamespace {
  uint64_t hash = 0;
  std::string_view bytes;
  const NSStringView* text = nullptr;  // in the tree
};

struct ReadPrefix {
  uint64_t hash = 0;
  std::string_view bytes;
  const ReadNamespace* bound = nullptr;  // at this place; null for none
  uint64_t declaredIn = 0;               // the tag
  const NSXMLName* node = nullptr;       // the name of the nodes that declare it
};

struct ReadName {
  struct Interned {
    const ReadNamespace* URI = nullptr;
    const NSXMLName* name = nullptr;
    uint16_t number = 0;  // of an element: somebody's who builds the tree; 0 for none yet
  };

  uint64_t hash = 0;
  uint64_t head[2] = {};   // its first bytes, then zeros
  uint64_t masks[2] = {};  // ones where it has bytes
  std::string_view bytes;
  ReadPrefix* prefix = nullptr;  // the empty one if there is none
  bool hasPrefix = false;
  bool isOfXML = false;            // its prefix is "xml"
  uint32_t selected = 0;           // what the selection says of its local name
  ReadPrefix* declares = nullptr;  // as an attribute
  Interned element;                // as what it was interned last
  Interned attribute;
  ReadName* follower = nullptr;  // in a tag, the last time
};

class ReadNames {
 public:
  // Names are counted by the tree.
  explicit ReadNames(NSXMLTree& tree);

  // Asked once of each local name that is met.
  using Selection = std::function<uint32_t(std::string_view localName)>;
  void select(Selection selection) { _selection = std::move(selection); }

  // These throw NotTaken for what is no name, or not one that can stand there.
  //
  // The entry of the name between the two places; nothing at `textEnd` is read.
  ReadName* find(const char* begin, const char* end, const char* textEnd);
  // The same without knowing where it ends, for what is likely to stand there; null for: find it.
  ReadName* likely(const char* begin, const char* textEnd) {
    ReadName* const name = _last->follower;
    if (!name || static_cast<size_t>(textEnd - begin) <= name->bytes.size()) return nullptr;
    if (!endsName(begin[name->bytes.size()]) || !isAt(*name, begin, textEnd)) return nullptr;
    return _last = name;
  }
  // The name that was found last, and what is likely to follow it; for somebody who finds what
  // stands behind it again.
  ReadName* last() const { return _last; }
  void goBack(ReadName* to) { _last = to; }
  // Whether the byte may stand behind a name in a tag.
  static bool endsName(char byte) {
    constexpr uint64_t ends = uint64_t{1} << '\t' | uint64_t{1} << '\n' | uint64_t{1} << '\r' |
                              uint64_t{1} << ' ' | uint64_t{1} << '=' | uint64_t{1} << '>' |
                              uint64_t{1} << '/';
    const auto place = static_cast<unsigned char>(byte);
    return place < 64 && (ends >> place & 1) != 0;
  }
  // Whether the name stands at the place, in such a text.
  static bool isAt(const ReadName& name, const char* place, const char* textEnd) {
    if (static_cast<size_t>(textEnd - place) < sizeof name.head) {
      return isAtEnd(name, place, textEnd);
    }
    uint64_t words[2];
    std::memcpy(words, place, sizeof words);
    const uint64_t others =
        ((words[0] & name.masks[0]) ^ name.head[0]) | ((words[1] & name.masks[1]) ^ name.head[1]);
    return others == 0 && (name.bytes.size() <= sizeof words || isRest(name, place, textEnd));
  }
  // Good until the next one is asked for.
  ReadName::Interned& element(ReadName& name);
  const NSXMLName* elementName(ReadName& name) { return element(name).name; }
  const NSXMLName* attributeName(ReadName& name);
  const NSXMLName* target(std::string_view bytes);  // of an instruction

  // The same of what is not put into the tree: only that it can stand there.
  static void checkElementName(const ReadName& name) {
    take(name.prefix->bound || !name.hasPrefix);
  }
  void checkTarget(std::string_view bytes) { static_cast<void>(targetEntry(bytes)); }
  // An element's name with the namespace that its prefix was bound to where it was read.
  const NSXMLName* elementName(ReadName& name, const ReadNamespace* boundThere) {
    return resolve(name, boundThere, name.element);
  }

  // What an element declares: from here on, until `endElement` for the same depth. `store` puts the
  // text of a new namespace into the tree. Answers that text, null for no namespace.
  void startTag() { ++_tag; }
  using Store = std::function<const NSStringView*(std::string_view)>;
  const NSStringView* declare(ReadPrefix& prefix, std::string_view URI, size_t depth,
                              const Store& store);
  void endElement(size_t depth) {
    while (!_bindings.empty() && _bindings.back().depth == depth) unbind();
  }
  const NSXMLName* declarationName(ReadPrefix& prefix);

 private:
  struct Resolved {
    uint64_t hash = 0;
    const ReadName* written = nullptr;
    const ReadNamespace* URI = nullptr;
    const NSXMLName* name = nullptr;
  };
  struct Binding {
    size_t depth;
    ReadPrefix* prefix;
    const ReadNamespace* before;
  };

  static bool isAtEnd(const ReadName& name, const char* place, const char* textEnd);
  static bool isRest(const ReadName& name, const char* place, const char* textEnd);
  ReadName* targetEntry(std::string_view bytes);
  ReadName* add(std::string_view bytes, uint64_t hash, const uint64_t (&head)[2]);
  ReadPrefix* prefixOf(std::string_view bytes);
  ReadNamespace* namespaceOf(std::string_view URI, const Store& store);
  const NSXMLName* resolve(ReadName& name, const ReadNamespace* URI, ReadName::Interned& last);
  const NSXMLName* interned(std::string_view bytes, NSStringView URI);
  void unbind();

  NSXMLTree& _tree;
  EntryMemory _memory;
  EntryTable<ReadName> _names;
  EntryTable<ReadPrefix> _prefixes;
  EntryTable<ReadNamespace> _namespaces;
  EntryTable<Resolved> _resolved;
  std::vector<Binding, ValueAllocator<Binding>> _bindings;
  uint64_t _tag = 0;
  Selection _selection;
  ReadName _none;
  ReadName* _last = &_none;  // that was found
  ReadPrefix* const _noPrefix;
};

}  // namespace xquery
