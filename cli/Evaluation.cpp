#include "Evaluation.h"

#include "Documents.h"
#include "Messages.h"

namespace cli {

using namespace xquery;

// What a query names beside it is looked for beside its file, or in the working folder.
Ref<XQuery> compile(const Options& options, const Ref<NSString>& source) {
  XQueryLoading loading;
  const auto URL = NSURL::fileURLWithPath(options.queryText ? "./" : options.queryFile);
  if (URL) loading.moduleURL = URL->absoluteString()->utf8();
  const XQueryWay way = options.plan ? XQueryWay::Explained : XQueryWay::Planned;
  Ref<XQuery> query = XQuery::xqueryWithSource(source, loading, XQueryLimits(), way);
  const Ref<NSArray> errors = query->parseErrors();
  if (!errors || errors->count() == 0) return query;
  throw Failure{StatusQueryError, descriptions(*errors)};
}

Evaluation::Evaluation(const Options& options)
    : _context(XQueryContext::xqueryContextWithNamespaces(options.namespaces)) {}

Ref<NSArray> Evaluation::evaluate(const XQuery& query, const XQueryConstants& constants,
                                  const Value& contextItem) {
  Ref<XQueryError> error;
  Ref<NSArray> items = _context->evaluateXQuery(query, constants, contextItem, &error);
  if (const Ref<NSError> failure = XQueryFirstError(items, error)) {
    throw Failure{StatusQueryError, description(*failure)};
  }
  return items;
}

}  // namespace cli
