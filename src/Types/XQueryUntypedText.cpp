#include "Types/XQueryUntypedText.h"

#include "Platform/Base/WorkMeter.h"
#include "xquery/XMLNode.h"

namespace xquery {
namespace {

// Descends while an element or document has exactly one child. Answers the node whose own text is
// the whole string value, or null when the text must be gathered.
const NSXMLNode* holderOfWholeText(const NSXMLNode* node) {
  WorkPacer pacer;
  for (;;) {
    pacer.turn();
    if (node->kind() != Kind::Element && node->kind() != Kind::Document) return node;
    const NSXMLNode* child = node->firstChild();
    if (!child || child != node->lastChild()) return nullptr;
    // A comment's or processing instruction's text is no part of its parent's.
    if (child->kind() == Kind::Comment || child->kind() == Kind::ProcessingInstruction) {
      return nullptr;
    }
    node = child;
  }
}

}  // namespace

XQueryUntypedText::XQueryUntypedText(const NSObject& operand) {
  if (!operand.isNode()) {
    _view = cast<NSString>(&operand)->view();
    return;
  }
  const auto* node = cast<NSXMLNode>(&operand);
  if (const NSXMLNode* holder = holderOfWholeText(node)) {
    _view = holder->textView();
    return;
  }
  if (!node->firstChild()) return;
  _gathered = node->stringValue();
  if (_gathered) _view = _gathered->view();
}

}  // namespace xquery
