// One item of an operand of a comparison, with what comparing it has found out.
#pragma once

#include "Platform/Numbers/NumberText.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryTypeTable.h"
#include "Types/XQueryUntypedText.h"

#include <cstdint>
#include <optional>
#include <utility>
#include <vector>

namespace xquery {

class XQueryComparand {
 public:
  // Nodes and atomic values.
  static bool isPossible(const NSObject* item) {
    return item && (item->isNode() || XQueryIsAtomicType(item));
  }

  explicit XQueryComparand(NSObject* item)
      : _item(item),
        _type(item->isNode() ? XQueryTypeID{XQueryTypeUntypedAtomic} : XQueryObjectTypeID(item)),
        _primitive(XQueryPrimitiveTypeForTypeID(_type)) {
    if (isUntyped() || _primitive == XQueryTypeString) _text = XQueryUntypedText(*item);
  }

  XQueryTypeID type() const { return _type; }
  bool isUntyped() const { return _type == XQueryTypeUntypedAtomic; }
  bool isStringType() const { return _primitive == XQueryTypeString; }
  // Casting it to xs:string keeps its text.
  bool isText() const { return isUntyped() || _type == XQueryTypeString; }
  bool isNumeric() const {
    return _primitive >= XQueryTypeDouble && _primitive <= XQueryTypeDecimal;
  }
  // A number that has digits of its own.
  bool isExact() const {
    if (!isNumeric()) return false;
    const NSNumber::Storage storage = number().storage();
    return storage != NSNumber::Storage::Double && storage != NSNumber::Storage::Float;
  }
  const NSNumber& number() const { return *cast<NSNumber>(_item); }
  NSStringView text() const { return _text.view(); }

  // A number's value, or the number that an untyped text begins with; nothing when there is none.
  std::optional<double> asDouble() {
    if (!_scanned) {
      _scanned = true;
      if (isNumeric()) {
        _double = number().doubleValue();
      } else if (double value = 0; isUntyped() && scanDouble(text(), value)) {
        _double = value;
      }
    }
    return _double;
  }

  // Exactly xs:integer in a machine word.
  std::optional<int64_t> asSmallInteger() const {
    if (_type != XQueryTypeInteger) return std::nullopt;
    const NSDecimal* decimal = number().storedDecimal();
    if (!decimal || !decimal->isSmallInteger()) return std::nullopt;
    return decimal->smallInteger();
  }

  // The item's typed value, cast to `target` unless that is 0; each cast is done once.
  Value valueAs(XQueryTypeID target, XQueryContext& context) {
    if (!_typed) _typed = XQueryTypedValue(_item, context);
    if (target == XQueryTypeNone) return _typed;
    for (const auto& [type, value] : _casts) {
      if (type == target) return value;
    }
    Value value = XQueryCastAsTypeForContext(_typed, target, context);
    _casts.emplace_back(target, value);
    return value;
  }

 private:
  NSObject* _item;  // kept alive by the operand
  XQueryTypeID _type;
  XQueryTypeID _primitive;
  XQueryUntypedText _text;
  bool _scanned = false;
  std::optional<double> _double;
  Value _typed;
  std::vector<std::pair<XQueryTypeID, Value>> _casts;
};

}  // namespace xquery
