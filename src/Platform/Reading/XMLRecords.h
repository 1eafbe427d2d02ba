// A document that is read record by record: of each, a tree that holds its subtree, the elements
// above it with their attributes and namespaces, and nothing else.
//
// Every record takes the memory of the one before, so that reading takes no more than the largest
// record does, however long the document is. Of the text nothing is kept but what is before the
// document element. What does grow is the table of names, with each name and namespace that the
// document has not used before.
//
// Our reader reads as far as it takes the text, and libxml2 goes on from there: with the errors,
// and the places of errors, of one that has read all of it.
#pragma once

#include "Platform/Reading/TextSource.h"
#include "xquery/XMLNode.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <vector>

namespace xquery {

// Which elements are records: those that paths of names find from the document on, outermost ones
// only.
struct XMLRecordStep {
  bool isAnywhere = false;                  // below, not a child
  const NSXMLExpandedName* name = nullptr;  // null for any
};
using XMLRecordPath = std::vector<XMLRecordStep>;
// Of all paths together, each with one more than it has.
constexpr size_t mostRecordSteps = 64;

class XMLRecords {
 public:
  // `source` should not keep what it has read: one with a rewinding. The names live as long as this
  // does. `options` are NSXMLOptions.
  XMLRecords(TextSource& source, std::span<const XMLRecordPath> paths, uint32_t options);
  ~XMLRecords();
  XMLRecords(const XMLRecords&) = delete;
  XMLRecords& operator=(const XMLRecords&) = delete;

  // Looks at a record, which must not be referred to afterwards; false ends the reading.
  using Receiver = std::function<bool(const NSXMLElement& record)>;
  // Once. False, with the error, where the document is not well formed, after the records before
  // that. What the receiver throws is thrown on.
  [[nodiscard]] bool read(const Receiver& receive, NSXMLParseError& error);

  // Within the receiver: how many of the elements above the record are those that were above the
  // record before, from the document element on. Others may lie in the same places with the same
  // names.
  size_t elementsKept() const;
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
