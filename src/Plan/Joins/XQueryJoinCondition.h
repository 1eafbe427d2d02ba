// The comparison by which a where clause, a quantifier or a predicate picks items: one operand, the
// key, is read from the item, the other one, the probe, is the same for all items of one round.
#pragma once

#include "Expr/XQueryExpr.h"
#include "Plan/Joins/XQueryConditionParts.h"
#include "Plan/Joins/XQueryJoinKeys.h"
#include "Plan/Joins/XQueryJoinTable.h"
#include "Plan/Paths/XQueryValueWay.h"
#include "Plan/Planning.h"

#include <optional>
#include <utility>
#include <vector>

namespace xquery {

class XQueryStep;
class XQueryWalkedPath;

// What an expression reads while items are picked.
enum class XQueryJoinReads : uint8_t {
  Item,     // the item and nothing else
  Round,    // anything but the item
  Unknown,  // both, or it is not repeatable
};

// How the items are known to what reads them.
struct XQueryJoinScope {
  bool isFocus = false;       // the item is the context item; otherwise
  XQueryVariableSet item;     // variables that hold the item, or what follows from it alone
  XQueryVariableSet settled;  // variables that are set anew for each item, these included
  int64_t itemID = 0;         // the variable that holds the item itself, if any
  int level = 0;              // how many conditions it is inside of, which are asked of each node

  XQueryJoinReads readsOf(const XQueryFacts& facts) const;
};

// One comparison.
struct XQueryJoinTerm {
  Ref<XQueryExpr> key;
  Ref<XQueryExpr> probe;
  XQueryJoinRelation relation;
  // How much it promises to exclude, never 0.
  int promise = 0;
  // What is behind it excludes items as well: neither key nor probe may fail where it does.
  bool mustNotFail = false;
  // Terms behind it may exclude those items only for which its own table has an answer.
  bool mustAnswer = false;
  // The key looks outside the item.
  bool looksOutOfItems = false;
  // What the probe reads where it looks outside the nodes that it starts from.
  std::optional<XQueryFacts> outward;
  // Of an equality the way from an item to its key, if it is one by which the index of a tree may
  // know the item.
  std::optional<XQueryValueWay> way;
};

struct XQueryJoinCondition {
  // Joined by "and"; none when there is no comparison. The one that promises most is the first,
  // unless one must answer: then they are in their order.
  std::vector<XQueryJoinTerm> terms;
  // The terms, filters and guards are the whole condition.
  bool isWhole = false;
  // What else there is up to the last term, all joined by "and": conditions that read the item
  // only, and those that do not read it.
  std::vector<Ref<XQueryExpr>> filters;
  bool filtersMayFail = false;
  std::vector<Ref<XQueryExpr>> guards;
  // What would be evaluated for an item that is left out, and must not fail: what reads the item
  // only, and what does not read it.
  std::vector<Ref<XQueryExpr>> checks;
  std::vector<Ref<XQueryExpr>> needed;
  // Filters and checks look outside the item.
  bool looksOutOfItems = false;
  // What those of the guards and the needed read that look outside the nodes they start from.
  std::vector<XQueryFacts> outward;
  // Local variables that evaluating any of this sets.
  XQueryVariableSet assigns;
  // Where the condition is that one of several holds: the others, in their order behind this one,
  // which have none of their own. None is asked behind one that holds.
  std::vector<XQueryJoinCondition> orElse;

  // Another condition holds as well, and an error in either excludes an item.
  void join(XQueryJoinCondition other) {
    add(std::move(other));
    putBestFirst();
  }
  // The same for one of many, before the best are put first.
  void add(XQueryJoinCondition other);
  // There is more to the condition.
  void leaveOpen();
  // What is evaluated for no item that is left out must not fail either.
  void addNeeded(const std::vector<Ref<XQueryExpr>>& more);
  void putBestFirst();
};

// Finds the comparisons of a condition.
class XQueryJoinSearch {
 public:
  XQueryJoinSearch(const XQueryPlanning& planning, XQueryJoinScope scope,
                   std::vector<XQueryJoinClause> clauses)
      : _planning(planning), _scope(scope), _clauses(std::move(clauses)) {}

  // The comparisons, of those joined by "and", that can pick items. An item that one excludes is
  // excluded by the whole condition: where an error excludes as well (`errorExcludes`) because what
  // stands before it is repeatable and what stands behind it cannot tell whether there was an
  // error, and otherwise because what stands before it reads the item only, or does not read it, or
  // cannot fail.
  XQueryJoinCondition conditionIn(XQueryPlaceID place, bool errorExcludes) const;
  // The same where the items are picked for which the condition may not hold.
  XQueryJoinCondition complementIn(XQueryPlaceID place) const;

  // The conditions that "and" joins, in their order; none for too long a chain.
  std::vector<XQueryPlaceID> conjuncts(XQueryPlaceID condition) const;
  // Nothing that the condition could come to makes "and" fail.
  bool cannotFail(XQueryPlaceID place) const;

 private:
  struct Comparison {
    XQueryJoinRelation relation;
    Ref<XQueryExpr> key;  // null for none
    Ref<XQueryExpr> probe;
    XQueryFacts keyFacts;
    XQueryFacts probeFacts;
    XQueryPlaceID keyPlace = XQueryNoPlace;  // where the key is written, if it is
    bool isWhole = true;
  };
  // The value comparison code whose relation an operator asks for.
  static std::optional<int> relationCode(int operatorType);

  const XQueryPlace& at(XQueryPlaceID place) const { return _planning.program[place]; }
  const XQueryFacts& facts(XQueryPlaceID place) const { return _planning.facts[place]; }
  Comparison comparisonAt(const XQueryConditionPart& part) const;
  Comparison comparisonThatFails(XQueryPlaceID place) const;
  struct Operand {
    Ref<XQueryExpr> expr;
    XQueryFacts facts;
    XQueryPlaceID place = XQueryNoPlace;  // unless it is that of a function's body
  };
  static Comparison comparisonOf(int operatorType, Operand left, Operand right,
                                 const XQueryJoinScope& scope);
  Comparison operandsAt(XQueryPlaceID place, const XQueryJoinScope& scope) const;
  Comparison comparisonOfCall(XQueryPlaceID place) const;
  Comparison comparisonOfPrefix(XQueryPlaceID place) const;
  Comparison comparisonOfPath(XQueryPlaceID place) const;
  Comparison comparisonOfStart(XQueryPlaceID place, XQueryWalkedPath& path) const;
  Comparison comparisonOfStep(XQueryPlaceID place, XQueryWalkedPath& path) const;
  Comparison comparisonOfNodes(XQueryWalkedPath& path, const XQueryStep& step,
                               const std::vector<XQueryPlaceID>& predicates,
                               const XQueryFacts& before, bool isOne) const;
  Comparison comparisonOfDifference(XQueryPlaceID place) const;
  Comparison comparisonOfSame(XQueryPlaceID place) const;
  Comparison equalityOf(XQueryPlaceID left, XQueryPlaceID right, XQueryItemKinds kinds) const;
  bool joinsWith(Comparison& found, bool mayExchange) const;
  bool describePartOfCall(XQueryPlaceID call, XQueryPlaceID body, XQueryPlaceID part,
                          Operand& operand) const;
  Comparison comparisonOfSome(XQueryPlaceID place) const;
  struct Before;
  XQueryJoinScope ofItemOnly() const;
  XQueryJoinCondition conditionOf(const XQueryConditionPart& whole, bool errorExcludes) const;
  XQueryJoinCondition conditionOf(const XQueryConditionParts& parts, bool errorExcludes) const;
  XQueryJoinCondition alternativesIn(const XQueryConditionParts& parts, bool errorExcludes) const;
  XQueryJoinCondition alternativesOf(const XQueryConditionParts& parts, size_t index,
                                     bool errorExcludes) const;
  XQueryJoinCondition termsIn(const XQueryConditionParts& parts, bool errorExcludes,
                              bool takesConstants) const;
  bool pass(const XQueryConditionPart& part, Before& before) const;
  bool passTerm(XQueryPlaceID place, const Comparison& comparison, XQueryJoinCondition& condition,
                Before& before) const;
  bool passComparison(XQueryPlaceID place, const XQueryJoinScope& scope, Before& before) const;
  std::vector<XQueryJoinClause> clausesBefore(const XQueryFacts& key) const;
  std::optional<XQueryValueWay> wayOf(const Comparison& comparison) const;
  XQueryJoinTerm made(const Comparison& comparison) const;

  const XQueryPlanning& _planning;
  const XQueryJoinScope _scope;
  const std::vector<XQueryJoinClause> _clauses;
};

}  // namespace xquery
