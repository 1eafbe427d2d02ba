// Nobody can tell a kept outcome from one found again:
//
//   - what the expression reads is compared by identity: local variables, the context item or the
//     document above it, the ordering mode; where a tree or a global variable has changed, or nodes
//     are still being filled, nothing kept is used (Context/KeptValues.h)
//     of an item that is read by way of its parents alone it is one of these, and what is below it
//     is what is around the item
//   - what it leaves behind it leaves each time: the variables that it sets, and after a failure
//     the focus in which that arose, which the next evaluation of the context may start from
//   - a failure is the same error again, raised where the expression stands
//   - reaching a limit is no outcome
//
// With diagnostics on, which show each error as it is made, everything is evaluated.
#include "Plan/Operators/XQueryKeptExpr.h"

#include "Context/XQueryContextInternal.h"
#include "xquery/Collection.h"
#include "xquery/Number.h"
#include "xquery/XMLNode.h"

#include <algorithm>
#include <array>
#include <memory>
#include <span>
#include <vector>

namespace xquery {

// What the expression reads, as it is now.
class XQueryKeptExpr::Dependencies {
 public:
  // `isKnown` is false where there is no telling: the document above what is no node.
  Dependencies(const XQueryFacts& facts, const std::vector<Above>& above,
               const XQueryContextInternal& context) {
    add(NSNumber::numberWithBool(context.ordered()));
    if (facts.does(XQueryDeeds::ReadsItem)) {
      add(read(context.contextItem(), 0, above));
    } else if (facts.does(XQueryDeeds::ReadsRoot)) {
      const auto* node = dyn_cast<NSXMLNode>(context.contextItem());
      isKnown = node != nullptr;
      if (node) add(node->rootNode());
    }
    facts.reads.forEach(
        [&](int64_t varID) { add(read(context.variableForID(varID), varID, above)); });
  }
  std::span<const Value> values() const { return {_values.data(), _count}; }

  bool isKnown = true;

 private:
  // What is read of an item: itself, or a node above it.
  Value read(Value item, int64_t varID, const std::vector<Above>& above) {
    const auto found = std::find_if(above.begin(), above.end(),
                                    [varID](const Above& each) { return each.varID == varID; });
    if (found == above.end()) return item;
    auto* node = dyn_cast<NSXMLNode>(item.get());
    for (uint8_t i = 0; i < found->steps && node; ++i) node = node->parent();
    isKnown = isKnown && node;
    return Value(node);
  }
  void add(Value value) { _values[_count++] = std::move(value); }

  std::array<Value, mostVariables + 2> _values;
  size_t _count = 0;
};

// Which of the variables that it may set one evaluation did set. A mark is put into those whose
// former values it does not read, so that one that is set to what it was already is seen as well.
class XQueryKeptExpr::Assignments {
 public:
  Assignments(const XQueryFacts& facts, XQueryContextInternal& context) : _context(context) {
    facts.assigns.forEach([&](int64_t varID) {
      XQueryVariableSet own;
      own.add(varID);
      Value former = context.variableForID(varID);
      const bool isMarked = former && !facts.reads.meets(own);
      if (isMarked) context.setVariable(_mark, varID);
      _variables.push_back({varID, std::move(former), isMarked});
    });
  }

  // After the evaluation. False where there is no telling: a slot that there was not yet and holds
  // the empty sequence may have come with a later one.
  bool finish() {
    bool isKnown = true;
    for (Variable& variable : _variables) {
      const Value value = _context.variableForID(variable.varID);
      if (variable.isMarked && value == _mark) {
        _context.setVariable(std::move(variable.value), variable.varID);
        variable.varID = 0;
        continue;
      }
      if (!variable.value && value && value->kind() == Kind::Null) isKnown = false;
      if (!value) variable.varID = 0;
      variable.value = value;
    }
    return isKnown;
  }

  // Sets the variables as the evaluation left them.
  void replay(XQueryContextInternal& context) const {
    for (const Variable& variable : _variables) {
      context.setVariable(variable.value, variable.varID);
    }
  }

 private:
  struct Variable {
    int64_t varID;  // 0, which sets nothing, for one that was not set
    Value value;    // the former one, and afterwards the one that was set
    bool isMarked;
  };

  XQueryContextInternal& _context;
  const Value _mark = NSArray::array();
  std::vector<Variable> _variables;
};

// The focus as it is.
struct XQueryKeptExpr::Focus {
  explicit Focus(const XQueryContextInternal& context)
      : item(context.contextItem()), position(context.position()), last(context.last()) {}

  Value item;
  int64_t position;
  int64_t last;
};

class XQueryKeptExpr::Outcome final : public XQueryKeptValue {
 public:
  // Of an evaluation that has just been done.
  Outcome(Value value, Assignments assignments, const Focus& before,
          const XQueryContextInternal& context)
      : _value(std::move(value)), _assignments(std::move(assignments)) {
    if (_value || !context.isFailing()) return;
    _error = context.tracedError();
    // A part of the focus that the evaluation has not set is, the next time, what it is then.
    const Focus left(context);
    if (left.item != before.item || left.position != before.position) {
      _item = left.item;
      _position = left.position;
      _setsItem = true;
    }
    _last = left.last;
    _setsLast = left.last != before.last;
  }

  Value replay(XQueryContextInternal& context) const {
    _assignments.replay(context);
    if (!_error) return _value;
    if (_setsItem) context.setContextItem(_item, _position);
    if (_setsLast) context.setLast(_last);
    return context.fail(_error, 0);
  }

 private:
  Value _value;
  Assignments _assignments;
  Ref<XQueryError> _error;  // null unless the evaluation failed
  bool _setsItem = false;
  bool _setsLast = false;
  Value _item;
  int64_t _position = 0;
  int64_t _last = 0;
};

std::string_view XQueryKeptExpr::obstacleTo(const XQueryFacts& facts) {
  if (facts.does(XQueryDeeds::MakesNodes)) return "it makes nodes, new ones each time";
  if (facts.does(XQueryDeeds::Traces)) return "it traces";
  if (!facts.isRepeatable()) return "it may do something else when it is evaluated again";
  if (facts.does(XQueryDeeds::ReadsPosition)) return "it reads the position";
  if (facts.does(XQueryDeeds::ReadsSize)) return "it reads the size";
  if (!facts.reads.isExact() || !facts.assigns.isExact()) {
    return "it reads or sets too many variables to know them one by one";
  }
  // What is around the nodes of a global variable is looked at by nobody.
  if (facts.does(XQueryDeeds::ReadsOutside) && facts.does(XQueryDeeds::ReadsGlobals)) {
    return "it reads what is around nodes of a global variable, which may change";
  }
  return facts.reads.count() <= mostVariables ? "" : "it reads more variables than are compared";
}

Ref<XQueryKeptExpr> XQueryKeptExpr::exprWithPlain(Ref<XQueryExpr> plain, const XQueryFacts& facts) {
  return exprWithPlain(std::move(plain), facts, {});
}

Ref<XQueryKeptExpr> XQueryKeptExpr::exprWithPlain(Ref<XQueryExpr> plain, const XQueryFacts& facts,
                                                  std::vector<Above> above) {
  return make<XQueryKeptExpr>(std::move(plain), facts, std::move(above));
}

Value XQueryKeptExpr::computeValue(XQueryContext& context) const {
  auto& dynamic = _internal(context);
  auto& keptValues = dynamic.keptValues();
  if (keptValues.looksAway(*this) || _internal(context).showsErrors()) {
    return plain().evaluateWithContext(context);
  }
  const Dependencies dependencies(_facts, _above, dynamic);
  if (!dependencies.isKnown) return plain().evaluateWithContext(context);
  const bool looksAround = _facts.does(XQueryDeeds::ReadsOutside);
  std::shared_ptr<XQueryKeptValue> kept;
  const auto use = _above.empty()
                       ? keptValues.useAtOnce(*this, dependencies.values(), looksAround, kept)
                       : keptValues.use(*this, dependencies.values(), looksAround, kept);
  if (use == XQueryKeptValues::Use::Further && kept) {
    return std::static_pointer_cast<Outcome>(kept)->replay(dynamic);
  }
  if (use != XQueryKeptValues::Use::Second) return plain().evaluateWithContext(context);
  Assignments assignments(_facts, dynamic);
  const Focus before(dynamic);
  Value value = plain().evaluateWithContext(context);
  bool isKnown = assignments.finish() && !dynamic.isFailingForGood();
  // The focus that an error leaves may be the item itself.
  if (!_above.empty() && (!value || dynamic.isFailing())) isKnown = false;
  std::shared_ptr<Outcome> outcome;
  if (isKnown) outcome = std::make_shared<Outcome>(value, std::move(assignments), before, dynamic);
  keptValues.keep(*this, dependencies.values(), std::move(outcome));
  return value;
}

}  // namespace xquery
