// The whole-query cases of tests/queries, compiled and with the answer that each has alone.
#pragma once

#include "xquery/xquery.h"

#include <filesystem>
#include <map>
#include <string>
#include <vector>

namespace bench {

struct SoakCase {
  std::string file;  // and line, of its name
  int line = 0;
  std::string text;
  xquery::XQueryVariables constants;
  std::map<std::string, std::string> namespaces;
  std::map<std::string, std::string> modules;
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

  // Without those that answer anew each time, as what asks for the time does.
  const std::vector<SoakCase>& all() const { return _all; }
  xquery::Ref<xquery::XQuery> compiled(const SoakCase& c, xquery::XQueryWay way) const;

 private:
  void readFile(const std::filesystem::path& path);
  void finish(SoakCase& c, const std::string& xml, const std::map<std::string, std::string>& files);

  std::filesystem::path _folder;
  std::map<std::string, xquery::Value> _documents;
  std::vector<SoakCase> _all;
};

// The items with their types, a line for each, or the error with its number, line and text.
std::string soakAnswer(const xquery::XQuery& query, xquery::XQueryContext& context,
                       const SoakCase& c);
bool isSoakLimit(const std::string& answer);

}  // namespace bench
