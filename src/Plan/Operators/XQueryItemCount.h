// How many items an expression answers, without a list of them where that is open: "count(E)",
// "exists(E)", "count(E) > 2", where E is a FLWOR, a filter, a call of a declared function whose
// body is a filter or a path, or what has paths between commas; and variables whose values nobody
// asks for anything else.
#pragma once

#include "Plan/Operators/XQueryPathCount.h"
#include "Plan/Operators/XQueryPlannedExpr.h"

#include <cstdint>
#include <utility>

namespace xquery {

// Whether the expression can count its items without a list of them, perhaps: a FLWOR, a filter,
// a call of a declared function, or paths between commas. For paths of nodes there is
// XQueryPathCount. What has commas must be repeatable: where it counts nothing, it is evaluated
// anew.
bool XQueryCountsItems(const XQueryExpr& expr);

class XQueryItemCount : public XQueryPlannedExpr {
 public:
  using Question = XQueryPathCount::Question;

  // `counted` is part of the plain expression, or that itself. With `mayEndEarly` nobody can tell
  // how far it was evaluated.
  [[nodiscard]] static Ref<XQueryItemCount> exprWithPlain(Ref<XQueryExpr> plain,
                                                          Ref<XQueryExpr> counted,
                                                          Question question, bool mayEndEarly) {
    return make<XQueryItemCount>(std::move(plain), std::move(counted), question, mayEndEarly);
  }

  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryItemCount(Ref<XQueryExpr> plain, Ref<XQueryExpr> counted, Question question,
                  bool mayEndEarly)
      : XQueryPlannedExpr(std::move(plain)),
        _counted(std::move(counted)),
        _question(question),
        _mayEndEarly(mayEndEarly) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const Ref<XQueryExpr> _counted;
  const Question _question;
  const bool _mayEndEarly;
};

// In place of what a variable takes: the number of its items, for XQueryAskedCount.
class XQueryKeptCount : public XQueryPlannedExpr {
 public:
  [[nodiscard]] static Ref<XQueryKeptCount> exprWithPlain(Ref<XQueryExpr> plain) {
    return make<XQueryKeptCount>(std::move(plain));
  }

  // An integer.
  Value computeValue(XQueryContext& context) const override;

 protected:
  using XQueryPlannedExpr::XQueryPlannedExpr;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

// In place of what asks for the number of a variable's items, which is what it has taken.
class XQueryAskedCount : public XQueryPlannedExpr {
 public:
  [[nodiscard]] static Ref<XQueryAskedCount> exprWithPlain(Ref<XQueryExpr> plain, int64_t varID,
                                                           XQueryPathCount::Question question) {
    return make<XQueryAskedCount>(std::move(plain), varID, question);
  }

  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryAskedCount(Ref<XQueryExpr> plain, int64_t varID, XQueryPathCount::Question question)
      : XQueryPlannedExpr(std::move(plain)), _varID(varID), _question(question) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const int64_t _varID;
  const XQueryPathCount::Question _question;
};

}  // namespace xquery
