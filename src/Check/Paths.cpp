// Steps that find nothing, steps from what is no node, and paths that XQuery 1.0 answers otherwise.
#include "Check/Checking.h"
#include "Check/Uses.h"
#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Plan/Labels.h"
#include "Platform/Base/WorkMeter.h"
#include "xquery/Number.h"

#include <array>
#include <cmath>

namespace xquery {
namespace {

using ID = XQueryWarningID;
using namespace XQueryItems;

constexpr XQueryItemKinds inContent = Element | Instruction | Comment | Text;
constexpr XQueryItemKinds above = Document | Element;

struct Axis {
  std::string_view name;
  XQueryItemKinds from;      // the nodes that have such others
  XQueryItemKinds to;        // which these may be; Node for the axes below
  std::string_view missing;  // what the other nodes have none of
};

// By the codes of the axes. The descendant axes are left alone: they may go on behind a node that
// has no descendants.
constexpr std::array<Axis, 13> axes = {{
    {"", Node, Node, ""},
    {"", above, inContent, "children"},
    {"descendant::", Node, inContent, ""},
    {"descendant-or-self::", Node, Node, ""},
    {"@", Element, Attribute, "attributes"},
    {"self::", Node, Node, ""},
    {"following-sibling::", inContent, inContent, "siblings"},
    {"following::", Node, inContent, ""},
    {"ancestor::", Node & ~Document, above, "ancestors"},
    {"parent::", Node & ~Document, above, "parent"},
    {"preceding::", Node, Node, ""},
    {"preceding-sibling::", inContent, inContent, "siblings"},
    {"ancestor-or-self::", Node, Node, ""},
}};

const Axis& axisOf(const XQueryAxisStep& step) {
  return axes.at(static_cast<size_t>(step.axis()));
}

std::string labelOf(const XQueryAxisStep& step) {
  std::string test = "node()";
  if (const auto* name = dyn_cast<XQueryNameTest>(step.expr())) {
    test = name->name()->utf8();
  } else if (step.expr()) {
    test = isa<XQueryWildCardNameTest>(step.expr()) ? "*" : XQueryLabelOf(*step.expr());
  }
  return std::string(axisOf(step).name) + test;
}

bool isNameTest(const XQueryExpr* test) {
  return test && (test->kind() == Kind::NameTest || test->kind() == Kind::WildCardNameTest);
}

// Follows the steps of a path with the kinds of what reaches them; None when that is not known.
class Steps {
 public:
  Steps(XQueryChecking& checking, XQueryPlaceID path) : _checking(checking), _path(path) {}

  void run() {
    const XQueryStep* step = _checking.as<XQueryPathExpr>(_path)->step();
    _part = _checking.program.firstPart(_path);
    const XQueryFactsAt at(_checking.program, _checking.facts, _path);
    if (step && isa<XQueryAxisStep>(step)) _items = at.itemOfFocus(_checking.at(_path).focus);
    for (bool isFirst = true; step; step = step->next(), isFirst = false) {
      const XQueryPlaceID first = _part;
      while (_part != XQueryNoPlace && _checking.at(_part).step == step) {
        _part = _checking.program.nextPart(_part);
      }
      const XQueryPlaceID place = first == _part ? _path : first;
      if (const auto* axisStep = dyn_cast<XQueryAxisStep>(step)) {
        if (!take(place, *axisStep)) return;
      } else if (!takeFilter(place, *step, isFirst)) {
        return;
      }
    }
  }

 private:
  bool areValues() const { return _items.most > 0 && _items.are(Atomic); }

  bool take(XQueryPlaceID place, const XQueryAxisStep& step) {
    if (areValues()) {
      _checking.warn(place, ID::StepFromValue, {labelOf(step), XQueryNameOfKinds(_items.kinds)});
      return false;
    }
    const XQueryItemKinds from = _items.kinds & Node;
    if (from == None) return false;
    const Axis& axis = axisOf(step);
    if ((from & axis.from) == 0) {
      _checking.warn(
          place, ID::StepNeverMatches,
          {labelOf(step), XQueryNameOfKinds(from) + " has no " + std::string(axis.missing)});
      return false;
    }
    if (step.axis() == XQueryAxisSelf && (from & ~Attribute) == 0 && isNameTest(step.expr())) {
      _checking.warn(place, ID::SelfOfAttribute, {labelOf(step).substr(6)});
    }
    if (step.axis() == XQueryAxisFollowing && (from & ~Attribute) == 0) {
      _checking.warn(place, ID::FollowingOfAttribute);
    }
    const XQueryItemKinds onAxis = step.axis() == XQueryAxisSelf ? from : axis.to;
    const XQueryItemKinds found = onAxis & XQueryKindsOfStep(step);
    if (found == None && !isDocumentTest(step.expr())) {
      _checking.warn(place, ID::StepNeverMatches,
                     {labelOf(step), "there is no such node on the axis"});
      return false;
    }
    _items.setItems(found, 0, XQueryFacts::many);
    return true;
  }

  static bool isDocumentTest(const XQueryExpr* test) {
    const auto* type = dyn_cast<XQueryTypeDeclaration>(test);
    return type && type->type() == XQueryTypeDeclaration::DocumentTest && type->data();
  }

  bool takeFilter(XQueryPlaceID place, const XQueryStep& step, bool isFirst) {
    const XQueryFacts found =
        step.expr() && place != _path ? _checking.factsOf(place) : XQueryFacts::none();
    if (isFirst) {
      _items = found;
      return true;
    }
    if (areValues()) {
      _checking.warn(place, ID::PathOverValues, {XQueryNameOfKinds(_items.kinds)});
    }
    if (!step.next() && _items.most > 1 && isSameForMany(place, found)) {
      _checking.warn(place, ID::ValuesMerged);
    }
    const bool wasOne = _items.most <= 1;
    _items = found;
    _items.least = 0;
    if (!wasOne && found.most > 0) _items.most = XQueryFacts::many;
    return true;
  }

  // Truth values, literals and variables are the same objects each time.
  bool isSameForMany(XQueryPlaceID place, const XQueryFacts& facts) const {
    if (facts.most == 0 || !facts.are(Atomic)) return false;
    const Kind kind = _checking.at(_checking.program.withoutParentheses(place)).expr->kind();
    return facts.are(Boolean) || kind == Kind::Literal || kind == Kind::Variable;
  }

  XQueryChecking& _checking;
  const XQueryPlaceID _path;
  XQueryPlaceID _part = XQueryNoPlace;
  XQueryFacts _items;
};

// A position that is no whole number.
void checkPositions(XQueryChecking& checking, XQueryPlaceID path) {
  for (XQueryPlaceID part = checking.program.firstPart(path); part != XQueryNoPlace;
       part = checking.program.nextPart(part)) {
    if (checking.at(part).role != XQueryRole::Predicate) continue;
    const auto* number = dyn_cast<NSNumber>(checking.literalIn(part));
    if (!number) continue;
    const double position = number->doubleValue();
    if (position == std::floor(position) || position < 1) continue;
    checking.warn(part, ID::FractionPosition,
                  {checking.labelOf(part), std::to_string(static_cast<int64_t>(position))});
  }
}

}  // namespace

void XQueryCheckPath(XQueryChecking& checking, XQueryPlaceID place) {
  Steps(checking, place).run();
  checkPositions(checking, place);
}

// --- the order of nodes --------------------------------------------------------------------------

namespace {

// The last axis step, where it goes backwards. Filter steps behind it take its nodes as they come:
// the nearest first, of each node.
const XQueryAxisStep* lastReverseStep(const XQueryPathExpr& path) {
  const XQueryAxisStep* last = nullptr;
  const XQueryStep* end = nullptr;
  for (const XQueryStep* step = path.step(); step; step = step->next()) {
    if (const auto* axisStep = dyn_cast<XQueryAxisStep>(step)) last = axisStep;
    end = step;
  }
  if (!last || !last->isReverse()) return nullptr;
  return last != end && last->axis() == XQueryAxisParent ? nullptr : last;
}

// From the one context item of a query upwards by one step: one node at most, though a host may
// hand in several items.
bool isParentOfContext(const XQueryChecking& checking, XQueryPlaceID place,
                       const XQueryPathExpr& path) {
  const auto* only = dyn_cast<XQueryAxisStep>(path.step());
  return only && !only->next() && only->axis() == XQueryAxisParent &&
         checking.at(place).focus == XQueryNoPlace && !checking.program.bodyOf(place).function;
}

}  // namespace

void XQueryCheckReverseOrder(XQueryChecking& checking, const XQueryUses& uses) {
  WorkPacer pacer;
  for (XQueryPlaceID place = 0; place < checking.program.placeCount(); ++place) {
    pacer.turn();
    const auto* path = checking.as<XQueryPathExpr>(place);
    if (!path || checking.factsOf(place).most <= 1 || !checking.at(place).isOrdered) continue;
    const XQueryAxisStep* const step = lastReverseStep(*path);
    if (!step || !uses.showsOrder(place) || isParentOfContext(checking, place, *path)) continue;
    checking.warn(place, ID::ReverseOrder, {labelOf(*step)});
  }
}

}  // namespace xquery
