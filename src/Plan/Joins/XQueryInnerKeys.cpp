#include "Plan/Joins/XQueryInnerKeys.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"

#include <vector>

namespace xquery {

Value XQueryInnerKeys::computeValue(XQueryContext& context) const {
  auto& dynamic = _internal(context);
  const Value item = dynamic.contextItem();
  const int64_t position = dynamic.position();
  const int64_t last = dynamic.last();
  std::vector<Value> nodes;
  if (!_path->listNodesBefore(_step, context, nodes)) return {};
  XQueryGatherer keys;
  for (const Value& node : nodes) {
    checkWork();
    dynamic.setContextItem(node, 1);
    Value key = _key->evaluateWithContext(context);
    if (!key || XQueryHasFailed(key, context)) return {};
    keys.add(std::move(key));
  }
  dynamic.setContextItem(item, position);
  dynamic.setLast(last);
  return keys.value();
}

}  // namespace xquery
