// The queries of bench/queries: DATA/IDEA.PHRASING.xq is one way to ask for what all phrasings of
// the idea answer, over the data that is named like the folder.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

namespace bench {

struct PhrasedQuery {
  std::string data;      // "auction"
  std::string idea;      // "08-join"
  std::string phrasing;  // "published"
  std::string text;

  [[nodiscard]] bool asksTheSameAs(const PhrasedQuery& other) const {
    return data == other.data && idea == other.idea;
  }
  // One of the twenty queries usually asked of auction data, whose ideas are numbered.
  [[nodiscard]] bool isOfTheTwenty() const { return idea[0] >= '0' && idea[0] <= '9'; }
};

// Sorted by data, idea and phrasing. Throws std::runtime_error for a file of another kind.
[[nodiscard]] std::vector<PhrasedQuery> phrasedQueries(const std::filesystem::path& folder);

}  // namespace bench
