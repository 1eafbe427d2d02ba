// What asks the context, and what speaks to the host: errors and traces.
#include "arguments/Driver.h"

#include <gtest/gtest.h>

namespace xquery::arguments {
namespace {

Sequence position(const Call& call) {
  if (!call.contextItem) throw Refused();
  return one(integer(1));
}

// No evaluation sets the size of its context.
Sequence last(const Call&) {
  throw Refused();
}

// The name of the error, "namespace#local part".
std::string errorName(const Call& call) {
  if (!call.count()) return "http://www.w3.org/2004/07/xqt-errors#FOER0000";
  const Sequence& value = call[0];
  if (value.size() != 1 || value[0].type != 15) return "(null)#";
  return value[0].text == "p:n" ? "u#n" : "(null)#" + value[0].text;
}

Sequence error(const Call& call) {
  const std::string description = call.count() > 1 ? stringOf(call[1]) : "";
  fail(0, errorName(call) + (description.empty() ? "" : " - " + description));
}

Sequence trace(const Call& call) {
  promotedToString(call[1]);
  return call[0];
}

}  // namespace

const std::vector<Function>& focusFunctions() {
  static const std::vector<Function> functions = {
      {"fn:position", 0, 0, position},
      {"fn:last", 0, 0, last},
      {"fn:static-base-uri", 0, 0, [](const Call&) { return Sequence(); }},
      {"fn:default-collation", 0, 0, [](const Call&) { return one(string("")); }},
      {"fn:error", 0, 3, error},
      {"fn:trace", 2, 2, trace},
  };
  return functions;
}

TEST(FocusArguments, EndAsTheRulesSay) {
  expectRules(focusFunctions());
}

}  // namespace xquery::arguments
