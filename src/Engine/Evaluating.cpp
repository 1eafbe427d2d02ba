#include "xquery/Evaluating.h"

#include "Types/XQueryValueErrors.h"
#include "xquery/Collection.h"

namespace xquery {

namespace {

using Items = XQueryResult<XQueryItemRange>;

Ref<XQueryError> readingError(std::string_view path, const NSXMLParseError& problem) {
  std::string text(path);
  if (!path.empty()) text += ": ";
  if (!path.empty() && problem.message.starts_with(text)) text.clear();  // of a file not found
  if (problem.line > 0) {
    text += "line " + std::to_string(problem.line) + ", column " + std::to_string(problem.column) +
            ": ";
  }
  return XQueryErrors::notReadable.error(text + problem.message);
}

XQueryResult<Ref<NSXMLDocument>> document(const Ref<NSXMLDocument>& read, std::string_view path,
                                          const NSXMLParseError& problem) {
  if (read) return read;
  return readingError(path, problem);
}

// An item that is an error may be one of another domain, as a stylesheet's is.
Ref<XQueryError> engineError(const Ref<NSError>& error) {
  if (auto* known = dyn_cast<XQueryError>(error)) return known;
  return XQueryError::error(error->code(), error->description());
}

Ref<XQueryContext> contextOr(const Ref<XQueryContext>& context) {
  return context ? context : XQueryContext::xqueryContext();
}

}  // namespace

XQueryResult<Ref<NSXMLDocument>> XQueryReadFile(const std::string& path, uint32_t options) {
  NSXMLParseError problem;
  return document(NSXMLDocument::documentWithFile(path, options, &problem), path, problem);
}

XQueryResult<Ref<NSXMLDocument>> XQueryReadXML(std::string_view bytes, uint32_t options) {
  NSXMLParseError problem;
  return document(NSXMLDocument::documentWithData(bytes, options, &problem), {}, problem);
}

XQueryResult<Ref<XQuery>> XQueryCompile(std::string_view source, const XQueryLoading& loading,
                                        const XQueryLimits& limits, XQueryWay way) {
  auto query = XQuery::xqueryWithSource(source, loading, limits, way);
  if (const auto errors = query->parseErrors()) {
    return Ref<XQueryError>(cast<XQueryError>(errors->objectAtIndex(0)));
  }
  return query;
}

XQueryResult<XQueryItemRange> XQueryEvaluate(const XQueryResult<Ref<XQuery>>& query,
                                             const XQueryInput& contextItem,
                                             const XQueryVariables& variables,
                                             const Ref<XQueryContext>& context) {
  if (contextItem.error()) return contextItem.error();
  if (!query) return query.error();
  Ref<XQueryError> error;
  const auto items =
      contextOr(context)->evaluateXQuery(**query, variables, contextItem.value(), &error);
  if (const auto failure = XQueryFirstError(items, error)) return engineError(failure);
  return XQueryItemRange(items);
}

XQueryResult<XQueryItemRange> XQueryEvaluate(std::string_view source,
                                             const XQueryInput& contextItem,
                                             const XQueryVariables& variables,
                                             const Ref<XQueryContext>& context) {
  return XQueryEvaluate(XQueryCompile(source), contextItem, variables, context);
}

XQueryResult<void> XQueryEvaluateStream(const XQueryResult<Ref<XQuery>>& query,
                                        const XQueryStreamInput& input,
                                        const XQueryContext::StreamReceiver& receive,
                                        const XQueryVariables& variables,
                                        const Ref<XQueryContext>& context) {
  if (!query) return query.error();
  XQueryStreamFailure failure;
  if (contextOr(context)->evaluateStream(**query, variables, input, receive, failure)) return {};
  if (failure.error) return failure.error;
  return readingError(input.read ? std::string_view() : input.path, failure.reading);
}

}  // namespace xquery
