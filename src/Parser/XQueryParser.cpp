#include "Parser/XQueryParser.h"

#include "Parser/XQueryScanner.h"
#include "Parser/XQueryTokens.h"
#include "Platform/Base/NSLog.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryErrors.h"

#include <algorithm>
#include <chrono>
#include <climits>
#include <condition_variable>
#include <cstring>
#include <exception>
#include <mutex>
#include <new>

namespace xquery {
namespace {

// The process-wide lock. Whoever waits for it can be ended. It is made of a mutex and a condition
// because ThreadSanitizer does not see every way in which the library locks a timed mutex.
class ParserLock {
 public:
  void lock() {
    constexpr std::chrono::milliseconds betweenLooks(20);
    std::unique_lock guard(_mutex);
    while (_isTaken) {
      _released.wait_for(guard, betweenLooks);
      if (!_isTaken) break;
      guard.unlock();
      lookAtWork();
      guard.lock();
    }
    _isTaken = true;
  }
  void unlock() {
    {
      const std::lock_guard guard(_mutex);
      _isTaken = false;
    }
    _released.notify_one();
  }

 private:
  std::mutex _mutex;
  std::condition_variable _released;
  bool _isTaken = false;
};

ParserLock& parserLock() {
  // Never destroyed: queries may be compiled by destructors that run at exit.
  alignas(ParserLock) static unsigned char storage[sizeof(ParserLock)];
  static ParserLock* const sXQueryParserLock = ::new (storage) ParserLock;
  return *sXQueryParserLock;
}

XQueryParser* sXQueryParserCurrent = nullptr;
unsigned sXQueryParserSetterFlags = 0;

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

// At the current line; the text comes first in the log, then the error.
template <size_t places, class... Parts>
void logAndRecord(const XQueryErrorText<places>& row, const Parts&... parts) {
  const Ref<NSString> text = row.message(parts...);
  logText(text);
  sXQueryParserCurrent->setError(XQueryError::error(row.number, text, XQlineno));
}

Ref<NSString> currentSourceLine() {
  return sXQueryParserCurrent->sourceLine(XQlineno);
}

}  // namespace

NSObject* yyparse_result = nullptr;

// An evaluation that compiles a query may be ended while it waits for another thread's parse.
XQueryParser::Session::Session(XQueryParser& parser) : _parser(parser) {
  parserLock().lock();
  sXQueryParserCurrent = &parser;
  sXQueryParserSetterFlags = 0;
}

XQueryParser::Session::~Session() {
  XQueryScannerEnd();
  yyparse_result = nullptr;
  _parser._pool.clear();
  _parser._blocks.clear();
  sXQueryParserCurrent = nullptr;
  parserLock().unlock();
}

Ref<XQueryParser> XQueryParser::unparsedParserWithSource(Ref<NSString> source) {
  return make<XQueryParser>(std::move(source));
}

Ref<XQueryParser> XQueryParser::parserWithSource(Ref<NSString> source) {
  Ref<XQueryParser> parser = unparsedParserWithSource(std::move(source));
  parser->parse();
  return parser;
}

XQueryParser* XQueryParser::currentParser() {
  return sXQueryParserCurrent;
}

void XQueryParser::parse() {
  const Session session(*this);
  try {
    XQueryScannerInit(XQueryStateDEFAULT);
    yyparse_result = nullptr;
    // A failed run may leave what an unfinished rule had built.
    if (XQparse() == 0) _parsedModule = cast<XQueryParsedModule>(yyparse_result);
  } catch (const NSException&) {
    // The scanner's own error was recorded before it was raised; any other ends the evaluation that
    // the parse is part of.
    _parsedModule = nullptr;
    if (_errors.empty()) throw;
  } catch (const std::bad_alloc&) {
    _parsedModule = nullptr;
    setError(XQueryErrors::outOfMemory.error());
  } catch (const std::exception& failure) {
    _parsedModule = nullptr;
    setError(XQueryErrors::parserFailure.error(std::string_view(failure.what())));
  }
}

Ref<NSString> XQueryParser::sourceLine(int64_t index) {
  if (_sourceLines.empty()) {
    const NSStringView text = _source->view();
    for (uint32_t start = 0;;) {
      const uint32_t end = text.find(u'\n', start);
      if (end == NSStringView::notFound) {
        _sourceLines.push_back(NSString::stringWithView(text.substring(start)));
        break;
      }
      _sourceLines.push_back(NSString::stringWithView(text.substring(start, end - start)));
      start = end + 1;
    }
  }
  if (index < 0 || static_cast<uint64_t>(index) >= _sourceLines.size()) return NSString::empty();
  return _sourceLines[static_cast<size_t>(index)];
}

size_t XQueryParser::remainingBytes() {
  if (!_hasUTF8String) {
    _utf8String = _source->utf8();
    _length = _utf8String.size();
    _hasUTF8String = true;
  }
  return _length - _position;
}

size_t XQueryParser::readChars(size_t maxBytes, char* toBuffer) {
  const size_t count = std::min(maxBytes, remainingBytes());
  std::memcpy(toBuffer, _utf8String.data() + _position, count);
  _position += count;
  return count;
}

void* XQueryParser::allocate(size_t size) {
  _blocks.push_back(std::make_unique_for_overwrite<char[]>(size));
  return _blocks.back().get();
}

size_t XQueryParserReadChars(char* buffer, size_t maxBytes) {
  return sXQueryParserCurrent->readChars(maxBytes, buffer);
}

NSString* XQueryParserSting(std::string_view bytes) {
  return XQueryParserAutoRelease(NSString::stringWithUTF8(bytes));
}

void* XQueryParserAllocate(size_t size) {
  return sXQueryParserCurrent->allocate(size);
}

void XQerror(const char* message) {
  logAndRecord(XQueryErrors::invalidToken, message, XQScannerTokenText(), currentSourceLine());
}

void XQueryParseError(std::string_view message) {
  logAndRecord(XQueryErrors::scannerError, message, currentSourceLine());
}

void XQueryFatalError(const char* message) {
  record(XQueryErrors::parserFailure.error(message));
  throw NSException("XQueryLexFatalErr", NSString::stringWithUTF8(message));
}

void XQueryParserExtension(const Ref<NSString>& name, const Ref<NSString>& content, int64_t line) {
  record(XQueryErrors::mustUnderstandExtension.errorAtLine(line, name, content));
}

void XQueryParserPragma(const Ref<NSString>&, const Ref<NSString>&, int64_t) {}

void XQueryParserSetSetterFlag(unsigned flag, int64_t line) {
  for (const SetterError& row : setterErrors) {
    if (row.flag != flag) continue;
    if (sXQueryParserSetterFlags & flag) {
      sXQueryParserCurrent->setError(row.text.errorAtLine(line));
    }
    sXQueryParserSetterFlags |= flag;
    return;
  }
}

XQueryParse XQueryParseModule(const Ref<NSString>& source) {
  const auto parser = XQueryParser::parserWithSource(source);
  return {parser->parsedModule(), parser->errors()};
}

}  // namespace xquery
