// The reader for the documents that most are: UTF-8 or ASCII, XML 1.0 with namespaces, without
// declarations of their own.
//
// It takes a document only where it has understood all of it, and then reads it as libxml2 does;
// the rest is left to that, which has the last word on what is well formed (NotTaken.h). The text
// is looked at once for where markup may be (ByteMarks.h); from there each tag, text, comment and
// so on is read as a whole, as soon as all of it is in hand (TextSource.h), and put into the tree.
#pragma once

#include "Platform/Reading/TextSource.h"
#include "xquery/XMLNode.h"

namespace xquery {

class XMLProjection;

// The document, or what the projection needs of it; null where this reader does not take the text.
// `options` are NSXMLOptions.
[[nodiscard]] Ref<NSXMLDocument> readXML(TextSource& source, uint32_t options,
                                         const XMLProjection* projection = nullptr);

}  // namespace xquery
