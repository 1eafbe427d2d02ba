#include "Expr/XQueryExpr.h"

namespace xquery {

Ref<NSString> XQueryExpr::description() const {
  return NSString::stringWithASCII("<XQueryExpr>");
}

}  // namespace xquery
