// The two ways from XML text to a tree, and which of them a document goes.
#pragma once

#include "Platform/Reading/TextSource.h"
#include "xquery/XMLNode.h"

namespace xquery {

// The ways make equal trees; tests compare them.
enum class XMLWay : uint8_t {
  Either,  // our reader's, and libxml2's where that does not take the text
  Own,     // our reader's alone: null without an error where it does not take the text
  LibXML,  // libxml2's alone
};

class XMLProjection;

// The document; null, with the error, where it is not well formed. With a projection only what that
// needs is made, and the whole text read and refused as ever.
[[nodiscard]] Ref<NSXMLDocument> readDocument(TextSource& source, uint32_t options,
                                              NSXMLParseError& error, XMLWay way = XMLWay::Either,
                                              const XMLProjection* projection = nullptr);

// NSXMLDocument::documentWithData and documentWithFile, of what the projection needs. HTML is read
// as a whole.
[[nodiscard]] Ref<NSXMLDocument> projectedDocumentWithData(std::string_view bytes, uint32_t options,
                                                           const XMLProjection* projection,
                                                           NSXMLParseError& error);
[[nodiscard]] Ref<NSXMLDocument> projectedDocumentWithFile(const std::string& path,
                                                           uint32_t options,
                                                           const XMLProjection* projection,
                                                           NSXMLParseError& error,
                                                           const NSXMLReadingProgress& progress);

// NSXMLDocument::documentWithData, where packed text may be so long and no longer.
[[nodiscard]] Ref<NSXMLDocument> documentWithBoundedData(std::string_view bytes, uint32_t options,
                                                         uint64_t mostBytes,
                                                         NSXMLParseError& error);

// Of what the input gives, which cannot be read again; plain or packed. Null with an empty error
// where the input fails, of which whoever gave it knows more.
[[nodiscard]] Ref<NSXMLDocument> documentWithInput(const TextInput& input, uint32_t options,
                                                   NSXMLParseError& error);

// libxml2's way.
[[nodiscard]] Ref<NSXMLDocument> readWithLibXML(const TextInput& input, uint32_t options,
                                                size_t expectedBytes, NSXMLParseError& error,
                                                const XMLProjection* projection = nullptr);

}  // namespace xquery
