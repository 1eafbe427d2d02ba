// Names of attributes that a document gives to its elements by declarations. libxml2 holds the
// names in tags to the rules of namespaces, but not those of defaulted attributes, which reach the
// document as they were declared: "p:", "a:b:c", "xmlns:xml" bound to anything.
#pragma once

#include <string_view>

namespace xquery {

// Why no attribute of this name, which is a Name of XML, can have this default; null if it can.
// Prefixes that are not declared and attributes that are given twice are libxml2's to find, since
// that depends on the tag.
const char* faultOfDefault(std::string_view name, std::string_view value);

}  // namespace xquery
