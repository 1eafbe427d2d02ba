// The parser driver: turns the text of one query or library module into an XQueryParsedModule and a
// list of errors.
//
// All that a parse works on belongs to its parser, so any number of threads may parse at once.
// While a parser parses, it is the current one of its thread: the builders of the grammar leave
// their objects in its autorelease pool.
#pragma once

#include "Parser/XQueryScanner.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Base/XQueryPlaces.h"
#include "Prolog/XQueryParsedModule.h"
#include "xquery/Error.h"
#include "xquery/Exception.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace xquery {

// The bits of the prolog setters seen so far in the current parse.
enum XQuerySetterFlag : unsigned {
  XQuerySetterXMLSpace = 1,
  XQuerySetterDefaultCollation = 2,
  XQuerySetterBaseURI = 4,
  XQuerySetterConstruction = 8,
  XQuerySetterOrdering = 16,
  XQuerySetterEmptyOrdering = 32,
  XQuerySetterInheritNamespaces = 64,
};

class XQueryParser : public NSCounted {
 public:
  // Parses at once: a parser is read-only afterwards. A compilation has failed when there are
  // errors, whatever module there is. The places of what it makes are added to those of a module at
  // that URL, which may be null; without any given they have a table of their own.
  [[nodiscard]] static Ref<XQueryParser> parserWithSource(Ref<NSString> source,
                                                          Ref<NSString> URL = nullptr,
                                                          Ref<XQueryPlaces> places = nullptr);

  // Null when parsing failed, and for a query of nothing but white space and comments.
  const Ref<XQueryParsedModule>& parsedModule() const { return _parsedModule; }
  const std::vector<Ref<XQueryError>>& errors() const { return _errors; }
  const Ref<NSString>& source() const { return _source; }
  // The line of the source, counted from 0; the empty string outside.
  Ref<NSString> sourceLine(int64_t index) const;
  const Ref<XQueryPlaces>& places() const { return _places; }
  // Without the second argument the place is not known.
  void setError(Ref<XQueryError> error, std::optional<XQuerySpan> at = std::nullopt);
  // That of this thread; null outside a parse.
  static XQueryParser* currentParser();

  // Copies the next bytes of the source's UTF-8 form, in which every line ends with a line feed and
  // no byte order mark stands at the start; answers how many, 0 at the end.
  size_t readChars(size_t maxBytes, char* toBuffer);
  // Bytes that readChars has still to hand out.
  size_t remainingBytes();

  // --- while it parses ---------------------------------------------------------------------------
  XQueryScanner& scanner() { return *_scanner; }
  // The value of the grammar's start symbol: a module, or null for a query of nothing.
  void setResult(NSObject* module) { _result = module; }
  // Notes what the expressions will not tell.
  void remark(XQueryRemark remark) { _remarks.push_back(std::move(remark)); }
  // What the production that is at work stands for.
  void setSpan(XQuerySpan span) { _span = span; }
  XQuerySpan span() const { return _span; }
  // The error, known to have arisen there.
  Ref<XQueryError> placed(const Ref<XQueryError>& error) { return placed(error, _span); }
  Ref<XQueryError> placed(const Ref<XQueryError>& error, XQuerySpan at);
  // Gives the expression or prolog item that place, instead of one that it has.
  void setPlace(XQueryExpr& expr, XQuerySpan span);
  void setPlace(XQueryPrologItem& item) { item.setPlace(_places->add(_span)); }
  // The second declaration of one kind is an error at its line; an unknown flag is ignored.
  void XQueryParserSetSetterFlag(unsigned flag, int64_t line);
  // Keeps the object alive until the parse ends. One token may complete any number of expressions,
  // so this is looked at as work.
  void autorelease(Value object) {
    checkWork();
    _pool.push_back(std::move(object));
  }
  // Memory that lives as long; null when there is none.
  void* allocate(size_t size);

  // Makes a parser the current one of its thread and gives it a scanner.
  class Session {
   public:
    explicit Session(XQueryParser& parser);
    ~Session();
    Session(const Session&) = delete;
    Session& operator=(const Session&) = delete;

   private:
    XQueryParser& _parser;
    XQueryParser* const _around;  // the one that was current before
  };
  // A parser that has not parsed, for driving the scanner alone.
  [[nodiscard]] static Ref<XQueryParser> unparsedParserWithSource(
      Ref<NSString> source, Ref<NSString> URL = nullptr, Ref<XQueryPlaces> places = nullptr);

 protected:
  XQueryParser(Ref<NSString> initWithSource, Ref<NSString> URL, Ref<XQueryPlaces> places);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  template <class T>
  using Counted = std::vector<T, ValueAllocator<T>>;

  void parse();
  void runGrammar();
  void makeUTF8String();
  NSStringView text() const;

  std::vector<Ref<XQueryError>> _errors;
  Ref<NSString> _source;
  Counted<char> _utf8String;
  Ref<XQueryParsedModule> _parsedModule;
  size_t _length = 0;
  size_t _position = 0;
  bool _hasUTF8String = false;
  unsigned _setterFlags = 0;
  XQueryRemarks _remarks;
  Ref<XQueryPlaces> _places;
  XQuerySpan _span;
  NSObject* _result = nullptr;  // owned by the pool
  std::unique_ptr<XQueryScanner> _scanner;
  Counted<Value> _pool;
  std::vector<Counted<char>> _blocks;
};

// --- what the scanner and the grammar call; each works on the current parser ---------------------

// A string owned by the parser's pool. The name lacks its "r".
NSString* XQueryParserSting(std::string_view bytes);
template <class T>
T* XQueryParserAutoRelease(Ref<T> object) {
  T* result = object.get();
  if (result) XQueryParser::currentParser()->autorelease(Value(std::move(object)));
  return result;
}
// Memory that lives as long as the parse; null when there is none.
void* XQueryParserAllocate(size_t size);

// A syntax error: error 3 with the current token, the current line and its text.
void XQerror(const char* message);
// An error of the scanner: error 3 with the current line and its text.
void XQueryParseError(std::string_view message);
// A failure of the generated scanner: error 3 without a line, and an NSException named
// "XQueryLexFatalErr" that ends the parse.
[[noreturn]] void XQueryFatalError(const char* message);
// Every extension is rejected (error 14), every pragma accepted and ignored.
void XQueryParserExtension(const Ref<NSString>& name, const Ref<NSString>& content, int64_t line);
void XQueryParserPragma(const Ref<NSString>& name, const Ref<NSString>& content, int64_t line);

}  // namespace xquery
