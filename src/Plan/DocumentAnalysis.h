// What analyses have in common that ask how a program looks at the document that is its context
// item, before it is read: they go over the program until a place shows that it cannot be read in
// the way that they are for.
//
// The descendant axis of this language ends where the next sibling of its node or of that one's
// parent begins, and with the document where there is neither. From an element of at most
// `levelsThatHoldDescendants` levels it finds no element outside of that: were there neither a next
// sibling of it nor of its parent, then no element would follow.
#pragma once

#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Plan/FactsAnalysis.h"
#include "Plan/Program.h"

#include <cstddef>
#include <string_view>
#include <utility>

namespace xquery {

// `Plan`: what the analysis finds, with the place and the reason of a refusal.
template <class Plan>
class XQueryDocumentAnalysis {
 public:
  XQueryDocumentAnalysis(const XQueryProgram& program, const XQueryFactTable& facts)
      : _program(program), _facts(facts) {}

 protected:
  static constexpr size_t levelsThatHoldDescendants = 3;

  // Does the work, which may refuse, and answers the plan.
  template <class Work>
  Plan planBy(Work work) {
    try {
      work();
    } catch (const Refusal& refusal) {
      _plan.refusedAt = refusal.place;
      _plan.reason = refusal.reason;
    }
    return std::move(_plan);
  }
  [[noreturn]] static void refuse(XQueryPlaceID place, std::string_view reason) {
    throw Refusal{place, reason};
  }

  const XQueryExpr* exprAt(XQueryPlaceID place) const { return _program[place].expr; }
  static bool asksForAnyNode(const XQueryExpr* test) {
    const auto* type = dyn_cast<XQueryTypeDeclaration>(test);
    return type && type->type() == XQueryTypeDeclaration::AnyKindTest;
  }

  const XQueryProgram& _program;
  const XQueryFactTable& _facts;
  Plan _plan;

 private:
  struct Refusal {
    XQueryPlaceID place;
    std::string_view reason;
  };
};

}  // namespace xquery
