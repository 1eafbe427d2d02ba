// Trees that are built and changed with checks, and documents that are frozen.
//
//   auto document = NSXMLDocument::document();
//   auto book = XQueryMakeElement("book");
//   if (!book || !XQuerySetAttribute(**book, "isbn", isbn)) return fail();
//   if (const auto done = XQueryAddChild(*document, *book); !done) return fail(done.error());
//   const auto shared = XQueryFreeze(document);  // for any number of threads
//
// The members of NSXMLNode, NSXMLElement and NSXMLDocument take what they are given, and the tree
// may come to be none that could be written as XML. The functions here refuse what is no XML 1.0
// with namespaces: the result is an error, and nothing has changed. All text is UTF-8.
//
//   6   the text is not well-formed UTF-8
//   6   the text holds the character U+0000, which XML does not have
//   6   "1a" is not of the form of xs:QName          (xs:NCName for targets and prefixes)
//   25  Attribute name not distinct
//   26  processing instruction content cannot contain ?>
//   28  invalid node for document                    a second element, a text, a document
//   44  Attribute namesapce is xmlns                 an attribute with the name xmlns; the prefix
//                                                    xmlns and its namespace, of elements as well
//   70  invalid namespace declaration                a prefix without a URI or with one that is
//                                                    reserved, or with two on one element
//   72  invalid comment                              "--" in it, or "-" at its end
//   0   a CDATA section cannot contain ]]>
//   0   the document is frozen
//   0   the node has a parent already
//   0   the node cannot be there                     a child in a text, an attribute among the
//                                                    children, a node below itself
//
// A tree is changed by one thread at a time, while no other reads it.
#pragma once

#include "xquery/Export.h"
#include "xquery/Result.h"
#include "xquery/XMLNode.h"

#include <cstdint>
#include <string_view>

namespace xquery {

// --- nodes without a parent ----------------------------------------------------------------------

// A name is a QName as it is to be written. A prefix needs a namespace; a name without one is in
// that namespace, or in none where that is empty. Declarations need not be added: whoever writes
// the tree finds out which are needed.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Ref<NSXMLElement>> XQueryMakeElement(
    std::string_view name, std::string_view namespaceURI = {});
// An attribute in a namespace needs a prefix.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Ref<NSXMLNode>> XQueryMakeAttribute(
    std::string_view name, std::string_view value, std::string_view namespaceURI = {});
// The declaration of a prefix, or of the default namespace where that is empty.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Ref<NSXMLNode>> XQueryMakeNamespace(
    std::string_view prefix, std::string_view namespaceURI);
[[nodiscard]] XQUERY_EXPORT XQueryResult<Ref<NSXMLNode>> XQueryMakeText(std::string_view text);
// A text that is written as a CDATA section.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Ref<NSXMLNode>> XQueryMakeCDATA(std::string_view text);
[[nodiscard]] XQUERY_EXPORT XQueryResult<Ref<NSXMLNode>> XQueryMakeComment(std::string_view text);
// The target is an NCName and not "xml", in whatever case.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Ref<NSXMLNode>> XQueryMakeProcessingInstruction(
    std::string_view target, std::string_view content);

// --- changes -------------------------------------------------------------------------------------

// The child, which has no parent, becomes the last one of a document or an element, or the one at
// that index; it keeps its identity. A document takes one element, comments and processing
// instructions.
[[nodiscard]] XQUERY_EXPORT XQueryResult<void> XQueryAddChild(NSXMLNode& parent,
                                                              const Ref<NSXMLNode>& child);
[[nodiscard]] XQUERY_EXPORT XQueryResult<void> XQueryInsertChild(NSXMLNode& parent,
                                                                 const Ref<NSXMLNode>& child,
                                                                 uint32_t atIndex);
// An attribute or a namespace, which has no parent. The names of the attributes of an element
// differ both as they are written and by namespace and local name.
[[nodiscard]] XQUERY_EXPORT XQueryResult<void> XQueryAddAttribute(NSXMLElement& element,
                                                                  const Ref<NSXMLNode>& attribute);
[[nodiscard]] XQUERY_EXPORT XQueryResult<void> XQueryAddNamespace(NSXMLElement& element,
                                                                  const Ref<NSXMLNode>& node);
// Gives the attribute with that local name in that namespace the value, whatever prefix it has, or
// adds one.
[[nodiscard]] XQUERY_EXPORT XQueryResult<void> XQuerySetAttribute(
    NSXMLElement& element, std::string_view name, std::string_view value,
    std::string_view namespaceURI = {});
// The text of a node; in place of all the children of an element.
[[nodiscard]] XQUERY_EXPORT XQueryResult<void> XQuerySetText(NSXMLNode& node,
                                                             std::string_view text);
// Takes the node out of its parent; what has none stays as it is. It lives on while it is referred
// to.
[[nodiscard]] XQUERY_EXPORT XQueryResult<void> XQueryRemove(NSXMLNode& node);

// --- frozen documents ----------------------------------------------------------------------------

// From now on nobody can change the document or anything in it, neither by these functions nor by
// the members of its nodes, which answer false or do nothing; copies can be changed. So it may be
// shared by threads without a word between them.
//
// The answer is the document itself. Only where nodes that were taken out of it, or once stood
// beside it, still share its memory is it a frozen copy, and the document stays as it was.
[[nodiscard]] XQUERY_EXPORT Ref<NSXMLDocument> XQueryFreeze(const Ref<NSXMLDocument>& document);
// Whether the node is in a frozen document.
[[nodiscard]] XQUERY_EXPORT bool XQueryIsFrozen(const NSXMLNode& node);

}  // namespace xquery
