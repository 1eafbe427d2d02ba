// A document that is read record by record: of each, a tree that holds its subtree, the elements
// above it with their attributes and namespaces, and nothing else.
//
// Every record takes the memory of the one before, so that reading takes no more than the largest
// record does, however long the document is. Nothing of the text is kept either.
#pragma once

#include "Platform/Reading/TextSource.h"
#include "xquery/XMLNode.h"

#include <cstdint>
#include <memory>
#include <span>
#include <string_view>
#include <vector>

namespace xquery {

// Which elements are records: those that a path of names finds from the document on, outermost
// ones only.
struct XMLRecordStep {
  bool isAnywhere = false;                  // below, not a child
  const NSXMLExpandedName* name = nullptr;  // null for any
};
constexpr size_t mostRecordSteps = 63;

// Counted from 1; columns in bytes.
struct TextPlace {
  int64_t line = 1;
  int64_t column = 1;

  void pass(std::string_view text);
};

class XMLRecords {
 public:
  // `source` should not keep what it has read: one with a rewinding. The names live as long as this
  // does. `options` are NSXMLOptions.
  XMLRecords(TextSource& source, std::span<const XMLRecordStep> path, uint32_t options);
  ~XMLRecords();
  XMLRecords(const XMLRecords&) = delete;
  XMLRecords& operator=(const XMLRecords&) = delete;

  // The next record; the one before must not be referred to any more. Null at the end of the
  // document, and where the text is none that our reader takes.
  const NSXMLElement* next();
  // Whether all of the document has been read.
  bool isAtEnd() const;
  // After the last record, where not all has been read: where the piece of the document begins that
  // our reader does not take.
  TextPlace place() const;
  // Above the records; the same all the time.
  NSXMLDocument* document() const;
  // How many references to the document, its nodes and their texts there are, this object's
  // included. To be compared with what it was before a record was looked at.
  uint32_t references() const;

 private:
  class Reading;
  std::unique_ptr<Reading> _reading;
};

}  // namespace xquery
