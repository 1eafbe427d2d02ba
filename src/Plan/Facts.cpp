#include "Plan/Facts.h"

namespace xquery {
namespace {

XQueryTreeFact treeOfBoth(XQueryTreeFact a, XQueryTreeFact b) {
  if (a == b || b == XQueryTreeFact::NoNodes) return a;
  return a == XQueryTreeFact::NoNodes ? b : XQueryTreeFact::Any;
}

}  // namespace

XQueryFacts XQueryFacts::items(XQueryItemKinds kinds, uint8_t least, uint8_t most) {
  XQueryFacts facts;
  facts.setItems(kinds, least, most);
  return facts;
}

XQueryFacts XQueryFacts::nothingYet() {
  XQueryFacts facts = items(XQueryItems::None, many, 0);
  facts.inOrder = true;
  facts.findsRoot = true;
  return facts;
}

void XQueryFacts::setItems(const XQueryFacts& from) {
  least = from.least;
  most = from.most;
  kinds = from.kinds;
  inOrder = from.inOrder;
  tree = from.tree;
}

void XQueryFacts::setItems(XQueryItemKinds ofKinds, uint8_t atLeast, uint8_t atMost) {
  kinds = ofKinds;
  least = atLeast;
  most = atMost;
  inOrder = false;
  tree = XQueryTreeFact::Any;
  settle();
}

void XQueryFacts::settle() {
  if (kinds == XQueryItems::None) most = 0;
  if (most == 0) kinds = XQueryItems::None;
  if (!mayBe(XQueryItems::Node | XQueryItems::Other)) tree = XQueryTreeFact::NoNodes;
  if (most <= 1 && are(XQueryItems::Node)) inOrder = true;
}

void XQueryFacts::addDeeds(const XQueryFacts& part) {
  deeds |= part.deeds;
  reads.add(part.reads);
  assigns.add(part.assigns);
}

// Whoever asks for the document above a node of the whole looks around that node.
void XQueryFacts::addDeedsWithin(const XQueryFacts& part) {
  XQueryFacts inner = part;
  if (inner.does(XQueryDeeds::ReadsRoot)) inner.deeds |= XQueryDeeds::ReadsOutside;
  inner.deeds &= static_cast<uint16_t>(~XQueryDeeds::ReadsFocus);
  addDeeds(inner);
}

void XQueryFacts::orItems(const XQueryFacts& other) {
  least = std::min(least, other.least);
  most = std::max(most, other.most);
  kinds |= other.kinds;
  inOrder = inOrder && other.inOrder;
  tree = treeOfBoth(tree, other.tree);
}

void XQueryFacts::appendItems(const XQueryFacts& other) {
  // Nothing on one side leaves the other as it is.
  if (most == 0 || other.most == 0) {
    inOrder = most == 0 ? other.inOrder : inOrder;
  } else {
    inOrder = false;
  }
  least = std::min<uint8_t>(many, least + other.least);
  most = std::min<uint8_t>(many, most + other.most);
  kinds |= other.kinds;
  tree = treeOfBoth(tree, other.tree);
}

}  // namespace xquery
