// What the value of an expression depends on: found by looking at a bound expression, so that a
// value can be kept, or found by another way, where that makes no difference.
#pragma once

#include <cstdint>
#include <vector>

namespace xquery {

class XQueryExpr;

struct XQueryReads {
  // Whether every evaluation with the same context item, position, size and variables gives an
  // equal value, or fails alike, and does nothing else that anybody could tell: literals,
  // variables, the context item, operators, lists, paths, and calls of functions that look at their
  // arguments only. Nothing else is known to be repeatable, constructors least of all, and very
  // large expressions are not looked through. The other answers count for repeatable expressions.
  bool isRepeatable = true;
  // The context item.
  bool focus = false;
  // What lies outside the subtrees of the nodes it starts from: an element that a constructor
  // made gets a parent later, so this may change, while what is inside a node never does, nor what
  // is around a node of a document. The descendant axes may look out, since they go on to the end
  // of the document from a last child of a last child.
  bool outside = false;
  bool globals = false;
  // A document may be fetched, once for the whole evaluation.
  bool loads = false;
  // IDs of local variables, each once.
  std::vector<int64_t> variables;

  bool readsVariable(int64_t varID) const;
};

XQueryReads XQueryReadsOf(const XQueryExpr& expr);

// Whether an expression may be evaluated any number of times for the same focus. Where something
// may assign variables between two evaluations, an expression that reads one is not repeatable.
bool XQueryIsRepeatable(const XQueryExpr& expr, bool variablesMayChange = false);

}  // namespace xquery
