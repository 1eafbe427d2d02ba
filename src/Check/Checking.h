// What a family of warnings is given: the program, what is known of it, and who hears.
#pragma once

#include "Check/WarningTable.h"
#include "Plan/FactsAnalysis.h"
#include "Plan/Program.h"
#include "xquery/Warnings.h"

#include <initializer_list>
#include <string>
#include <string_view>
#include <unordered_map>
#include <unordered_set>
#include <vector>

namespace xquery {

class XQueryFunctionCall;
class XQueryUses;

class XQueryChecking {
 public:
  // So many warnings are kept: nobody reads more.
  static constexpr size_t mostWarnings = 10'000;
  // How far a family looks around from a place, so that checking stays in proportion to the length
  // of a query.
  static constexpr int mostLevels = 64;

  XQueryChecking(const XQueryProgram& ofProgram, const XQueryFactTable& known,
                 const XQueryProlog& mainProlog);

  using ID = XQueryWarningID;
  using Parts = std::initializer_list<std::string>;

  // The parts take the places of "…" in the text of the warning.
  void warn(XQueryPlaceID place, ID id, Parts parts = {}, const Ref<NSString>& name = nullptr);
  // Where no expression stands: the line, counted from 0, and the number of the place where it is
  // known.
  struct Spot {
    int64_t line;
    XQueryPlaceNumber number = 0;
  };
  // The same at a spot of a module.
  void warnAt(const XQueryProlog& module, Spot spot, ID id, Parts parts = {},
              const Ref<NSString>& name = nullptr);
  // Whether it is asked for the first time about that place: for what is told once of a whole.
  bool isFirstIn(XQueryPlaceID whole) { return _toldOf.insert(whole).second; }
  bool isFull() const { return _found.size() >= mostWarnings; }
  // What has been found, in order.
  std::vector<XQueryWarning> takeWarnings();

  // --- looking at places -----------------------------------------------------------------------
  const XQueryPlace& at(XQueryPlaceID place) const { return program[place]; }
  template <class T>
  const T* as(XQueryPlaceID place) const {
    return place == XQueryNoPlace ? nullptr : dyn_cast<T>(at(place).expr);
  }
  // What stands there, without the parentheses around it.
  template <class T>
  const T* inside(XQueryPlaceID place) const {
    return place == XQueryNoPlace ? nullptr : as<T>(program.withoutParentheses(place));
  }
  // An argument of a call, or the places of both operands; XQueryNoPlace where there is none.
  XQueryPlaceID argument(XQueryPlaceID call, size_t index) const;
  size_t argumentCount(XQueryPlaceID call) const;
  XQueryPlaceID leftOperand(XQueryPlaceID whole) const;
  XQueryPlaceID rightOperand(XQueryPlaceID whole) const;
  // The built-in function that is called there, of the namespace of functions; empty for any other
  // expression.
  std::string_view functionCalledIn(XQueryPlaceID place) const;
  // The value of a literal, in parentheses or not; null for anything else.
  const NSObject* literalIn(XQueryPlaceID place) const;
  // A literal that is a text; none for anything else.
  const NSString* textIn(XQueryPlaceID place) const;
  // Whether the text, cast to a QName there, has a prefix that the prolog does not know: prefixes
  // of constructors, and those that a caller makes known, are not asked.
  bool hasUnknownPrefix(const NSString& name, XQueryPlaceID place) const;
  // Whether it is a call that gives texts as untyped values, where XQuery 1.0 has strings.
  bool givesUntypedText(XQueryPlaceID place) const;
  // Whether it is a search that may find nothing, or is nothing. Of what a variable or a function
  // gives that is hardly ever known.
  bool mayWellBeEmpty(XQueryPlaceID place) const;
  // What was written, as far as a message needs it.
  std::string labelOf(XQueryPlaceID place) const;
  const XQueryFacts& factsOf(XQueryPlaceID place) const { return facts[place]; }
  // The kinds of the atomized value, surely all of them known; None where an item may be anything.
  XQueryItemKinds atomicKinds(XQueryPlaceID place) const;
  // Whether a name could not be resolved in the query and waits for the namespaces of its caller.
  bool waitsForCaller(const XQueryExpr* name) const { return _waitingNames.contains(name); }
  // Null for what has no body in the program.
  const XQueryProgramBody* bodyOf(const XQueryFunctionDecl* function) const;
  const XQueryProgramBody* bodyOf(const XQueryVarDecl* variable) const;

  // The functions of a local name that a module has declared or imported.
  using Functions = std::vector<const XQueryFunctionDecl*>;
  const Functions& functionsNamed(const XQueryProlog& prolog, const std::string& localName);

  const XQueryProgram& program;
  const XQueryFactTable& facts;
  const XQueryProlog& main;

 private:
  struct Found {
    size_t module;  // 0 for the main one, the others in the order of the bodies
    XQueryPlaceID place;
    XQueryPlaceNumber number;  // of its place in the text
    XQueryWarning warning;
  };
  static Spot spotOf(const XQueryProgram& program, XQueryPlaceID place);
  void add(const XQueryProlog& module, XQueryPlaceID place, Spot spot, XQueryWarning warning);
  size_t numberOf(const XQueryProlog& module);
  static XQueryWarning warningOf(ID id, Parts parts, const Ref<NSString>& name);

  std::vector<Found> _found;
  std::unordered_set<XQueryPlaceID> _toldOf;
  std::unordered_map<const XQueryProlog*, size_t> _modules;
  std::unordered_map<const NSObject*, const XQueryProgramBody*> _bodies;
  std::unordered_set<const XQueryExpr*> _waitingNames;
  // Made for a module when it is first asked for.
  std::unordered_map<const XQueryProlog*, std::unordered_map<std::string, Functions>> _functions;
};

// Whether a collation is the order of code points, by which all text is compared.
bool XQueryIsCodepointCollation(std::string_view URI);

// "a string", "a number": kinds of values for people.
std::string XQueryNameOfKinds(XQueryItemKinds kinds);

// --- families ------------------------------------------------------------------------------------

// Each looks at one place, of an expression of its kind.
void XQueryCheckCallName(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckVariable(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckNameTest(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckConstructorName(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckComputedName(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckAnyType(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckTest(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckOperator(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckPath(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckTypedExpr(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckBindingType(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckTypeswitch(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckCast(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckLiteral(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckBuiltInCall(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckFLWOR(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckQuantifier(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckElement(XQueryChecking& checking, XQueryPlaceID place);
void XQueryCheckDocument(XQueryChecking& checking, XQueryPlaceID place);
// Each looks at the whole program.
void XQueryCheckUnused(XQueryChecking& checking, const XQueryUses& uses);
void XQueryCheckEmptyComparisons(XQueryChecking& checking, const XQueryUses& uses);
void XQueryCheckReverseOrder(XQueryChecking& checking, const XQueryUses& uses);
void XQueryCheckDeclarations(XQueryChecking& checking, const XQueryUses& uses);
void XQueryCheckRemarks(XQueryChecking& checking, const XQueryUses& uses);

}  // namespace xquery
