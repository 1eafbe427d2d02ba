// The values that every built-in function is called with, and what is known of each: a value of
// every type of the casting table, nodes of every kind, sequences, and an object without a type.
#pragma once

#include "Types/CastingTable.h"
#include "xquery/Object.h"

#include <string>
#include <string_view>
#include <vector>

namespace xquery::arguments {

enum class NodeKind { Document, Element, Attribute, Namespace, Instruction, Comment, Text };

// What is known of a node, written by hand beside the text that it is parsed from.
struct Node {
  std::string label;
  NodeKind kind;
  std::string text;  // string value
  std::string name;
  std::string localName;
  std::string URI;
  std::string XML;
  std::string baseURI;
  std::string documentURI;
  std::string language;
  std::vector<std::string> prefixes;  // in scope, nearest first
  size_t root;                        // number of the topmost node
  Value object;
};

// One item as the rules see it: type and text, and for a node which one it is.
struct Item {
  int type = 0;  // 0 for a node and for an object without a type
  std::string text;
  const Node* node = nullptr;
  const castingtable::Row* row = nullptr;  // what casting makes of it, where the table says

  bool isNode() const { return node != nullptr; }
  bool isAtomic() const { return type > 6; }
};
using Sequence = std::vector<Item>;

struct Sample {
  std::string name;
  Sequence items;
  Value value;
  bool isTypical;  // taken into the pairs
  bool isUsual;    // taken into combinations of three and more
};

// The nodes by number, documents and roots before what they hold.
const std::vector<Node>& nodes();
const std::vector<Sample>& samples();
const Sample& sampleNamed(std::string_view name);

// The row of a value of that type that prints so; null when the table has none.
const castingtable::Row* rowOf(int type, const std::string& text);

// One item as the tests print it: "42 12" (type and text), "node r", "data 6162", "error 6 text".
std::string show(const NSObject& item);
// All items, separated by ", "; "()" for none.
std::string show(const Value& value);

}  // namespace xquery::arguments
