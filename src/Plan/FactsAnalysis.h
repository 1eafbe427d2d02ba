// The analysis that finds the facts of every place of a program, parts before their wholes.
//
// What follows from the parts is said once for each class of expressions, in the table of
// FactsAnalysis.cpp and the files of the families beside it:
//
//   FactsOfLeaves, FactsOfRoots, FactsOfOperators, FactsOfPaths, FactsOfClauses, FactsOfCalls
//
// To add a class: a row in the table and a function in the file of its family.
//
// A declared function has a summary: the facts of its body. Functions that call each other are gone
// over until no summary changes; each time they can only say less.
#pragma once

#include "Plan/Facts.h"
#include "Plan/Program.h"

#include <unordered_map>
#include <vector>

namespace xquery {

class XQueryFactTable {
 public:
  explicit XQueryFactTable(const XQueryProgram& program);

  const XQueryFacts& operator[](XQueryPlaceID place) const { return _facts[place]; }
  // Of what a call of the function answers; the weakest for one that is not of the program.
  const XQueryFacts& ofFunction(const XQueryFunctionDecl* function) const;
  // Whether the local variable that is read there has been set, whatever happened before.
  bool isSurelySet(XQueryPlaceID variable) const;
  // The same for that of a quantifier's clause wherever it can be read.
  bool setsSurely(XQueryPlaceID clause) const;

 private:
  void analyse();
  bool summarize();

  const XQueryProgram& _program;
  using Function = const XQueryFunctionDecl*;
  XQueryPlanList<XQueryFacts> _facts;
  std::unordered_map<Function, XQueryFacts, std::hash<Function>, std::equal_to<>,
                     ValueAllocator<std::pair<const Function, XQueryFacts>>>
      _functions;
};

// One place while its facts are found. Those of its parts are known.
class XQueryFactsAt {
 public:
  XQueryFactsAt(const XQueryProgram& inProgram, const XQueryFactTable& known, XQueryPlaceID at)
      : program(inProgram), table(known), place(at) {}

  const XQueryPlace& here() const { return program[place]; }
  template <class T>
  const T& expr() const {
    return *cast<T>(here().expr);
  }
  // Of the first part in that role; null without one.
  const XQueryFacts* part(XQueryRole role) const {
    const XQueryPlaceID found = program.part(place, role);
    return found == XQueryNoPlace ? nullptr : &table[found];
  }
  // The same, where what is left out is the empty sequence.
  XQueryFacts partOrNone(XQueryRole role) const {
    const XQueryFacts* facts = part(role);
    return facts ? *facts : XQueryFacts::none();
  }
  // Calls visit(place) for each part, in order.
  template <class Visit>
  void forEachPart(Visit visit) const {
    for (XQueryPlaceID each = program.firstPart(place); each != XQueryNoPlace;
         each = program.nextPart(each)) {
      visit(each);
    }
  }
  // What is known of "." in the focus that is set at a place.
  XQueryFacts itemOfFocus(XQueryPlaceID focus) const;

  const XQueryProgram& program;
  const XQueryFactTable& table;
  const XQueryPlaceID place;
};

// What a class of expressions concludes from its parts. The facts given already tell what all the
// parts read and do together, and nothing of the items.
using XQueryConclude = void (*)(const XQueryFactsAt& at, XQueryFacts& facts);

// Whether there is a document above the context item, once evaluation comes to the place: what is
// evaluated before has found it. Asked while the place is analysed.
bool XQueryFindsRootBefore(const XQueryFactsAt& at);

// Leaves.
void XQueryFactsOfLiteral(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfVariable(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfContextItem(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfQNameReference(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfNoValue(const XQueryFactsAt& at, XQueryFacts& facts);
// Operators, lists, type expressions.
void XQueryFactsOfList(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfOperator(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfTruth(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfTreat(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfCast(const XQueryFactsAt& at, XQueryFacts& facts);
// Paths.
void XQueryFactsOfRoot(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfPath(const XQueryFactsAt& at, XQueryFacts& facts);
// Clauses.
void XQueryFactsOfBinding(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfCase(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfOrderSpec(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfFLWOR(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfQuantifier(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfConditional(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfTypeswitch(const XQueryFactsAt& at, XQueryFacts& facts);
// Constructors and calls.
void XQueryFactsOfConstructor(const XQueryFactsAt& at, XQueryFacts& facts);
void XQueryFactsOfCall(const XQueryFactsAt& at, XQueryFacts& facts);

// What a value is known to be that matches a declared type: a matter of kinds and count.
void XQueryRestrictToType(const XQueryExpr* type, XQueryFacts& facts);
// Whether an operator may fail where its operands do not.
bool XQueryOperatorMayFail(int type, const XQueryFacts& left, const XQueryFacts& right);
// The kinds that an axis step may find.
class XQueryAxisStep;
XQueryItemKinds XQueryKindsOfStep(const XQueryAxisStep& step);

}  // namespace xquery
