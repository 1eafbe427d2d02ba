// What the classic interface of the PCRE library takes literally and its successor refuses.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace xquery {

// The pattern in the successor's words: the same matches, with nothing in it that only the classic
// interface accepts. None when the pattern has nothing of the kind. `extended` is the option under
// which "#" begins a comment.
std::optional<std::string> PCREClassicSyntax(std::string_view pattern, bool extended);

}  // namespace xquery
