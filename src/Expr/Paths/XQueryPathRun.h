// What one evaluation of a path carries from step to step, and a step's node test made ready for
// its nodes.
#pragma once

#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/Paths/XQueryPathResults.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Platform/Tree/Names.h"
#include "xquery/XMLNode.h"

#include <cstdint>
#include <memory>
#include <utility>
#include <vector>

namespace xquery {

// Whether every item of a value of any shape is a node.
bool XQueryAllAreNodes(const Value& items);

class XQueryPathRun {
 public:
  XQueryPathRun(XQueryPathResults& toResults, XQueryContext& forContext)
      : results(toResults), context(forContext) {}

  XQueryPathResults& results;
  XQueryContext& context;
  // An error has come up: the steps hand nothing on any more.
  bool hasFailed = false;

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
class XQueryNodeTest {
 public:
  // The test of a step, or null, which nothing passes.
  XQueryNodeTest(const XQueryExpr* test, XQueryPathRun& run);
  // Makes it accept none but these kinds.
  void restrictTo(uint32_t kinds) { _kinds &= kinds; }
  uint32_t kinds() const { return _kinds; }
  // Whether it takes every node of these kinds.
  bool asksForKindAlone() const { return !_name && !_askFurther; }

  bool matches(const NSXMLNode* node) {
    if ((_kinds & XQueryKindBit(node->kind())) == 0) return false;
    if (_name) return node->expandedName() == _name;
    return !_askFurther || matchesFurther(node);
  }
  // The name that an element or attribute needs when it needs nothing else, and other nodes cannot
  // have; null for another test.
  const NSXMLExpandedName* onlyName() const { return _name; }

 private:
  void setTest();
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
  XQueryPathRun* _run;
  const NSXMLExpandedName* _name = nullptr;
  uint32_t _kinds = 0;
  bool _askFurther = false;
};

}  // namespace xquery
