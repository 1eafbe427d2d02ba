// The paths of files, judged by their text alone.
#pragma once

#include "xquery/URL.h"

#include <optional>
#include <string>
#include <string_view>

namespace xquery {

// The absolute path that a file URL of this machine names. It has neither "." nor ".." nor empty
// names: dot segments are removed as RFC 3986 does it, written plainly or in escapes, whatever the
// file system holds. So "a/.." is where one is, also where "a" is a link or does not exist, and
// nobody learns from the answer which it is. A path that ends in a slash keeps it: it is one of a
// folder. Nothing when the URL is another one or names what no file can be called.
std::optional<std::string> localPathOf(const NSURL& URL);

// The same of an absolute path that is not in a URL.
std::string withoutDots(std::string_view path);

}  // namespace xquery
