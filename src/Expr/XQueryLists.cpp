#include "Expr/XQueryLists.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/XQueryAsking.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryParts.h"
#include "Expr/XQuerySequence.h"
#include "xquery/Collection.h"

#include <utility>
#include <vector>

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

// What a list within another one adds to it: the items of its value, one by one as they come, so
// that no list copies the items of those within it, whatever the number of levels.
//
// A list whose only value is an array answers that array, which may hold arrays where a host made
// it. So an array that comes first is held back until something follows in the list, and goes to
// the list around it as a value where nothing does.
class XQueryListPart {
 public:
  // `around`: of the list that this one is in; null for the outermost.
  XQueryListPart(XQueryGatherer& results, XQueryListPart* around)
      : _results(results), _around(around) {}

  void add(Value value) {
    if (!value || isNull(value)) return;
    if (!_around) return _results.add(std::move(value));
    if (!_isFollowed && !_held && isa<NSArray>(value)) {
      _held = std::move(value);
      return;
    }
    follow();
    give(std::move(value));
  }

  // What is left for the list around this one: the value of this list, where it is an array that
  // was held back to the end; nothing otherwise.
  Value rest() { return _held ? normalised(std::move(_held)) : Value(); }

  XQueryGatherer& results() const { return _results; }

 private:
  // Another value of this list, which makes items of all.
  void follow() {
    _isFollowed = true;
    if (_held) give(std::exchange(_held, Value()));
  }

  void give(Value value) {
    value = normalised(flattened(std::move(value)));
    if (isNull(value)) return;
    announceItems();
    _results.add(std::move(value));
  }

  // The lists around this one have another value, once for all of its items; the outer ones first,
  // since what they hold stands before it.
  void announceItems() {
    if (_hasItems) return;
    std::vector<XQueryListPart*> holding;
    XQueryListPart* part = this;
    for (; part->_around && !part->_hasItems; part = part->_around) {
      part->_hasItems = true;
      if (part->_around->_held) holding.push_back(part->_around);
      part->_around->_isFollowed = true;
    }
    while (!holding.empty()) {
      holding.back()->follow();
      holding.pop_back();
    }
  }

  XQueryGatherer& _results;
  XQueryListPart* const _around;
  Value _held;
  bool _isFollowed = false;  // no array is the only value any more
  bool _hasItems = false;    // and the lists around know
};

bool XQueryExprList::gather(XQueryListPart& part, XQueryContext& context) const {
  XQueryCheckStack(context);
  for (size_t index = 0; index < count(); ++index) {
    const XQueryExpr* element = objectAtIndex(index);
    if (const auto* list = dyn_cast<XQueryExprList>(element); list && !isa<XQueryArgs>(list)) {
      XQueryListPart within(part.results(), &part);
      if (!XQueryAsk(*list, context, [&] { return list->gather(within, context); })) return false;
      part.add(within.rest());
      continue;
    }
    Value value = element->evaluateWithContext(context);
    if (XQueryHasFailed(value, context)) return false;
    part.add(std::move(value));
  }
  return true;
}

Value XQueryExprList::computeValue(XQueryContext& context) const {
  if (const XQueryExpr* only = count() == 1 ? objectAtIndex(0) : nullptr) {
    XQueryCheckStack(context);
    Value value = only->evaluateWithContext(context);
    if (value) return normalised(std::move(value));
    return _internal(context).isFailing() ? Value() : Value(NSNull::null());
  }
  XQueryGatherer results;
  XQueryListPart whole(results, nullptr);
  return gather(whole, context) ? results.value() : Value();
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
