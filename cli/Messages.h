// What goes to standard error about a failure.
#pragma once

#include "xquery/xquery.h"

#include <string>
#include <string_view>

namespace cli {

// The text with its control characters written as "\u001B", and so the ones that turn the direction
// of text: what comes from a query, a document or the command line must not steer a terminal. Tabs
// and line feeds stay.
std::string visible(std::string_view utf8);

// The same, with tabs and line feeds made visible too: what names something stands within a line.
std::string visibleName(std::string_view utf8);

// An error's description to the letter, apart from control characters and from what it quotes of
// the query: no more than 200 characters of the source line, around the place, and of the token.
std::string description(const xquery::NSError& error);

// The descriptions of what a compilation found, each only once.
std::string descriptions(const xquery::NSArray& errors);

}  // namespace cli
