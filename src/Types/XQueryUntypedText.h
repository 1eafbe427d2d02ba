// The text of an untyped operand, read where it lies.
//
// Comparing or computing with a node means taking its string value as an untyped value. Most such
// nodes are attributes, or elements around a single text, whose string value lies in the tree in
// one piece; reading it there costs no allocation.
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"

namespace xquery {

// Whether the object is a node or an untyped string, so that XQueryUntypedText can read it.
inline bool XQueryIsUntyped(const NSObject* object) {
  return object && (object->isNode() || object->kind() == Kind::String);
}

// Valid while the node's tree, or the string, lives and the tree is not changed.
class XQueryUntypedText {
 public:
  XQueryUntypedText() = default;
  // Of a node: its string value. Of a string of either kind: its text.
  explicit XQueryUntypedText(const NSObject& operand);

  NSStringView view() const { return _view; }

 private:
  NSStringView _view;
  Ref<NSString> _gathered;  // holds the text when it had to be put together from several nodes
};

}  // namespace xquery
