// Reading is from left to right, without recursion. A function that reads a piece of a document
// gets the place where it begins and answers the place behind it, or null where the text in hand
// ends before the piece does: then there is no trace of the attempt but names that are known
// already, and it is made again with more text.
#include "Platform/Reading/XMLReader.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Reading/AttributeSet.h"
#include "Platform/Reading/LibXML.h"
#include "Platform/Reading/MarkedText.h"
#include "Platform/Reading/NotTaken.h"
#include "Platform/Reading/ProjectedTags.h"
#include "Platform/Reading/SkippedElements.h"
#include "Platform/Reading/XMLCharacters.h"
#include "Platform/Reading/XMLPieces.h"
#include "Platform/Reading/XMLProlog.h"
#include "Platform/Text/ASCII.h"
#include "Platform/Text/UTF8.h"

#include <cstring>
#include <new>
#include <optional>
#include <utility>

namespace xquery {

namespace {

constexpr std::string_view sectionStart = "<![CDATA[";
constexpr std::string_view byteOrderMark = "\xEF\xBB\xBF";

// Whether the text begins with the word; where it is too short to tell, it does not.
bool isAt(const char* at, const char* end, std::string_view word) {
  return static_cast<size_t>(end - at) >= word.size() &&
         std::memcmp(at, word.data(), word.size()) == 0;
}

class XMLReader {
 public:
  XMLReader(TextSource& source, uint32_t options)
      : _source(source), _tree(options, source.expectedBytes()), _names(_tree.tree()) {}
  // Of the document only that is made; it outlives the reader.
  XMLReader(TextSource& source, uint32_t options, const XMLProjection& projection)
      : _source(source), _tree(options, bytesBeforeAny), _names(_tree.tree()) {
    _projected.emplace(_tree, _names, _texts, projection);
    _skipped.emplace(_text, _names, _texts, _tree, *_projected);
  }
  NSXMLDocument* read();

  // --- piece by piece --------------------------------------------------------------------------
  bool readNextPiece();
  bool isComplete() const { return _at == _end && _open.empty() && _hasRoot; }
  ReadTree& tree() { return _tree; }
  size_t depth() const { return _open.size(); }
  bool hasRoot() const { return _hasRoot; }
  const char* pieceStart() const { return _pieceStart; }
  std::string_view textBehind() const {
    return {_source.begin(), static_cast<size_t>(_at - _source.begin())};
  }
  TextInput rest() { return _source.from(_at); }
  // The tree may go back to what it was, and libxml2 may go on from any piece.
  void beginPieces(XMLPieces::Leaving leaving) {
    _isByPieces = true;
    _leaving = std::move(leaving);
    start();
  }

 private:
  void start();
  bool getMore();
  const char* readPiece(const char* at);
  const char* readProlog(const char* at);
  const char* readSpaceAround(const char* at);
  const char* readMarkup(const char* at);
  const char* readDeclarationLike(const char* at);

  const char* readText(const char* at);
  bool isFollowedBySection(const char* at) const;
  void addText(const RawText& text, bool isWhole);

  ReadName* readName(const char*& at);
  const char* readStartTag(const char* at);
  const char* readAttribute(const char* at);
  const char* readEquals(const char* at) const;
  const char* readValue(const char* at, char quote, RawText& value);
  const char* skipSpace(const char* at) const;
  void openElement(ReadName& name);
  void closeElement();
  void declareNamespaces();
  void addAttributes();
  const char* readEndTag(const char* at);

  const char* readComment(const char* at);
  const char* readSection(const char* at);
  const char* readInstruction(const char* at);
  ReadText linesOf(RawText raw);

  TextSource& _source;
  ReadTree _tree;
  ReadNames _names;
  RawTexts _texts;
  MarkedText _text;
  const char* _at = nullptr;
  const char* _end = nullptr;
  SkippedElements::OpenNames _open;  // the elements
  ReadTag _tag;                      // that is being read
  AttributeSet _distinct;
  bool _hasBegun = false;
  bool _hasType = false;
  bool _hasRoot = false;

  static constexpr size_t bytesBeforeAny = size_t{1} << 14;
  std::optional<ProjectedTags> _projected;
  std::optional<SkippedElements> _skipped;

  bool _isByPieces = false;
  const char* _pieceStart = nullptr;  // of the last one
  XMLPieces::Leaving _leaving;
};

// --- the whole -------------------------------------------------------------------------------

bool XMLReader::getMore() {
  if (_leaving) _leaving(textBehind());
  const bool isMore = _source.more(_at);
  _at = _source.begin();
  _end = _source.end();
  _text.start(_at, _end);
  return isMore;
}

void XMLReader::start() {
  _at = _source.begin();
  _end = _source.end();
  _text.start(_at, _end);
}

NSXMLDocument* XMLReader::read() {
  start();
  for (;;) {
    const char* const next = _at == _end ? nullptr : readPiece(_at);
    if (next) {
      _at = next;
    } else if (!getMore() && (_hasBegun || _at == _end)) {
      break;
    }
  }
  take(isComplete());
  return _tree.finish();
}

// False at the end of the text.
bool XMLReader::readNextPiece() {
  for (;;) {
    const char* const next = _at == _end ? nullptr : readPiece(_at);
    if (next) {
      _pieceStart = std::exchange(_at, next);
      return true;
    }
    if (!getMore() && (_hasBegun || _at == _end)) return false;
  }
}

const char* XMLReader::readPiece(const char* at) {
  if (!_hasBegun) return readProlog(at);
  if (*at == '<') {
    const bool maySkip = _skipped && !_open.empty();
    const char* const next = maySkip ? _skipped->skip(at, _open) : at;
    return next == at ? readMarkup(at) : next;
  }
  return _open.empty() ? readSpaceAround(at) : readText(at);
}

// Before the first piece.
const char* XMLReader::readProlog(const char* at) {
  constexpr size_t longestStart = 9;  // the mark, "<?xml" and white space
  const bool isShort = static_cast<size_t>(_end - at) < longestStart;
  if (isShort && _source.isUnfinished()) return nullptr;
  const char* next = at;
  if (isAt(at, _end, byteOrderMark)) next += byteOrderMark.size();
  if (isAt(next, _end, "<?xml") && next + 5 < _end && isXMLSpace(next[5])) {
    XMLDeclaration declaration;
    next = readXMLDeclaration(next, _end, declaration);
    if (!next) {
      take(_source.isUnfinished());
      return nullptr;
    }
    if (declaration.isASCII) _texts.expectASCII();
    take(!declaration.isASCII || *at == '<');
  }
  _hasBegun = true;
  return next;
}

const char* XMLReader::readSpaceAround(const char* at) {
  take(isXMLSpace(*at));
  return skipSpace(at);
}

const char* XMLReader::readMarkup(const char* at) {
  if (at + 1 == _end) return nullptr;
  switch (at[1]) {
    case '/':
      return readEndTag(at);
    case '?':
      return readInstruction(at);
    case '!':
      return readDeclarationLike(at);
    default:
      return readStartTag(at);
  }
}

// What begins with "<!".
const char* XMLReader::readDeclarationLike(const char* at) {
  if (isAt(at, _end, "<!--")) return readComment(at);
  if (isAt(at, _end, sectionStart)) return readSection(at);
  if (static_cast<size_t>(_end - at) < sectionStart.size()) return nullptr;
  take(isAt(at, _end, "<!DOCTYPE") && !_hasType && !_hasRoot);
  const char* const next = readDocumentType(at, _end);
  if (next) _hasType = true;
  return next;
}

// --- text ------------------------------------------------------------------------------------

const char* XMLReader::readText(const char* at) {
  RawText text;
  text.begin = at;
  for (;; ++at) {
    at = _text.textEnd(at, text.wide);
    if (at == _end) return nullptr;
    if (*at == '<') break;
    if (*at == '>') {
      take(at - text.begin < 2 || at[-1] != ']' || at[-2] != ']');
    } else {
      take(*at == '&' || *at == '\r');
      text.isPlain = false;
    }
  }
  if (at + 1 == _end) return nullptr;
  text.end = at;
  addText(text, !isFollowedBySection(at));
  return at;
}

// Whether what follows may be more text.
bool XMLReader::isFollowedBySection(const char* at) const {
  return at[1] == '!';
}

void XMLReader::addText(const RawText& text, bool isWhole) {
  const bool isNeeded = !_projected || _projected->needsTexts();
  if (!isNeeded && text.isSurelyRight()) return;
  const ReadText known = _texts.content(text);
  if (!isNeeded) return _tree.check(known);
  if (_projected) _projected->buildAbove();
  if (isWhole && !_tree.hasText()) {
    _tree.addWholeText(known);
  } else {
    if (_isByPieces) _tree.check(known);
    _tree.addText(known.bytes);
  }
}

// --- tags ------------------------------------------------------------------------------------

const char* XMLReader::skipSpace(const char* at) const {
  if (at < _end && !isXMLSpace(*at)) return at;
  for (WorkPacer pacer; at < _end && isXMLSpace(*at); ++at) pacer.turn();
  return at;
}

// Moves behind the name; null where the text in hand ends before it may.
ReadName* XMLReader::readName(const char*& at) {
  if (ReadName* const name = _names.likely(at, _end)) [[likely]] {
    at += name->bytes.size();
    return name;
  }
  uint64_t wide = 0;
  const char* const begin = at;
  at = _text.nameEnd(begin, wide);
  take(!(wide && _texts.expectsASCII()) && static_cast<size_t>(at - begin) <= longestNameTaken);
  return at == _end ? nullptr : _names.find(begin, at, _end);
}

const char* XMLReader::readStartTag(const char* at) {
  take(!_open.empty() || !_hasRoot);
  ReadName* const name = readName(++at);
  if (!name) return nullptr;
  _tag.clear();
  for (;;) {
    const char* const next = skipSpace(at);
    if (next == _end) return nullptr;
    if (*next == '>') {
      openElement(*name);
      return next + 1;
    }
    if (*next == '/') {
      if (next + 1 == _end) return nullptr;
      take(next[1] == '>');
      openElement(*name);
      closeElement();
      return next + 2;
    }
    take(next != at);
    at = readAttribute(next);
    if (!at) return nullptr;
  }
}

const char* XMLReader::readEquals(const char* at) const {
  at = skipSpace(at);
  if (at == _end) return nullptr;
  take(*at == '=');
  at = skipSpace(at + 1);
  return at == _end ? nullptr : at;
}

const char* XMLReader::readAttribute(const char* at) {
  ReadName* const name = readName(at);
  if (!name) return nullptr;
  at = readEquals(at);
  if (!at) return nullptr;
  take(*at == '"' || *at == '\'');
  return readValue(at + 1, *at, _tag.add(name));
}

const char* XMLReader::readValue(const char* at, char quote, RawText& value) {
  value.begin = at;
  for (;; ++at) {
    at = _text.valueEnd(at, value.wide);
    if (at == _end) return nullptr;
    if (*at == quote) break;
    if (*at == '"' || *at == '\'' || *at == '>') continue;
    take(*at == '&' || isXMLSpace(*at));
    value.isPlain = false;
  }
  value.end = at;
  return at + 1;
}

void XMLReader::declareNamespaces() {
  _names.startTag();
  const auto store = [this](std::string_view URI) {
    return _isByPieces ? _tree.storedLasting(ReadText(URI)) : _tree.stored(ReadText(URI));
  };
  for (ReadAttribute& attribute : _tag.attributes) {
    if (!attribute.name->declares) continue;
    attribute.URI = _names.declare(*attribute.name->declares, _texts.value(attribute.value).bytes,
                                   _open.size(), store);
  }
}

// The namespaces of a tag are in scope in all of it.
void XMLReader::openElement(ReadName& name) {
  if (_tag.declares) declareNamespaces();
  _open.push_back(&name);
  _hasRoot = true;
  if (_projected) return _projected->open(name, _tag);
  ReadName::Interned& interned = _names.element(name);
  _tree.openElement(interned.name, interned.number);
  if (_tag.declares) _tag.addNamespaces(_tree, _names);
  if (!_tag.attributes.empty()) addAttributes();
}

void XMLReader::addAttributes() {
  _distinct.start(_tag.attributes.size());
  for (const ReadAttribute& attribute : _tag.attributes) {
    if (attribute.name->declares) continue;
    const NSXMLName* const name = _names.attributeName(*attribute.name);
    take(_distinct.insert(name->expanded));
    _tree.addAttribute(name, _texts.value(attribute.value));
  }
}

void XMLReader::closeElement() {
  if (!_projected || _projected->close()) _tree.closeElement();
  _open.pop_back();
  _names.endElement(_open.size());
}

const char* XMLReader::readEndTag(const char* at) {
  take(!_open.empty());
  const ReadName& name = *_open.back();
  at += 2;
  if (static_cast<size_t>(_end - at) <= name.bytes.size()) return nullptr;
  take(ReadNames::isAt(name, at, _end));
  at = skipSpace(at + name.bytes.size());
  if (at == _end) return nullptr;
  take(*at == '>');
  closeElement();
  return at + 1;
}

// --- comments, sections, instructions --------------------------------------------------------

// Of what is not looked at for markup. Something that ends a run of text stands behind it.
ReadText XMLReader::linesOf(RawText raw) {
  for (const char* at = raw.begin; (at = _text.textEnd(at, raw.wide)) < raw.end; ++at) {
    if (*at == '\r') raw.isPlain = false;
    take(static_cast<unsigned char>(*at) >= ' ' || *at == '\r');
  }
  return _texts.lines(raw);
}

const char* XMLReader::readComment(const char* at) {
  const char* const begin = at + 4;
  for (at = begin;; ++at) {
    at = findInBlocks(at, _end, '-');
    if (_end - at < 3) return nullptr;
    if (at[1] == '-') break;
  }
  take(at[2] == '>');
  const ReadText text = linesOf({begin, at});
  if (!_projected || _projected->needsComments()) {
    _tree.addComment(text);
  } else {
    _tree.endText();
    _tree.check(text);
  }
  return at + 3;
}

const char* XMLReader::readSection(const char* at) {
  take(!_open.empty());
  const char* const begin = at + sectionStart.size();
  for (at = begin;; ++at) {
    at = findInBlocks(at, _end, ']');
    if (_end - at < 3) return nullptr;
    if (at[1] == ']' && at[2] == '>') break;
  }
  const ReadText text = linesOf({begin, at});
  if (_projected) {
    if (!_projected->needsTexts()) {
      _tree.check(text);
      return at + 3;
    }
    _projected->buildAbove();
  }
  if (_isByPieces) _tree.check(text);
  _tree.addSection(text.bytes);
  return at + 3;
}

// Those that are spelt like the declaration of a document are reserved, but for two.
bool isReservedTarget(std::string_view target) {
  return lowerCase(target.substr(0, 3)) == "xml" && target != "xml-stylesheet" &&
         target != "xml-model";
}

const char* XMLReader::readInstruction(const char* at) {
  const char* const targetBegin = at + 2;
  for (at = targetBegin; at < _end && *at != '?' && !isXMLSpace(*at); ++at) continue;
  if (_end - at < 2) return nullptr;
  const std::string_view target(targetBegin, static_cast<size_t>(at - targetBegin));
  take(!isReservedTarget(target) && (*at != '?' || at[1] == '>'));
  const char* const begin = skipSpace(at);
  for (at = begin;; ++at) {
    at = findInBlocks(at, _end, '?');
    if (_end - at < 2) return nullptr;
    if (at[1] == '>') break;
  }
  static_cast<void>(_texts.written(target, !isASCII(target)));
  if (!_projected || _projected->needsInstructions()) {
    if (_projected) _projected->buildAbove();
    _tree.addInstruction(_names.target(target), linesOf({begin, at}));
  } else {
    _tree.endText();
    _names.checkTarget(target);
    _tree.check(linesOf({begin, at}));
  }
  return at + 2;
}

}  // namespace

// --- the doors -------------------------------------------------------------------------------

Ref<NSXMLDocument> readXML(TextSource& source, uint32_t options, const XMLProjection* projection) {
  try {
    if (projection) return Ref<NSXMLDocument>(XMLReader(source, options, *projection).read());
    return Ref<NSXMLDocument>(XMLReader(source, options).read());
  } catch (const NotTaken&) {
  } catch (const LibXMLStop&) {
  } catch (const std::bad_alloc&) {
  }
  return nullptr;
}

class XMLPieces::Reading : public XMLReader {
 public:
  using XMLReader::XMLReader;
};

XMLPieces::XMLPieces(TextSource& source, uint32_t options, Leaving leaving)
    : _reading(std::make_unique<Reading>(source, options)) {
  _reading->beginPieces(std::move(leaving));
}

XMLPieces::~XMLPieces() = default;

void XMLPieces::letGoOfTree() {
  _reading->tree().abandon();
}

size_t XMLPieces::read() {
  if (_reading->readNextPiece()) return _reading->depth();
  take(_reading->isComplete());
  return none;
}

ReadTree& XMLPieces::tree() {
  return _reading->tree();
}

bool XMLPieces::hasRoot() const {
  return _reading->hasRoot();
}

const char* XMLPieces::lastPiece() const {
  return _reading->pieceStart();
}

std::string_view XMLPieces::textBehind() const {
  return _reading->textBehind();
}

TextInput XMLPieces::rest() {
  return _reading->rest();
}

}  // namespace xquery
