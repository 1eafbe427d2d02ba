// How the host's flags and callbacks read documents.
#pragma once

#include "xquery/capi/nodes.h"

#include <cstdint>

namespace xquery::capi {

bool areReadingFlags(xq_reading flags);
// As NSXMLOptions.
uint32_t readingOptions(xq_reading flags);

// What the host's callback reads. It is not called again after its end or its failure.
class HostInput {
 public:
  HostInput(xq_read read, void* data) : _read(read), _data(data) {}

  ptrdiff_t operator()(char* buffer, size_t size);
  bool hasFailed() const { return _hasFailed; }

 private:
  const xq_read _read;
  void* const _data;
  bool _isOver = false;
  bool _hasFailed = false;
};

}  // namespace xquery::capi
