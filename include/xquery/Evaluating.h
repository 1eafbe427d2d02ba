// What most hosts do, in one call each, each with a result that is looked at.
//
//   const auto items = XQueryEvaluate("//book[price > 10]/title", XQueryReadFile("books.xml"));
//   if (!items) return report(items.error()->description()->utf8());
//   for (const Value& item : *items) use(XQueryItemStringValue(*item));
//
// What goes wrong first is the error of the result, so that calls may be put into one another. The
// errors are those of XQuery.h, found in whatever way that gives them back: while compiling, while
// evaluating, or as one of the items. A document that cannot be read or parsed is one of number 0
// and of the category Loading: the path where there is one, the place and what is wrong, as in
// "books.xml: line 3, column 7: ...".
#pragma once

#include "xquery/Export.h"
#include "xquery/Limits.h"
#include "xquery/Loading.h"
#include "xquery/Result.h"
#include "xquery/Stream.h"
#include "xquery/Values.h"
#include "xquery/XMLNode.h"
#include "xquery/XQuery.h"

#include <cstdint>
#include <string>
#include <string_view>
#include <utility>

namespace xquery {

// --- documents -----------------------------------------------------------------------------------

// As NSXMLDocument::documentWithFile and documentWithData; white space is kept unless other options
// are given.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Ref<NSXMLDocument>> XQueryReadFile(
    const std::string& path, uint32_t options = NSXMLNodePreserveWhitespace);
[[nodiscard]] XQUERY_EXPORT XQueryResult<Ref<NSXMLDocument>> XQueryReadXML(
    std::string_view bytes, uint32_t options = NSXMLNodePreserveWhitespace);

// --- queries -------------------------------------------------------------------------------------

// A query without errors; the error is the first of those that it has. Arguments as those of
// XQuery::xqueryWithSource.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Ref<XQuery>> XQueryCompile(
    std::string_view source, const XQueryLoading& loading = {}, const XQueryLimits& limits = {},
    XQueryWay way = XQueryWay::Planned);

// A context item: any value, nothing, or what an operation gave that may have failed.
class XQueryInput {
 public:
  XQueryInput() = default;
  XQueryInput(Value value) : _value(std::move(value)) {}
  template <class Object>
  XQueryInput(Ref<Object> value) : _value(std::move(value)) {}
  template <class Object>
  XQueryInput(const XQueryResult<Ref<Object>>& result) : _error(result.error()) {
    if (result) _value = *result;
  }

  const Value& value() const { return _value; }
  const Ref<XQueryError>& error() const { return _error; }

 private:
  Value _value;
  Ref<XQueryError> _error;
};

// The items of the result, which keep what they are part of alive; none for a query without a
// value. Against the context given, or one that is new and gone afterwards.
[[nodiscard]] XQUERY_EXPORT XQueryResult<XQueryItemRange> XQueryEvaluate(
    const XQueryResult<Ref<XQuery>>& query, const XQueryInput& contextItem = {},
    const XQueryVariables& variables = {}, const Ref<XQueryContext>& context = nullptr);
// Of a query that is asked once.
[[nodiscard]] XQUERY_EXPORT XQueryResult<XQueryItemRange> XQueryEvaluate(
    std::string_view source, const XQueryInput& contextItem = {},
    const XQueryVariables& variables = {}, const Ref<XQueryContext>& context = nullptr);

// As XQueryContext::evaluateStream, with a query that was compiled to be streamed. Items before the
// error have been handed out.
[[nodiscard]] XQUERY_EXPORT XQueryResult<void> XQueryEvaluateStream(
    const XQueryResult<Ref<XQuery>>& query, const XQueryStreamInput& input,
    const XQueryContext::StreamReceiver& receive, const XQueryVariables& variables = {},
    const Ref<XQueryContext>& context = nullptr);

}  // namespace xquery
