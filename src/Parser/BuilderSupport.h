// What the builders share.
#pragma once

#include "Expr/XQueryExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Parser/Builders.h"
#include "Parser/XQueryParser.h"
#include "xquery/Collection.h"

namespace xquery {

template <class T>
Ref<T> XQRef(NSObject* object) {
  return Ref<T>(cast<T>(object));
}

// Says of an expression that it is what the production at work stands for. One that grows from
// production to production has the place of the last.
inline NSObject* XQPlace(NSObject* expr) {
  XQueryParser& parser = *XQueryParser::currentParser();
  parser.setPlace(*cast<XQueryExpr>(expr), parser.span());
  return expr;
}

// Hands an expression to the pool, with its line.
template <class T>
NSObject* XQAtLine(Ref<T> expr, int64_t line) {
  expr->setExprLine(line);
  XQPlace(expr.get());
  return XQueryParserAutoRelease(std::move(expr));
}

// Notes what the expressions will not tell of what stands there; the names may be null.
inline void XQRemarkAt(XQuerySpan span, XQueryRemark::Matter matter, int64_t line,
                       NSObject* first = nullptr, NSObject* second = nullptr) {
  XQueryParser& parser = *XQueryParser::currentParser();
  parser.remark(
      {matter, line, parser.places()->add(span), XQRef<NSString>(first), XQRef<NSString>(second)});
}

// The same of the production at work.
inline void XQRemark(XQueryRemark::Matter matter, int64_t line, NSObject* first = nullptr) {
  XQRemarkAt(XQueryParser::currentParser()->span(), matter, line, first);
}

inline NSObject* XQList(NSObject* item) {
  Ref<NSArray> list = NSArray::array();
  if (item) list->objects().emplace_back(item);
  return XQueryParserAutoRelease(std::move(list));
}

inline NSObject* XQListAdd(NSObject* list, NSObject* item) {
  cast<NSArray>(list)->objects().emplace_back(item);
  return list;
}

// Appends one item, or the items of a list one by one.
inline NSObject* XQListAddAll(NSObject* list, NSObject* itemOrItems) {
  if (!itemOrItems) return list;
  const NSArray* items = dyn_cast<NSArray>(itemOrItems);
  if (!items) return XQListAdd(list, itemOrItems);
  auto& objects = cast<NSArray>(list)->objects();
  objects.insert(objects.end(), items->objects().begin(), items->objects().end());
  return list;
}

template <class T>
std::vector<Ref<T>> XQVector(NSObject* list) {
  std::vector<Ref<T>> result;
  if (!list) return result;
  const NSArray* array = cast<NSArray>(list);
  result.reserve(array->count());
  for (const Value& object : array->objects()) result.push_back(XQRef<T>(object.get()));
  return result;
}

}  // namespace xquery
