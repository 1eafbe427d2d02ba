// HTML bytes as text, before anybody reads the HTML.
#pragma once

#include <string>
#include <string_view>

namespace xquery {

// The bytes as well-formed UTF-8 without a signature, from the encoding that they are in: the one
// of the signature, else the one that the first kilobyte names ("charset="), else UTF-8 when they
// are that, else Windows-1252.
std::string HTMLAsUTF8(std::string_view bytes);

// Whether a tag has more attributes than that. Values in quotes count for nothing, nor do scripts
// and style sheets. HTML that is malformed on purpose can be read in another way than here.
bool hasTagOfMoreAttributes(std::string_view HTML, size_t count);

}  // namespace xquery
