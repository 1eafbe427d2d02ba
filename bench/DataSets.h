// The data that the queries of bench/queries are about, by the names of their folders.
#pragma once

#include "AuctionData.h"
#include "BibliographyData.h"
#include "BusinessData.h"

#include <string>
#include <string_view>

namespace bench {

struct DataSet {
  std::string_view name;
  std::string (*generate)(double factor);
};

inline constexpr DataSet dataSets[] = {
    {"auction", auctionData},
    {"bibliography", bibliographyData},
    {"business", businessData},
};

}  // namespace bench
