#include "Plan/Rules.h"

#include <array>

namespace xquery {
namespace {

constexpr std::array rules = {
    XQueryRule{"constants", "what consists of literals alone is evaluated once, beforehand",
               XQueryFoldConstants},
    XQueryRule{"names", "comparing name() or local-name() with a constant makes no string",
               XQueryCompareNames},
    XQueryRule{"invariants", "what does not change in a loop is kept from one turn to the next",
               XQueryKeepInvariants},
    XQueryRule{"sets", "the items of a long side of a comparison are found by their values",
               XQueryCompareWithSets},
    XQueryRule{"texts", "comparing children and attributes with a constant makes no values",
               XQueryCompareConstants},
    XQueryRule{"short paths", "what a few steps find from one node is taken as it comes",
               XQueryShortenPaths},
    // Behind what replaces keys and probes, which joins evaluate.
    XQueryRule{"for-joins", "the where clause picks items of the for clauses by their keys",
               XQueryJoinForClauses},
    XQueryRule{"quantifier-joins", "what a quantifier asks for picks items by their keys",
               XQueryJoinQuantifiers},
    XQueryRule{"step-joins", "a predicate picks the items of its step by their keys",
               XQueryJoinSteps},
};

}  // namespace

std::span<const XQueryRule> XQueryRules() {
  return rules;
}

}  // namespace xquery
