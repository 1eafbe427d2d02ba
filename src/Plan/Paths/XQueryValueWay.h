// The way from a node to values that belong to it, by names: over children and descendants, and
// perhaps to an attribute or texts in the end. "@id", "author/last", ".//emph", "title/text()".
#pragma once

#include "Context/XQueryContextInternal.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/ValueIndex.h"

#include <cstddef>
#include <optional>
#include <vector>

namespace xquery {

class XQueryAxisStep;
class XQueryNameTest;
class XQueryStep;

class XQueryValueWay {
 public:
  static constexpr size_t mostSteps = 8;

  // Goes on along the steps from the first one up to `end`, which is null for all of them, whatever
  // their predicates are. False, and the way is of no use, for others than to names and texts.
  [[nodiscard]] bool addSteps(const XQueryStep* first, const XQueryStep* end);
  // Whether it leads to the node itself.
  bool isEmpty() const { return _steps.empty() && !_attribute && !_endsInTexts; }
  // Whether it leads to children and their attributes alone.
  bool isOfChildren() const;

  // Whether names need not be resolved in the namespaces of the context.
  bool isOpen(const XQueryContext& context) const {
    return !_needsNoDefaultNamespace || !_internal(context).hasDefaultNamespace();
  }
  // The key by which an index finds the elements of the name from which the way leads to a value.
  NSXMLValueKey keyFor(const NSXMLExpandedName& element) const;
  // Whether there is a key of what has the value: the elements that the way leads to, or those that
  // have the attribute.
  bool hasKeyOfEnd() const { return isOfChildren() && (!_steps.empty() || _attribute); }
  NSXMLValueKey keyOfEnd() const;
  // From such an element up to the node where the way begins; null where it is another way.
  NSXMLNode* start(NSXMLNode* end) const;

 private:
  bool addStep(const XQueryAxisStep& step, bool isBelow);
  const NSXMLExpandedName* nameOf(const XQueryNameTest& test);

  std::vector<NSXMLValueStep> _steps;
  NSXMLExpandedNameRef _attribute;
  bool _endsInTexts = false;
  bool _needsNoDefaultNamespace = false;
};

}  // namespace xquery
