// References of RFC 3986: their parts, what may stand in them, and their resolution.
//
// Everything here takes time in proportion to the text, in steps between which an evaluation can be
// ended, and no memory but that of a resolved text.
#pragma once

#include "Platform/Text/Blocks.h"

#include <optional>
#include <string_view>

namespace xquery {

// What the delimiters of a text cut it into, the delimiters left out; "http://h/p?q#f" is "http",
// "h", "/p", "q", "f". A part that is empty differs from one that is not there.
struct URIParts {
  std::optional<std::string_view> scheme;
  std::optional<std::string_view> authority;
  std::string_view path;
  std::optional<std::string_view> query;
  std::optional<std::string_view> fragment;
};
URIParts partsOfURIReference(std::string_view text);

// Whether the text is a URI or a relative reference, character for character.
bool isURIReference(std::string_view text);

// Strict resolution of a reference against an absolute base; every part stays as it was written.
// Nothing when either is no reference or the base has no scheme.
using URIText = ValueText<char>;
std::optional<URIText> resolveURIReference(std::string_view reference, std::string_view base);

}  // namespace xquery
