#include "Platform/Reading/XMLRecords.h"

#include "Platform/Base/Stack.h"
#include "Platform/Reading/LibXMLTreeHandler.h"
#include "Platform/Reading/NotTaken.h"
#include "Platform/Reading/ResumedText.h"
#include "Platform/Reading/TextLines.h"
#include "Platform/Reading/XMLPieces.h"
#include "Platform/Reading/XMLRecordFilter.h"
#include "Platform/Text/Blocks.h"
#include "Platform/Tree/Arena.h"

#include <algorithm>
#include <exception>

namespace xquery {

namespace {

// The records from the events of libxml2, below the elements that are open already. What it is
// given to get there, tags and then so many bytes of text, makes events that are passed over.
class LibXMLRecords final : public LibXMLHandler {
 public:
  LibXMLRecords(ReadTree& tree, XMLRecordFilter& filter, size_t depth,
                const XMLRecords::Receiver& receive)
      : _below(tree, true), _filter(filter), _depth(depth), _receive(receive) {}

  void passOver(size_t startTags, size_t endTags, uint64_t bytes) {
    _startTags = startTags;
    _endTags = endTags;
    _bytes = bytes;
  }
  // The receiver has ended the parse; what it has thrown is thrown on.
  bool hasBeenEnded() const {
    if (_thrown) std::rethrow_exception(_thrown);
    return _hasBeenEnded;
  }

  void startElement(const LibXMLName& name, const LibXMLNamespaces& namespaces,
                    const LibXMLAttributes& attributes) override {
    if (passesOver(_startTags)) return;
    _below.startElement(name, namespaces, attributes);
    ++_depth;
    look(_depth - 1);
  }
  void endElement() override {
    if (passesOver(_endTags)) return;
    _below.endElement();
    --_depth;
    look(_depth + 1);
  }
  void characters(std::string_view text) override {
    if (_startTags > 0) return;
    const uint64_t passed = std::min<uint64_t>(_bytes, text.size());
    _bytes -= passed;
    text.remove_prefix(passed);
    if (text.empty()) return;
    _below.characters(text);
    look(_depth);
  }
  void CDATA(std::string_view text) override {
    _below.CDATA(text);
    look(_depth);
  }
  void comment(std::string_view text) override {
    if (isBefore()) return;
    _below.comment(text);
    look(_depth);
  }
  void processingInstruction(LibXMLText target, std::string_view text) override {
    if (isBefore()) return;
    _below.processingInstruction(target, text);
    look(_depth);
  }

 private:
  static bool passesOver(size_t& count) { return count > 0 && count-- > 0; }
  // In the prolog that has been read already.
  bool isBefore() const { return _startTags > 0; }
  void look(size_t depthBefore) {
    const NSXMLElement* const record = _filter.look(depthBefore, _depth);
    if (!record) return;
    try {
      _hasBeenEnded = !_receive(*record);
    } catch (...) {
      _thrown = std::current_exception();
    }
    if (_hasBeenEnded || _thrown) throw LibXMLStop{"the reading has been ended"};
    _filter.dropRecord();
  }

  LibXMLTreeHandler _below;
  XMLRecordFilter& _filter;
  size_t _depth;
  const XMLRecords::Receiver& _receive;
  size_t _startTags = 0;
  size_t _endTags = 0;
  uint64_t _bytes = 0;
  bool _hasBeenEnded = false;
  std::exception_ptr _thrown;
};

}  // namespace

class XMLRecords::Reading {
 public:
  Reading(TextSource& source, std::span<const XMLRecordPath> paths, uint32_t options)
      : _pieces(source, options, [this](std::string_view text) { leave(text); }),
        _document(cast<NSXMLDocument>(_pieces.tree().current())),
        _treeIsDocuments{_pieces},
        _filter(_pieces.tree(), paths) {}
  Reading(const Reading&) = delete;
  Reading& operator=(const Reading&) = delete;

  bool read(const Receiver& receive, NSXMLParseError& error);
  NSXMLDocument* document() const { return _document.get(); }
  size_t elementsKept() const { return _filter.elementsKept(); }

 private:
  enum class State : uint8_t { Record, AtEnd, NotTaken };

  const NSXMLElement* readRecord();
  State readRecordIfTaken(const NSXMLElement*& record);
  bool readRest(const Receiver& receive, NSXMLParseError& error);
  void leave(std::string_view text);
  void beginRoot();
  void dropUnfinishedTag();

  ValueText<char> _prolog;  // what is before the document element
  TextLines _lines;
  bool _hasRoot = false;
  size_t _depth = 0;
  XMLPieces _pieces;
  const Ref<NSXMLDocument> _document;
  // Whoever refers to the document owns the tree, also where the rest of this could not be made.
  const struct TreeIsDocuments {
    ~TreeIsDocuments() { pieces.letGoOfTree(); }
    XMLPieces& pieces;
  } _treeIsDocuments;
  XMLRecordFilter _filter;
};

// --- our reader ------------------------------------------------------------------------------

void XMLRecords::Reading::leave(std::string_view text) {
  if (!_hasRoot) appendInBlocks(_prolog, text);
  _lines.leave(text, _depth);
}

void XMLRecords::Reading::beginRoot() {
  _hasRoot = true;
  const char* const begin = _pieces.textBehind().data();
  appendInBlocks(_prolog,
                 std::string_view(begin, static_cast<size_t>(_pieces.lastPiece() - begin)));
}

// Null at the end of the document.
const NSXMLElement* XMLRecords::Reading::readRecord() {
  for (;;) {
    const size_t depth = _pieces.read();
    if (depth == XMLPieces::none) return nullptr;
    const size_t depthBefore = _depth;
    _depth = depth;
    if (depth > depthBefore) _lines.open(depth, _pieces.lastPiece());
    if (!_hasRoot && _pieces.hasRoot()) beginRoot();
    if (const NSXMLElement* const record = _filter.look(depthBefore, depth)) return record;
  }
}

XMLRecords::Reading::State XMLRecords::Reading::readRecordIfTaken(const NSXMLElement*& record) {
  try {
    record = readRecord();
    return record ? State::Record : State::AtEnd;
  } catch (const NotTaken&) {
  } catch (const LibXMLStop&) {
  }
  return State::NotTaken;
}

bool XMLRecords::Reading::read(const Receiver& receive, NSXMLParseError& error) {
  for (const NSXMLElement* record = nullptr;;) {
    switch (readRecordIfTaken(record)) {
      case State::AtEnd:
        return true;
      case State::NotTaken:
        return readRest(receive, error);
      case State::Record:
        if (!receive(*record)) return true;
        _filter.dropRecord();
    }
  }
}

// --- libxml2 ---------------------------------------------------------------------------------

// Of a tag that our reader does not take there may be an element already.
void XMLRecords::Reading::dropUnfinishedTag() {
  size_t depth = 0;
  for (const NSXMLNode* node = _pieces.tree().current(); node->parent(); node = node->parent()) {
    ++depth;
  }
  if (depth > _depth) _pieces.tree().dropOpenElement();
}

bool XMLRecords::Reading::readRest(const Receiver& receive, NSXMLParseError& error) {
  // The receiver needs the thread that it is called on.
  if (stackLeft() < LibXMLStackBytes) {
    error = {"too little stack is left to read this document", 0, 0};
    return false;
  }
  dropUnfinishedTag();
  leave(_pieces.textBehind());
  ResumedText text(_prolog);
  std::vector<const NSXMLElement*> open;
  for (const NSXMLNode* node = _pieces.tree().current(); node->parent(); node = node->parent()) {
    open.push_back(cast<NSXMLElement>(node));
  }
  for (size_t depth = 1; depth <= _depth; ++depth) {
    text.addTag(*open[_depth - depth], _lines.lineOf(depth));
  }
  const bool isBehindRoot = _hasRoot && _depth == 0;
  if (isBehindRoot) text.addRoot();
  LibXMLRecords handler(_pieces.tree(), _filter, _depth, receive);
  const uint64_t filled = _hasRoot ? text.moveTo(_lines.place()) : 0;
  handler.passOver(isBehindRoot ? 1 : _depth, isBehindRoot ? 1 : 0, isBehindRoot ? 0 : filled);
  const bool isWellFormed = parseWithLibXML(text.followedBy(_pieces.rest()), handler, error);
  if (!handler.hasBeenEnded()) return isWellFormed;
  error = {};
  return true;
}

// --- the door --------------------------------------------------------------------------------

XMLRecords::XMLRecords(TextSource& source, std::span<const XMLRecordPath> paths, uint32_t options)
    : _reading(std::make_unique<Reading>(source, paths, options)) {}

XMLRecords::~XMLRecords() = default;

bool XMLRecords::read(const Receiver& receive, NSXMLParseError& error) {
  return _reading->read(receive, error);
}

uint32_t XMLRecords::references() const {
  return __atomic_load_n(&NSXMLTree::of(document())->references, __ATOMIC_RELAXED);
}

size_t XMLRecords::elementsKept() const {
  return _reading->elementsKept();
}

NSXMLDocument* XMLRecords::document() const {
  return _reading->document();
}

}  // namespace xquery
