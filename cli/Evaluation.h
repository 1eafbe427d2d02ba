// The query, compiled and evaluated for one input after the other.
#pragma once

#include "Options.h"
#include "xquery/xquery.h"

#include <functional>
#include <memory>
#include <utility>

namespace cli {

// Throws Failure.
xquery::Ref<xquery::XQuery> compile(const Options& options,
                                    const xquery::Ref<xquery::NSString>& source);

// In a context of its own, so that no evaluation knows of another; but one that is repeated keeps
// its context. Null for a query that has no value and no error, such as a library module. Throws
// Failure; a value that is an error counts as one wherever it stands.
class Evaluation {
 public:
  // The client may be null.
  Evaluation(const Options& options, std::shared_ptr<xquery::XQueryClient> client);
  xquery::Ref<xquery::NSArray> evaluate(const xquery::XQuery& query,
                                        const xquery::XQueryVariables& constants,
                                        const xquery::Value& contextItem);
  // As XQueryContext::evaluateStream.
  bool evaluateStream(const xquery::XQuery& query, const xquery::XQueryVariables& constants,
                      const xquery::XQueryStreamInput& input,
                      const std::function<bool(const xquery::Value& item)>& receive,
                      xquery::XQueryStreamFailure& failure);

  const xquery::XQueryContext& context() const { return *_context; }

 private:
  const xquery::Ref<xquery::XQueryContext> _context;
};

// Whether a result, null for none, is neither empty nor false.
bool isTrue(const xquery::NSArray* items);

}  // namespace cli
