// Nodes as HTML text.
#pragma once

#include "Results.h"
#include "xquery/xquery.h"

namespace cli {

// Elements without a namespace or in that of XHTML are HTML's: those that cannot have content are
// written without end tag, all others with one, and the text of scripts and styles as it is.
// Elements of other namespaces are written with their local names, as those of drawings and
// formulas are in HTML. A document begins with its type.
void writeHTML(const xquery::NSXMLNode& node, ResultPart& result);

}  // namespace cli
