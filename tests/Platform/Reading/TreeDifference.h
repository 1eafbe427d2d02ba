// Whether two trees are equal in all that can be seen of them, the numbers of document order
// included.
#pragma once

#include "Platform/Tree/Arena.h"
#include "Platform/Tree/TreeHead.h"
#include "xquery/XMLNode.h"

#include <string>

namespace xquery::readingtest {

inline std::string differenceOfNodes(const NSXMLNode* one, const NSXMLNode* other) {
  const auto place = [&](const char* what) {
    return std::string(what) + " of " + one->XPath()->utf8() + ": \"" + one->textView().utf8() +
           "\", \"" + other->textView().utf8() + "\"";
  };
  if (one->kind() != other->kind()) return place("the kind");
  if (one->nodeName() != other->nodeName()) return place("the name");
  if (one->textView() != other->textView()) return place("the text");
  if (one->textView().isWide() != other->textView().isWide()) return place("the width");
  if (NSXMLNodeOrder::number(*one) != NSXMLNodeOrder::number(*other)) return place("the number");
  if (NSXMLTree::isCDATA(one) != NSXMLTree::isCDATA(other)) return place("the section");
  const auto* const element = dyn_cast<NSXMLElement>(one);
  if (!element) return "";
  const NSXMLNode* a = NSXMLTree::firstPropertyOf(element);
  const NSXMLNode* b = NSXMLTree::firstPropertyOf(cast<NSXMLElement>(other));
  for (; a && b; a = NSXMLTree::nextProperty(a), b = NSXMLTree::nextProperty(b)) {
    const std::string difference = differenceOfNodes(a, b);
    if (!difference.empty() || a->parent() != one || b->parent() != other) return difference;
  }
  return a || b ? place("the number of properties") : "";
}

// What differs first; empty if nothing does.
inline std::string differenceOfTrees(const NSXMLDocument* one, const NSXMLDocument* other) {
  const NSXMLNode* a = one;
  const NSXMLNode* b = other;
  for (; a && b; a = a->nextNode(), b = b->nextNode()) {
    if (!a->firstChild() != !b->firstChild() || !a->nextSibling() != !b->nextSibling()) {
      return "the shape around " + a->XPath()->utf8();
    }
    const std::string difference = differenceOfNodes(a, b);
    if (!difference.empty()) return difference;
    if (!a->previousSibling() != !b->previousSibling() || !a->lastChild() != !b->lastChild()) {
      return "the links of " + a->XPath()->utf8();
    }
  }
  if (a || b) return "the number of nodes";
  std::string written;
  std::string otherWritten;
  one->appendXMLTo(written);
  other->appendXMLTo(otherWritten);
  return written == otherWritten ? "" : "the text that is written";
}

}  // namespace xquery::readingtest
