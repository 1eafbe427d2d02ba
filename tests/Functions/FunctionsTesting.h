// Calling built-in functions, alone and in queries, and reading their answers.
#pragma once

#include "Expr/Operators/OperatorTestSupport.h"
#include "Functions/XQueryBuiltInFunction.h"
#include "Platform/Base/WorkMeter.h"

#include <gtest/gtest.h>

#include <string>
#include <string_view>
#include <vector>

namespace xquery::functiontest {

using operatortest::boolean;
using operatortest::decimal;
using operatortest::elementFrom;
using operatortest::empty;
using operatortest::infinity;
using operatortest::integer;
using operatortest::minusInfinity;
using operatortest::months;
using operatortest::nan;
using operatortest::number;
using operatortest::outcome;
using operatortest::seconds;
using operatortest::sequence;
using operatortest::show;
using operatortest::single;
using operatortest::string;
using operatortest::typed;
using operatortest::untyped;

// What the procedure answers ("null" for refused arguments, "record ..." for an error it answers),
// or "error ..." when it raises. The focus has no item unless one is given.
inline std::string call(XQueryProcedure procedure, const std::vector<Value>& arguments,
                        const Value& contextItem = Value()) {
  return outcome([&](XQueryContext& context) {
    if (contextItem) _internal(context).setContextItem(contextItem, 1);
    return procedure(arguments.empty() ? nullptr : arguments.data(), arguments.size(), context);
  });
}

// Which of the given numbers of arguments the procedure refuses, for arguments that it would take.
inline std::string refusedCounts(XQueryProcedure procedure, const Value& argument, size_t most = 5,
                                 const Value& contextItem = Value()) {
  std::string refused;
  for (size_t count = 0; count <= most; ++count) {
    if (call(procedure, std::vector<Value>(count, argument), contextItem) == "null") {
      refused += (refused.empty() ? "" : " ") + std::to_string(count);
    }
  }
  return refused;
}

// The items of the result as `show` prints them, separated by ", "; or "error 17 line 1 message".
inline std::string answer(std::string_view query, const Value& contextItem = Value(),
                          const XQueryVariables& constants = {}) {
  const Ref<XQuery> compiled = XQuery::xqueryWithSource(query);
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  Ref<XQueryError> error;
  const Ref<NSArray> items = context->evaluateXQuery(*compiled, constants, contextItem, &error);
  if (error) {
    return "error " + std::to_string(error->err()) + " line " + std::to_string(error->line()) +
           " " + error->msg()->utf8();
  }
  std::string text;
  if (!items) return "no result";
  for (const Value& item : items->objects()) text += (text.empty() ? "" : ", ") + show(item);
  return text;
}

// Ends the work of this thread, by throwing WorkEnded, when it looks for the given time whether it
// should end. Every step that is counted is followed by a look.
struct WorkEnded {};

class WorkEnder final : public WorkWatcher {
 public:
  explicit WorkEnder(int look) : _looksLeft(look) {
    workMeter.stepsLeft = 1;
    workMeter.watcher = this;
  }
  ~WorkEnder() {
    workMeter.watcher = nullptr;
    workMeter.stepsLeft = WorkMeter::manySteps;
  }
  void lookAtWork() override {
    workMeter.stepsLeft = 1;
    if (--_looksLeft == 0) throw WorkEnded();
  }

 private:
  int _looksLeft;
};

inline Value document(std::string_view xml) {
  return NSXMLDocument::documentWithData(xml, NSXMLNodePreserveWhitespace);
}

}  // namespace xquery::functiontest
