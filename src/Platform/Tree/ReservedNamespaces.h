// The namespaces that are bound to prefixes of their own and to nothing else.
#pragma once

#include <string_view>

namespace xquery {

inline constexpr std::string_view namespaceOfXML = "http://www.w3.org/XML/1998/namespace";
inline constexpr std::string_view namespaceOfDeclarations = "http://www.w3.org/2000/xmlns/";

}  // namespace xquery
