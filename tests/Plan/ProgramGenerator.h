// Random programs over random documents. The same seed makes the same.
//
// What they are made of is in a file for each family: ProgramGenerator.cpp has documents, functions
// and what programs consist of, ProgramGeneratorPaths paths and conditions, ProgramGeneratorClauses
// clauses, constructors and calls, ProgramGeneratorJoins what is asked of many items again and
// again.
#pragma once

#include "Expr/RandomChoices.h"

#include <functional>
#include <string>
#include <utility>
#include <vector>

namespace xquery::plantest {

class ProgramGenerator {
 public:
  explicit ProgramGenerator(unsigned seed) : _random(seed) {}

  // Elements a, b, c, some in a namespace, with attributes x and y, small numbers and words for
  // texts, instructions with such names. Some documents are large enough to be indexed.
  std::string document();
  std::string program();

 private:
  static constexpr size_t nodesOfIndexedTree = 260;
  static constexpr size_t elementsWorthAnIndex = 80;

  std::string element(int depth);
  std::string word() { return _random.oneOf({"1", "2", "3", "10", "2.5", "u", "v", "", "-1"}); }
  // A function of one parameter. One that calls itself does so with less each time.
  std::string function(const std::string& name, const std::string& recursion);
  std::string literal();
  std::string constant();
  std::string variable();
  std::string expr(int depth);

  std::string nodeTest();
  std::string predicate(int depth);
  // The items from one position to another.
  std::string range(int depth);
  // A number that may be the same for all items, not be there, or fail.
  std::string computedPosition(int depth);
  std::string nameCondition();
  // One node and a set of nodes.
  std::string membership(int depth);
  // One node and a few steps.
  std::string nearbyNode();
  // What only asks whether there are nodes, or how many.
  std::string existence(int depth);
  std::string step(int depth);
  // What a path begins with that goes on behind parentheses.
  std::string pathInside();
  // Unions, intersections and differences of paths from the document.
  std::string setOfPaths(int depth);
  // A loop whose condition looks at little more than the names above.
  std::string askedOfNames(int depth);
  // A variable that is used instead of a path from the document.
  std::string standsForPath(int depth);
  std::string path(int depth);
  std::string comparison(int depth);
  std::string operand(int depth);

  // With one more variable in scope.
  template <class Make>
  std::string within(const std::string& variable, Make make) {
    _variables.push_back(variable);
    std::string text = make();
    _variables.pop_back();
    return text;
  }

  std::string flwor(int depth);
  std::string quantified(int depth);
  std::string constructor(int depth);
  // Nodes that are looked at while the elements that have taken them in are still being made.
  std::string growingTree(int depth);
  std::string call(int depth);
  std::string other(int depth);
  std::string typeswitch(int depth);

  // Lists long enough for a table, mostly.
  std::string many();
  std::string pathDown();
  std::string inParts(const std::string& whole);
  std::string loopsInParts();
  std::string keyOf(const std::string& item);
  std::string match(const std::string& item);
  std::string difference(const std::string& one, const std::string& other);
  std::string matches(const std::string& item);
  // The same in other words, perhaps with another condition.
  std::string phrased(const std::string& item);
  // An equality and something else of the same items, both with one key for most of them.
  std::string twoMatches(const std::string& item);
  std::string joined(int depth);
  // The condition of a join in the return clause.
  std::string conditional(int depth);
  // Of which only the number is asked for, mostly.
  std::string counted(int depth);
  // Of which the first items are asked for: of a path, or of what is sorted.
  std::string first(int depth);
  // Clauses behind which a condition asks for what an earlier one has set.
  std::string filtered(int depth);
  // Of a list what lies below a node.
  std::string stretch();
  // Clauses that are joined through another one.
  std::string chain();
  // What has come up before in a list.
  std::string earlier();
  // Where values stand in a list.
  std::string positions();
  std::string asked();
  // What has a certain value, asked so often that an index of values is worth its making.
  std::string lookedUp(int depth);
  // The same in a list that a variable holds. `condition` writes one on an item.
  std::string lookedUpInList(const std::function<std::string(const std::string&)>& condition);
  std::string negatedFor(const std::string& kind, const std::string& condition);
  // The same condition for one item after another, so that a table is worth its making.
  std::string join(int depth);

  RandomChoices _random;
  std::vector<std::string> _variables;
  std::vector<std::string> _functions;
  bool _hasGlobal = false;
};

}  // namespace xquery::plantest
