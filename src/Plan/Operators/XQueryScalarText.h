// The text of a value that may be no object yet.
#pragma once

#include "Plan/Operators/XQueryScalar.h"
#include "Types/XQueryString.h"
#include "Types/XQueryUntypedText.h"

#include <cstdint>

namespace xquery {

// What functions that take strings read: the text of a string or a node, and none of nothing.
// Other values would be refused, or are not known here. Valid while the value's object lives.
class XQueryScalarText {
 public:
  explicit XQueryScalarText(const XQueryScalar& value) {
    if (value.form == XQueryScalar::Text) {
      const auto* string = cast<NSString>(value.object);
      _view = string->view().substring(value.start, value.length);
      _kinds = IsText | IsStringType;
    } else if (value.form == XQueryScalar::Object) {
      read(value.object);
    } else if (value.isNothing()) {
      _kinds = IsNothing;
    }
  }

  bool isKnown() const { return _kinds != 0; }
  // Of a string or a node.
  bool isItem() const { return (_kinds & (IsText | IsStringType)) != 0; }
  // Whether both are compared as strings, without a cast that may fail.
  bool comparesWith(const XQueryScalarText& other) const {
    return (_kinds & other._kinds & (IsText | IsStringType)) != 0;
  }
  NSStringView view() const { return _gathered.view().length() > 0 ? _gathered.view() : _view; }

 private:
  enum Kinds : uint8_t { IsText = 1, IsStringType = 2, IsNothing = 4 };

  void read(const NSObject* object) {
    if (const auto* typed = dyn_cast<XQueryString>(object)) {
      _view = typed->view();
      _kinds = typed->typeID() == XQueryTypeString ? IsText | IsStringType : IsStringType;
    } else if (XQueryIsUntyped(object)) {
      _gathered = XQueryUntypedText(*object);
      _kinds = IsText;
    }
  }

  NSStringView _view;
  XQueryUntypedText _gathered;
  uint8_t _kinds = 0;
};

}  // namespace xquery
