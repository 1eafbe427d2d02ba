// What the other steps of a path must be where a step is to set no focus of its own any more.
#pragma once

#include "Plan/Program.h"

namespace xquery {

class XQueryPlanning;
class XQueryStep;
class XQueryWalkedPath;

// Predicates leave their focus behind for an error that comes up later in the path, which an
// evaluation of the context may start from. Whether nothing that comes up later could show the one
// that filtering the nodes of a step leaves: the path starts from one item or from nodes, names
// raise nothing, and expressions in place of a step, which set a focus of their own, stand behind
// it.
bool XQueryHidesFocusOf(const XQueryStep& step, const XQueryWalkedPath& path, XQueryPlaceID place,
                        const XQueryPlanning& planning);

}  // namespace xquery
