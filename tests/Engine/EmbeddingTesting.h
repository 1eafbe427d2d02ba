// The public interface as a host program uses it, in few words.
#pragma once

#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <string>
#include <string_view>

namespace xquery {

inline Value parse(std::string_view xml) {
  NSXMLParseError failure;
  Value document = NSXMLDocument::documentWithData(xml, NSXMLNodePreserveWhitespace, &failure);
  EXPECT_TRUE(document) << failure.message;
  return document;
}

// The items as the command prints them, one after another with a blank between.
inline std::string strings(const Ref<NSArray>& items) {
  if (!items) return "(no result)";
  std::string all;
  for (const Value& item : items->objects()) {
    if (!all.empty()) all += ' ';
    all += XQueryItemStringValue(*item);
  }
  return all;
}

class Embedding : public testing::Test {
 protected:
  Ref<NSArray> evaluate(std::string_view source, const XQueryVariables& constants = {},
                        const Value& item = Value()) {
    const auto query = XQuery::xqueryWithSource(source);
    return context->evaluateXQuery(*query, constants, item, &error);
  }
  // Number and message of the last error; empty without one.
  std::string failure() const {
    if (!error) return "";
    return std::to_string(error->err()) + " " + (error->msg() ? error->msg()->utf8() : "(none)");
  }

  Ref<XQueryContext> context = XQueryContext::xqueryContext();
  Ref<XQueryError> error;
};

}  // namespace xquery
