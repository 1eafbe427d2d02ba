#include "Plan/Paths/XQueryPathGivers.h"

#include "Expr/XQuerySequence.h"

namespace xquery {

void XQueryGiveItems(const Value& list, XQueryItemGiver::Taker& taker) {
  const XQueryItemList items(list.get());
  for (size_t i = 0; i < items.count(); ++i) {
    if (!taker.take(Value(items[i]))) return;
  }
}

bool XQueryShortPathGiver::giveItems(XQueryContext& context, Taker& taker) const {
  auto& dynamic = _internal(context);
  const bool arePicked = _walked && _walked->picker();
  NSXMLNode* const start = arePicked ? nullptr : _walk.start(context);
  if (start && !dynamic.showsErrors()) {
    // The variable that it starts from may be the one that takes the nodes.
    const Value held(start);
    XQueryAsk(*_path, context, [&] {
      _walk.visit(start, [&taker](NSXMLNode* found) { return taker.take(Value(found)); });
      return true;
    });
  } else {
    const Value items = _path->evaluateWithContext(context);
    if (XQueryHasFailed(items, context)) return false;
    XQueryGiveItems(items, taker);
  }
  return !dynamic.isFailing();
}

}  // namespace xquery
