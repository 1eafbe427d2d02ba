// The base URI of a result, as results show it.
#pragma once

#include "xquery/Object.h"

namespace xquery {

class XQueryContextInternal;

// Marks the first item of a result with the base URI that its construction recorded, if any. What
// was there before the evaluation stays as it is.
void XQueryDecorateWithBaseURI(NSObject* first, XQueryContextInternal& context);

}  // namespace xquery
