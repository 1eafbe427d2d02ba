#include "Check/Check.h"

#include "Check/Checking.h"
#include "Check/Uses.h"
#include "Platform/Base/WorkMeter.h"

#include <array>
#include <vector>

namespace xquery {
namespace {

using Look = void (*)(XQueryChecking&, XQueryPlaceID);

struct Row {
  Kind kind;
  Look look;
};

constexpr std::array rows = {
    Row{Kind::FunctionCall, XQueryCheckCallName},
    Row{Kind::FunctionCall, XQueryCheckBuiltInCall},
    Row{Kind::FunctionCall, XQueryCheckCast},
    Row{Kind::Variable, XQueryCheckVariable},
    Row{Kind::NameTest, XQueryCheckNameTest},
    Row{Kind::WildCardNameTest, XQueryCheckNameTest},
    Row{Kind::QNameReference, XQueryCheckConstructorName},
    Row{Kind::TypeDeclaration, XQueryCheckAnyType},
    Row{Kind::OperatorExpr, XQueryCheckOperator},
    Row{Kind::PathExpr, XQueryCheckPath},
    Row{Kind::InstanceOfExpr, XQueryCheckTypedExpr},
    Row{Kind::TreatExpr, XQueryCheckTypedExpr},
    Row{Kind::CastExpr, XQueryCheckCast},
    Row{Kind::CastableExpr, XQueryCheckCast},
    Row{Kind::ForExpr, XQueryCheckBindingType},
    Row{Kind::LetExpr, XQueryCheckBindingType},
    Row{Kind::QuantifiedItem, XQueryCheckBindingType},
    Row{Kind::TypeswitchExpr, XQueryCheckTypeswitch},
    Row{Kind::Literal, XQueryCheckLiteral},
    Row{Kind::FLWORExpr, XQueryCheckFLWOR},
    Row{Kind::QuantifiedExpr, XQueryCheckQuantifier},
    Row{Kind::ElementExpr, XQueryCheckElement},
    Row{Kind::ElementExpr, XQueryCheckComputedName},
    Row{Kind::ComputedAttributeExpr, XQueryCheckComputedName},
    Row{Kind::DocumentExpr, XQueryCheckDocument},
};

using Looks = std::array<std::vector<Look>, 256>;

const Looks& looksByKind() {
  static const Looks table = [] {
    Looks found;
    for (const Row& row : rows) found[static_cast<size_t>(row.kind)].push_back(row.look);
    return found;
  }();
  return table;
}

constexpr std::array<void (*)(XQueryChecking&, const XQueryUses&), 5> wholes = {
    XQueryCheckUnused,       XQueryCheckEmptyComparisons, XQueryCheckReverseOrder,
    XQueryCheckDeclarations, XQueryCheckRemarks,
};

}  // namespace

std::vector<XQueryWarning> XQueryCheckedProgram(const XQueryProlog& prolog,
                                                const Ref<XQueryExpr>& body) {
  const XQueryProgram program(prolog, body);
  const XQueryFactTable facts(program);
  XQueryChecking checking(program, facts, prolog);
  const Looks& looks = looksByKind();
  WorkPacer pacer;
  for (XQueryPlaceID place = 0; place < program.placeCount() && !checking.isFull(); ++place) {
    pacer.turn();
    for (const Look look : looks[static_cast<size_t>(program[place].expr->kind())]) {
      look(checking, place);
    }
    XQueryCheckTest(checking, place);
  }
  const XQueryUses uses(checking);
  for (const auto& look : wholes) look(checking, uses);
  return checking.takeWarnings();
}

}  // namespace xquery
