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
    XQueryRule{"texts", "comparing children and attributes with a constant makes no values",
               XQueryCompareConstants},
    XQueryRule{"short paths", "what a few steps find from one node is taken as it comes",
               XQueryShortenPaths},
};

}  // namespace

std::span<const XQueryRule> XQueryRules() {
  return rules;
}

}  // namespace xquery
