// The tree of a document that is being read, whoever reads it: which texts become nodes, and how
// they are stored.
//
// Text arrives in pieces and is collected until markup ends it; then it is stored in the arena,
// 8-bit if it can be, and becomes a text node unless it is white space that is not to be kept.
// Texts are UTF-8. What turns out to be none, or none of XML's, ends the reading: LibXMLStop, which
// is also thrown for a text that is too long for a node.
#pragma once

#include "Platform/Text/Blocks.h"
#include "Platform/Tree/ElementLog.h"
#include "Platform/Tree/TreeBuilder.h"
#include "Platform/Tree/TreeIndexes.h"

#include <memory>
#include <string_view>
#include <vector>

namespace xquery {

// A text, and whether all of it is known to be ASCII, as far as its reader has looked.
struct ReadText {
  explicit ReadText(std::string_view all);
  ReadText(std::string_view all, bool isNarrow) : bytes(all), isASCII(isNarrow) {}
  std::string_view bytes;
  bool isASCII;
};

class ReadTree {
 public:
  // `options` are NSXMLOptions. So many bytes are expected; there may be more.
  ReadTree(uint32_t options, size_t expectedBytes);

  NSXMLTree& tree() { return _builder.tree(); }
  // The finished tree's root, which the caller must make a reference to.
  [[nodiscard]] NSXMLDocument* finish();
  // For a tree that nobody goes on with: nothing is put down about it, which would take memory.
  void abandon();

  // Names must have been adopted by the tree. Of an element, its namespaces and then its attributes
  // follow.
  void openElement(const NSXMLName* name) {
    NSXMLElementLog::Number unknown = 0;
    openElement(name, unknown);
  }
  // The number is kept for the name, and is 0 before the first time.
  void openElement(const NSXMLName* name, NSXMLElementLog::Number& number);
  void addNamespace(const NSXMLName* prefix, const NSStringView* storedURI);  // null for no URI
  void addAttribute(const NSXMLName* name, const ReadText& value);
  void closeElement();
  // A piece of text. The first is for one that nothing is added to any more.
  void addWholeText(const ReadText& text);
  void addText(std::string_view text);
  bool hasText() const { return !_pending.empty(); }
  void addSection(std::string_view text);
  void addComment(const ReadText& text);
  void addInstruction(const NSXMLName* target, const ReadText& text);
  // Something follows that ends a run of text, whether or not it is put into the tree.
  void endText() {
    if (hasText()) flush();
  }
  // Throws for what is none at once, not when it is put into the tree.
  void check(const ReadText& text) {
    if (!text.isASCII) checkWide(text.bytes);
  }
  // For nodes to share.
  const NSStringView* stored(const ReadText& text);
  const NSStringView* storedLasting(const ReadText& text);

  // --- reading part by part ----------------------------------------------------------------------
  NSXMLNode* current() const { return _builder.current(); }
  NSXMLTreeBuilder::Mark mark() const { return _builder.mark(); }
  // Text that is still pending is gone as well.
  void backTo(const NSXMLTreeBuilder::Mark& mark);
  void endOpenNodes() { _builder.endOpenNodes(); }
  // Instead of closing it: as if it had not been there.
  void dropOpenElement();

 private:
  // An element under which xml:space changes what is kept.
  struct SpaceChange {
    const NSXMLNode* element;
    bool keepsOutside;
  };

  void flush();
  bool isKept(std::string_view text) const;
  NSXMLNode* addLeaf(Kind kind, const ReadText& text);  // a text or a comment
  void addPending(bool isSection);
  // Calls `add` with the text in the width in which it is stored: with a view of it that is good
  // until the next text, or with where it is stored already.
  template <class Add>
  auto withStorable(const ReadText& text, Add add);
  NSStringView widened(std::string_view text);
  void checkWide(std::string_view text);
  const NSStringView* storedInHand(std::string_view text);
  const NSStringView* storedAlone(std::string_view text);
  void endSpaceChange();
  void hearSpace(const NSXMLName* name, std::string_view value);

  bool _alwaysKeepsWhitespace;
  bool _keepsWhitespace;  // at this place
  bool _keepsCDATA;
  bool _pendingIsExact = false;  // some of it came from a CDATA section: kept whatever it is
  NSXMLTreeBuilder _builder;
  std::unique_ptr<NSXMLElementLog> _log;
  NSXMLKindCounts _counts;  // but elements and texts
  std::vector<SpaceChange, ValueAllocator<SpaceChange>> _spaceChanges;
  ValueText<char> _pending;  // text not yet stored
  std::vector<char16_t, ValueAllocator<char16_t>> _units;
};

}  // namespace xquery
