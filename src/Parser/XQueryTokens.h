// The token codes: 257 to 434, one enumerator kToken... each. The grammar is their only list.
#pragma once

#include "XQueryGrammar.tab.h"

namespace xquery {

// The name of a token code; the empty string for a code that is not a token's.
const char* XQTokenName(int code);

}  // namespace xquery
