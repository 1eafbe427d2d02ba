// A deterministic generator of bibliographic records: people, journals and proceedings, then many
// small records with one to many authors by name, references to other records (`cite/@key`), to
// proceedings (`crossref`) and to journals (`journal`) by key. The same factor gives the same bytes
// on every machine. Factor 1 is about 110 MB, and everything is in proportion to the factor.
#pragma once

#include <string>

namespace bench {

[[nodiscard]] std::string bibliographyData(double factor);

}  // namespace bench
