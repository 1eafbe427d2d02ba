#include "Context/XQueryContextInternal.h"

#include "Context/ProfileRecorder.h"
#include "Platform/Base/NSLog.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Base/XQueryErrorTrace.h"
#include "Platform/Tree/Arena.h"
#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryProlog.h"
#include "Types/TypesContext.h"
#include "Types/XQueryDate.h"
#include "Types/XQueryNodeFunctions.h"
#include "xquery/Collection.h"
#include "xquery/Exception.h"

#include <atomic>
#include <new>
#include <utility>

namespace xquery {

bool XQueryIsLimit(const XQueryError* error) {
  return error && error->category() == XQueryErrorCategory::Limit;
}

namespace {

uint64_t nextBaseURIOwner() {
  static std::atomic<uint64_t> last = 0;
  return ++last;
}

}  // namespace

XQueryContextInternal::XQueryContextInternal(XQueryContext& owner)
    : _owner(owner), _baseURIOwner(nextBaseURIOwner()), _loader(NSURLLoader::loaderWithLoading()) {}

XQueryContextInternal::~XQueryContextInternal() = default;

void XQueryContextInternal::takeSettings(XQueryContextInternal& of) {
  setLoading(of.loader().loading());  // the one that may find no memory
  _contextNamespaces = std::move(of._contextNamespaces);
  _client = std::move(of._client);
  _limits = std::move(of._limits);
}

NSObject* XQueryContextInternal::globalForQName(const XQueryQName& qName) const {
  const auto found = _globals.find(qName);
  return found == _globals.end() ? nullptr : found->second.get();
}

void XQueryContextInternal::setGlobal(const Value& value, const Ref<XQueryQName>& forQName) {
  _keptValues.noteGlobalChange();
  _globals[forQName] = value;
}

void XQueryContextInternal::_clearGlobals() {
  _globals.clear();
}

Ref<NSString> XQueryContextInternal::namespaceForPrefix(NSStringView prefix) const {
  return _prolog ? _prolog->namespaceForPrefix(prefix) : Ref<NSString>();
}

Ref<NSString> XQueryContextInternal::namespaceForPrefix(NSStringView prefix,
                                                        bool& fromProlog) const {
  return _prolog ? _prolog->namespaceForPrefix(prefix, fromProlog) : Ref<NSString>();
}

Ref<NSString> XQueryContextInternal::defaultElementNamespace() const {
  return _prolog ? _prolog->defaultElementNamespace() : Ref<NSString>();
}

Ref<NSString> XQueryContextInternal::defaultCollation() const {
  return _prolog ? _prolog->defaultCollation() : Ref<NSString>();
}

const Ref<NSString>& XQueryContextInternal::baseURI() const {
  static const Ref<NSString> none;
  return _prolog ? _prolog->baseURI() : none;
}

bool XQueryContextInternal::xmlSpacePreserve() const {
  return _prolog && _prolog->xmlSpacePreserve();
}

void XQueryContextInternal::pushInScopeNamespaces(std::vector<Ref<NSXMLNode>> namespaces) {
  _inScopeNamespaces.push(std::move(namespaces));
}

void XQueryContextInternal::popInScopeNamespaces() {
  _inScopeNamespaces.pop();
}

Ref<NSString> XQueryContextInternal::firstPrefixForNamespace(const Ref<NSString>& URI) const {
  if (!URI) return {};
  if (const NSXMLNode* declaration = _inScopeNamespaces.forURI(URI->view())) {
    return declaration->name();
  }
  if (!_prolog) return {};
  const Value prefixes = _prolog->prefixesForID(_prolog->namespaceID(URI));
  if (const auto* several = dyn_cast<NSArray>(prefixes)) {
    return several->count() ? cast<NSString>(several->objects().back()) : nullptr;
  }
  return dyn_cast<NSString>(prefixes);
}

const NSXMLNode* XQueryContextInternal::inScopeNamespaceForPrefix(NSStringView prefix) const {
  return _inScopeNamespaces.forPrefix(prefix);
}

NSXMLNameRef XQueryContextInternal::declarationName(NSStringView prefix) {
  for (const NSXMLNameRef& name : _declarationNames) {
    if (name && name->text == prefix) return name;
  }
  NSXMLNameRef& place = _declarationNames[_oldestDeclarationName];
  _oldestDeclarationName = (_oldestDeclarationName + 1) % _declarationNames.size();
  return place = NSXMLNameRef(prefix, NSStringView());
}

Ref<NSString> XQueryContextInternal::contextNamespaceForPrefix(NSStringView prefix) const {
  const auto found = _contextNamespaces.find(prefix.utf8());
  return found == _contextNamespaces.end() ? Ref<NSString>() : found->second;
}

void XQueryContextInternal::addNamespace(const Ref<NSString>& URI, const Ref<NSString>& forPrefix) {
  if (URI) {
    _contextNamespaces[forPrefix->utf8()] = URI;
  } else {
    _contextNamespaces.erase(forPrefix->utf8());
  }
}

// One copy serves all nodes that are recorded with the same URI in a row.
void XQueryContextInternal::setBaseURI(const Ref<NSString>& URI, const NSXMLNode* forNode) {
  if (!URI || !forNode) return;
  if (!(_givenBaseURI == URI)) {
    _recordedBaseURI = NSString::stringWithView(URI->view());
    _givenBaseURI = URI;
  }
  if (NSXMLTree::recordBaseURI(forNode, _baseURIOwner, _recordedBaseURI)) ++_baseURINodeCount;
}

Ref<NSString> XQueryContextInternal::baseURIForNode(const NSXMLNode* node) {
  if (!node) return {};
  Ref<NSString> own = _baseURIs.ofNode(node);
  if ((own && own->length() > 0) || _baseURINodeCount == 0) return own;
  return NSXMLTree::recordedBaseURI(node, _baseURIOwner);
}

const Ref<XQueryDate>& XQueryContextInternal::currentDateTime() {
  if (!_currentDateTime) _currentDateTime = XQueryDate::currentDateTime();
  return _currentDateTime;
}

namespace {

Ref<NSString> reasonOf(const Ref<XQueryError>& error) {
  return error ? error->description() : Ref<NSString>();
}

// With diagnostics on an error goes through the assertion handler, which logs it and throws under a
// name of its own.
void logAsAssertionFailure(const Ref<XQueryError>& error) {
  const Ref<NSString> reason = reasonOf(error);
  NSLog(
      "*** Assertion failure in -[XQueryContextInternal setError:raiseException:], "
      "Eval/XQueryContextInternal:288: " +
      (reason ? reason->utf8() : std::string("(null)")));
}

[[noreturn]] void throwError(const Ref<XQueryError>& error) {
  throw NSException(XQueryLogEnabled() ? "NSInternalInconsistencyException" : "XQueryError",
                    reasonOf(error));
}

}  // namespace

void XQueryContextInternal::setError(Ref<XQueryError> error, bool raiseException) {
  _error = std::move(error);
  _isThrownOn = false;
  if (!raiseException) return;
  if (XQueryLogEnabled()) logAsAssertionFailure(_error);
  throwError(_error);
}

Value XQueryContextInternal::fail(Ref<XQueryError> error, XQueryPlaceNumber at) {
  _error = std::move(error);
  _failureTrace.begin(at);
  if (XQueryLogEnabled()) logAsAssertionFailure(_error);
  _failure = Failure::Error;
  return {};
}

void XQueryContextInternal::failAsRaised(XQueryPlaceNumber at) {
  if (!std::exchange(_isThrownOn, false)) _failureTrace.begin(at);
  _failure = Failure::Error;
}

void XQueryContextInternal::failForWantOfMemory(XQueryPlaceNumber at) {
  if (!std::exchange(_isThrownOn, false)) _failureTrace.begin(at);
  _failure = Failure::WantOfMemory;
}

Ref<XQueryError> XQueryContextInternal::traced(const Ref<XQueryError>& error) const {
  if (!error || !_prolog || !(isFailing() || _isThrownOn)) return error;
  return _failureTrace.on(*error, _prolog->modules().places());
}

Ref<XQueryError> XQueryContextInternal::placed(const Ref<XQueryError>& error,
                                               XQueryPlaceNumber at) const {
  if (!_prolog || XQueryErrorTrace::of(*error)) return error;
  return XQueryErrorTrace::error(*error,
                                 XQueryErrorTrace::traceInPlaces(_prolog->modules().places(), at));
}

void XQueryContextInternal::passOverFailure(Ref<XQueryError> error) {
  if (std::exchange(_failure, Failure::None) == Failure::WantOfMemory) throw std::bad_alloc();
  _error = std::move(error);
}

void XQueryContextInternal::throwFailure() {
  _isThrownOn = true;
  if (std::exchange(_failure, Failure::None) == Failure::WantOfMemory) throw std::bad_alloc();
  throwError(_error);
}

void XQueryContextInternal::raise(Ref<XQueryError> error) {
  setError(std::move(error), true);
  __builtin_unreachable();
}

void XQueryContextInternal::raise(Ref<XQueryError> error, XQueryPlaceNumber at) {
  _error = std::move(error);
  if (XQueryLogEnabled()) logAsAssertionFailure(_error);
  _failureTrace.begin(at);
  _isThrownOn = at != 0;
  throwError(_error);
}

void XQueryRaise(XQueryContext& context, Ref<XQueryError> error) {
  _internal(context).raise(std::move(error));
}

Ref<NSString> XQueryDefaultElementNamespace(const XQueryContext& context) {
  return _internal(context).defaultElementNamespace();
}

Ref<NSString> XQueryNamespaceForPrefix(const XQueryContext& context, NSStringView prefix) {
  return _internal(context).namespaceForPrefix(prefix);
}

XQueryProfileRecorder& XQueryContextInternal::profileOf(
    std::shared_ptr<const XQueryProfiledProgram> program, size_t counters) {
  if (!_profile || _profile->program() != program) {
    _profile = std::make_unique<XQueryProfileRecorder>(std::move(program), counters);
  }
  return *_profile;
}

Value XQueryContextInternal::XQueryExternalFunctionForQName(const XQueryQName&) const {
  return {};
}

}  // namespace xquery
