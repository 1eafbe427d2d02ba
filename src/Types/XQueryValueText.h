// Text that comes from a host.
#pragma once

#include "xquery/Error.h"

#include <string_view>

namespace xquery {

// Why a text is refused: bytes that are not UTF-8, or a character that XML does not have. Null for
// a good one.
Ref<XQueryError> XQueryTextError(std::string_view text);

}  // namespace xquery
