#include "MissingDocuments.h"

#include "Reports.h"
#include "Streams.h"

namespace cli {

void MissingDocuments::XQueryClientMissesDocument(const xquery::XQueryMissingDocument& document,
                                                  xquery::XQueryContext&) {
  if (_options.quiet) return;
  const std::lock_guard lock(_mutex);
  if (_told.size() > mostWarnings || !_told.insert(document.URL).second) return;
  writeMessage(_told.size() <= mostWarnings ? warning(_options, document)
                                            : warningOfMore(_options));
}

}  // namespace cli
