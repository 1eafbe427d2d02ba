// The engine as the benchmarks use it, through its public interface.
#pragma once

#include "xquery/xquery.h"

#include <stdexcept>
#include <string>

namespace bench {

inline xquery::Ref<xquery::NSXMLDocument> parse(const std::string& xml) {
  auto document = xquery::NSXMLDocument::documentWithData(xml, xquery::NSXMLNodePreserveWhitespace);
  if (!document) throw std::runtime_error("the engine cannot parse the document");
  return document;
}

inline xquery::Ref<xquery::XQuery> compile(const std::string& text) {
  auto query = xquery::XQuery::xqueryWithSource(std::string_view(text));
  if (query->parseErrors()) throw std::runtime_error("the engine cannot compile " + text);
  return query;
}

// The number of items in the result.
inline size_t evaluate(xquery::XQueryContext& context, const xquery::XQuery& query,
                       const xquery::Value& contextItem,
                       const xquery::XQueryVariables& constants = {}) {
  xquery::Ref<xquery::XQueryError> error;
  const auto items = context.evaluateXQuery(query, constants, contextItem, &error);
  if (!items) throw std::runtime_error(error ? error->description()->utf8() : "no result");
  return items->count();
}

// The items as the command prints them, one on a line.
inline std::string printed(const xquery::NSArray& items) {
  std::string text;
  for (const xquery::Value& item : items.objects()) {
    if (const auto* node = xquery::dyn_cast<xquery::NSXMLNode>(item)) {
      node->appendXMLTo(text);
    } else {
      text += xquery::XQueryItemStringValue(*item);
    }
    text += '\n';
  }
  return text;
}

}  // namespace bench
