#include "Plan/Paths/XQueryValueWay.h"

#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Plan/Paths/XQueryWalkedStep.h"
#include "Platform/Tree/Names.h"

#include <algorithm>

namespace xquery {

namespace {

bool isToTexts(const XQueryAxisStep& step) {
  const auto* type = dyn_cast<XQueryTypeDeclaration>(step.expr());
  return step.axis() == XQueryAxisChild && type && type->acceptsCount(1) && !type->data() &&
         type->type() == XQueryTypeDeclaration::TextTest;
}

}  // namespace

bool XQueryValueWay::addSteps(const XQueryStep* first, const XQueryStep* end) {
  bool isBelow = false;
  for (const XQueryStep* step = first; step != end; step = step->next()) {
    const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
    if (!axisStep || _attribute || _endsInTexts) return false;
    if (XQueryWalkedStep(*axisStep).isDescendantShorthand()) {
      isBelow = true;
    } else if (addStep(*axisStep, isBelow)) {
      isBelow = false;
    } else {
      return false;
    }
  }
  return !isBelow;
}

bool XQueryValueWay::addStep(const XQueryAxisStep& step, bool isBelow) {
  if (isToTexts(step) && !isBelow) {
    _endsInTexts = true;
    return true;
  }
  const auto* test = dyn_cast<XQueryNameTest>(step.expr());
  const NSXMLExpandedName* name = test ? nameOf(*test) : nullptr;
  if (!name || _steps.size() == mostSteps) return false;
  if (step.axis() == XQueryAxisAttribute && !isBelow) {
    _attribute = NSXMLExpandedNameRef(name);
    return true;
  }
  if (step.axis() != XQueryAxisChild && step.axis() != XQueryAxisDescendant) return false;
  _steps.emplace_back(NSXMLExpandedNameRef(name), isBelow || step.axis() == XQueryAxisDescendant);
  return true;
}

const NSXMLExpandedName* XQueryValueWay::nameOf(const XQueryNameTest& test) {
  if (const NSXMLExpandedName* name = test.boundName()) return name;
  _needsNoDefaultNamespace = true;
  return test.nameWithoutNamespace();
}

bool XQueryValueWay::isOfChildren() const {
  return std::none_of(_steps.begin(), _steps.end(),
                      [](const NSXMLValueStep& step) { return step.isToDescendants; });
}

NSXMLValueKey XQueryValueWay::keyFor(const NSXMLExpandedName& element) const {
  return {NSXMLExpandedNameRef(&element), _steps, _attribute, _endsInTexts};
}

NSXMLValueKey XQueryValueWay::keyOfEnd() const {
  const auto name = _steps.empty() ? NSXMLExpandedNameRef() : _steps.back().name;
  return {name, {}, _attribute, _endsInTexts};
}

NSXMLNode* XQueryValueWay::start(NSXMLNode* end) const {
  NSXMLNode* node = end;
  for (size_t index = _steps.size(); node && index-- > 0; node = node->parent()) {
    if (node->kind() != Kind::Element || node->expandedName() != _steps[index].name.get()) {
      return nullptr;
    }
  }
  return node;
}

}  // namespace xquery
