// Trees as libxml2 has them, for the libraries that work on those: copies in both directions.
//
// Both copies are made in one pass over the nodes and take time in proportion to them, whatever
// their nesting; they may be ended at a limit of the evaluation, by an exception.
#pragma once

#include "xquery/XMLNode.h"

#include <cstddef>
#include <memory>
#include <string>

struct _xmlDoc;
struct _xmlDict;

namespace xquery {

struct LibXMLFreeDocument {
  void operator()(_xmlDoc* document) const;
};
using LibXMLDocument = std::unique_ptr<_xmlDoc, LibXMLFreeDocument>;

// Null for a document that nests deeper than that many levels. Names are kept in the dictionary,
// which the copy shares; null for one of its own. The URL is what references in the document are
// relative to; empty for none. Texts of no length are left out, and declarations are added for
// names whose prefix is not declared. Throws std::bad_alloc.
LibXMLDocument LibXMLDocumentFrom(const NSXMLDocument& document, size_t mostLevels,
                                  const std::string& URL, _xmlDict* dictionary = nullptr);

// DTDs are left out.
Ref<NSXMLDocument> documentFromLibXML(const _xmlDoc& document);

// All text of the document, in order.
Ref<NSString> textFromLibXML(const _xmlDoc& document);

}  // namespace xquery
