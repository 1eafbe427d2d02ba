// The data that the queries of bench/queries are about, by the names of their folders.
#pragma once

#include "AuctionData.h"
#include "BibliographyData.h"
#include "BusinessData.h"

#include <algorithm>
#include <iterator>
#include <stdexcept>
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

inline std::string generatedData(std::string_view name, double factor) {
  const auto* set = std::find_if(std::begin(dataSets), std::end(dataSets),
                                 [name](const DataSet& one) { return one.name == name; });
  if (set == std::end(dataSets)) throw std::runtime_error("no such data: " + std::string(name));
  return set->generate(factor);
}

}  // namespace bench
