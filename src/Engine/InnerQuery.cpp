#include "Functions/InnerQuery.h"

#include "Context/LimitWatch.h"
#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Platform/Base/HostFailure.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Base/XQueryErrorTrace.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryErrors.h"
#include "xquery/XMLNode.h"

namespace xquery {
namespace {

// Of inner queries under way on this thread.
thread_local int innerQueries = 0;

class OneDeeper {
 public:
  explicit OneDeeper(XQueryContext& outer) {
    if (innerQueries == XQueryMostInnerQueries) {
      _internal(outer).raise(XQueryErrors::nestedTooDeeply.error());
    }
    ++innerQueries;
  }
  ~OneDeeper() { --innerQueries; }
  OneDeeper(const OneDeeper&) = delete;
  OneDeeper& operator=(const OneDeeper&) = delete;
};

// A path is asked for nodes.
void refuseOtherItems(XQueryInnerResult& result) {
  if (!result.items) return;
  WorkPacer pacer;
  for (const Value& item : result.items->objects()) {
    pacer.turn();
    if (item->isNode()) continue;
    result = {nullptr, XQueryErrors::itemNotANode.error()};
    return;
  }
}

// The text of an inner query stands in the module that is being evaluated.
std::string moduleURLOf(const XQueryContext& context) {
  const XQueryProlog* prolog = _internal(context).activeProlog();
  const bool isKnown = prolog && prolog->moduleURL();
  return isKnown ? prolog->moduleURL()->absoluteString()->utf8() : std::string();
}

// For a caller without an evaluation of its own.
Ref<NSArray> itemsOrError(XQueryInnerResult result, Ref<NSError>* error) {
  if (error) *error = result.error;
  return std::move(result.items);
}

XQueryInnerResult evaluateAlone(const Ref<NSString>& source, const Value& contextItem) {
  XQueryInnerResult result;
  const Ref<XQuery> query = XQuery::xqueryWithSource(source);
  result.items =
      XQueryContext::xqueryContext()->evaluateXQuery(*query, {}, contextItem, &result.error);
  return result;
}

}  // namespace

XQueryInnerResult XQueryEvaluateInnerQuery(const Ref<NSString>& source, const Value& contextItem,
                                           XQueryContext& outer) {
  XQueryCheckStack(outer);
  const OneDeeper deeper(outer);
  const Ref<XQueryContext> context = XQueryNestedContext(outer);
  XQueryLoading loading = context->contextLoading();
  loading.moduleURL = moduleURLOf(outer);
  XQueryInnerResult result;
  passingOnHostFailures([&] {
    const Ref<XQuery> query = XQuery::xqueryWithSource(source, loading);
    result.items = context->evaluateXQuery(*query, {}, contextItem, &result.error);
  });
  // The text of the inner query is nowhere to be seen: its errors are where it was evaluated.
  if (result.error) result.error = XQueryErrorTrace::error(*result.error, nullptr);
  if (XQueryIsLimit(result.error.get())) _internal(outer).raise(result.error);
  return result;
}

XQueryInnerResult XQueryEvaluateInnerPath(const Ref<NSString>& path, const Value& contextItem,
                                          XQueryContext& outer) {
  XQueryInnerResult result = XQueryEvaluateInnerQuery(path, contextItem, outer);
  refuseOtherItems(result);
  return result;
}

// Here and not with the rest of the tree, which knows nothing of queries.
Ref<NSArray> NSXMLNode::objectsForXQuery(const Ref<NSString>& query, Ref<NSError>* error) {
  return itemsOrError(evaluateAlone(query, this), error);
}

Ref<NSArray> NSXMLNode::nodesForXPath(const Ref<NSString>& path, Ref<NSError>* error) {
  XQueryInnerResult result = evaluateAlone(path, this);
  refuseOtherItems(result);
  return itemsOrError(std::move(result), error);
}

}  // namespace xquery
