#include "Peer.h"

#include <libxml/parser.h>
#include <libxml/xpath.h>

#include <stdexcept>

namespace bench {

struct PeerDocument::Impl {
  xmlDocPtr document;
  xmlXPathContextPtr context;
};

PeerDocument::PeerDocument(const std::string& xml) : _impl(std::make_unique<Impl>()) {
  _impl->document = xmlReadMemory(xml.data(), static_cast<int>(xml.size()), nullptr, nullptr,
                                  XML_PARSE_HUGE | XML_PARSE_NONET);
  if (!_impl->document) throw std::runtime_error("the peer cannot parse the document");
  _impl->context = xmlXPathNewContext(_impl->document);
}

PeerDocument::~PeerDocument() {
  xmlXPathFreeContext(_impl->context);
  xmlFreeDoc(_impl->document);
}

struct PeerQuery::Impl {
  xmlXPathCompExprPtr expression;
};

PeerQuery::PeerQuery(const std::string& xpath) : _impl(std::make_unique<Impl>()) {
  _impl->expression = xmlXPathCompile(reinterpret_cast<const xmlChar*>(xpath.c_str()));
  if (!_impl->expression) throw std::runtime_error("the peer cannot compile " + xpath);
}

PeerQuery::~PeerQuery() {
  xmlXPathFreeCompExpr(_impl->expression);
}

size_t PeerQuery::evaluate(const PeerDocument& document) const {
  const xmlXPathContextPtr context = document._impl->context;
  context->node = reinterpret_cast<xmlNodePtr>(document._impl->document);
  const xmlXPathObjectPtr result = xmlXPathCompiledEval(_impl->expression, context);
  if (!result) throw std::runtime_error("the peer cannot evaluate a query");
  const size_t count =
      result->nodesetval ? static_cast<size_t>(result->nodesetval->nodeNr) : size_t{0};
  xmlXPathFreeObject(result);
  return count;
}

}  // namespace bench
