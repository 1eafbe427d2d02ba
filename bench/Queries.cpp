#include "Queries.h"

#include <algorithm>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <tuple>

namespace bench {
namespace {

PhrasedQuery readQuery(const std::filesystem::path& path) {
  const std::string name = path.stem().string();
  const size_t dot = name.find('.');
  std::ifstream file(path, std::ios::binary);
  if (path.extension() != ".xq" || dot == 0 || dot == std::string::npos || !file) {
    throw std::runtime_error("not an IDEA.PHRASING.xq: " + path.string());
  }
  return {path.parent_path().filename().string(), name.substr(0, dot), name.substr(dot + 1),
          std::string(std::istreambuf_iterator<char>(file), {})};
}

}  // namespace

std::vector<PhrasedQuery> phrasedQueries(const std::filesystem::path& folder) {
  std::vector<PhrasedQuery> queries;
  for (const auto& entry : std::filesystem::recursive_directory_iterator(folder)) {
    if (entry.is_regular_file()) queries.push_back(readQuery(entry.path()));
  }
  std::sort(queries.begin(), queries.end(), [](const PhrasedQuery& a, const PhrasedQuery& b) {
    return std::tie(a.data, a.idea, a.phrasing) < std::tie(b.data, b.idea, b.phrasing);
  });
  return queries;
}

}  // namespace bench
