// Warnings as texts: "LINE identifier, LINE identifier".
#pragma once

#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <string>
#include <string_view>
#include <vector>

namespace xquery::checktest {

struct Case {
  std::string_view query;
  std::string_view warnings;  // empty for none
};

inline Ref<XQuery> explained(std::string_view text, const XQueryLimits& limits = {}) {
  XQueryLoading loading;
  loading.moduleURL = "file:///nowhere/query.xq";
  return XQuery::xqueryWithSource(text, loading, limits, XQueryWay::Explained);
}

inline std::string shown(const std::vector<XQueryWarning>& warnings) {
  std::string text;
  for (const XQueryWarning& warning : warnings) {
    text += (text.empty() ? "" : ", ") + std::to_string(warning.line) + " ";
    text += warning.identifier;
  }
  return text;
}

inline std::string warningsOf(std::string_view text) {
  const auto query = explained(text);
  if (const auto errors = query->parseErrors()) {
    return cast<XQueryError>(errors->objects().front())->description()->utf8();
  }
  return shown(XQueryWarnings(*query));
}

// The text of the only warning.
inline std::string textOf(std::string_view query) {
  const auto warnings = XQueryWarnings(*explained(query));
  return warnings.size() == 1 ? warnings.front().text->utf8() : shown(warnings);
}

template <size_t count>
void expectWarnings(const Case (&cases)[count]) {
  for (const Case& each : cases) EXPECT_EQ(warningsOf(each.query), each.warnings) << each.query;
}

}  // namespace xquery::checktest
