#include "Types/XQueryBaseURIs.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/TreeHead.h"
#include "Types/XQueryNodeFunctions.h"

#include <algorithm>
#include <limits>

namespace xquery {

namespace {

const NSXMLNode* ownBase(const NSXMLElement* element) {
  return element->attributeForName(NSStringView::ascii("xml:base"));
}

// Where the climb begins: for a document, and what stands directly in it, at its root element.
const NSXMLElement* firstElement(const NSXMLNode* node) {
  if (node && !isa<NSXMLElement>(node) && !isa<NSXMLDocument>(node)) node = node->parent();
  const auto* document = dyn_cast<NSXMLDocument>(node);
  return document ? document->rootElement() : dyn_cast<NSXMLElement>(node);
}

const NSXMLElement* elementAbove(const NSXMLElement* element) {
  return dyn_cast<NSXMLElement>(element->parent());
}

Ref<NSString> textOf(const NSXMLNode* base) {
  const Ref<NSString> text = base ? base->stringValue() : nullptr;
  return text ? text : NSString::empty();
}

struct Climb {
  const NSXMLNode* base;     // the nearest; null for none on the way
  const NSXMLElement* next;  // where the climb goes on, unless it is over
};

Climb climb(const NSXMLElement* element, size_t mostLevels) {
  WorkPacer pacer;
  for (; element && mostLevels; --mostLevels) {
    pacer.turn();
    if (const NSXMLNode* base = ownBase(element)) return {base, nullptr};
    element = elementAbove(element);
  }
  return {nullptr, element};
}

Ref<NSString> textAtTheEndOfTheClimb(const NSXMLElement* element) {
  return textOf(climb(element, std::numeric_limits<size_t>::max()).base);
}

}  // namespace

// A base URI is taken as written: relative ones are not resolved against outer ones, and the
// document's own URI plays no part.
Ref<NSString> XQueryNodeBaseURI(const NSXMLNode* node) {
  return textAtTheEndOfTheClimb(firstElement(node));
}

Ref<NSString> XQueryBaseURIs::ofNode(const NSXMLNode* node) {
  constexpr size_t shortClimb = 32;
  const Climb climbed = climb(firstElement(node), shortClimb);
  return climbed.next ? ofDeepElement(climbed.next) : textOf(climbed.base);
}

Ref<NSString> XQueryBaseURIs::ofDeepElement(const NSXMLElement* element) {
  if (!_tree || !_tree->isOf(element)) {
    clear();
    _tree = NSXMLTreeIndexes::of(element);
  }
  if (!_tree) return textAtTheEndOfTheClimb(element);
  NSXMLIndexList<const NSXMLElement*> climbed;
  WorkPacer pacer;
  size_t kept = 0;
  while (element && (kept = levelsTo(element)) == 0) {
    pacer.turn();
    climbed.push_back(element);
    element = elementAbove(element);
  }
  _way.resize(kept);
  for (; !climbed.empty(); climbed.pop_back()) {
    pacer.turn();
    const NSXMLNode* base = ownBase(climbed.back());
    if (!base && !_way.empty()) base = _way.back().base;
    _way.push_back({climbed.back(), base});
  }
  return textOf(_way.back().base);
}

// The elements of a way are in document order.
size_t XQueryBaseURIs::levelsTo(const NSXMLElement* element) const {
  const auto isBefore = [](const Level& level, const NSXMLElement* other) {
    return NSXMLNodeOrder::number(*level.element) < NSXMLNodeOrder::number(*other);
  };
  const auto found = std::lower_bound(_way.begin(), _way.end(), element, isBefore);
  if (found == _way.end() || found->element != element) return 0;
  return static_cast<size_t>(found - _way.begin()) + 1;
}

void XQueryBaseURIs::clear() {
  _tree = NSXMLIndexesRef();
  _way.clear();
  _way.shrink_to_fit();
}

}  // namespace xquery
