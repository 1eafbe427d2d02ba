// The names of the built-in functions, for hosts.
#include "Functions/XQueryBuiltInFunction.h"
#include "xquery/XQuery.h"

namespace xquery {

std::vector<XQueryFunctionName> XQueryLibraryFunctions() {
  std::vector<XQueryFunctionName> names;
  for (const auto& row : XQueryBuiltInFunction::registrations()) {
    const auto [least, most] = row.arguments;
    names.push_back(
        {XQueryModules::builtinNamespaceForID(row.namespaceID)->utf8(), std::string(row.localName),
         least,
         most == XQueryBuiltInFunction::many ? std::nullopt : std::optional<unsigned>(most)});
  }
  return names;
}

}  // namespace xquery
