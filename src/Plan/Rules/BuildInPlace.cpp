// Nodes that are constructed for the content of another one.
//
// Pattern     an element constructor or a computed attribute whose value is the content of an
//             element or a document, or becomes part of it by way of lists, "return", the branches
//             of a conditional and the cases of a typeswitch
// Facts       none are asked for: the way leads through nothing that could look at the node
// Operator    none: the constructor makes its node in the tree of the one it is for, which it would
//             be moved to
// Why         nobody knows the node before it has its parent, except by way of nodes that it has
//             taken in; from then on the tree knows that it has several roots. A constructor that
//             fails takes the one around it with it.
#include "Expr/Constructors/XQueryAttributeExpr.h"
#include "Expr/Constructors/XQueryElementExpr.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"

namespace xquery {
namespace {

bool becomesContent(const XQueryProgram& program, XQueryPlaceID place) {
  for (int level = 0; level < XQueryPlanning::mostLevels; ++level) {
    const XQueryPlace& at = program[place];
    switch (at.role) {
      case XQueryRole::Content: {
        const Kind kind = program[at.parent].expr->kind();
        return kind == Kind::ElementExpr || kind == Kind::DocumentExpr;
      }
      case XQueryRole::Element:
      case XQueryRole::Branch:
      case XQueryRole::Return:
        place = at.parent;
        break;
      case XQueryRole::Case:
        place = program[at.parent].parent;  // over the case clause
        break;
      default:
        return false;
    }
  }
  return false;
}

}  // namespace

void XQueryBuildInPlace(XQueryPlanning& planning) {
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    XQueryExpr* expr = planning.program[place].expr;
    auto* element = dyn_cast<XQueryElementExpr>(expr);
    auto* attribute = dyn_cast<XQueryComputedAttributeExpr>(expr);
    if (!(element || attribute) || !becomesContent(planning.program, place)) continue;
    if (element) {
      element->buildInPlace();
    } else {
      attribute->buildInPlace();
    }
    planning.choose(place);
  }
}

}  // namespace xquery
