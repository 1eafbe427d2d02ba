// Reads the examples out of the documents for people, docs/*.md, and runs them. There are two
// forms: `query` → `result` in a line, whose items are separated by ", ", and a block
//
//   ```xquery
//   the query
//   ```
//   ```text
//   the result
//   ```
//
// with each item on a line of its own. No items are "()", a failure is "error NUMBER MESSAGE".
// Comments, which a reader of the page does not see, say what the blocks behind them are given:
//
//   <!-- input: examples/books.xml -->   the context item, until the next one; "none" for none
//   <!-- var: limit=10 -->               an external variable, of the next block only
//
// Relative locations are those of the folder `examples`, as for a command that is started there.
#pragma once

#include "xquery/xquery.h"

#include <string>
#include <string_view>
#include <vector>

namespace xquery::docs {

struct Example {
  std::string query, result;
  std::string place;      // "docs/guide.md:12"
  int line = 0;           // of the query
  std::string separator;  // of the items
  std::string input;      // a path below the root of the project, empty for none
  std::string variable;   // "limit=10", empty for none
};

struct Document {
  std::string name;  // "docs/guide.md"
  std::vector<std::string> lines;
  std::vector<Example> examples;
  std::vector<std::string> faults;  // what looks like an example and is none
};

Document documentOf(std::string name, std::string_view text);
Document readDocument(const std::string& name);
// All pages in docs and the README.
std::vector<Document> readDocuments();

// The items of a result as an example writes them, or the error.
std::string evaluated(const Example& example, XQueryWay way);
// Examples that give something else than they say, one a line, and faults of the document.
std::string failuresOf(const Document& document);

}  // namespace xquery::docs
