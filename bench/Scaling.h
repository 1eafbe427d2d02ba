// Whether the time of a path grows in proportion to the document.
#pragma once

namespace bench {

// Measures `//item` and `//item/..` over 10 MB and 100 MB and prints the growth of the time beside
// the growth of the document. The exit status of the program: 0 when the time has grown at most
// twice as much as the document.
[[nodiscard]] int reportScaling();

}  // namespace bench
