#include "Plan/Paths/XQueryPathPattern.h"

#include "Plan/Operators/XQueryNodeQuestion.h"
#include "Plan/Paths/XQueryPathWalk.h"
#include "Plan/Paths/XQueryWalkedPath.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/TreeHead.h"

#include <algorithm>

namespace xquery {
namespace {

bool goesDown(const XQueryWalkedStep& step) {
  return step.axis == XQueryAxisChild || step.axis == XQueryAxisDescendant ||
         step.axis == XQueryAxisAttribute;
}

// Of what belongs to an element beside its children.
bool isBeside(const NSXMLNode& node) {
  return node.kind() == Kind::Attribute || node.kind() == Kind::Namespace;
}

bool standsOnAxis(const NSXMLNode& node, int axis) {
  return axis == XQueryAxisAttribute ? node.kind() == Kind::Attribute : !isBeside(node);
}

}  // namespace

bool XQueryPathPattern::fits(const XQueryWalkedPath& path) {
  const bool isFromDocument = path.start() && isa<XQueryRootStep>(path.start()) &&
                              path.start()->predicates().empty() && path.countsNodes();
  if (!isFromDocument) return false;
  size_t levels = 0;
  size_t deep = 0;
  bool isDeep = false;
  for (const XQueryWalkedStep& step : path.steps()) {
    if (step.isDescendantShorthand() && !isDeep) {
      isDeep = true;
      continue;
    }
    if (!goesDown(step) || (step.hasPredicates() && !step.filtersEach)) return false;
    if (step.axis == XQueryAxisAttribute && &step != &path.steps().back()) return false;
    isDeep = isDeep || step.axis == XQueryAxisDescendant;
    if (isDeep && (++deep > 1 || levels > 1)) return false;
    isDeep = false;
    if (++levels > mostLevels) return false;
  }
  return levels > 0 && !isDeep;
}

XQueryPathPattern::XQueryPathPattern(const XQueryWalkedPath& path, const NSXMLDocument& ofDocument,
                                     XQueryContext& context)
    : _document(ofDocument), _context(context), _run(_results, context) {
  bool isDeep = false;
  for (const XQueryWalkedStep& step : path.steps()) {
    if (step.isDescendantShorthand()) {
      isDeep = true;
      continue;
    }
    isDeep = isDeep || step.axis == XQueryAxisDescendant;
    _levels.push_back({&step, XQueryStepTest(step, _run), isDeep});
    isDeep = false;
  }
}

bool XQueryPathPattern::findsElementsAlone(bool hasInstructions) const {
  const Level& last = _levels.back();
  if (last.step->axis == XQueryAxisAttribute || !last.test.takesElements()) return false;
  if (last.test.onlyName()) return true;
  if (!last.test.onlyNames() && !last.test.takesAllNamed()) return false;
  return !hasInstructions || !last.test.acceptsInstructions();
}

std::optional<uint64_t> XQueryPathPattern::mostAsked(const NSXMLNameIndex& elements) const {
  const Level& last = _levels.back();
  if (last.step->axis == XQueryAxisAttribute) return std::nullopt;
  if (const NSXMLExpandedName* name = last.test.onlyName()) return elements.nodes(name).size();
  const NSXMLNameSelection* names = last.test.onlyNames();
  return names ? std::optional(elements.count(*names, &_document, nullptr)) : std::nullopt;
}

// Predicates are asked when all names are right.
bool XQueryPathPattern::finds(NSXMLNode* node) {
  std::array<NSXMLNode*, mostLevels> at{};
  if (!standsRight(node, at)) return false;
  for (size_t level = 0; level < _levels.size(); ++level) {
    if (!isKept(*_levels[level].step, at[level])) return false;
  }
  return true;
}

bool XQueryPathPattern::standsRight(NSXMLNode* node, std::array<NSXMLNode*, mostLevels>& at) {
  for (size_t level = _levels.size(); level-- > 0;) {
    Level& asked = _levels[level];
    if (!node || !standsOnAxis(*node, asked.step->axis) || !asked.test.matches(node)) return false;
    at[level] = node;
    NSXMLNode* const above = node->parent();
    if (!asked.isDeep) {
      node = above;
      continue;
    }
    if (!above || !NSXMLNodeOrder::areComparable(&_document, above)) return false;
    if (level == 0) return true;
    // "//@x" finds the attributes of the topmost as well.
    NSXMLNode* const topmost = topmostAbove(isBeside(*node) ? above : node);
    const bool isBelow = topmost && (topmost != node);
    if (!isBelow || !_levels[0].test.matches(topmost)) return false;
    at[0] = topmost;
    return true;
  }
  return node == &_document;
}

// The child of the document in whose subtree the node is.
NSXMLNode* XQueryPathPattern::topmostAbove(const NSXMLNode* node) {
  NSXMLNode* found = nullptr;
  WorkPacer pacer;
  for (NSXMLNode* child = _document.firstChild(); child; child = child->nextSibling()) {
    pacer.turn();
    if (NSXMLNodeOrder::number(*child) > NSXMLNodeOrder::number(*node)) break;
    found = child;
  }
  return found;
}

bool XQueryPathPattern::isKept(const XQueryWalkedStep& step, NSXMLNode* node) const {
  return std::all_of(
      step.firstPredicate(), step.step->predicates().end(), [&](const auto& predicate) {
        const XQueryNodeQuestion* question = XQueryNodeQuestionIn(predicate.get());
        const auto answer = question ? question->holdsFor(node, _context) : std::nullopt;
        return answer ? *answer : XQueryStep::keeps(*predicate, node, 1, _context);
      });
}

}  // namespace xquery
