#include "Plan/Rules.h"

#include <array>

namespace xquery {
namespace {

constexpr std::array rules = {
    XQueryRule{"paths", "an operator walks it, which further rules know of", XQueryWalkPaths},
    XQueryRule{"name tests", "a filter or a union of names becomes the test of one step",
               XQueryTakeNames},
    XQueryRule{"paths in paths", "a path that begins with another one goes on from its steps",
               XQuerySplicePaths},
    XQueryRule{"moved paths", "a path is walked where the variable is used that stands for it",
               XQueryMovePaths},
    XQueryRule{"positions", "a position that is compared with a number is asked for by number",
               XQueryTakePositions},
    XQueryRule{"ranges", "the items from one position to another are taken without asking each",
               XQueryTakePositionRanges},
    XQueryRule{"ends", "conditions in front of a position are asked no further than that",
               XQueryEndWithPositions},
    XQueryRule{"walks", "no node is walked twice, and no further than needed", XQueryKeepTrails},
    XQueryRule{"constants", "what consists of literals alone is evaluated once, beforehand",
               XQueryFoldConstants},
    XQueryRule{"names", "comparing name() or local-name() with a constant makes no string",
               XQueryCompareNames},
    XQueryRule{"invariants", "what does not change in a loop is kept from one turn to the next",
               XQueryKeepInvariants},
    // Before what replaces operands, which would not see that a variable holds something else.
    XQueryRule{"lists", "a variable takes the number of items where nothing else is asked for",
               XQueryCountLists},
    XQueryRule{"earlier items", "what is equal before a position is found in a table",
               XQueryCompareEarlierItems},
    XQueryRule{"sets", "the items of a long side of a comparison are found by their values",
               XQueryCompareWithSets},
    XQueryRule{"set counts", "the nodes of sets are counted by the names on the way to them",
               XQueryCountSets},
    XQueryRule{"loop counts", "what loops over paths find is counted as what one path finds",
               XQueryCountLoops},
    XQueryRule{"way counts", "a loop that asks for names above is counted by the ways of names",
               XQueryCountByWays},
    XQueryRule{"counts", "items are counted, or found to be there, without a list of them",
               XQueryCountPaths},
    XQueryRule{"first", "no more is walked or sorted than the first items that are asked for",
               XQueryTakeFirst},
    XQueryRule{"one by one", "a clause finds no more of its items than are asked for",
               XQueryTakeOneByOne},
    XQueryRule{"members", "whether one node is in a large set is looked up in a table",
               XQueryAskMembers},
    XQueryRule{"index-of", "where a value stands in a list is looked up in a table",
               XQueryFindPositions},
    XQueryRule{"set filters", "a path is asked for each node of a set whether it finds that",
               XQueryFilterByPaths},
    XQueryRule{"nearby nodes", "whether a few steps find one node is asked without a list of all",
               XQueryFindNearbyNodes},
    XQueryRule{"texts", "comparing children and attributes with a constant makes no values",
               XQueryCompareConstants},
    XQueryRule{"conditions", "several conditions on a node are asked of it as it is",
               XQueryJoinConditions},
    // Behind what asks conditions of nodes as they are.
    XQueryRule{"stretches", "of nodes in order those below another one are found where they begin",
               XQueryTakeStretches},
    XQueryRule{"short paths", "what a few steps find from one node is taken as it comes",
               XQueryShortenPaths},
    XQueryRule{"operands", "arithmetic and comparisons of numbers and texts make no values between",
               XQueryAnswerQuickly},
    XQueryRule{"constructors",
               "what is constructed for another node is made in the tree of that one",
               XQueryBuildInPlace},
    // Behind what replaces probes, which looking up evaluates.
    XQueryRule{"values", "elements with a value are found in the index of the tree",
               XQueryLookUpValues},
    // Behind what replaces keys and probes, which joins evaluate.
    XQueryRule{"for-joins", "the where clause picks items of the for clauses by their keys",
               XQueryJoinForClauses},
    XQueryRule{"quantifier-joins", "what a quantifier asks for picks items by their keys",
               XQueryJoinQuantifiers},
    XQueryRule{"step-joins", "a predicate picks the items of its step by their keys",
               XQueryJoinSteps},
    // Behind the joins, which evaluate what conditions consist of.
    XQueryRule{"early conditions", "a condition is asked as soon as what it reads is there",
               XQueryAskEarly},
    // Before what calls these functions with machine numbers.
    XQueryRule{"functions",
               "functions of numbers, texts and lists are computed without objects, calls included",
               XQueryComputeFunctions},
    XQueryRule{"scalars", "arithmetic, comparisons and logic over numbers make no objects between",
               XQueryComputeScalars},
    // Behind what it adds without making it.
    XQueryRule{"folds", "what a loop yields is summed up or compared as it comes, without a list",
               XQueryFoldNumbers},
    // Behind all that evaluates expressions otherwise than they are written.
    XQueryRule{"last uses", "a list that is read for the last time is changed instead of copied",
               XQueryTakeLastUses},
};

}  // namespace

std::span<const XQueryRule> XQueryRules() {
  return rules;
}

}  // namespace xquery
