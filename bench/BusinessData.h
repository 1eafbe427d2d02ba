// A deterministic generator of business records: a tree of units with their employees, customers,
// products, orders with lines, and payments, each kind in a namespace of its own, nearly all of it
// in attributes: identifiers, dates, decimals. The same factor gives the same bytes on every
// machine. Factor 1 is about 110 MB, and everything is in proportion to the factor.
#pragma once

#include <string>

namespace bench {

[[nodiscard]] std::string businessData(double factor);

}  // namespace bench
