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

// The document: a file, or what a function of the host reads. All XML that NSXMLDocument reads,
// packed by gzip, xz, zstd or bzip2 as well; UTF-8 without declarations of its own is by far the
// fastest.
struct XQueryStreamInput {
  std::string path;  // "-" is standard input; not looked at where there is a function
  // Fills the buffer; answers the number of bytes, 0 at the end of the input, negative on failure.
  // What it answers is looked at before it is called again, however little it is. Called on the
  // evaluating thread; must not throw.
  std::function<ptrdiff_t(char* buffer, size_t size)> read;
  uint32_t options = 0;           // NSXMLOptions; that for HTML is not looked at
  NSXMLReadingProgress progress;  // of a file; may be empty
  // Of a file, which may be a pipe: called where nothing can be read from it yet, before that is
  // waited for. Time to write what has been gathered; may be empty, must not throw.
  std::function<void()> beforeWaiting;
  // Called before a record is evaluated, with the element that it is, which is good until the next
  // call, and with the number of elements above it that are above the record before it as well,
  // counted from the document element. From there on they are others, though they may look the
  // same. May be empty, must not throw.
  std::function<void(const NSXMLElement& record, size_t elementsKept)> beforeRecord;
};

// Why a stream ended before its end: one of the two is set.
struct XQueryStreamFailure {
  Ref<XQueryError> error;
  // Of the document: what NSXMLDocument says of it, with line 0 where it could not be read.
  NSXMLParseError reading;
};

class XQuery;

// How a query that was compiled to be streamed is evaluated, for people, in UTF-8: the path to the
// records, and what is made of what they give.
//
//   record: /site/people/person
//   result: count
//
// Empty for a query that was compiled otherwise, or with errors.
[[nodiscard]] XQUERY_EXPORT std::string XQueryStreamDescription(const XQuery& query);

}  // namespace xquery
