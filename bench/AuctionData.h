// A deterministic generator of auction data: one document of regions with items, categories, a
// category graph, people, open auctions and closed auctions. The same factor gives the same bytes
// on every machine. Factor 1 is about 110 MB, and everything is in proportion to the factor.
#pragma once

#include <string>

namespace bench {

[[nodiscard]] std::string auctionData(double factor);

}  // namespace bench
