// Profiled evaluations as texts.
#pragma once

#include "Context/ProfileRecorder.h"
#include "Plan/PlanTesting.h"
#include "Plan/Profile/XQueryProfiledProgram.h"

#include <cstdlib>
#include <string>
#include <string_view>
#include <vector>

namespace xquery::plantest {

struct Profiled {
  Ref<XQuery> query;
  Ref<XQueryContext> context = XQueryContext::xqueryContext();
  Ref<XQueryError> error;
  Ref<NSArray> items;

  explicit Profiled(std::string_view text, const Value& contextItem = Value(),
                    const XQueryLimits& limits = {})
      : query(compiled(text, XQueryWay::Profiled)) {
    context->contextSetLimits(limits);
    evaluate(contextItem);
  }
  void evaluate(const Value& contextItem = Value()) {
    items = context->evaluateXQuery(*query, {}, contextItem, &error);
  }

  const XQueryProfiledProgram& program() const { return *_internal(*query).profiledProgram(); }
  const XQueryProfileCounts& counts() const { return _internal(*context).profile()->counts(); }

  static std::string nameOf(const XQueryProfiledExpression& expression) {
    const bool isBoth = !expression.role.empty() && !expression.label.empty();
    return expression.role + (isBoth ? ": " : "") + expression.label;
  }
  // Of the first expression of that name; null for one that is not counted, or not there.
  const XQueryProfileCounter* counter(std::string_view name) const {
    for (const XQueryProfiledExpression& each : program().expressions) {
      if (nameOf(each) != name) continue;
      return each.counter == XQueryNoCounter ? nullptr : &counts().counters()[each.counter];
    }
    return nullptr;
  }
  // "name 2 calls 3 items", for what ran, in the order in which it is written.
  std::vector<std::string> lines() const {
    std::vector<std::string> found;
    for (const XQueryProfiledExpression& each : program().expressions) {
      if (each.counter == XQueryNoCounter) continue;
      const XQueryProfileCounter& counter = counts().counters()[each.counter];
      found.push_back(nameOf(each) + " " + std::to_string(counter.calls) + "/" +
                      std::to_string(counter.items));
    }
    return found;
  }
};

// While it exists queries are not planned.
class AsWritten {
 public:
  AsWritten() { ::setenv("XQUERY_PLAN", "0", 1); }
  ~AsWritten() { ::unsetenv("XQUERY_PLAN"); }
  AsWritten(const AsWritten&) = delete;
  AsWritten& operator=(const AsWritten&) = delete;
};

inline Value documentOf(std::string_view xml) {
  return NSXMLDocument::documentWithData(std::string(xml), NSXMLNodePreserveWhitespace, nullptr);
}

}  // namespace xquery::plantest
