// Where the time of evaluations goes: how often each expression of a query ran, how many items it
// answered, and how long it took.
//
//   auto query = XQuery::xqueryWithSource(text, XQueryLoading(), XQueryLimits(),
//                                         XQueryWay::Profiled);
//   auto context = XQueryContext::xqueryContext();
//   auto items = context->evaluateXQuery(*query, {}, document, &error);
//   XQueryProfile profile(*query);
//   profile.add(*context);
//   write("profile.html", profile.describe(XQueryProfileFormat::HTML));
//
// Counting belongs to the context: one profiled query may be evaluated by any number of threads,
// each with a context of its own. Results, errors and limits are those of the query compiled
// otherwise. It takes longer: each count reads the clock twice, which takes some 100 ns, and where
// an expression takes no longer than that, the time shown is mostly that of counting.
#pragma once

#include "xquery/Export.h"

#include <chrono>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>

namespace xquery {

class XQuery;
class XQueryContext;
struct XQueryProfileData;

enum class XQueryProfileFormat : uint8_t {
  JSON,  // RFC 8259, see docs/profile.md
  Text,  // the expressions as a tree, with their counts and times in columns
  HTML,  // one page that needs no network: the query with its costs, its expressions, a flame graph
};

// What only the host knows. What is left out is not shown.
struct XQueryProfileSurroundings {
  std::string name;                                 // of the query, such as its file; UTF-8
  std::optional<std::chrono::nanoseconds> reading;  // of the documents it was given
  std::optional<std::chrono::nanoseconds> printing;
  std::optional<uint64_t> inputs;      // how many documents it was evaluated for
  std::optional<uint64_t> failures;    // how many of the evaluations ended in an error
  std::optional<uint64_t> memoryPeak;  // of the process, in bytes
};

// A sum of evaluations of one query. For one thread at a time.
class XQUERY_EXPORT XQueryProfile {
 public:
  // Of no evaluation yet.
  explicit XQueryProfile(const XQuery& query);
  ~XQueryProfile();
  XQueryProfile(XQueryProfile&& other) noexcept;
  XQueryProfile& operator=(XQueryProfile&& other) noexcept;

  // Adds all evaluations of the query against the context so far, those included that failed or
  // reached a limit. To be called once for a context, between evaluations. Adds nothing and answers
  // false unless the query was compiled to be profiled, and is the one that was profiled last
  // there: a context keeps the profile of one query.
  bool add(const XQueryContext& context);
  // How many have been added.
  uint64_t evaluations() const;
  // UTF-8. Whatever comes from the query is written so that it cannot be taken for anything else:
  // characters that control terminals or the direction of text, and markup. Empty for a query that
  // was not compiled to be profiled.
  std::string describe(XQueryProfileFormat format,
                       const XQueryProfileSurroundings& surroundings = {}) const;

 private:
  std::unique_ptr<XQueryProfileData> _data;
};

}  // namespace xquery
