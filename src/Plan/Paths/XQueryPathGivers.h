// Who gives the nodes of a path to a clause one after another: as the walk finds them, where it
// finds them in document order from one node; otherwise the path is evaluated as a whole, and its
// items are given then.
#pragma once

#include "Expr/XQueryAsking.h"
#include "Expr/XQueryItemGiver.h"
#include "Plan/Operators/XQueryShortWalk.h"
#include "Plan/Paths/XQueryWalkedPath.h"

#include <utility>

namespace xquery {

// For a path that findsInOrder.
class XQueryWalkedPathGiver final : public XQueryItemGiver {
 public:
  explicit XQueryWalkedPathGiver(Ref<XQueryWalkedPath> path) : _path(std::move(path)) {}

  bool giveItems(XQueryContext& context, Taker& taker) const override {
    return XQueryAsk(*_path, context, [&] { return _path->giveItems(context, taker); });
  }

 private:
  const Ref<XQueryWalkedPath> _path;
};

// For a short path whose walk visitsInOrder. Where a picker is set later for what it walks, that
// picks the items; `walked` may be null.
class XQueryShortPathGiver final : public XQueryItemGiver {
 public:
  XQueryShortPathGiver(Ref<XQueryExpr> path, const XQueryShortWalk& walk,
                       Ref<XQueryWalkedPath> walked)
      : _path(std::move(path)), _walk(walk), _walked(std::move(walked)) {}

  bool giveItems(XQueryContext& context, Taker& taker) const override;

 private:
  const Ref<XQueryExpr> _path;
  const XQueryShortWalk _walk;
  const Ref<XQueryWalkedPath> _walked;
};

// Gives what is in a list.
void XQueryGiveItems(const Value& list, XQueryItemGiver::Taker& taker);

}  // namespace xquery
