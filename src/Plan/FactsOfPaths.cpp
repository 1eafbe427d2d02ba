// Facts of paths: what each step makes of the nodes that reach it.
#include "Expr/Paths/XQueryPath.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Plan/FactsAnalysis.h"

namespace xquery {
namespace {

using namespace XQueryItems;

XQueryItemKinds kindsOnAxis(int axis) {
  constexpr XQueryItemKinds inContent = Element | Instruction | Comment | Text;
  switch (axis) {
    case XQueryAxisAttribute:
      return Attribute;
    case XQueryAxisParent:
    case XQueryAxisAncestor:
      return Document | Element;
    case XQueryAxisChild:
    case XQueryAxisDescendant:
    case XQueryAxisFollowing:
    case XQueryAxisFollowingSibling:
    case XQueryAxisPrecedingSibling:
      return inContent;
    default:
      return Node;
  }
}

XQueryItemKinds kindsOfTest(const XQueryExpr* test) {
  switch (test ? test->kind() : Kind::None) {
    case Kind::NameTest:
      return Element | Attribute;
    case Kind::WildCardNameTest:
      return Element | Attribute | Namespace | Instruction;
    case Kind::TypeDeclaration: {
      XQueryFacts facts = XQueryFacts::one(Node);
      XQueryRestrictToType(test, facts);
      const auto* type = cast<XQueryTypeDeclaration>(test);
      const bool isNodeTest = type->type() != XQueryTypeDeclaration::Item &&
                              type->type() != XQueryTypeDeclaration::Atomic;
      return isNodeTest ? facts.kinds : Node;
    }
    default:
      return None;
  }
}

bool staysInside(int axis) {
  return axis == XQueryAxisChild || axis == XQueryAxisAttribute || axis == XQueryAxisSelf;
}

// Whether the step finds one node at most from each.
bool findsOne(const XQueryAxisStep& step) {
  switch (step.axis()) {
    case XQueryAxisSelf:
    case XQueryAxisParent:
      return true;
    case XQueryAxisAttribute:
      return step.expr() && step.expr()->kind() == Kind::NameTest;
    default:
      return false;
  }
}

// Whether a predicate asks for one position, the same whichever item it is asked of.
bool isOneNumberForAll(const XQueryFacts& predicate) {
  return predicate.are(Numeric) && predicate.most <= 1 && predicate.isRepeatable() &&
         !predicate.does(XQueryDeeds::ReadsFocus);
}

// Follows the steps of one path.
class Walk {
 public:
  Walk(const XQueryFactsAt& at, XQueryFacts& facts) : _at(at), _facts(facts) {}

  void run() {
    _part = _at.program.firstPart(_at.place);
    const XQueryStep* step = _at.expr<XQueryPathExpr>().step();
    if (!step) return _facts.setItems(XQueryFacts::none());
    if (isa<XQueryAxisStep>(step)) startFromFocus();
    for (bool isFirst = true; step; step = step->next(), isFirst = false) {
      if (const auto* axisStep = dyn_cast<XQueryAxisStep>(step)) {
        take(*axisStep);
      } else {
        takeFilter(*step, isFirst);
      }
    }
    _facts.setItems(_items);
  }

 private:
  void startFromFocus() {
    _facts.deeds |= XQueryDeeds::ReadsItem;
    _items.setItems(_at.itemOfFocus(_at.here().focus));
    if (_items.are(Node)) _items.tree = XQueryTreeFact::OfContext;
  }

  // The parts of the step, and what its predicates read and do. An error in one of them drops an
  // item and nothing more.
  void takePredicates(const XQueryStep& step, bool hasPrimary) {
    if (hasPrimary) _part = _at.program.nextPart(_part);
    if (const auto* axisStep = dyn_cast<XQueryAxisStep>(&step); axisStep && axisStep->expr()) {
      _part = _at.program.nextPart(_part);
    }
    for (size_t index = 0; index < step.predicates().size(); ++index) {
      if (!step.predicates()[index]) break;
      _items.filter();
      if (step.asksForPosition(index) || isOneNumberForAll(_at.table[_part])) _isOneOfEach = true;
      _part = _at.program.nextPart(_part);
    }
  }

  void take(const XQueryAxisStep& step) {
    const XQueryFacts before = _items;
    // Only nodes have axes; anything else is an error in one place or another.
    if (!before.are(Node) || step.testMayRaise()) _facts.deeds |= XQueryDeeds::MayFail;
    if (!staysInside(step.axis())) _facts.deeds |= XQueryDeeds::ReadsOutside;
    const XQueryTreeFact tree = before.are(Node) ? before.tree : XQueryTreeFact::Any;
    const bool wasOne = before.most <= 1;
    _isOneOfEach = findsOne(step);
    _items.setItems(XQueryKindsOfStep(step), 0, XQueryFacts::many);
    takePredicates(step, false);
    if (before.most == 0) _items.most = 0;
    if (wasOne && _isOneOfEach) _items.most = std::min<uint8_t>(_items.most, 1);
    _items.tree = tree;
    // The results are sorted, and those of a reverse axis the other way round.
    _items.inOrder = _at.here().isOrdered && !step.isReverse() && tree == XQueryTreeFact::OfContext;
    _items.settle();
  }

  void takeFilter(const XQueryStep& step, bool isFirst) {
    const bool hasPrimary = step.expr() != nullptr;
    const XQueryFacts primary = hasPrimary ? _at.table[_part] : XQueryFacts::none();
    const bool wasOne = _items.most <= 1;
    _isOneOfEach = false;
    if (isFirst) {
      _items.setItems(primary);
      takePredicates(step, hasPrimary);
      if (_isOneOfEach) _items.most = std::min<uint8_t>(_items.most, 1);
      _items.settle();
      return;
    }
    // Nodes and atomic values among the results of one step are an error.
    _facts.deeds |= XQueryDeeds::MayFail;
    const bool isNone = _items.most == 0;
    XQueryFacts found = primary;
    found.least = 0;
    if (!wasOne && found.most != 0) found.most = XQueryFacts::many;
    if (isNone) found.most = 0;
    // The items of several evaluations stand together, each object once, and nodes are sorted.
    if (!wasOne) found.inOrder = false;
    if (found.tree == XQueryTreeFact::OfContext && _items.tree != XQueryTreeFact::OfContext) {
      found.tree = XQueryTreeFact::Any;
      found.inOrder = found.inOrder && found.most <= 1;
    }
    _items.setItems(found);
    takePredicates(step, hasPrimary);
    _items.settle();
  }

  const XQueryFactsAt& _at;
  XQueryFacts& _facts;
  XQueryFacts _items;
  XQueryPlaceID _part = XQueryNoPlace;
  bool _isOneOfEach = false;  // the step keeps one node at most of those it finds from each
};

}  // namespace

XQueryItemKinds XQueryKindsOfStep(const XQueryAxisStep& step) {
  return kindsOnAxis(step.axis()) & kindsOfTest(step.expr());
}

void XQueryFactsOfRoot(const XQueryFactsAt& at, XQueryFacts& facts) {
  facts.deeds |= XQueryDeeds::ReadsRoot;
  if (!XQueryFindsRootBefore(at)) facts.deeds |= XQueryDeeds::MayFail;
  facts.findsRoot = true;
  facts.setItems(Document, 1, 1);
  facts.tree = XQueryTreeFact::OfContext;
}

void XQueryFactsOfPath(const XQueryFactsAt& at, XQueryFacts& facts) {
  // What fails in a predicate fails there.
  facts.deeds &= static_cast<uint16_t>(~XQueryDeeds::MayFail);
  at.forEachPart([&](XQueryPlaceID part) {
    const XQueryRole role = at.program[part].role;
    const bool isEvaluated = role == XQueryRole::FirstStep || role == XQueryRole::Step;
    if (isEvaluated && at.table[part].does(XQueryDeeds::MayFail)) {
      facts.deeds |= XQueryDeeds::MayFail;
    }
  });
  Walk(at, facts).run();
}

}  // namespace xquery
