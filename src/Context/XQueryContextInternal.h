// The dynamic context: variables, globals, focus, in-scope namespaces, the active prolog, the last
// error and what is kept from one evaluation to the next.
#pragma once

#include "Context/FailureTrace.h"
#include "Context/KeptValues.h"
#include "Context/XQueryFrame.h"
#include "Platform/Base/NSLog.h"
#include "Platform/Loading/NSURLLoader.h"
#include "Platform/Tree/Names.h"
#include "Prolog/XQueryNamespaceStack.h"
#include "Types/XQueryBaseURIs.h"
#include "Types/XQueryQName.h"
#include "xquery/Error.h"
#include "xquery/Exception.h"
#include "xquery/Object.h"
#include "xquery/XMLNode.h"
#include "xquery/XQuery.h"

#include <array>
#include <map>
#include <memory>
#include <string>
#include <unordered_map>
#include <vector>

namespace xquery {

class XQueryDate;
class XQueryProfileRecorder;
struct XQueryProfiledProgram;
class XQueryProlog;
class XQueryRegExCache;

// Whether the error says that a limit of the engine was reached. Such an error ends the evaluation
// even where others are passed over.
bool XQueryIsLimit(const XQueryError* error);

class XQueryContextInternal {
 public:
  // `owner` is what the host knows the context by.
  explicit XQueryContextInternal(XQueryContext& owner);
  ~XQueryContextInternal();
  // For one that takes the place of another: what the host set there.
  void takeSettings(XQueryContextInternal& of);

  // --- variables -------------------------------------------------------------------------------
  // Null for an ID below 1 or past the end; a slot that was never set holds NSNull.
  NSObject* variableForID(int64_t varID) const {
    return _variables ? _variables->valueForID(varID) : nullptr;
  }
  // The same, as it is held until a variable is set or the frame goes.
  const Value* variableSlotForID(int64_t varID) const {
    return _variables ? _variables->slotForID(varID) : nullptr;
  }
  // The value of a variable that is not read again in the call; the frame may let go of it.
  Value lastValueOfVariable(int64_t varID) {
    return _variables ? _variables->lastValueForID(varID) : Value();
  }
  // ID 0 is ignored.
  void setVariable(Value value, int64_t forID) {
    if (!_variables) _variables = make<XQueryFrame>();
    if (forID > 0) _variables->setValue(std::move(value), forID);
  }
  // The frame in force: null where no variable was set since one was taken away.
  XQueryFrameRef _inScopeVariables() const { return _variables; }
  void _setInScopeVariables(XQueryFrameRef variables) { _variables = std::move(variables); }
  // Installs the given frame and leaves the former one in its place.
  void _exchangeInScopeVariables(XQueryFrameRef& variables) { _variables.swap(variables); }
  NSObject* globalForQName(const XQueryQName& qName) const;
  void setGlobal(const Value& value, const Ref<XQueryQName>& forQName);
  void _clearGlobals();

  // --- static questions, answered by the active prolog ------------------------------------------
  XQueryProlog* activeProlog() const { return _prolog; }
  void setActiveProlog(XQueryProlog* prolog) { _prolog = prolog; }
  Ref<NSString> namespaceForPrefix(NSStringView prefix) const;
  Ref<NSString> namespaceForPrefix(NSStringView prefix, bool& fromProlog) const;
  Ref<NSString> defaultElementNamespace() const;
  Ref<NSString> defaultCollation() const;
  const Ref<NSString>& baseURI() const;
  bool xmlSpacePreserve() const;

  // --- focus -----------------------------------------------------------------------------------
  const Value& contextItem() const { return _contextItem; }
  int64_t position() const { return _position; }
  int64_t last() const { return _last; }
  void setContextItem(Value item, int64_t position) {
    _contextItem = std::move(item);
    _position = position;
  }
  void setLast(int64_t last) { _last = last; }

  bool ordered() const { return _ordered; }
  void setOrdered(bool ordered) { _ordered = ordered; }

  // --- namespaces ------------------------------------------------------------------------------
  void pushInScopeNamespaces(std::vector<Ref<NSXMLNode>> namespaces);
  void popInScopeNamespaces();
  // The innermost constructor's prefix for the URI, else the last of the active prolog's prefixes;
  // null when there is none.
  Ref<NSString> firstPrefixForNamespace(const Ref<NSString>& URI) const;
  // The innermost constructor's declaration of the prefix; null when none declares it.
  const NSXMLNode* inScopeNamespaceForPrefix(NSStringView prefix) const;
  // The name of a declaration of the prefix. Names are looked up under a lock, and constructors
  // declare the same few prefixes over and over.
  NSXMLNameRef declarationName(NSStringView prefix);
  Ref<NSString> contextNamespaceForPrefix(NSStringView prefix) const;
  bool hasDefaultNamespace() const {
    return !_contextNamespaces.empty() && _contextNamespaces.contains(std::string());
  }
  // A null URI removes the prefix.
  void addNamespace(const Ref<NSString>& URI, const Ref<NSString>& forPrefix);

  // --- base URIs of constructed nodes ------------------------------------------------------------
  // Does nothing when either is null. The record is kept by the node's tree and dies with it.
  void setBaseURI(const Ref<NSString>& URI, const NSXMLNode* forNode);
  Ref<NSString> baseURIForNode(const NSXMLNode* node);
  // How many nodes have ever been recorded, those that are gone included.
  size_t baseURINodeCount() const { return _baseURINodeCount; }

  // --- documents and bodies ----------------------------------------------------------------------
  // What the URL names, parsed as XML or HTML without text of white space only; NSNull when it
  // cannot be had. Fetched once: the first answer, a failure included, is the answer for good,
  // unless too many failures were forgotten.
  Value XQueryDocumentForURL(const Ref<NSURL>& URL);
  // The raw bytes; null when they cannot be had. What was loaded as a document, or could not be,
  // has none.
  Ref<NSData> URLBody(const Ref<NSURL>& URL);
  // Between evaluations and between records: forgets the failures when they take more than a
  // context may keep. Other documents are wanted again, but any number of URLs can be made up that
  // name nothing.
  void forgetManyFailures();
  NSURLLoader& loader() const { return *_loader; }
  void setLoading(const XQueryLoading& loading);

  // --- errors ----------------------------------------------------------------------------------
  const Ref<XQueryError>& error() const { return _error; }
  // Keeps the error (the last one wins) and, when asked, throws an NSException named "XQueryError"
  // whose reason is the error's description. With diagnostics on it is an assertion failure, logged
  // and thrown under a name of its own.
  void setError(Ref<XQueryError> error, bool raiseException);
  // For code that always raises. Who says where the error arose knows better than the expression
  // that is being evaluated.
  [[noreturn]] void raise(Ref<XQueryError> error);
  [[noreturn]] void raise(Ref<XQueryError> error, XQueryPlaceNumber at);

  // --- failing -----------------------------------------------------------------------------------
  // An error is on its way out from the expression that met it, which answered null, until somebody
  // passes over it or the evaluation has ended; nothing is evaluated meanwhile.
  bool isFailing() const { return _failure != Failure::None; }
  // For an expression, which answers what this answers: keeps the error like `raise` and throws
  // nothing. An error that has arisen before keeps its place.
  [[gnu::cold]] Value fail(Ref<XQueryError> error, XQueryPlaceNumber at);
  // The error that was kept last has been raised by an exception, which ends here.
  void failAsRaised(XQueryPlaceNumber at);
  // As yet without an error, for which there may be no memory before values are given back.
  void failForWantOfMemory(XQueryPlaceNumber at);
  // The failing passes a call on its way out.
  void failThroughCall(XQueryPlaceNumber at, const NSString* function) {
    _failureTrace.addCall(at, function);
  }
  // The error that is failing or has been thrown on, with its place and calls; with an error it is
  // that one which they are those of.
  Ref<XQueryError> tracedError() const { return traced(_error); }
  Ref<XQueryError> traced(const Ref<XQueryError>& error) const;
  // The error, which is not raised but answered as a value, with its place.
  Ref<XQueryError> placed(const Ref<XQueryError>& error, XQueryPlaceNumber at) const;
  // Whether the evaluation ends, since a limit was reached, where other errors are passed over.
  bool isFailingForGood() const {
    return _failure == Failure::WantOfMemory || (isFailing() && XQueryIsLimit(_error.get()));
  }
  // Ends the failing; the error kept is the one given from now on. Want of memory is thrown on.
  void passOverFailure(Ref<XQueryError> error);
  // Goes on as an exception, for code that cannot answer null.
  [[noreturn, gnu::cold]] void throwFailure();

  // The present of the first call, a dateTime; the same object at every later call.
  const Ref<XQueryDate>& currentDateTime();

  std::shared_ptr<XQueryClient> client() const { return _client; }
  void setClient(std::shared_ptr<XQueryClient> client) { _client = std::move(client); }

  // An evaluation against the context is under way as long as one of these lives; they may nest.
  class UnderWay {
   public:
    explicit UnderWay(XQueryContextInternal& context) : _context(context) {
      ++_context._evaluations;
    }
    ~UnderWay() { --_context._evaluations; }
    UnderWay(const UnderWay&) = delete;
    UnderWay& operator=(const UnderWay&) = delete;

   private:
    XQueryContextInternal& _context;
  };
  bool isEvaluating() const { return _evaluations > 0; }

  // Whether diagnostics show every error, as the environment said when the evaluation began. Asking
  // the environment takes longer than many an expression does.
  bool showsErrors() const { return _showsErrors; }
  void askForDiagnostics() { _showsErrors = XQueryLogEnabled(); }

  // What expressions keep for their next evaluation within this one of the query.
  XQueryKeptValues& keptValues() { return _keptValues; }
  // This and all else that is kept for the rest of an evaluation.
  void clearKept() {
    _keptValues.clear();
    _baseURIs.clear();
    _declarationNames = {};
  }
  // The regular expressions compiled last; null until the first one.
  std::shared_ptr<XQueryRegExCache>& regExCache() { return _regExCache; }

  // What the expressions of the query cost that was compiled to be profiled and evaluated last;
  // null when there was none.
  XQueryProfileRecorder* profile() const { return _profile.get(); }
  // Goes on with the profile of that program, or begins a new one.
  XQueryProfileRecorder& profileOf(std::shared_ptr<const XQueryProfiledProgram> program,
                                   size_t counters);

  const XQueryLimits& limits() const { return _limits; }
  void setLimits(XQueryLimits limits) { _limits = std::move(limits); }

  // Always null: external functions cannot be bound.
  Value XQueryExternalFunctionForQName(const XQueryQName& qName) const;

 private:
  enum class Failure : uint8_t { None, Error, WantOfMemory };

  // Null, with the reason, when it cannot be had.
  Ref<NSXMLDocument> loadDocument(const NSURL& URL, std::string& reason);
  void tellOfMissingDocument(const NSURL& URL, std::string reason);

  XQueryContext& _owner;
  XQueryFrameRef _variables;
  XQueryNamespaceStack _inScopeNamespaces;
  std::array<NSXMLNameRef, 4> _declarationNames;  // those asked for last
  size_t _oldestDeclarationName = 0;
  const uint64_t _baseURIOwner;  // this context's number among those that record base URIs
  size_t _baseURINodeCount = 0;
  // The URI given last, and a copy of it that refers to no tree.
  Ref<NSString> _givenBaseURI;
  Ref<NSString> _recordedBaseURI;
  std::unordered_map<Ref<XQueryQName>, Value, XQueryQNameHash, XQueryQNameEqual> _globals;
  std::map<std::string, Ref<NSString>> _contextNamespaces;
  Ref<NSURLLoader> _loader;
  NSURLTable<Value> _documentCache;  // documents, NSNull for failures
  size_t _failureBytes = 0;          // of URLs that named no document
  NSURLTable<Ref<NSURLHandle>> _URLCache;
  XQueryKeptValues _keptValues;
  XQueryBaseURIs _baseURIs;
  std::unique_ptr<XQueryProfileRecorder> _profile;
  Ref<XQueryError> _error;
  Ref<XQueryDate> _currentDateTime;
  XQueryProlog* _prolog = nullptr;
  std::shared_ptr<XQueryClient> _client;
  XQueryLimits _limits;
  std::shared_ptr<XQueryRegExCache> _regExCache;
  Value _contextItem;
  int64_t _position = 0;
  int64_t _last = 0;
  uint32_t _evaluations = 0;
  bool _ordered = true;
  bool _showsErrors = XQueryLogEnabled();
  Failure _failure = Failure::None;
  bool _isThrownOn = false;  // the failing has a place already, and goes on as an exception
  XQueryFailureTrace _failureTrace;
};

// What a context is to the engine.
struct XQueryContextShell {
  static XQueryContextInternal& internal(const XQueryContext& context) { return *context._private; }
};
inline XQueryContextInternal& _internal(const XQueryContext& context) {
  return XQueryContextShell::internal(context);
}

// Hands a traced value to the client, or to the log where there is none.
void _traceValue(XQueryContext& context, const Value& value, const Ref<NSString>& forLabel);

// Whether the expression that answered this has met an error.
inline bool XQueryHasFailed(const Value& answer, const XQueryContext& context) {
  return !answer && _internal(context).isFailing();
}

}  // namespace xquery
