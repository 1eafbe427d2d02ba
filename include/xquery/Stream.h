// Documents that are evaluated record by record, in the memory of one record, however long they
// are; see XQueryContext::evaluateStream.
#pragma once

#include "xquery/Error.h"
#include "xquery/XMLNode.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>

namespace xquery {

// The document: a file, or what a function of the host reads. XML in UTF-8 without declarations of
// its own; packed by gzip, xz, zstd or bzip2 as well.
struct XQueryStreamInput {
  std::string path;  // "-" is standard input; not looked at where there is a function
  // Fills the buffer; answers the number of bytes, 0 at the end of the input, negative on failure.
  // Called on the evaluating thread; must not throw.
  std::function<ptrdiff_t(char* buffer, size_t size)> read;
  uint32_t options = 0;           // NSXMLOptions; that for HTML is not looked at
  NSXMLReadingProgress progress;  // of a file; may be empty
};

// Why a stream ended before its end: one of the two is set.
struct XQueryStreamFailure {
  Ref<XQueryError> error;
  // Of the document, with line 0 where it could not be read. What is well formed and yet not read
  // as a stream, such as another encoding, is told of in the same way.
  NSXMLParseError reading;
};

}  // namespace xquery
