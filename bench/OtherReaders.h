// Other readers of XML, for comparison.
#pragma once

#include <string>

namespace bench {

// Each reads the text and forgets it again; false where it does not take it.

// libxml2's SAX parser with handlers that do nothing.
[[nodiscard]] bool readWithSAX(const std::string& xml);
[[nodiscard]] bool readWithLibXMLTree(const std::string& xml);
// White space is kept, as by the others.
[[nodiscard]] bool readWithPugixml(const std::string& xml);

}  // namespace bench
