// How many nodes a path finds, or whether that is a certain number of them at least: "count(P)",
// "exists(P)", "empty(P)", "not(P)", "count(P) > 2", P itself where its truth is asked for.
#pragma once

#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Paths/XQueryWalkedPath.h"

#include <cstdint>
#include <utility>

namespace xquery {

class XQueryPathCount : public XQueryPlannedExpr {
 public:
  // What is asked of the number of nodes.
  struct Question {
    // 0: the number itself; else whether there are so many at least.
    uint64_t least = 0;
    bool isNegated = false;
  };

  // The path countsNodes and is part of the plain expression, or that itself.
  [[nodiscard]] static Ref<XQueryPathCount> exprWithPlain(Ref<XQueryExpr> plain,
                                                          Ref<XQueryWalkedPath> path,
                                                          Question question) {
    return make<XQueryPathCount>(std::move(plain), std::move(path), question);
  }

  // An integer, or one of the shared truth values.
  Value computeValue(XQueryContext& context) const override;

 protected:
  XQueryPathCount(Ref<XQueryExpr> plain, Ref<XQueryWalkedPath> path, Question question)
      : XQueryPlannedExpr(std::move(plain)), _path(std::move(path)), _question(question) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  const Ref<XQueryWalkedPath> _path;
  const Question _question;
};

}  // namespace xquery
