// RFC 3986: the seam to uriparser.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace xquery {

// Whether the text is a URI or a relative reference, character for character.
bool isURIReference(std::string_view text);

// Strict resolution of a reference against an absolute base. Nothing when either does not parse or
// the base has no scheme.
std::optional<std::string> resolveURIReference(std::string_view reference, std::string_view base);

}  // namespace xquery
