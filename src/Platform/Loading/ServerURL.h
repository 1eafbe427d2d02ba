// URLs on servers, in the form in which they can be compared.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace xquery {

// Scheme, host, port and path of an absolute URL as RFC 3986 normalises them, without query and
// fragment: "HTTP://H:80/a/./%62?q" is "http://h/a/b". Nothing where two programs may read it as
// different places: with a user name, an escape in the host, a port that is none, or ".." that
// shows only once escapes or parameters are taken off; nor without a host and for files.
std::optional<std::string> normalisedServerURL(std::string_view URL);

// The same of what other URLs are to be compared with: nothing with a query or a fragment as well.
std::optional<std::string> normalisedServerPrefix(std::string_view URL);

// Whether the one is the other or lies below it, segment by segment; both normalised.
bool isBelowServerURL(std::string_view URL, std::string_view prefix);

}  // namespace xquery
