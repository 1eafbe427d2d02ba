// The names that a step takes where it takes several, or where a predicate says which: the step
// "(a | b)", and "*[self::a or self::b]", "*[name() = ('a', 'b')]", "*[local-name() = 'a']"; and
// those that a wildcard with a prefix or a local name takes.
//
// A rule gives a step its choice (XQueryWalkedStep); what the query says in its place is evaluated
// no more.
#pragma once

#include "Expr/Paths/XQueryNameTest.h"
#include "Platform/Tree/NameIndex.h"
#include "xquery/String.h"
#include "xquery/XMLNode.h"

#include <utility>
#include <vector>

namespace xquery {

class XQueryNameChoice final : public NSXMLNameSelection {
 public:
  enum class By : uint8_t {
    Test,       // an element or attribute as a name test finds it
    Element,    // an element as a name test finds it
    LocalName,  // any node whose local name is the text
    NodeName,   // an element or attribute whose local name is the text
    Name,       // any node whose name is the text, with its prefix
    URI,        // any node whose name is in the namespace of the text
  };

  // A test that cannot raise an error, or a text that is not empty.
  void addTest(By by, Ref<XQueryNameTest> test) { add({by, std::move(test), {}}); }
  void addText(By by, Ref<NSString> text) { add({by, {}, std::move(text)}); }
  void add(const XQueryNameChoice& others) {
    _alternatives.insert(_alternatives.end(), others._alternatives.begin(),
                         others._alternatives.end());
  }
  // Those names alone that are also among the others.
  void meet(const XQueryNameChoice& others);
  bool isEmpty() const { return _alternatives.empty(); }
  size_t count() const { return _alternatives.size(); }

  // Whether elements and attributes alone can have one of the names.
  bool isOfTests() const;
  // Whether elements alone can.
  bool isOfElements() const;
  // The only name; null where there are several or it is a text.
  const XQueryNameTest* onlyTest() const;
  // Whether the names depend on the namespaces of the context: of one with a default namespace.
  bool needsContext() const;
  bool accepts(const NSXMLNode& node, XQueryContext* context) const;

  // For an index, where no context is needed.
  bool mayTake(const NSXMLExpandedName& name) const override;
  bool takes(const NSXMLNode& node) const override { return accepts(node, nullptr); }

 private:
  struct Condition {
    By by;
    Ref<XQueryNameTest> test;
    Ref<NSString> text;

    bool accepts(const NSXMLNode& node, XQueryContext* context) const;
    bool mayTake(const NSXMLExpandedName& name) const;
  };
  // All of them must hold.
  using Alternative = std::vector<Condition>;

  void add(Condition condition) { _alternatives.push_back({std::move(condition)}); }
  template <class Holds>
  bool eachHasOne(Holds holds) const;

  std::vector<Alternative> _alternatives;
};

}  // namespace xquery
