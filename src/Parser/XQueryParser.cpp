#include "Parser/XQueryParser.h"

#include "Parser/XQueryScanner.h"
#include "Parser/XQueryTokens.h"
#include "Platform/Base/NSLog.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Base/XQueryErrorTrace.h"
#include "Types/XQueryErrors.h"
#include "xquery/Exception.h"

#include <algorithm>
#include <cstring>
#include <exception>
#include <new>

// What bison makes of the grammar.
int XQparse(xquery::XQueryParser& parser);

namespace xquery {
namespace {

// Reached with one instruction: every builder asks for it.
constinit thread_local XQueryParser* sXQueryParserCurrent
    __attribute__((tls_model("initial-exec"))) = nullptr;

struct SetterError {
  unsigned flag;
  XQueryErrorText<> text;
};

constexpr SetterError setterErrors[] = {
    {XQuerySetterXMLSpace, XQueryErrors::secondXMLSpace},
    {XQuerySetterDefaultCollation, XQueryErrors::secondDefaultCollation},
    {XQuerySetterBaseURI, XQueryErrors::secondBaseURI},
    {XQuerySetterConstruction, XQueryErrors::secondConstruction},
    {XQuerySetterOrdering, XQueryErrors::secondOrderingMode},
    {XQuerySetterEmptyOrdering, XQueryErrors::secondEmptyOrdering},
    {XQuerySetterInheritNamespaces, XQueryErrors::secondInheritNamespaces},
};

void logText(const Ref<NSString>& text) {
  if (XQueryLogEnabled()) NSLog(text->utf8());
}

// The error was logged when it was made; its text follows.
void record(const Ref<XQueryError>& error) {
  sXQueryParserCurrent->setError(error);
  logText(error->msg());
}

// At the current line, which the text ends with; the text comes first in the log, then the error.
template <size_t places, class... Parts>
void logAndRecord(const XQueryErrorText<places>& row, const Parts&... parts) {
  const XQueryScanner& scanner = sXQueryParserCurrent->scanner();
  const Ref<NSString> sourceLine = sXQueryParserCurrent->sourceLine(scanner.line());
  const Ref<NSString> text = row.message(parts..., sourceLine);
  logText(text);
  sXQueryParserCurrent->setError(
      XQueryError::error(row.number, text, scanner.line(), sourceLine, scanner.column()),
      scanner.span());
}

// A carriage return, with the line feed behind it if there is one, is one line feed.
template <class Bytes>
void appendWithLineFeeds(Bytes& out, std::string_view bytes, bool& isAfterReturn) {
  if (isAfterReturn && bytes.starts_with('\n')) bytes.remove_prefix(1);
  isAfterReturn = false;
  while (!bytes.empty()) {
    const size_t length = std::min(bytes.find('\r'), bytes.size());
    out.insert(out.end(), bytes.begin(), bytes.begin() + static_cast<ptrdiff_t>(length));
    bytes.remove_prefix(length);
    if (bytes.empty()) return;
    out.push_back('\n');
    bytes.remove_prefix(1);
    isAfterReturn = bytes.empty();
    if (bytes.starts_with('\n')) bytes.remove_prefix(1);
  }
}

}  // namespace

XQueryParser::Session::Session(XQueryParser& parser)
    : _parser(parser), _around(sXQueryParserCurrent) {
  parser._scanner = std::make_unique<XQueryScanner>(parser);
  parser._setterFlags = 0;
  sXQueryParserCurrent = &parser;
}

XQueryParser::Session::~Session() {
  _parser._scanner = nullptr;
  _parser._result = nullptr;
  _parser._pool = {};
  _parser._blocks = {};
  sXQueryParserCurrent = _around;
}

XQueryParser::XQueryParser(Ref<NSString> initWithSource, Ref<NSString> URL,
                           Ref<XQueryPlaces> places)
    : NSCounted(Kind::Internal),
      _source(std::move(initWithSource)),
      _places(places ? std::move(places) : XQueryPlaces::places()) {
  _places->beginModule(_source, std::move(URL));
}

Ref<XQueryParser> XQueryParser::unparsedParserWithSource(Ref<NSString> source, Ref<NSString> URL,
                                                         Ref<XQueryPlaces> places) {
  return make<XQueryParser>(std::move(source), std::move(URL), std::move(places));
}

Ref<XQueryParser> XQueryParser::parserWithSource(Ref<NSString> source, Ref<NSString> URL,
                                                 Ref<XQueryPlaces> places) {
  Ref<XQueryParser> parser =
      unparsedParserWithSource(std::move(source), std::move(URL), std::move(places));
  parser->parse();
  return parser;
}

XQueryParser* XQueryParser::currentParser() {
  return sXQueryParserCurrent;
}

void XQueryParser::setError(Ref<XQueryError> error, std::optional<XQuerySpan> at) {
  _errors.push_back(at ? placed(error, *at) : std::move(error));
}

Ref<XQueryError> XQueryParser::placed(const Ref<XQueryError>& error, XQuerySpan at) {
  return XQueryErrorTrace::error(*error,
                                 XQueryErrorTrace::traceInPlaces(_places, _places->add(at)));
}

void XQueryParser::setPlace(XQueryExpr& expr, XQuerySpan span) {
  if (expr.exprPlace() == 0) {
    expr.setExprPlace(_places->add(span));
  } else {
    _places->change(expr.exprPlace(), span);
  }
}

void XQueryParser::parse() {
  const Session session(*this);
  try {
    runGrammar();
  } catch (const NSException&) {
    // The scanner's own error was recorded before it was raised; any other ends the evaluation that
    // the parse is part of.
    _parsedModule = nullptr;
    if (_errors.empty()) throw;
  } catch (const std::bad_alloc&) {
    _parsedModule = nullptr;
    // Where it was a ceiling that refused the memory, this ends the evaluation.
    lookAtWork();
    setError(XQueryErrors::outOfMemory.error());
  } catch (const std::exception& failure) {
    _parsedModule = nullptr;
    setError(XQueryErrors::parserFailure.error(std::string_view(failure.what())));
  }
}

// A failed run may leave what an unfinished rule had built.
void XQueryParser::runGrammar() {
  _scanner->XQueryScannerInit(XQueryStateDEFAULT);
  if (XQparse(*this) != 0) return;
  _parsedModule = cast<XQueryParsedModule>(_result);
  if (_parsedModule) _parsedModule->setRemarks(std::move(_remarks));
}

// The source without a byte order mark at its start.
NSStringView XQueryParser::text() const {
  constexpr char16_t byteOrderMark = 0xFEFF;
  const NSStringView text = _source->view();
  return text.length() > 0 && text[0] == byteOrderMark ? text.substring(1) : text;
}

Ref<NSString> XQueryParser::sourceLine(int64_t index) const {
  const NSStringView text = this->text();
  WorkPacer pacer;
  uint32_t start = 0;
  for (uint32_t at = 0; index >= 0; ++at) {
    pacer.turn();
    const bool isAtEnd = at >= text.length();
    const char16_t unit = isAtEnd ? u'\n' : text[at];
    if (unit != u'\n' && unit != u'\r') continue;
    if (index == 0) return NSString::stringWithView(text.substring(start, at - start));
    if (isAtEnd) break;
    if (unit == u'\r' && at + 1 < text.length() && text[at + 1] == u'\n') ++at;
    start = at + 1;
    --index;
  }
  return NSString::empty();
}

void XQueryParser::makeUTF8String() {
  constexpr uint32_t unitsAtATime = 64 * 1024;
  constexpr uint32_t unitsPerStep = 4096;
  const NSStringView text = this->text();
  _utf8String.reserve(text.length());
  std::string bytes;
  bool isAfterReturn = false;
  for (uint32_t start = 0, end = 0; start < text.length(); start = end) {
    checkWork(unitsAtATime / unitsPerStep);
    end = std::min(text.length() - start, unitsAtATime) + start;
    // Both halves of a pair belong to one character.
    if (end < text.length() && (text[end - 1] & 0xFC00) == 0xD800) ++end;
    bytes.clear();
    text.substring(start, end - start).appendUTF8To(bytes);
    appendWithLineFeeds(_utf8String, bytes, isAfterReturn);
  }
  _length = _utf8String.size();
  _hasUTF8String = true;
}

size_t XQueryParser::remainingBytes() {
  if (!_hasUTF8String) makeUTF8String();
  return _length - _position;
}

size_t XQueryParser::readChars(size_t maxBytes, char* toBuffer) {
  const size_t count = std::min(maxBytes, remainingBytes());
  if (count > 0) std::memcpy(toBuffer, _utf8String.data() + _position, count);
  _position += count;
  // What was handed out is not kept twice.
  if (_position == _length) _utf8String = {};
  return count;
}

void* XQueryParser::allocate(size_t size) {
  try {
    return _blocks.emplace_back(size).data();
  } catch (const std::bad_alloc&) {
    // A ceiling ends more than the parse.
    lookAtWork();
    return nullptr;
  }
}

NSString* XQueryParserSting(std::string_view bytes) {
  return XQueryParserAutoRelease(NSString::stringWithUTF8(bytes));
}

void* XQueryParserAllocate(size_t size) {
  return sXQueryParserCurrent->allocate(size);
}

void XQerror(const char* message) {
  logAndRecord(XQueryErrors::invalidToken, message, sXQueryParserCurrent->scanner().tokenText());
}

void XQueryParseError(std::string_view message) {
  logAndRecord(XQueryErrors::scannerError, message);
}

void XQueryFatalError(const char* message) {
  record(XQueryErrors::parserFailure.error(message));
  throw NSException("XQueryLexFatalErr", NSString::stringWithUTF8(message));
}

void XQueryParserExtension(const Ref<NSString>& name, const Ref<NSString>& content, int64_t line) {
  XQueryParser& parser = *sXQueryParserCurrent;
  const auto error = XQueryErrors::mustUnderstandExtension.errorAtLine(line, name, content);
  parser.setError(error, parser.scanner().extensionSpan());
  logText(error->msg());
}

void XQueryParserPragma(const Ref<NSString>&, const Ref<NSString>&, int64_t) {}

void XQueryParser::XQueryParserSetSetterFlag(unsigned flag, int64_t line) {
  for (const SetterError& row : setterErrors) {
    if (row.flag != flag) continue;
    if (_setterFlags & flag) setError(row.text.errorAtLine(line), _span);
    _setterFlags |= flag;
    return;
  }
}

XQueryParse XQueryParseModule(const Ref<NSString>& source, const Ref<NSString>& URL,
                              const Ref<XQueryPlaces>& places) {
  const auto parser = XQueryParser::parserWithSource(source, URL, places);
  return {parser->parsedModule(), parser->errors()};
}

}  // namespace xquery
