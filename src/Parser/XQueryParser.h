// The parser driver: turns the text of one query or library module into an XQueryParsedModule and a
// list of errors.
//
// The generated scanner and parser keep their state in globals. One process-wide lock, held for the
// whole of each parse, makes them safe to use from several threads; while it is held, the parser
// that holds it is the current one, through which the scanner reads its input, reports errors and
// leaves its objects in an autorelease pool.
#pragma once

#include "Prolog/XQueryParsedModule.h"
#include "xquery/Error.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstdint>
#include <memory>
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
  // errors, whatever module there is.
  [[nodiscard]] static Ref<XQueryParser> parserWithSource(Ref<NSString> source);

  // Null when parsing failed, and for a query of nothing but white space and comments.
  const Ref<XQueryParsedModule>& parsedModule() const { return _parsedModule; }
  const std::vector<Ref<XQueryError>>& errors() const { return _errors; }
  const Ref<NSString>& source() const { return _source; }
  // The line of the source, counted from 0 and split at "\n"; the empty string outside.
  Ref<NSString> sourceLine(int64_t index);
  void setError(Ref<XQueryError> error) { _errors.push_back(std::move(error)); }
  static XQueryParser* currentParser();

  // Copies the next bytes of the source's UTF-8 form; answers how many, 0 at the end.
  size_t readChars(size_t maxBytes, char* toBuffer);
  // Bytes that readChars has still to hand out.
  size_t remainingBytes();

  // Keeps the object alive until the parse ends.
  void autorelease(Value object) { _pool.push_back(std::move(object)); }
  void* allocate(size_t size);

  // Makes a parser the current one and the caller the owner of the process-wide lock.
  class Session {
   public:
    explicit Session(XQueryParser& parser);
    ~Session();
    Session(const Session&) = delete;
    Session& operator=(const Session&) = delete;

   private:
    XQueryParser& _parser;
  };
  // A parser that has not parsed, for driving the scanner alone.
  [[nodiscard]] static Ref<XQueryParser> unparsedParserWithSource(Ref<NSString> source);

 protected:
  explicit XQueryParser(Ref<NSString> initWithSource)
      : NSCounted(Kind::Internal), _source(std::move(initWithSource)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  void parse();

  std::vector<Ref<XQueryError>> _errors;
  Ref<NSString> _source;
  std::vector<Ref<NSString>> _sourceLines;
  std::string _utf8String;
  Ref<XQueryParsedModule> _parsedModule;
  size_t _length = 0;
  size_t _position = 0;
  bool _hasUTF8String = false;
  std::vector<Value> _pool;
  std::vector<std::unique_ptr<char[]>> _blocks;
};

// The value of the last grammar run; owned by the current parser's pool.
extern NSObject* yyparse_result;

// --- what the scanner and the grammar call; each works on the current parser ---------------------

size_t XQueryParserReadChars(char* buffer, size_t maxBytes);
// A string owned by the parser's pool. The name lacks its "r".
NSString* XQueryParserSting(std::string_view bytes);
template <class T>
T* XQueryParserAutoRelease(Ref<T> object) {
  T* result = object.get();
  if (result) XQueryParser::currentParser()->autorelease(Value(std::move(object)));
  return result;
}
// Memory that lives as long as the current parser.
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
// The second declaration of one kind is an error at its line; an unknown flag is ignored.
void XQueryParserSetSetterFlag(unsigned flag, int64_t line);

}  // namespace xquery
