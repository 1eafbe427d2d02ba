// Nobody can tell a table from looking through the set:
//
//   - the table is of one value, which is compared by identity; it holds the identity of its nodes,
//     which no change of a tree changes
//   - where an operand is anything but nodes, small, or has failed, everything is done the plain
//     way; the operands can be repeated
//   - the variable of a quantifier is left as the quantifier leaves it: at the member that was
//     found, or at the last one
#include "Plan/Operators/XQueryMembership.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/Paths/IdentitySet.h"
#include "Expr/XQuerySequence.h"
#include "Types/XQueryNumber.h"
#include "xquery/Collection.h"
#include "xquery/Number.h"

namespace xquery {
namespace {

// A smaller set is looked through as quickly.
constexpr size_t fewMembers = 16;

}  // namespace

class XQueryMembership::Members final : public XQueryKeptValue {
 public:
  // Null for a set with an item that is no node.
  static std::shared_ptr<Members> of(const NSArray& set) {
    auto members = std::make_shared<Members>();
    WorkPacer pacer;
    for (const Value& each : set.objects()) {
      pacer.turn();
      if (!each || !each->isNode()) return nullptr;
      if (members->_nodes.insert(each.get())) ++members->_count;
    }
    return members;
  }

  bool holds(const NSObject* node) const { return _nodes.contains(node); }
  int64_t count() const { return _count; }

 private:
  XQueryIdentitySet _nodes;
  int64_t _count = 0;
};

std::shared_ptr<const XQueryMembership::Members> XQueryMembership::membersOf(
    const Value& set, XQueryContext& context) const {
  const auto* array = dyn_cast<NSArray>(set);
  if (!array || array->count() < fewMembers) return nullptr;
  auto& keptValues = _internal(context).keptValues();
  if (keptValues.looksAway(*this)) return nullptr;
  std::shared_ptr<XQueryKeptValue> kept;
  const auto use = keptValues.use(*this, {&set, 1}, false, kept);
  if (use == XQueryKeptValues::Use::Second) {
    kept = Members::of(*array);
    keptValues.keep(*this, {&set, 1}, kept);
  }
  return std::static_pointer_cast<const Members>(kept);
}

Value XQueryMembership::computeValue(XQueryContext& context) const {
  // Diagnostics show each error once.
  if (_internal(context).showsErrors()) return plain().evaluateWithContext(context);
  Value node;
  if (!_operands.isSetFirst) {
    node = normalised(_operands.node->evaluateWithContext(context));
    if (XQueryHasFailed(node, context)) return {};
  }
  const Value set = _operands.set->evaluateWithContext(context);
  if (XQueryHasFailed(set, context)) return {};
  const auto members = membersOf(set, context);
  if (!members) return plain().evaluateWithContext(context);
  auto& dynamic = _internal(context);
  const auto& items = cast<NSArray>(set)->objects();
  if (_question == Question::Some) dynamic.setVariable(items.front(), _operands.varID);
  if (_operands.isSetFirst) {
    node = normalised(_operands.node->evaluateWithContext(context));
    if (XQueryHasFailed(node, context)) return {};
  }
  if (!node || !(isNull(node) || node->isNode())) return plain().evaluateWithContext(context);
  if (_question == Question::Some) {
    dynamic.setVariable(members->holds(node.get()) ? node : items.back(), _operands.varID);
  }
  return answer(node, *members);
}

Value XQueryMembership::answer(const Value& node, const Members& members) const {
  const bool isThere = !isNull(node);
  const bool isMember = isThere && members.holds(node.get());
  switch (_question) {
    case Question::Intersection:
      return isMember ? node : NSNull::null();
    case Question::Difference:
      return isMember ? NSNull::null() : node;
    case Question::CountOfUnion:
      return XQueryNumber::integerWithInt64(members.count() + (isThere && !isMember ? 1 : 0));
    case Question::Some:
      return NSNumber::numberWithBool(isMember);
  }
  return {};
}

}  // namespace xquery
