// Nodes as objects of Python.
#pragma once

#include "Module.h"

namespace xquery::python {

// xquery.Node. It keeps the whole tree of the node; two of one node are equal. The trees are never
// changed from Python, so that any number of threads may read them.
struct Node {
  Ref<NSXMLNode> node;
};

py::object nodeToPython(const NSXMLNode* node);
// None for null.
py::object nodeOrNone(const NSXMLNode* node);

// The first item of what the path, any query, answers for the node, or all of them. Documents and
// modules are not loaded.
py::object findFirst(const Node& node, const py::object& path);
py::object findAll(const Node& node, const py::object& path);

}  // namespace xquery::python
