// libxml2, as the source of a document's events. Its headers are included here, in
// LibXMLMemory.cpp, LibXMLTree.cpp and LibXSLT.cpp only.
//
// Well-formedness, namespaces, encodings and internal entities are its work. External entities and
// external DTDs are never read: a reference to one is an error. Depth and the length of texts are
// bounded by memory only.
#pragma once

#include "Platform/Reading/TextSource.h"
#include "xquery/XMLNode.h"

#include <cstddef>
#include <functional>
#include <string_view>

namespace xquery {

// Text of names: UTF-8 ended by a zero byte, null for none. Equal texts have equal addresses while
// one document is parsed.
using LibXMLText = const unsigned char*;

struct LibXMLName {
  LibXMLText localName;
  LibXMLText prefix;
  LibXMLText URI;
};

class LibXMLNamespaces {
 public:
  LibXMLNamespaces(const LibXMLText* fields, int count) : _fields(fields), _count(count) {}
  int count() const { return _count; }
  LibXMLText prefix(int index) const { return _fields[2 * index]; }
  LibXMLText URI(int index) const { return _fields[2 * index + 1]; }

 private:
  const LibXMLText* _fields;
  int _count;
};

class LibXMLAttributes {
 public:
  LibXMLAttributes(const LibXMLText* fields, int count) : _fields(fields), _count(count) {}
  int count() const { return _count; }
  LibXMLName name(int index) const {
    const LibXMLText* field = _fields + 5 * index;
    return {field[0], field[1], field[2]};
  }
  std::string_view value(int index) const {
    const LibXMLText* field = _fields + 5 * index;
    return {reinterpret_cast<const char*>(field[3]), static_cast<size_t>(field[4] - field[3])};
  }

 private:
  const LibXMLText* _fields;
  int _count;
};

class LibXMLHandler {
 public:
  virtual void startElement(const LibXMLName& name, const LibXMLNamespaces& namespaces,
                            const LibXMLAttributes& attributes) = 0;
  virtual void endElement() = 0;
  // Adjacent text may come in several pieces.
  virtual void characters(std::string_view text) = 0;
  virtual void CDATA(std::string_view text) = 0;
  virtual void comment(std::string_view text) = 0;
  virtual void processingInstruction(LibXMLText target, std::string_view text) = 0;

 protected:
  ~LibXMLHandler() = default;
};

// What a handler throws to end the parse; the place is filled in.
struct LibXMLStop {
  const char* message;
};

// What entities and attribute defaults add to a document is at most the larger of these: an
// absolute number of bytes, and a multiple of the bytes read so far. A reference counts for the
// text of its entity and a little more, so that empty entities are bounded too; a default counts
// for its value and a little more.
constexpr size_t LibXMLAddedBytes = size_t{10} << 20;
constexpr size_t LibXMLAddedFactor = 20;
constexpr size_t LibXMLReferenceCost = 32;
constexpr size_t LibXMLAttributeCost = 16;

// libxml2 compares every attribute of a start tag with every other, every declaration too, and the
// names of a list in a declaration; it looks prefixes up among all namespaces in scope, and tables
// of its own stop growing long before what is in them does. It cannot be interrupted meanwhile: a
// tag of a million attributes would keep it busy for minutes. More than these are refused before
// that work begins, or where it has gone on for some tens of milliseconds, so that an evaluation
// which is told to end while a document is read ends within its tenth of a second on a slow machine
// too.
//
// In milliseconds between two events: 10,000 attributes 25, or 40 where they declare namespaces; 80
// million lookups 45; 6,000 defaults 35; 6,000 names of an enumeration 80, of notations 120.
constexpr size_t LibXMLMostAttributes = 10'000;          // of a tag
constexpr size_t LibXMLMostDefaults = 6'000;             // of the attributes of an element
constexpr size_t LibXMLMostListed = 6'000;               // names in a list
constexpr size_t LibXMLMostAttributesDeclared = 10'000;  // by one document
constexpr size_t LibXMLMostNamespaces = 250'000;         // in scope
constexpr size_t LibXMLMostLookups = 80'000'000;         // attributes of a tag, times namespaces

// libxml2 recurses with the nesting of content models and entities, a thousand levels and more: the
// stack that it is given.
constexpr size_t LibXMLStackBytes = size_t{2} << 20;

// Whether the document was well formed; else `error` says what is wrong, and where. Needs a stack
// of LibXMLStackBytes.
bool parseWithLibXML(const TextInput& input, LibXMLHandler& handler, NSXMLParseError& error);

}  // namespace xquery
