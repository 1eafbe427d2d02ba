// What stands between commas, of which one is evaluated behind the others.
//
//   ($list, $list[last()] + 1)
//
// A variable that others read as well is taken behind these, so that its list can take up theirs.
// Its place in the answer is the one where it is written.
#pragma once

#include "Expr/XQueryLists.h"
#include "Plan/Operators/XQueryPlannedExpr.h"

#include <cstddef>
#include <utility>

namespace xquery {

class XQueryLateElement : public XQueryPlannedExpr {
 public:
  // Evaluating that element cannot fail, nor can it be told when it is done.
  [[nodiscard]] static Ref<XQueryLateElement> exprWithPlain(Ref<XQueryExprList> plain,
                                                            size_t element) {
    return make<XQueryLateElement>(std::move(plain), element);
  }

  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryLateElement(const Ref<XQueryExprList>& plain, size_t element)
      : XQueryPlannedExpr(plain), _list(*plain), _element(element) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  bool gather(size_t from, size_t to, Value& value, XQueryContext& context) const;

  const XQueryExprList& _list;
  const size_t _element;
};

}  // namespace xquery
