// From the events of libxml2 to a tree.
//
// Names are looked up by the addresses of libxml2's texts, which are equal for equal names within
// one document, so that the process's table of names is asked once per name and document.
#pragma once

#include "Platform/Reading/LibXML.h"
#include "Platform/Reading/ProjectedElements.h"
#include "Platform/Reading/ReadTree.h"

#include <unordered_map>
#include <vector>

namespace xquery {

// Names met in one document, by the addresses of their texts.
class LibXMLNames {
 public:
  explicit LibXMLNames(NSXMLTree& tree) : _tree(tree), _slots(64) {}
  const NSXMLName* name(const LibXMLName& key);

 private:
  struct Slot {
    LibXMLName key;
    const NSXMLName* name = nullptr;
  };

  const NSXMLName* add(const LibXMLName& key);
  void insert(const Slot& entry);
  void grow();

  NSXMLTree& _tree;
  std::vector<Slot> _slots;  // a power of two
  size_t _count = 0;
};

// The namespaces of one document, stored once for all declarations of one URI.
class LibXMLURIs {
 public:
  // `goesBack`: the tree may, while it is read.
  explicit LibXMLURIs(bool goesBack = false) : _goesBack(goesBack) {}
  void addTo(ReadTree& tree, LibXMLNames& names, const LibXMLNamespaces& namespaces);

 private:
  const NSStringView* storedIn(ReadTree& tree, LibXMLText URI);

  const bool _goesBack;
  std::unordered_map<LibXMLText, const NSStringView*> _URIs;
};

// The same of a part of the document.
class LibXMLProjectionHandler final : public LibXMLHandler {
 public:
  LibXMLProjectionHandler(ReadTree& tree, const XMLProjection& projection)
      : _tree(tree), _names(tree.tree()), _projected(tree, projection) {}

  void startElement(const LibXMLName& name, const LibXMLNamespaces& namespaces,
                    const LibXMLAttributes& attributes) override;
  void endElement() override {
    if (_projected.close()) _tree.closeElement();
  }
  void characters(std::string_view text) override;
  void CDATA(std::string_view text) override;
  void comment(std::string_view text) override;
  void processingInstruction(LibXMLText target, std::string_view text) override;

 private:
  using States = XMLProjectionStates;

  void buildAbove();
  // Of a local name, which has one address for all of the document.
  States::NameID selected(LibXMLText localName);

  ReadTree& _tree;
  LibXMLNames _names;
  LibXMLURIs _URIs;
  ProjectedElements<LibXMLName> _projected;
  std::unordered_map<LibXMLText, States::NameID> _selected;
};

class LibXMLTreeHandler final : public LibXMLHandler {
 public:
  // `goesBack`: the tree may, while it is read.
  explicit LibXMLTreeHandler(ReadTree& tree, bool goesBack = false)
      : _tree(tree), _names(tree.tree()), _URIs(goesBack) {}

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
  ReadTree& _tree;
  LibXMLNames _names;
  LibXMLURIs _URIs;
};

}  // namespace xquery
