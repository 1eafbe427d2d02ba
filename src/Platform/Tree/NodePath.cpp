// The path that leads to a node.
#include "Platform/Base/WorkMeter.h"
#include "xquery/XMLNode.h"

#include <string>
#include <vector>

namespace xquery {

namespace {

// Whether a step to `node` would find the sibling, too.
bool isFoundWith(const NSXMLNode* sibling, const NSXMLNode* node) {
  return sibling->kind() == node->kind() && sibling->expandedName() == node->expandedName();
}

// Counted from 1 among the siblings that the same step finds.
size_t positionOf(const NSXMLNode* node, WorkPacer& pacer) {
  size_t position = 1;
  for (const NSXMLNode* sibling = node->previousSibling(); sibling;
       sibling = sibling->previousSibling()) {
    pacer.turn();
    if (isFoundWith(sibling, node)) ++position;
  }
  return position;
}

void appendStep(NSMutableString& path, const NSXMLNode* node, WorkPacer& pacer) {
  path.appendASCII("/");
  switch (node->kind()) {
    case Kind::Attribute:
      path.appendASCII("@");
      path.append(node->nameView());
      return;
    case Kind::Namespace:
      path.appendASCII("namespace::");
      path.append(node->nameView());
      return;
    case Kind::Element:
      path.append(node->nameView());
      break;
    case Kind::Comment:
      path.appendASCII("comment()");
      break;
    case Kind::ProcessingInstruction:
      path.appendASCII("processing-instruction()");
      break;
    default:
      path.appendASCII("text()");
      break;
  }
  path.appendASCII("[" + std::to_string(positionOf(node, pacer)) + "]");
}

}  // namespace

Ref<NSString> NSXMLNode::XPath() const {
  WorkPacer pacer;
  std::vector<const NSXMLNode*> way;
  for (const NSXMLNode* node = this; node && node->kind() != Kind::Document;
       node = node->parent()) {
    pacer.turn();
    way.push_back(node);
  }
  if (way.empty()) return NSString::stringWithASCII("/");
  NSMutableString path;
  for (size_t index = way.size(); index > 0; --index) appendStep(path, way[index - 1], pacer);
  return path.string();
}

}  // namespace xquery
