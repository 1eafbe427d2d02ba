#include "Expr/XQueryLists.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryParts.h"
#include "Expr/XQuerySequence.h"
#include "xquery/Collection.h"

namespace xquery {

void XQueryExprList::addObject(Ref<XQueryExpr> element) {
  if (!element) element = XQueryLiteral::literalWithValue(NSNull::null());
  _storage.append(std::move(element));
}

void XQueryExprList::insertObject(const Ref<XQueryExpr>& element, size_t atIndex) {
  if (_storage.hasValue()) {
    _storage.moveValueToArray();
    _storage.append(element);
  }
  if (_storage.hasArray()) _storage.insertInArray(atIndex, element);
}

void XQueryExprList::replaceObjectAtIndex(size_t index, Ref<XQueryExpr> withObject) {
  _storage.replaceAtIndex(index, std::move(withObject));
}

void XQueryExprList::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  for (size_t index = 0; index < count(); ++index) objectAtIndex(index)->bindInfoForProlog(prolog);
}

Value XQueryExprList::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  if (const XQueryExpr* only = count() == 1 ? objectAtIndex(0) : nullptr) {
    Value value = only->evaluateWithContext(context);
    if (value) return normalised(std::move(value));
    return _internal(context).isFailing() ? Value() : Value(NSNull::null());
  }
  XQueryGatherer results;
  for (size_t index = 0; index < count(); ++index) {
    Value value = objectAtIndex(index)->evaluateWithContext(context);
    if (XQueryHasFailed(value, context)) return {};
    results.add(std::move(value));
  }
  return results.value();
}

void XQueryExprList::visitParts(XQueryPartVisitor& visitor) {
  _storage.forEach([&](Ref<XQueryExpr>& part) { visitor.part(part, XQueryRole::Element); });
}

void XQueryArgs::visitParts(XQueryPartVisitor& visitor) {
  _storage.forEach([&](Ref<XQueryExpr>& part) { visitor.part(part, XQueryRole::Argument); });
}

const XQueryExpr* XQueryWithoutParentheses(const XQueryExpr* expr) {
  const auto* list = dyn_cast<XQueryExprList>(expr);
  while (list && list->kind() == Kind::ExprList && list->count() == 1) {
    expr = list->objectAtIndex(0);
    list = dyn_cast<XQueryExprList>(expr);
  }
  return expr;
}

Value XQueryArgs::computeValue(XQueryContext& context) const {
  auto arguments = NSArray::array();
  arguments->objects().reserve(count());
  for (size_t index = 0; index < count(); ++index) {
    Value value = objectAtIndex(index)->evaluateWithContext(context);
    if (XQueryHasFailed(value, context)) return {};
    arguments->objects().push_back(std::move(value));
  }
  return arguments;
}

}  // namespace xquery
