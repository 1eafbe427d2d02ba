// The exported classes: thin shells over their private objects, and the evaluation driver.
#include "xquery/XQuery.h"

#include "Context/LimitWatch.h"
#include "Context/XQueryContextInternal.h"
#include "Context/XQueryGlobals.h"
#include "Engine/BaseURIDecoration.h"
#include "Engine/XQueryInternal.h"
#include "Expr/XQuerySequence.h"
#include "Plan/Profile/XQueryProfiledProgram.h"
#include "Plan/Report.h"
#include "Platform/Base/HostFailure.h"
#include "Platform/Base/LastingObjects.h"
#include "Platform/Base/NSLog.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Credit.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryValues.h"
#include "xquery/Exception.h"
#include "xquery/XMLNode.h"

#include <algorithm>
#include <functional>
#include <new>
#include <stdexcept>

namespace xquery {

namespace {

using Internal = std::unique_ptr<XQueryInternal>;

Internal failed(Ref<XQueryError> error) {
  return std::make_unique<XQueryInternal>(std::move(error));
}

bool isLimited(const XQueryLimits& limits) {
  return limits.duration || limits.deadline || limits.cancelled || limits.memoryCeiling;
}

Internal compiledWithin(const XQueryLimits& limits, const std::function<Internal()>& compile) {
  XQueryLimitWatch watch(limits);
  try {
    watch.lookAtWork();
    Internal query = compile();
    watch.lookAtWork();
    return query;
  } catch (const NSException&) {
    if (!watch.error()) throw;
    return failed(watch.error());
  } catch (const std::bad_alloc&) {
    return failed(watch.allocationFailure().error());
  }
}

// Without limits of its own a compilation that is part of an evaluation ends with that one.
Internal compiled(const XQueryLimits& limits, const std::function<Internal()>& compile) {
  const LastingObjects lasting;
  try {
    return isLimited(limits) ? compiledWithin(limits, compile) : compile();
  } catch (const HostFailure& failure) {
    failure.giveBack();
  } catch (const std::bad_alloc&) {
    lookAtWork();
    return failed(XQueryErrors::outOfMemory.error());
  }
}

}  // namespace

Ref<XQuery> XQuery::xqueryWithSource(const Ref<NSString>& source) {
  return xqueryWithSource(source, XQueryLoading());
}

Ref<XQuery> XQuery::xqueryWithSource(std::string_view source) {
  return xqueryWithSource(source, XQueryLoading());
}

Ref<XQuery> XQuery::xqueryWithSource(const Ref<NSString>& source, const XQueryLoading& loading) {
  return xqueryWithSource(source, loading, XQueryLimits());
}

Ref<XQuery> XQuery::xqueryWithSource(std::string_view source, const XQueryLoading& loading) {
  return xqueryWithSource(source, loading, XQueryLimits());
}

Ref<XQuery> XQuery::xqueryWithSource(const Ref<NSString>& source, const XQueryLoading& loading,
                                     const XQueryLimits& limits) {
  return xqueryWithSource(source, loading, limits, XQueryWay::Planned);
}

Ref<XQuery> XQuery::xqueryWithSource(const Ref<NSString>& source, const XQueryLoading& loading,
                                     const XQueryLimits& limits, XQueryWay way) {
  return make<XQuery>(compiled(limits, [&] {
    if (!source) return failed(XQueryErrors::noSource.error());
    return std::make_unique<XQueryInternal>(source, loading, way);
  }));
}

Ref<XQuery> XQuery::xqueryWithSource(std::string_view source, const XQueryLoading& loading,
                                     const XQueryLimits& limits) {
  return xqueryWithSource(source, loading, limits, XQueryWay::Planned);
}

// Making a string of the text is part of the work.
Ref<XQuery> XQuery::xqueryWithSource(std::string_view source, const XQueryLoading& loading,
                                     const XQueryLimits& limits, XQueryWay way) {
  return make<XQuery>(compiled(limits, [&] {
    const auto text = NSString::stringWithUTF8(source);
    if (!text) return failed(XQueryErrors::notUTF8.error());
    return std::make_unique<XQueryInternal>(text, loading, way);
  }));
}

XQuery::XQuery(std::unique_ptr<XQueryInternal> internal)
    : NSCounted(Kind::Query), _private(std::move(internal)) {}

XQuery::~XQuery() {
  const LastingObjects lasting;
  _private.reset();
}

Ref<NSArray> XQuery::parseErrors() const {
  if (!_private->isError()) return {};
  const auto& errors = _private->errors();
  return NSArray::arrayWithObjects(std::vector<Value>(errors.begin(), errors.end()));
}

std::vector<XQueryWarning> XQueryWarnings(const XQuery& query) {
  return _internal(query).warnings();
}

Ref<NSString> XQuery::planDescription(XQueryPlanFormat format) const {
  const XQueryPlanReport* report = _private->planReport();
  if (!report) return {};
  switch (format) {
    case XQueryPlanFormat::JSON:
      return NSString::stringWithUTF8(report->JSON());
    case XQueryPlanFormat::DOT:
      return NSString::stringWithUTF8(report->DOT());
    case XQueryPlanFormat::Text:
      break;
  }
  return NSString::stringWithUTF8(report->text());
}

Ref<XQueryContext> XQueryContext::xqueryContext() {
  return make<XQueryContext>();
}

Ref<XQueryContext> XQueryContext::xqueryContextWithNamespaces(
    const std::map<std::string, std::string>& namespaces) {
  auto context = xqueryContext();
  for (const auto& [prefix, URI] : namespaces) {
    const auto prefixString = NSString::stringWithUTF8(prefix);
    const auto URIString = NSString::stringWithUTF8(URI);
    if (prefixString && URIString) _internal(*context).addNamespace(URIString, prefixString);
  }
  return context;
}

XQueryContext::XQueryContext()
    : NSCounted(Kind::Context), _private(std::make_unique<XQueryContextInternal>(*this)) {}

XQueryContext::~XQueryContext() = default;

void XQueryContext::addXQueryProlog(const Value&) {}

void XQueryContext::contextSetClient(std::shared_ptr<XQueryClient> client) {
  _private->setClient(std::move(client));
}

std::shared_ptr<XQueryClient> XQueryContext::contextClient() const {
  return _private->client();
}

void XQueryContext::contextSetLoading(const XQueryLoading& loading) {
  _private->setLoading(loading);
}

const XQueryLoading& XQueryContext::contextLoading() const {
  return _private->loader().loading();
}

void XQueryContext::contextSetLimits(XQueryLimits limits) {
  _private->setLimits(std::move(limits));
}

const XQueryLimits& XQueryContext::contextLimits() const {
  return _private->limits();
}

bool XQueryContext::contextReset() {
  if (_private->isEvaluating()) return false;
  auto fresh = std::make_unique<XQueryContextInternal>(*this);
  fresh->takeSettings(*_private);
  _private = std::move(fresh);
  return true;
}

void XQueryContext::contextAddClientSelector(std::string_view, std::string_view) {}

void _traceValue(XQueryContext& context, const Value& value, const Ref<NSString>& forLabel) {
  if (const auto client = _internal(context).client()) {
    passingOnHostFailures([&] { client->XQueryClientTraceValue(value, forLabel, context); });
  } else {
    XQueryClient().XQueryClientTraceValue(value, forLabel, context);
  }
}

void XQueryDecorateWithBaseURI(NSObject* first, XQueryContextInternal& context) {
  if (context.baseURINodeCount() == 0) return;
  if (const auto* document = dyn_cast<NSXMLDocument>(first)) first = document->rootElement();
  auto* element = dyn_cast<NSXMLElement>(first);
  if (!element || !NSXMLTree::isNew(element)) return;
  const NSStringView name = NSStringView::ascii("xml:base");
  const Ref<NSString> URI = context.baseURIForNode(element);
  const bool isEmpty = !URI || URI->length() == 0;
  if (isEmpty && element->attributeForName(name)) return;
  element->addAttribute(
      NSXMLNode::attributeWithName(name, URI ? URI->view() : NSStringView(),
                                   NSStringView::ascii("http://www.w3.org/XML/1998/namespace")));
}

namespace {

// Other errors leave the variables and the focus as they were when they arose. A limit may have
// been reached because of what those hold.
void dropValues(XQueryContextInternal& context, const Value& formerContextItem,
                int64_t formerPosition) {
  context._clearGlobals();
  context.clearKept();
  context._setInScopeVariables(nullptr);
  context.setContextItem(formerContextItem, formerPosition);
}

// Counts one evaluation of a query that was compiled for it, however it ends.
class Profiling {
 public:
  Profiling(XQueryContextInternal& context,
            const std::shared_ptr<const XQueryProfiledProgram>& program)
      : _profile(program ? &context.profileOf(program, program->counted.size()) : nullptr) {
    if (_profile) _profile->begin();
  }
  Profiling(const Profiling&) = delete;
  Profiling& operator=(const Profiling&) = delete;
  ~Profiling() {
    if (_profile) _profile->end();
  }

 private:
  XQueryProfileRecorder* const _profile;
};

}  // namespace

Ref<NSArray> XQueryContext::evaluateXQuery(const XQuery& query, const XQueryVariables& constants,
                                           const Value& contextItem, Ref<XQueryError>* error) {
  const XQueryInternal& compiled = _internal(query);
  if (error) *error = nullptr;
  if (compiled.isError()) return shapedResult(query.parseErrors(), error);

  const XQueryContextInternal::UnderWay underWay(*_private);
  const NSXMLEra era;
  const Profiling profiling(*_private, compiled.profiledProgram());
  beginEvaluation(compiled);
  if (contextItem && !isNull(contextItem)) _private->setContextItem(contextItem, 1);
  const Value result = evaluateModule(compiled, constants, [&] {
    return compiled.body() ? compiled.body()->evaluateWithContext(*this) : Value();
  });
  endEvaluation();
  return shapedResult(result, error);
}

void XQueryContext::beginEvaluation(const XQueryInternal& compiled) {
  endEvaluation();
  _private->askForDiagnostics();
  // No place is left of what ended the evaluation before.
  _private->setError(_private->error(), false);
  XQueryProlog& prolog = *compiled.prolog();
  _private->setOrdered(prolog.ordered());
  _private->setActiveProlog(&prolog);
}

void XQueryContext::endEvaluation() {
  _private->_clearGlobals();
  _private->clearKept();
  _private->forgetManyFailures();
}

namespace {

// Where there is no memory for the place of an error, the error is told without.
Ref<XQueryError> tracedError(const XQueryContextInternal& context, const Ref<XQueryError>& error) {
  try {
    return context.traced(error);
  } catch (const std::bad_alloc&) {
    return error;
  }
}

// The trees that come in from the host may be in use by other threads.
void takeCredit(const Value& contextItem, const XQueryVariables& constants) {
  constexpr size_t mostItems = 16;  // of a list; there is no room for many trees
  const auto take = [](const NSObject* item) {
    if (const auto* node = dyn_cast<NSXMLNode>(item)) NSXMLCredit::take(node);
  };
  take(contextItem.get());
  for (const auto& [name, value] : constants) {
    const auto* items = dyn_cast<NSArray>(value.get());
    if (!items) take(value.get());
    for (size_t i = 0; items && i < std::min(items->count(), mostItems); ++i) {
      take(items->objectAtIndex(i));
    }
  }
}

}  // namespace

// What the body answers, or the error that ended the evaluation.
Value XQueryContext::evaluateModule(const XQueryInternal& compiled,
                                    const XQueryVariables& constants,
                                    const std::function<Value()>& body) {
  XQueryLimitWatch watch(*this);
  const Value contextItem = _private->contextItem();
  const NSXMLCredit credit;
  takeCredit(contextItem, constants);
  const int64_t position = _private->position();
  try {
    // A limit that is reached already ends the shortest evaluation as well.
    watch.lookAtWork();
    XQuerySetConstants(constants, *compiled.prolog(), *this);
    XQueryEvaluateDeclarations(*compiled.prolog(), *this);
    Value result = body();
    if (XQueryHasFailed(result, *this)) _private->throwFailure();
    // Nor is a result of more than it may take handed out because it was made in a few steps.
    watch.lookAtWork();
    return result;
  } catch (const NSException&) {
    if (XQueryIsLimit(_private->error().get())) dropValues(*_private, contextItem, position);
    // The context keeps the error without its place, which would keep the text of the query.
    return tracedError(*_private, _private->error());
  } catch (const std::bad_alloc&) {
    dropValues(*_private, contextItem, position);
    return tracedError(*_private, watch.allocationFailure().error());
  } catch (const std::length_error&) {
    // Only decimals throw it.
    return XQueryErrors::tooManyDigits.error();
  } catch (const HostFailure& failure) {
    failure.giveBack();
  }
}

Ref<NSArray> XQueryContext::shapedResult(const Value& result, Ref<XQueryError>* error) {
  if (!result) return {};
  Ref<NSArray> items = dyn_cast<NSArray>(result);
  if (!items) items = NSArray::arrayWithObjects({result});
  if (items->count() == 0) return items;
  if (auto* failure = dyn_cast<XQueryError>(items->objectAtIndex(0))) {
    if (error) *error = failure;
    return {};
  }
  if (items->count() == 1 && isNull(items->objects().front())) return NSArray::array();
  XQueryDecorateWithBaseURI(items->objectAtIndex(0), *_private);
  return items;
}

}  // namespace xquery
