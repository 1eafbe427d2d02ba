// The whole-query cases under tests/queries/cases, for whoever evaluates them. A file holds any
// number of cases:
//
//   == what the case shows
//   -- var n=5                      (optional, repeatable: an untyped atomic external variable)
//   -- namespace p=urn:p            (optional, repeatable: a context namespace)
//   -- xml                          (optional: the context document, to the next section)
//   <a><b/></a>
//   -- file NAME                    (optional, repeatable: a file to load; "@folder@" stands in the
//   <c/>                             query and its result for the URL of its folder)
//   -- module URI                   (optional, repeatable: what there is at that location when the
//   module namespace m = "urn:m";    query is compiled; nowhere else is looked then)
//   -- query
//   //b
//   -- result                       (one line per item: type, tab, text as the command prints it)
//   element()	<b/>
//   -- error 6 line 1 invalid type for operator     (instead of a result; "line N" is optional,
//                                                    "..." stands for any text)
#pragma once

#include "xquery/xquery.h"

#include <filesystem>
#include <map>
#include <string>
#include <string_view>
#include <vector>

namespace xquery::querytest {

struct QueryCase {
  std::string file;  // and line, of its name
  int line = 0;
  XQueryVariables constants;
  std::map<std::string, std::string> namespaces;
  std::string xml;
  std::map<std::string, std::string> files;
  std::map<std::string, std::string> modules;
  std::string query;
  std::vector<std::string> result;
  std::string error;  // empty when a result is expected
};

// Where a case stands.
struct CasePlace {
  std::filesystem::path path;
  int line = 0;  // of its name
  std::string name;
};

constexpr std::string_view folderMark = "@folder@";

// All of them, file by file in the order of the alphabet. Reads no more than their names.
std::vector<CasePlace> placesOfCases(const std::filesystem::path& folder);
QueryCase readCase(const CasePlace& place);

// With the files in that folder, whose URL ends with a slash; compiled as the case asks for.
Ref<XQuery> compiledCase(const QueryCase& c, std::string_view folderURL, XQueryWay way);

std::string replaced(std::string text, std::string_view from, std::string_view by);
// An item as the cases write it: its type, a tab and its text.
std::string printedItem(const NSObject& item);

}  // namespace xquery::querytest
