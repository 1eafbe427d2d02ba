// Diagnostics on standard error.
#pragma once

#include <string_view>

namespace xquery {

// Writes one line; line ends inside the text are written as \n and \r. Lines of several threads
// do not mix.
void NSLog(std::string_view text);

// Whether the environment variable XQUERY_LOG switches diagnostics on: set, not empty and not
// exactly "0". Read anew at each call, so that a host can change it between queries.
bool XQueryLogEnabled();

}  // namespace xquery
