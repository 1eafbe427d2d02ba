// Document order between nodes.
#pragma once

#include "xquery/Object.h"
#include "xquery/XMLNode.h"

#include <vector>

namespace xquery {

bool XQueryNodeBefore(const NSXMLNode* a, const NSXMLNode* b);
bool XQueryNodeAfter(const NSXMLNode* a, const NSXMLNode* b);
// The same as the shared truth values.
Value op_node_before(const NSXMLNode* a, const NSXMLNode* b);
Value op_node_after(const NSXMLNode* a, const NSXMLNode* b);

// The plain parent-climbing algorithms, which define the answers; the functions above take a
// shortcut through the order numbers when both nodes hang in one tree.
bool XQueryNodeBeforeByClimbing(const NSXMLNode* a, const NSXMLNode* b);
bool XQueryNodeAfterByClimbing(const NSXMLNode* a, const NSXMLNode* b);

// -1, 0 or 1.
int NodeDocOrderCompareForward(const NSXMLNode* a, const NSXMLNode* b);
int NodeDocOrderCompareReverse(const NSXMLNode* a, const NSXMLNode* b);

// Sort arrays of nodes in place with the comparators above.
void XQuerySortNodesForward(std::vector<Value>& nodes);
void XQuerySortNodesReverse(std::vector<Value>& nodes);
// Keeps nodes of different documents in the order in which they stand.
void XQuerySortNodesForwardStable(std::vector<Value>& nodes);

}  // namespace xquery
