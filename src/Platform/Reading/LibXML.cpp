#include "Platform/Reading/LibXML.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Reading/DeclaredNames.h"
#include "Platform/Reading/LibXMLMemory.h"
#include "Platform/Reading/MarkupMeter.h"

#include <libxml/parser.h>
#include <libxml/parserInternals.h>
#include <libxml/SAX2.h>
#include <libxml/tree.h>
#include <libxml/xmlerror.h>

#include <algorithm>
#include <climits>
#include <cstring>
#include <exception>
#include <memory>
#include <new>
#include <unordered_map>
#include <utility>

namespace xquery {

namespace {

// One parse. Exceptions do not cross libxml2's C frames: a callback that fails notes the failure
// and stops the parser, and every callback that is still called afterwards does nothing. Only the
// end of an evaluation that the parse is part of is thrown on, when libxml2 has returned: it is
// looked for when input is read and when entities and defaults, which need no reading, add to the
// document. The content of an entity is parsed by an inner parser of libxml2's, which calls the
// same functions with itself in place of the outer one, and is stopped by its next call when the
// parse has failed.
//
// What libxml2 hands to whoever hears its errors depends on the way the report takes: what belongs
// to the parser, to its validation context (the parser itself), or to nobody, such as failures of
// encodings and of buffers. All of them arrive at the thread's parse.
class Parse {
 public:
  Parse(const TextInput& read, LibXMLHandler& handler, NSXMLParseError& error)
      : _read(read), _handler(handler), _error(error) {}
  bool run();

 private:
  static xmlSAXHandler callbacks();
  // What calls back is a parser, from here on the one at work.
  static Parse& of(void* parser);
  class Hearing;
  template <class Function>
  void guarded(Function function);
  void stop();
  void fail(const char* message);
  void failAt(const char* message, int64_t line, int64_t column);
  void note(const char* message, int64_t line, int64_t column);  // the first failure counts
  void end(std::exception_ptr exception);                        // counts as a failure
  void endInput();
  bool hasReadAll();
  size_t position() const;  // of the parser, in the document's text
  void hasEvent();
  void measureInput();
  const char* excess(const MarkupMeter& meter) const;
  void measureEntity(const xmlEntity& entity);
  void hasDeclaration(size_t listed);
  void chargeTag(size_t namespaces, size_t attributes);
  bool mayAdd(size_t bytes);
  bool mayAddDefaults(const LibXMLNamespaces& namespaces, const LibXMLAttributes& attributes,
                      int defaultedCount);
  // Comments and instructions of the internal subset are no nodes of the document.
  bool isInsideDTD() const { return _parser->inSubset != 0; }

  static int readInput(void* self, char* buffer, int size);
  static void startDocument(void* self);
  static void internalSubset(void* self, const xmlChar* name, const xmlChar* publicID,
                             const xmlChar* systemID);
  static void elementDecl(void* self, const xmlChar*, int, xmlElementContent*);
  static void attributeDecl(void* self, const xmlChar* element, const xmlChar* name, int, int,
                            const xmlChar* value, xmlEnumeration* tokens);
  static void notationDecl(void* self, const xmlChar*, const xmlChar*, const xmlChar*);
  static void entityDecl(void* self, const xmlChar* name, int type, const xmlChar* publicID,
                         const xmlChar* systemID, xmlChar* content);
  static void unparsedEntityDecl(void* self, const xmlChar* name, const xmlChar* publicID,
                                 const xmlChar* systemID, const xmlChar* notation);
  static xmlEntityPtr getEntity(void* self, const xmlChar* name);
  static xmlEntityPtr getParameterEntity(void* self, const xmlChar* name);
  bool isDeclaring(const xmlChar* name);
  xmlEntityPtr permitted(xmlEntityPtr entity);
  static void startElement(void* self, const xmlChar* localName, const xmlChar* prefix,
                           const xmlChar* URI, int namespaceCount, const xmlChar** namespaces,
                           int attributeCount, int defaultedCount, const xmlChar** attributes);
  static void endElement(void* self, const xmlChar*, const xmlChar*, const xmlChar*);
  static void characters(void* self, const xmlChar* text, int length);
  static void CDATABlock(void* self, const xmlChar* text, int length);
  static void comment(void* self, const xmlChar* text);
  static void processingInstruction(void* self, const xmlChar* target, const xmlChar* text);
  static void reference(void* self, const xmlChar* name);
  static void hearError(void*, xmlError* error);
  static void hearText(void*, const char* format, ...);
  void hear(const xmlError& error);

  const TextInput& _read;
  LibXMLHandler& _handler;
  NSXMLParseError& _error;
  xmlParserCtxt* _parser = nullptr;
  xmlParserCtxt* _atWork = nullptr;  // the same, or the one of an entity's content
  size_t _bytesRead = 0;
  size_t _bytesAdded = 0;
  MarkupMeter _meter;  // of what came since the last event, if measuring
  bool _isMeasuring = false;
  size_t _measuredTo = 0;              // the place in the document's text
  const xmlChar* _declared = nullptr;  // the entity, until it is asked for
  size_t _listedInEntities = 0;        // since the last declaration
  size_t _attributesDeclared = 0;
  std::unordered_map<LibXMLText, size_t> _defaults;  // of the elements
  bool _reachedEnd = false;
  bool _failed = false;
  std::exception_ptr _ended;
};

constexpr const char* outOfMemory = "out of memory";
constexpr size_t bytesPerStep = 1024;
constexpr size_t comparisonsPerStep = 10'000;
constexpr const char* tooMuchText = "entities expand to too much text";

std::string_view viewOf(const xmlChar* text, size_t length) {
  return {reinterpret_cast<const char*>(text), length};
}

std::string_view viewOf(const xmlChar* text) {
  return text ? std::string_view(reinterpret_cast<const char*>(text)) : std::string_view();
}

// --- failures --------------------------------------------------------------------------------

void Parse::note(const char* message, int64_t line, int64_t column) {
  if (_failed) return;
  _failed = true;
  std::string_view text = message ? message : "not well formed";
  while (!text.empty() && (text.back() == '\n' || text.back() == ' ')) text.remove_suffix(1);
  _error.message = text;
  std::replace(_error.message.begin(), _error.message.end(), '\n', ' ');
  _error.line = line;
  _error.column = column;
}

void Parse::end(std::exception_ptr exception) {
  if (!_ended) _ended = std::move(exception);
  note("the evaluation has ended", 0, 0);
}

Parse& Parse::of(void* self) {
  auto* const parser = static_cast<xmlParserCtxt*>(self);
  Parse& parse = *static_cast<Parse*>(parser->_private);
  parse._atWork = parser;
  if (parse._failed) xmlStopParser(parser);
  return parse;
}

// Parsers between these two stop at their next calls.
void Parse::stop() {
  xmlStopParser(_parser);
  if (_atWork != _parser) xmlStopParser(_atWork);
}

void Parse::failAt(const char* message, int64_t line, int64_t column) {
  note(message, line, column);
  stop();
}

void Parse::fail(const char* message) {
  const xmlParserInput* input = _parser->input;
  failAt(message, input ? input->line : 1, input ? input->col : 1);
}

template <class Function>
void Parse::guarded(Function function) {
  if (_failed) return;
  try {
    function();
  } catch (const LibXMLStop& stop) {
    fail(stop.message);
  } catch (const std::bad_alloc&) {
    fail(outOfMemory);
  } catch (...) {
    end(std::current_exception());
    stop();
  }
}

// The innermost of this thread.
thread_local Parse* current = nullptr;

// Takes what libxml2 reports on this thread while it lives: what a host has set for the thread is
// put back.
class Parse::Hearing {
 public:
  explicit Hearing(Parse& parse) {
    current = &parse;
    xmlSetStructuredErrorFunc(nullptr, hearError);
    xmlSetGenericErrorFunc(nullptr, hearText);
  }
  ~Hearing() {
    xmlSetGenericErrorFunc(_genericContext, _generic);
    xmlSetStructuredErrorFunc(_structuredContext, _structured);
    xmlResetLastError();  // which may hold all of a long text
    current = _outer;
  }
  Hearing(const Hearing&) = delete;
  Hearing& operator=(const Hearing&) = delete;

 private:
  Parse* const _outer = current;
  const xmlStructuredErrorFunc _structured = xmlStructuredError;
  void* const _structuredContext = xmlStructuredErrorContext;
  const xmlGenericErrorFunc _generic = xmlGenericError;
  void* const _genericContext = xmlGenericErrorContext;
};

void Parse::hearError(void*, xmlError* error) {
  current->hear(*error);
}

void Parse::hearText(void*, const char*, ...) {}

// The parser has no words for some of its errors, such as the end of the input at the beginning of
// a CDATA section, for which it has them further on.
const char* messageOf(const xmlError& error) {
  if (!error.message || !std::string_view(error.message).starts_with("Unregistered")) {
    return error.message;
  }
  return error.code == XML_ERR_CDATA_NOT_FINISHED ? "CData section not finished" : nullptr;
}

void Parse::hear(const xmlError& error) {
  // Neither warnings, of URIs that are relative or none, nor breaches of validity and of good
  // sense, for example a token that an enumeration has twice or a predefined entity declared
  // otherwise, make a document bad.
  const bool isMinor = error.level < XML_ERR_ERROR || error.code == XML_WAR_NS_URI ||
                       (error.level < XML_ERR_FATAL &&
                        (error.domain == XML_FROM_DTD || error.domain == XML_FROM_VALID ||
                         error.domain == XML_FROM_TREE));
  if (_failed || isMinor) return;
  // What concerns the input is heard while it is read, when the parser cannot be stopped.
  const bool isOfInput =
      !_parser || (error.domain != XML_FROM_PARSER && error.domain != XML_FROM_NAMESPACE);
  // Nor can the parser that was at work last, which may be gone.
  if (_parser) _atWork = _parser;
  if (!isOfInput) return failAt(messageOf(error), error.line, error.int2);
  const xmlParserInput* input = _parser ? _parser->input : nullptr;
  note(messageOf(error), input ? input->line : 0, input ? input->col : 0);
}

// --- input -----------------------------------------------------------------------------------

// The parser cannot be stopped here, since stopping frees the buffer that is being filled; after a
// failure it sees the end of the input. It is told that this is the end of its work as well: to
// report what is unfinished it would copy all of that, twice.
void Parse::endInput() {
  _parser->disableSAX = 1;
  _parser->instate = XML_PARSER_EOF;
}

int Parse::readInput(void* self, char* buffer, int size) {
  Parse& parse = *static_cast<Parse*>(self);
  if (parse._failed || parse._reachedEnd) return 0;
  ptrdiff_t count = -1;
  try {
    checkWork(static_cast<size_t>(size) / bytesPerStep + 1);
    count = parse._read(buffer, static_cast<size_t>(size));
  } catch (const std::bad_alloc&) {
    parse.note(outOfMemory, 0, 0);
  } catch (...) {
    parse.end(std::current_exception());
  }
  if (count < 0) parse.note("the input cannot be read", 0, 0);
  if (!parse._failed) parse.measureInput();
  if (parse._failed) {
    parse.endInput();
    return 0;
  }
  if (count == 0) parse._reachedEnd = true;
  parse._bytesRead += static_cast<size_t>(count);
  return static_cast<int>(count);
}

// The parser holds the text from `base` on; before that it has consumed some. While it waits for
// more its own pointers may be stale, but what is between them is right.
size_t Parse::position() const {
  const xmlParserInput* input = _parser->inputNr > 0 ? _parser->inputTab[0] : nullptr;
  return input ? input->consumed + static_cast<size_t>(input->cur - input->base) : 0;
}

// What came up to here is done with.
void Parse::hasEvent() {
  _measuredTo = position();
  _isMeasuring = false;
}

// Where the parser is, if not in markup that began before.
MarkupMeter::Place placeOf(const xmlParserCtxt& parser) {
  switch (parser.instate) {
    case XML_PARSER_COMMENT:
      return MarkupMeter::Place::Comment;
    case XML_PARSER_PI:
      return MarkupMeter::Place::Instruction;
    case XML_PARSER_CDATA_SECTION:
      return MarkupMeter::Place::Section;
    case XML_PARSER_DTD:
      return MarkupMeter::Place::Declaration;
    case XML_PARSER_START_TAG:
    case XML_PARSER_CONTENT:
      return MarkupMeter::Place::Content;
    default:
      return MarkupMeter::Place::Beyond;
  }
}

// Whenever input is read, which is often within anything long, measures what came before. The
// parser may have let go of some of that; it never does so within tags and lists.
void Parse::measureInput() {
  const xmlParserInput* input = _parser->inputNr > 0 ? _parser->inputTab[0] : nullptr;
  if (!input || !input->buf) return;
  const size_t held = xmlBufUse(input->buf->buffer);
  const auto* text = reinterpret_cast<const char*>(xmlBufContent(input->buf->buffer));
  if (_measuredTo < input->consumed) {
    _measuredTo = position();
    _meter.restart(placeOf(*_parser));
  } else if (!_isMeasuring) {
    _meter.restart(isInsideDTD() ? MarkupMeter::Place::Declaration : MarkupMeter::Place::Content);
  }
  _isMeasuring = true;
  const size_t start = std::min(_measuredTo - input->consumed, held);
  _meter.read({text + start, held - start});
  _measuredTo = input->consumed + held;
  if (const char* message = excess(_meter)) note(message, input->line, input->col);
}

const char* Parse::excess(const MarkupMeter& meter) const {
  const auto namespaces = static_cast<size_t>(_parser->nsNr) / 2;
  if (meter.mostAttributes() > LibXMLMostAttributes) return "too many attributes";
  if (namespaces > LibXMLMostNamespaces) return "too many namespaces";
  if (meter.mostNamed() * namespaces > LibXMLMostLookups) return "too many namespaces";
  if (meter.mostListed() + _listedInEntities > LibXMLMostListed) {
    return "too many names in a declaration";
  }
  return nullptr;
}

// libxml2 takes a zero byte after the root element for the end of the input.
bool Parse::hasReadAll() {
  const xmlParserInput* input = _parser->input;
  if (input && input->cur < input->end) return false;
  char byte = 0;
  return readInput(this, &byte, 1) == 0;
}

// --- entities --------------------------------------------------------------------------------

bool Parse::mayAdd(size_t bytes) {
  _bytesAdded += bytes;
  return _bytesAdded <= std::max(LibXMLAddedBytes, _bytesRead * LibXMLAddedFactor);
}

// Attributes that the internal subset gives to an element come last. Declarations given in this way
// cannot be told from those in the document, which are long enough never to reach the bound.
bool Parse::mayAddDefaults(const LibXMLNamespaces& namespaces, const LibXMLAttributes& attributes,
                           int defaultedCount) {
  size_t bytes = static_cast<size_t>(namespaces.count() + defaultedCount) * LibXMLAttributeCost;
  for (int index = attributes.count() - defaultedCount; index < attributes.count(); ++index) {
    bytes += attributes.value(index).size();
  }
  return bytes == 0 || mayAdd(bytes);
}

xmlEntityPtr Parse::permitted(xmlEntityPtr entity) {
  if (!entity) return nullptr;
  if (entity->etype == XML_EXTERNAL_GENERAL_PARSED_ENTITY ||
      entity->etype == XML_EXTERNAL_PARAMETER_ENTITY) {
    fail("external entities are not read");
    return nullptr;
  }
  if (entity->etype == XML_INTERNAL_PREDEFINED_ENTITY) return entity;
  const size_t bytes = static_cast<size_t>(entity->length) + LibXMLReferenceCost;
  guarded([&] {
    if (!mayAdd(bytes)) throw LibXMLStop{tooMuchText};
    checkWork(bytes / bytesPerStep + 1);
    measureEntity(*entity);
  });
  return _failed ? nullptr : entity;
}

// The text of an entity is parsed without reading anything. Lists of several entities may stand in
// one declaration.
void Parse::measureEntity(const xmlEntity& entity) {
  const bool isParameter = entity.etype == XML_INTERNAL_PARAMETER_ENTITY;
  MarkupMeter meter(isParameter ? MarkupMeter::Place::Declaration : MarkupMeter::Place::Content);
  meter.read(viewOf(entity.content, static_cast<size_t>(entity.length)));
  if (const char* message = excess(meter)) throw LibXMLStop{message};
  if (isParameter) _listedInEntities += meter.mostListed();
  // A parser of its own reads it, which is told all namespaces in scope.
  chargeTag(0, 1);
}

xmlEntityPtr Parse::getEntity(void* self, const xmlChar* name) {
  Parse& parse = of(self);
  if (parse._failed) return nullptr;
  xmlEntity* const entity = xmlSAX2GetEntity(parse._parser, name);
  return parse.isDeclaring(name) ? entity : parse.permitted(entity);
}

xmlEntityPtr Parse::getParameterEntity(void* self, const xmlChar* name) {
  Parse& parse = of(self);
  if (parse._failed) return nullptr;
  xmlEntity* const entity = xmlSAX2GetParameterEntity(parse._parser, name);
  return parse.isDeclaring(name) ? entity : parse.permitted(entity);
}

// What has just declared an entity with a text asks for it once, which is no use of it.
bool Parse::isDeclaring(const xmlChar* name) {
  return name == std::exchange(_declared, nullptr);
}

// --- declarations ----------------------------------------------------------------------------

// Every one is an end of what may grow without an event.
void Parse::hasDeclaration(size_t listed) {
  hasEvent();
  _listedInEntities = 0;
  guarded([&] { checkWork(1 + listed * listed / comparisonsPerStep); });
}

// The content is libxml2's to free, the tokens are not.
void Parse::elementDecl(void* self, const xmlChar*, int, xmlElementContent*) {
  of(self).hasDeclaration(0);
}

void Parse::attributeDecl(void* self, const xmlChar* element, const xmlChar* name, int, int,
                          const xmlChar* value, xmlEnumeration* tokens) {
  Parse& parse = of(self);
  size_t listed = 0;
  for (const xmlEnumeration* token = tokens; token; token = token->next) ++listed;
  xmlFreeEnumeration(tokens);
  parse.hasDeclaration(listed);
  parse.guarded([&] {
    const bool isTooMany = ++parse._attributesDeclared > LibXMLMostAttributesDeclared;
    const bool isDefaultTooMany = value && ++parse._defaults[element] > LibXMLMostDefaults;
    if (isTooMany || isDefaultTooMany) throw LibXMLStop{"too many attributes declared"};
    const char* const fault = value ? faultOfDefault(viewOf(name), viewOf(value)) : nullptr;
    if (fault) throw LibXMLStop{fault};
    // Where libxml2 keeps them, what has the same hash is searched one by one.
    checkWork(1 + parse._attributesDeclared / comparisonsPerStep);
  });
}

void Parse::notationDecl(void* self, const xmlChar*, const xmlChar*, const xmlChar*) {
  of(self).hasDeclaration(0);
}

// libxml2 keeps the declared entities in a document of its own, which holds nothing else.
void Parse::startDocument(void* self) {
  xmlSAX2StartDocument(of(self)._parser);
}

void Parse::internalSubset(void* self, const xmlChar* name, const xmlChar* publicID,
                           const xmlChar* systemID) {
  xmlSAX2InternalSubset(of(self)._parser, name, publicID, systemID);
  of(self).hasEvent();
}

void Parse::entityDecl(void* self, const xmlChar* name, int type, const xmlChar* publicID,
                       const xmlChar* systemID, xmlChar* content) {
  xmlSAX2EntityDecl(of(self)._parser, name, type, publicID, systemID, content);
  of(self).hasDeclaration(0);
  of(self)._declared = content ? name : nullptr;
}

void Parse::unparsedEntityDecl(void* self, const xmlChar* name, const xmlChar* publicID,
                               const xmlChar* systemID, const xmlChar* notation) {
  xmlSAX2UnparsedEntityDecl(of(self)._parser, name, publicID, systemID, notation);
  of(self).hasDeclaration(0);
}

// Called for what was not substituted: leaving it out would lose text in silence.
void Parse::reference(void* self, const xmlChar*) {
  Parse& parse = of(self);
  if (!parse._failed) parse.fail("reference to an entity that is not defined");
}

// --- content ---------------------------------------------------------------------------------

void Parse::chargeTag(size_t namespaces, size_t attributes) {
  const auto inScope = static_cast<size_t>(_parser->nsNr) / 2;
  const size_t comparisons =
      (namespaces * namespaces + attributes * attributes) / 2 + inScope * (1 + attributes);
  checkWork(1 + comparisons / comparisonsPerStep);
}

void Parse::startElement(void* self, const xmlChar* localName, const xmlChar* prefix,
                         const xmlChar* URI, int namespaceCount, const xmlChar** namespaces,
                         int attributeCount, int defaultedCount, const xmlChar** attributes) {
  Parse& parse = of(self);
  const LibXMLNamespaces declared(namespaces, namespaceCount);
  const LibXMLAttributes given(attributes, attributeCount);
  parse.hasEvent();
  parse.guarded([&] {
    if (!parse.mayAddDefaults(declared, given, defaultedCount)) throw LibXMLStop{tooMuchText};
    parse.chargeTag(static_cast<size_t>(namespaceCount), static_cast<size_t>(attributeCount));
    parse._handler.startElement({localName, prefix, URI}, declared, given);
  });
}

void Parse::endElement(void* self, const xmlChar*, const xmlChar*, const xmlChar*) {
  Parse& parse = of(self);
  parse.hasEvent();
  parse.guarded([&] { parse._handler.endElement(); });
}

void Parse::characters(void* self, const xmlChar* text, int length) {
  Parse& parse = of(self);
  parse.hasEvent();
  parse.guarded([&] { parse._handler.characters(viewOf(text, static_cast<size_t>(length))); });
}

void Parse::CDATABlock(void* self, const xmlChar* text, int length) {
  Parse& parse = of(self);
  parse.hasEvent();
  parse.guarded([&] { parse._handler.CDATA(viewOf(text, static_cast<size_t>(length))); });
}

void Parse::comment(void* self, const xmlChar* text) {
  Parse& parse = of(self);
  parse.hasEvent();
  parse.guarded([&] {
    checkWork();
    if (!parse.isInsideDTD()) parse._handler.comment(viewOf(text));
  });
}

void Parse::processingInstruction(void* self, const xmlChar* target, const xmlChar* text) {
  Parse& parse = of(self);
  parse.hasEvent();
  parse.guarded([&] {
    checkWork();
    if (!parse.isInsideDTD()) parse._handler.processingInstruction(target, viewOf(text));
  });
}

xmlSAXHandler Parse::callbacks() {
  xmlSAXHandler handler;
  std::memset(&handler, 0, sizeof handler);
  handler.initialized = XML_SAX2_MAGIC;
  handler.startDocument = startDocument;
  handler.internalSubset = internalSubset;
  handler.elementDecl = elementDecl;
  handler.attributeDecl = attributeDecl;
  handler.notationDecl = notationDecl;
  handler.entityDecl = entityDecl;
  handler.unparsedEntityDecl = unparsedEntityDecl;
  handler.getEntity = getEntity;
  handler.getParameterEntity = getParameterEntity;
  handler.reference = reference;
  handler.startElementNs = startElement;
  handler.endElementNs = endElement;
  handler.characters = characters;
  handler.ignorableWhitespace = characters;
  handler.cdataBlock = CDATABlock;
  handler.comment = comment;
  handler.processingInstruction = processingInstruction;
  handler.serror = hearError;
  return handler;
}

// --- the whole -------------------------------------------------------------------------------

bool Parse::run() {
  const Hearing hearing(*this);
  LibXMLValueBytes counted;
  xmlSAXHandler handler = callbacks();
  _parser = _atWork =
      xmlCreateIOParserCtxt(&handler, nullptr, readInput, nullptr, this, XML_CHAR_ENCODING_NONE);
  if (!_parser) throw std::bad_alloc();
  const LibXMLOwnedParser owned(_parser, counted);
  _parser->_private = this;
  xmlCtxtUseOptions(_parser, XML_PARSE_HUGE | XML_PARSE_NOENT | XML_PARSE_NONET);
  const bool isWellFormed = xmlParseDocument(_parser) == 0 && _parser->wellFormed;
  _atWork = _parser;
  if (!_failed && !isWellFormed) fail(nullptr);
  if (!_failed && !hasReadAll()) fail("extra content at the end of the document");
  if (_ended) std::rethrow_exception(_ended);
  return !_failed;
}

}  // namespace

bool parseWithLibXML(const TextInput& read, LibXMLHandler& handler, NSXMLParseError& error) {
  LibXMLMemory::begin();
  return Parse(read, handler, error).run();
}

}  // namespace xquery
