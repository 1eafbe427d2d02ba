#include "Plan/Paths/XQueryNameChoice.h"

#include "Platform/Tree/Names.h"

#include <algorithm>

namespace xquery {
namespace {

// Of a name as it is written: what stands behind the first colon, unless that is at either end.
NSStringView localPartOf(NSStringView name) {
  const auto colon = name.find(u':');
  const bool hasPrefix = colon != NSStringView::notFound && colon != 0 && colon + 1 < name.length();
  return hasPrefix ? name.substring(colon + 1, name.length() - colon - 1) : name;
}

}  // namespace

bool XQueryNameChoice::isOfTests() const {
  return std::all_of(_alternatives.begin(), _alternatives.end(),
                     [](const Alternative& each) { return each.by == By::Test; });
}

const XQueryNameTest* XQueryNameChoice::onlyTest() const {
  return _alternatives.size() == 1 ? _alternatives.front().test.get() : nullptr;
}

bool XQueryNameChoice::needsContext() const {
  return std::any_of(_alternatives.begin(), _alternatives.end(),
                     [](const Alternative& each) { return each.test && each.test->isDeferred(); });
}

bool XQueryNameChoice::accepts(const NSXMLNode& node, XQueryContext* context) const {
  for (const Alternative& each : _alternatives) {
    switch (each.by) {
      case By::Test: {
        const bool isNamed = node.kind() == Kind::Element || node.kind() == Kind::Attribute;
        if (isNamed && each.test->isValidNode(node, context)) return true;
        break;
      }
      case By::LocalName:
        if (node.localNameView() == each.text->view()) return true;
        break;
      case By::Name:
        if (node.nameView() == each.text->view()) return true;
        break;
    }
  }
  return false;
}

bool XQueryNameChoice::mayTake(const NSXMLExpandedName& name) const {
  return std::any_of(_alternatives.begin(), _alternatives.end(), [&](const Alternative& each) {
    if (each.by == By::LocalName) return name.localName == each.text->view();
    if (each.by == By::Name) return name.localName == localPartOf(each.text->view());
    const NSXMLExpandedName* known = each.test->boundName();
    return &name == (known ? known : each.test->nameWithoutNamespace());
  });
}

}  // namespace xquery
