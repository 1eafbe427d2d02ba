// From the events of libxml2 to a tree.
//
// Names are looked up by the addresses of libxml2's texts, which are equal for equal names within
// one document, so that the process's table of names is asked once per name and document.
#pragma once

#include "Platform/Reading/LibXML.h"
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

class LibXMLTreeHandler final : public LibXMLHandler {
 public:
  // `goesBack`: the tree may, while it is read.
  explicit LibXMLTreeHandler(ReadTree& tree, bool goesBack = false)
      : _tree(tree), _goesBack(goesBack), _names(tree.tree()) {}

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

  ReadTree& _tree;
  const bool _goesBack;
  LibXMLNames _names;
  std::unordered_map<LibXMLText, const NSStringView*> _URIs;
};

}  // namespace xquery
