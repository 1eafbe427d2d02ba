#include "Evaluation.h"

#include "Documents.h"
#include "Messages.h"
#include "Signals.h"

namespace cli {

using namespace xquery;

namespace {

// The bounds that the options set, and an end at an interrupt.
XQueryLimits limits(const Options& options) {
  XQueryLimits limits;
  limits.duration = options.timeout;
  limits.memoryCeiling = options.memory;
  limits.cancelled = interruption();
  return limits;
}

// What a query names beside it is looked for beside its file, or in the working folder.
XQueryLoading loading(const Options& options) {
  XQueryLoading loading;
  loading.policy = options.policy;
  const bool hasFile = !options.queryText && options.queryFile != "-";
  const auto URL = NSURL::fileURLWithPath(hasFile ? options.queryFile : "./");
  if (URL) loading.moduleURL = URL->absoluteString()->utf8();
  return loading;
}

std::vector<Ref<NSError>> list(const NSArray& errors) {
  std::vector<Ref<NSError>> all;
  for (const Value& error : errors.objects()) all.emplace_back(cast<NSError>(error.get()));
  return all;
}

}  // namespace

Ref<XQuery> compile(const Options& options, const Ref<NSString>& source) {
  const UnderWay compiling;
  const XQueryWay way = options.stream                  ? XQueryWay::Streamed
                        : options.plan || options.check ? XQueryWay::Explained
                        : options.profileFile           ? XQueryWay::Profiled
                                                        : XQueryWay::Planned;
  Ref<XQuery> query = XQuery::xqueryWithSource(source, loading(options), limits(options), way);
  const Ref<NSArray> errors = query->parseErrors();
  if (!errors || errors->count() == 0) return query;
  throw Failure{StatusQueryError, descriptions(*errors), list(*errors)};
}

Evaluation::Evaluation(const Options& options, std::shared_ptr<XQueryClient> client)
    : _context(XQueryContext::xqueryContextWithNamespaces(options.namespaces)) {
  _context->contextSetLoading(loading(options));
  _context->contextSetLimits(limits(options));
  _context->contextSetClient(std::move(client));
}

Ref<NSArray> Evaluation::evaluate(const XQuery& query, const XQueryVariables& constants,
                                  const Value& contextItem) {
  const UnderWay evaluating;
  Ref<XQueryError> error;
  Ref<NSArray> items = _context->evaluateXQuery(query, constants, contextItem, &error);
  if (const Ref<NSError> failure = XQueryFirstError(items, error)) {
    throw Failure{StatusQueryError, description(*failure), {failure}};
  }
  return items;
}

bool Evaluation::evaluateStream(const XQuery& query, const XQueryVariables& constants,
                                const XQueryStreamInput& input,
                                const std::function<bool(const Value& item)>& receive,
                                XQueryStreamFailure& failure) {
  const UnderWay evaluating;
  return _context->evaluateStream(query, constants, input, receive, failure);
}

// What has no such value, as several numbers have not, is a result all the same.
bool isTrue(const NSArray* items) {
  if (!items || items->count() == 0) return false;
  static const Ref<XQuery> query =
      XQuery::xqueryWithSource("declare variable $result external; boolean($result)");
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const Value result(const_cast<NSArray*>(items));
  const Ref<NSArray> answer = context->evaluateXQuery(*query, {{"result", result}}, nullptr);
  const bool isKnown = answer && answer->count() == 1 && !XQueryFirstError(answer);
  return !isKnown || XQueryItemStringValue(*answer->objectAtIndex(0)) == "true";
}

}  // namespace cli
