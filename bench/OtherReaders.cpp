#include "OtherReaders.h"

#include <libxml/parser.h>
#include <libxml/parserInternals.h>

#include <pugixml.hpp>

namespace bench {
namespace {

void ignoreStart(void*, const xmlChar*, const xmlChar*, const xmlChar*, int, const xmlChar**, int,
                 int, const xmlChar**) {}
void ignoreEnd(void*, const xmlChar*, const xmlChar*, const xmlChar*) {}
void ignoreText(void*, const xmlChar*, int) {}
void ignoreComment(void*, const xmlChar*) {}
void ignoreInstruction(void*, const xmlChar*, const xmlChar*) {}

xmlSAXHandler emptyHandlers() {
  xmlSAXHandler handler = {};
  handler.initialized = XML_SAX2_MAGIC;
  handler.startElementNs = ignoreStart;
  handler.endElementNs = ignoreEnd;
  handler.characters = handler.ignorableWhitespace = handler.cdataBlock = ignoreText;
  handler.comment = ignoreComment;
  handler.processingInstruction = ignoreInstruction;
  return handler;
}

constexpr int options = XML_PARSE_HUGE | XML_PARSE_NONET;

}  // namespace

bool readWithSAX(const std::string& xml) {
  static xmlSAXHandler handler = emptyHandlers();
  const xmlParserCtxtPtr parser =
      xmlCreateMemoryParserCtxt(xml.data(), static_cast<int>(xml.size()));
  if (!parser) return false;
  *parser->sax = handler;
  xmlCtxtUseOptions(parser, options);
  const bool isRead = xmlParseDocument(parser) == 0;
  if (parser->myDoc) xmlFreeDoc(parser->myDoc);
  xmlFreeParserCtxt(parser);
  return isRead;
}

bool readWithLibXMLTree(const std::string& xml) {
  const xmlDocPtr document =
      xmlReadMemory(xml.data(), static_cast<int>(xml.size()), nullptr, nullptr, options);
  if (document) xmlFreeDoc(document);
  return document != nullptr;
}

bool readWithPugixml(const std::string& xml) {
  pugi::xml_document document;
  const unsigned int all = pugi::parse_default | pugi::parse_ws_pcdata | pugi::parse_comments |
                           pugi::parse_pi | pugi::parse_declaration;
  return static_cast<bool>(document.load_buffer(xml.data(), xml.size(), all));
}

}  // namespace bench
