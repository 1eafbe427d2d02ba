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

bool XQueryNameChoice::Condition::accepts(const NSXMLNode& node, XQueryContext* context) const {
  const bool isElement = node.kind() == Kind::Element;
  switch (by) {
    case By::Test:
      return (isElement || node.kind() == Kind::Attribute) && test->isValidNode(node, context);
    case By::Element:
      return isElement && test->isValidNode(node, context);
    case By::LocalName:
      return node.localNameView() == text->view();
    case By::NodeName:
      return (isElement || node.kind() == Kind::Attribute) && node.localNameView() == text->view();
    case By::Name:
      return node.nameView() == text->view();
    case By::URI:
      return node.URIView() == text->view();
  }
  return false;
}

bool XQueryNameChoice::Condition::mayTake(const NSXMLExpandedName& name) const {
  switch (by) {
    case By::LocalName:
    case By::NodeName:
      return name.localName == text->view();
    case By::Name:
      return name.localName == localPartOf(text->view());
    case By::URI:
      return NSXMLURIOf(name) == text->view();
    default: {
      const NSXMLExpandedName* known = test->boundName();
      return &name == (known ? known : test->nameWithoutNamespace());
    }
  }
}

void XQueryNameChoice::meet(const XQueryNameChoice& others) {
  std::vector<Alternative> met;
  for (const Alternative& one : _alternatives) {
    for (const Alternative& other : others._alternatives) {
      met.push_back(one);
      met.back().insert(met.back().end(), other.begin(), other.end());
    }
  }
  _alternatives = std::move(met);
}

// Whether each of the alternatives has a condition of that sort.
template <class Holds>
bool XQueryNameChoice::eachHasOne(Holds holds) const {
  return std::all_of(_alternatives.begin(), _alternatives.end(), [&](const Alternative& each) {
    return std::any_of(each.begin(), each.end(), holds);
  });
}

bool XQueryNameChoice::isOfTests() const {
  return eachHasOne([](const Condition& each) { return each.test || each.by == By::NodeName; });
}

bool XQueryNameChoice::isOfElements() const {
  return eachHasOne([](const Condition& each) { return each.by == By::Element; });
}

const XQueryNameTest* XQueryNameChoice::onlyTest() const {
  const bool isOne = _alternatives.size() == 1 && _alternatives.front().size() == 1;
  return isOne ? _alternatives.front().front().test.get() : nullptr;
}

bool XQueryNameChoice::needsContext() const {
  return std::any_of(_alternatives.begin(), _alternatives.end(), [](const Alternative& all) {
    return std::any_of(all.begin(), all.end(),
                       [](const Condition& each) { return each.test && each.test->isDeferred(); });
  });
}

bool XQueryNameChoice::accepts(const NSXMLNode& node, XQueryContext* context) const {
  return std::any_of(_alternatives.begin(), _alternatives.end(), [&](const Alternative& all) {
    return std::all_of(all.begin(), all.end(),
                       [&](const Condition& each) { return each.accepts(node, context); });
  });
}

bool XQueryNameChoice::mayTake(const NSXMLExpandedName& name) const {
  return std::any_of(_alternatives.begin(), _alternatives.end(), [&](const Alternative& all) {
    return std::all_of(all.begin(), all.end(),
                       [&](const Condition& each) { return each.mayTake(name); });
  });
}

}  // namespace xquery
