// What one evaluation of a path carries from step to step, and a step's node test made ready for
// its nodes.
#pragma once

#include "Expr/Paths/XQueryAxisTrail.h"
#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/Paths/XQueryPathResults.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "xquery/XMLNode.h"

#include <cstdint>
#include <memory>
#include <utility>
#include <vector>

namespace xquery {

class XQueryAxisStep;
class XQueryNameChoice;

class XQueryPathRun {
 public:
  XQueryPathRun(XQueryPathResults& toResults, XQueryContext& forContext)
      : results(toResults), context(forContext) {}

  XQueryPathResults& results;
  XQueryContext& context;
  // An axis step makes each of its context items the focus. Nobody can see that focus, except where
  // an error leaves it behind, so it is left out unless an error may arise from the items.
  bool setsEveryFocus = true;
  // An error has come up: the steps hand nothing on any more.
  bool hasFailed = false;
  // Whether the steps have nothing more to hand on.
  bool isOver() const { return hasFailed || results.isComplete(); }
  // The results will be sorted, so the order in which nodes arrive is free.
  bool orderIsFree = false;

  // A step with predicates that only lists what it would filter, and where; null otherwise.
  const XQueryStep* listingStep = nullptr;
  std::vector<Value>* listed = nullptr;

  // How many steps of the path keep trails.
  size_t trailCount = 0;
  // A trail begins anew where a tree has changed since it was last asked for: what a predicate of
  // an earlier step constructs may give the nodes a parent.
  XQueryAxisTrail& trail(size_t index);

  bool contextHasDefaultNamespace();
  // The interned name of a deferred test; resolved once (which may raise) and kept while the path
  // is evaluated. Null for a name that no node can have.
  const NSXMLExpandedName* nameForDeferredTest(const XQueryNameTest& test);

  // A list for the nodes of one context item, empty; lists are closed in the reverse order of their
  // opening and used again by the next context item. An error abandons them with the run.
  std::vector<NSXMLNode*>& openNodeList() {
    if (_openNodeLists == _nodeLists.size()) {
      _nodeLists.push_back(std::make_unique<std::vector<NSXMLNode*>>());
    }
    std::vector<NSXMLNode*>& nodes = *_nodeLists[_openNodeLists++];
    nodes.clear();
    return nodes;
  }
  void closeNodeList() { --_openNodeLists; }

 private:
  enum class DefaultNamespace : uint8_t { Unknown, None, Present };

  std::vector<std::pair<const XQueryNameTest*, NSXMLExpandedNameRef>> _deferredNames;
  std::vector<std::unique_ptr<std::vector<NSXMLNode*>>> _nodeLists;
  struct Trail {
    XQueryAxisTrail trail;
    uint64_t changeCount = 0;  // NSXMLTree::changeCount at its last use
  };
  std::vector<Trail> _trails;
  size_t _openNodeLists = 0;
  DefaultNamespace _defaultNamespace = DefaultNamespace::Unknown;
};

// A set of node kinds as bits.
constexpr uint32_t XQueryKindBit(Kind kind) {
  return 1U << static_cast<unsigned>(kind);
}

// A node test in the form that is quickest to ask: the kinds of node it accepts as bits and, for a
// name, the interned name. It answers as XQueryAxisStep::isValid does; what the two words cannot
// say is asked there.
//
// A step with a choice of names accepts what the test accepts and has one of the names.
class XQueryNodeTest {
 public:
  XQueryNodeTest(const XQueryAxisStep& step, XQueryPathRun& run);

  bool matches(const NSXMLNode* node) {
    if ((_kinds & XQueryKindBit(node->kind())) == 0) return false;
    if (_name) return node->expandedName() == _name;
    return !_askFurther || matchesFurther(node);
  }
  // The name that an element or attribute needs when it needs nothing else, and other nodes cannot
  // have; null for another test.
  const NSXMLExpandedName* onlyName() const { return _name; }
  // The same for names of which a node needs one; instructions may have them as well.
  const NSXMLNameSelection* onlyNames() const { return _namesAreKnown ? _choice : nullptr; }
  bool acceptsInstructions() const {
    return (_kinds & XQueryKindBit(Kind::ProcessingInstruction)) != 0;
  }

 private:
  void setTest();
  void setChoice();
  void setNameTest(const XQueryNameTest& test);
  void setWildCard(const XQueryWildCardNameTest& test);
  void setKindTest(const XQueryTypeDeclaration& test);
  void accept(uint32_t kinds) { _kinds = kinds; }
  void ask(uint32_t kinds) {
    _kinds = kinds;
    _askFurther = true;
  }
  bool matchesFurther(const NSXMLNode* node);

  const XQueryExpr* _expr;
  XQueryPathRun& _run;
  const NSXMLExpandedName* _name = nullptr;
  const XQueryNameChoice* _choice;
  uint32_t _kinds = 0;
  bool _askFurther = false;
  bool _namesAreKnown = false;
};

}  // namespace xquery
