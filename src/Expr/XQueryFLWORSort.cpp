#include "Expr/XQueryFLWORSort.h"

#include "Expr/StableMergeSort.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/Number.h"
#include "xquery/String.h"

#include <algorithm>
#include <functional>

namespace xquery {
namespace {

class KeyOrder {
 public:
  KeyOrder(bool ascending, bool emptyLeast) : _ascending(ascending), _emptyLeast(emptyLeast) {}

  // Below, at or above zero in the order asked for.
  int compare(const std::vector<Value>& a, const std::vector<Value>& b) {
    for (size_t k = 0; k < a.size(); ++k) {
      if (const int raw = compareKeys(*a[k], *b[k])) return _ascending ? raw : -raw;
    }
    return 0;
  }
  bool isComparable() const { return _isComparable; }

 private:
  int compareKeys(const NSObject& a, const NSObject& b) {
    const bool aIsEmpty = a.kind() == Kind::Null;
    const bool bIsEmpty = b.kind() == Kind::Null;
    if (aIsEmpty && bIsEmpty) return 0;
    if (aIsEmpty) return _emptyLeast ? -1 : 1;
    if (bIsEmpty) return _emptyLeast ? 1 : -1;
    switch (commonType(a, b)) {
      case XQueryTypeString:
        return cast<NSString>(&a)->compare(*cast<NSString>(&b));
      case XQueryTypeBoolean:
      case XQueryTypeDouble:
      case XQueryTypeFloat:
      case XQueryTypeDecimal:
        return cast<NSNumber>(&a)->compare(*cast<NSNumber>(&b));
      default:
        // Some order, so that the sort ends; its result is thrown away.
        _isComparable = false;
        return std::less<>()(&a, &b) ? -1 : 1;
    }
  }

  static XQueryTypeID commonType(const NSObject& a, const NSObject& b) {
    const XQueryTypeID typeA = XQueryPrimitiveTypeForTypeID(XQueryObjectTypeID(&a));
    const XQueryTypeID typeB = XQueryPrimitiveTypeForTypeID(XQueryObjectTypeID(&b));
    return typeA == typeB ? typeA : XQueryLeastCommonNumericType(typeA, typeB);
  }

  bool _ascending;
  bool _emptyLeast;
  bool _isComparable = true;
};

}  // namespace

bool XQueryFLWORSort(std::vector<XQuerySortItem>& items, bool ascending, bool emptyLeast) {
  KeyOrder order(ascending, emptyLeast);
  stableMergeSort(items, [&](const XQuerySortItem& a, const XQuerySortItem& b) {
    return order.compare(*a.sortInfo, *b.sortInfo) < 0;
  });
  return order.isComparable();
}

}  // namespace xquery
