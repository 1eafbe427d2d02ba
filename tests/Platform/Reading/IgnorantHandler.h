// A handler of events that takes no notice of them.
#pragma once

#include "Platform/Reading/LibXML.h"

namespace xquery::readingtest {

class IgnorantHandler : public LibXMLHandler {
 public:
  virtual ~IgnorantHandler() = default;
  void startElement(const LibXMLName&, const LibXMLNamespaces&, const LibXMLAttributes&) override {}
  void endElement() override {}
  void characters(std::string_view) override {}
  void CDATA(std::string_view) override {}
  void comment(std::string_view) override {}
  void processingInstruction(LibXMLText, std::string_view) override {}
};

}  // namespace xquery::readingtest
