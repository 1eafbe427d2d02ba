// Texts of different kinds for measuring readers: records that consist of attributes, prose with
// little markup, text in several scripts, and elements in each other. The same factor gives the
// same bytes on every machine; factor 1 is about 110 MB.
#pragma once

#include <string>

namespace bench {

[[nodiscard]] std::string attributeRecords(double factor);
[[nodiscard]] std::string proseText(double factor);
[[nodiscard]] std::string textInScripts(double factor);
// Thousands of levels deep, again and again.
[[nodiscard]] std::string nestedElements(double factor);

}  // namespace bench
