#include "NodePlace.h"

#include <algorithm>
#include <vector>

namespace cli {

using namespace xquery;

namespace {

// What tells a node among its siblings.
std::string test(const NSXMLNode& node) {
  switch (node.kind()) {
    case Kind::Element:
      return node.nameView().utf8();
    case Kind::Comment:
      return "comment()";
    case Kind::ProcessingInstruction:
      return "processing-instruction()";
    default:
      return "text()";
  }
}

}  // namespace

size_t NodePlaces::position(const NSXMLNode& node) {
  const auto known = _positions.find(&node);
  if (known != _positions.end()) return known->second;
  const NSXMLNode* parent = node.parent();
  std::unordered_map<std::string, size_t> counts;
  for (const NSXMLNode* child = parent ? parent->firstChild() : nullptr; child;
       child = child->nextSibling()) {
    _positions[child] = ++counts[test(*child)];
  }
  return parent ? _positions[&node] : 1;
}

std::string NodePlaces::step(const NSXMLNode& node) {
  if (node.kind() == Kind::Attribute) return "/@" + node.nameView().utf8();
  if (node.kind() == Kind::Namespace) return "/namespace::" + node.nameView().utf8();
  return "/" + test(node) + "[" + std::to_string(position(node)) + "]";
}

std::string NodePlaces::place(const NSXMLNode& node) {
  std::vector<std::string> steps;
  for (const NSXMLNode* each = &node; each && each->kind() != Kind::Document;
       each = each->parent()) {
    steps.push_back(step(*each));
  }
  std::string path;
  for (auto each = steps.rbegin(); each != steps.rend(); ++each) path += *each;
  return path.empty() ? "/" : path;
}

}  // namespace cli
