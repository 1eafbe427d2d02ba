// The whole-query cases of tests/queries and some queries that take longer, compiled and with the
// answer that each has alone.
#pragma once

#include "queries/QueryCase.h"
#include "xquery/xquery.h"

#include <filesystem>
#include <map>
#include <string>
#include <string_view>
#include <vector>

namespace bench {

struct SoakCase {
  xquery::querytest::QueryCase text;
  std::string folderURL;   // of its files
  xquery::Value document;  // null for none; shared by all cases with the same text
  xquery::Ref<xquery::XQuery> plain;
  xquery::Ref<xquery::XQuery> planned;
  std::string alone;  // as soakAnswer tells it
};

// The files that cases load lie in a folder that goes with the object.
class SoakCases {
 public:
  SoakCases();
  ~SoakCases();
  SoakCases(const SoakCases&) = delete;
  SoakCases& operator=(const SoakCases&) = delete;

  // Without those that answer anew each time, as what asks for the time does. The last few take
  // longer than all others.
  const std::vector<SoakCase>& all() const { return _all; }
  size_t longCount() const { return _longCount; }

 private:
  void add(const xquery::querytest::QueryCase& text);

  std::filesystem::path _folder;
  std::map<std::string, xquery::Value> _documents;
  std::vector<SoakCase> _all;
  size_t _longCount = 0;
};

// The items with their types, a line for each, or the error with its number, line and text.
std::string soakAnswer(const xquery::XQuery& query, xquery::XQueryContext& context,
                       const SoakCase& c);
// Whether that is an error of a limit with that text.
bool isSoakLimit(const std::string& answer, std::string_view text);

}  // namespace bench
