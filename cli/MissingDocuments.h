// Warnings of documents that a query named and that could not be had: to the query they are the
// empty sequence, and nobody would know why.
#pragma once

#include "Options.h"
#include "xquery/xquery.h"

#include <cstddef>
#include <mutex>
#include <set>
#include <string>

namespace cli {

// For the contexts of all threads. Each document is told of once, and after so many only that there
// are more; nothing is said with --quiet.
class MissingDocuments : public xquery::XQueryClient {
 public:
  static constexpr size_t mostWarnings = 100;

  explicit MissingDocuments(const Options& options) : _options(options) {}
  void XQueryClientMissesDocument(const xquery::XQueryMissingDocument& document,
                                  xquery::XQueryContext& context) override;

 private:
  const Options& _options;
  std::mutex _mutex;
  std::set<std::string> _told;  // URLs
};

}  // namespace cli
