// How the items of a result are written.
#pragma once

#include "NodePlace.h"
#include "Options.h"
#include "Results.h"
#include "xquery/xquery.h"

#include <string>

namespace cli {

// What stands around all items of all inputs, and between them.
Framing framing(const Options& options);

// Writes the items of one input.
class ItemWriter {
 public:
  // `inputName` is what --with-name puts before each item.
  ItemWriter(const Options& options, std::string inputName, ResultPart& result)
      : _options(options), _inputName(std::move(inputName)), _result(result) {}

  // Stops at the first failed write.
  void write(const xquery::NSArray& items);
  void write(const xquery::NSObject& item);

 private:
  // A name that XML and JSON cannot hold, such as one that is not UTF-8, is given as its URL.
  std::string documentedInputName() const;
  void writeItem(const xquery::NSObject& item);
  void writeLine(const xquery::NSObject& item);
  void writeValue(const xquery::NSObject& item);
  void writeXML(const xquery::NSXMLNode& node);
  void writeXMLItem(const xquery::NSObject& item);
  void writeAttribute(const char* name, const std::string& value);
  void writeJSONItem(const xquery::NSObject& item);

  const Options& _options;
  const std::string _inputName;
  ResultPart& _result;
  NodePlaces _places;
};

}  // namespace cli
