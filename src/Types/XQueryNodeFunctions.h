// What the data model asks of a node. Nothing here fails: of a missing node the answer is null, ""
// or false.
#pragma once

#include "Platform/Tree/Names.h"
#include "xquery/Object.h"
#include "xquery/String.h"
#include "xquery/XMLNode.h"

#include <vector>

namespace xquery {

class XQueryContext;

Ref<NSString> XQueryNodeStringValue(const NSXMLNode* node);
Ref<NSString> XQueryNodeTypedValue(const NSXMLNode* node);
void XQueryNodeAddChildTextValues(const NSXMLNode* node, NSMutableString& text);
Ref<NSString> XQueryNodeName(const NSXMLNode* node);
Ref<NSString> XQueryNodeTypeName(const NSXMLNode* node);  // always null
Ref<NSString> XQueryNodeLanguage(const NSXMLNode* node);  // null when none
Ref<NSString> XQueryNodeBaseURI(const NSXMLNode* node);   // "" when none
Ref<NSString> XQueryNodeDocumentURI(const NSXMLNode* node);
NSXMLNode* XQueryNodeRoot(const NSXMLNode* node);
Ref<NSString> XQueryNodeNamespaceForPrefix(const NSXMLNode* node, NSStringView prefix);
std::vector<Ref<NSString>> XQueryNodeInScopePrefixes(const NSXMLNode* node);
std::vector<Ref<NSXMLNode>> CopyXQueryNodeNamespaces(const NSXMLNode* node);
bool XQueryNodeEqual(const NSXMLNode* a, const NSXMLNode* b, XQueryContext* context);
Value XQueryNodeResolveID(const NSXMLNode* node, NSStringView id);     // always null
Value XQueryNodeResolveIDRef(const NSXMLNode* node, NSStringView id);  // always null
Ref<NSString> XQueryNodeStringRepresentaion(const NSXMLNode* node);
Ref<NSXMLDocument> XQueryNodeFromString(const NSString& string, uint32_t options);
Ref<NSXMLDocument> XQueryNodeFromData(const NSData& data, uint32_t options);

Ref<NSXMLNode> XQueryXMLNodeText(const NSString& text);
Ref<NSXMLNode> XQueryXMLNodeCDATA(const NSString& text);
// Null for text that a comment cannot hold.
Ref<NSXMLNode> XQueryXMLNodeComment(const NSString& text);
// Null for the target "xml" in any letter case.
Ref<NSXMLNode> XQueryXMLNodePI(const NSString& target, const NSString& text);
Ref<NSXMLNode> XQueryXMLNodePI(NSXMLNameRef target, NSStringView text);
Ref<NSXMLNode> XQueryXMLNodeAttribute(const NSString& name, const NSString& value);
Ref<NSXMLNode> XQueryXMLNodeNamespace(const NSString& prefix, const NSString& URI);
bool XQueryNamespacesEqual(NSStringView a, NSStringView b);

}  // namespace xquery
