// How many nodes a path finds, or whether that is a certain number of them at least: "count(P)",
// "exists(P)", "empty(P)", "not(P)", "count(P) > 2", P itself where its truth is asked for.
#pragma once

#include "Plan/Operators/XQueryNodeQuestion.h"
#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Operators/XQueryShortWalk.h"
#include "Plan/Paths/XQueryWalkedPath.h"

#include <cstdint>
#include <optional>
#include <utility>

namespace xquery {

class XQueryPathCount : public XQueryPlannedExpr, private XQueryNodeQuestion {
 public:
  // What is asked of the number of nodes.
  struct Question {
    // 0: the number itself; else whether there are so many at least.
    uint64_t least = 0;
    bool isNegated = false;

    // A new integer, or one of the shared truth values.
    Value answer(uint64_t count) const;
  };

  // The path countsNodes and is part of the plain expression, or that itself.
  [[nodiscard]] static Ref<XQueryPathCount> exprWithPlain(Ref<XQueryExpr> plain,
                                                          Ref<XQueryWalkedPath> path,
                                                          Question question) {
    return make<XQueryPathCount>(std::move(plain), std::move(path), question);
  }

  // An integer, or one of the shared truth values.
  Value computeValue(XQueryContext& context) const override;
  const XQueryNodeQuestion* nodeQuestion() const override {
    const bool isQuestion = _question.least != 0 && _isShort && _shortWalk.startsFromFocus();
    return isQuestion ? this : nullptr;
  }

 protected:
  XQueryPathCount(Ref<XQueryExpr> plain, Ref<XQueryWalkedPath> path, Question question)
      : XQueryPlannedExpr(std::move(plain)), _path(std::move(path)), _question(question) {
    readShortWalk();
  }
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  std::optional<bool> holdsFor(NSXMLNode* node, const XQueryContext& context) const override;
  void readShortWalk();
  uint64_t countFrom(NSXMLNode* node, uint64_t most) const;
  bool holdsFrom(NSXMLNode* node) const {
    return (countFrom(node, _shortLeast) >= _shortLeast) != _question.isNegated;
  }

  const Ref<XQueryWalkedPath> _path;
  const Question _question;
  // From one node the short walk finds the same, or so many where the path finds something at all.
  bool _isShort = false;
  XQueryShortWalk _shortWalk;
  uint64_t _shortLeast = 0;
};

}  // namespace xquery
