// Reading of a document what a query needs of it.
#include "Engine/XQueryInternal.h"
#include "Plan/Projection/XQueryProjectionPlan.h"
#include "Platform/Reading/XMLDocuments.h"
#include "xquery/Projection.h"
#include "xquery/XQuery.h"

namespace xquery {

namespace {

// Null where all is needed.
const XMLProjection* projectionOf(const XQuery& query) {
  const XQueryProjectionPlan* const plan = _internal(query).projectionPlan();
  return plan && plan->isPossible() ? &plan->projection : nullptr;
}

}  // namespace

XQueryProjection XQueryProjectionOf(const XQuery& query) {
  const XQueryProjectionPlan* const plan = _internal(query).projectionPlan();
  if (!plan) return {true, true, "the query is not planned"};
  if (!plan->isPossible()) return {true, true, std::string(plan->reason)};
  return {false, plan->answersNodes, plan->projection.description()};
}

Ref<NSXMLDocument> XQueryProjectedDocumentWithFile(const XQuery& query, const std::string& path,
                                                   uint32_t options, NSXMLParseError* error,
                                                   const NSXMLReadingProgress& progress) {
  NSXMLParseError ignored;
  return projectedDocumentWithFile(path, options, projectionOf(query), error ? *error : ignored,
                                   progress);
}

Ref<NSXMLDocument> XQueryProjectedDocumentWithData(const XQuery& query, std::string_view bytes,
                                                   uint32_t options, NSXMLParseError* error) {
  NSXMLParseError ignored;
  return projectedDocumentWithData(bytes, options, projectionOf(query), error ? *error : ignored);
}

}  // namespace xquery
