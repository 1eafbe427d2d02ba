// Nodes and values as handles.
#pragma once

#include "C/Handles.h"
#include "xquery/capi/nodes.h"
#include "xquery/XMLNode.h"

struct xq_node : xquery::capi::Handle<xquery::capi::Tag::Node> {
  explicit xq_node(xquery::Ref<xquery::NSXMLNode> ofNode) : node(std::move(ofNode)) {}

  xquery::Ref<xquery::NSXMLNode> node;
};
