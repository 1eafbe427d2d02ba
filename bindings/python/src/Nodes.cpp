#include "Nodes.h"

#include <xquery/Serializing.h>

#include <functional>
#include <vector>

namespace xquery::python {
namespace {

py::object kindOf(const Node& self) {
  switch (self.node->kind()) {
    case Kind::Document:
      return py::str("document");
    case Kind::Element:
      return py::str("element");
    case Kind::Attribute:
      return py::str("attribute");
    case Kind::Namespace:
      return py::str("namespace");
    case Kind::ProcessingInstruction:
      return py::str("processing-instruction");
    case Kind::Comment:
      return py::str("comment");
    default:
      return py::str("text");
  }
}

py::object textOf(const Node& self) {
  return toStr(self.node->stringValue()->view());
}

py::object namespaceOf(const Node& self) {
  const NSStringView URI =
      self.node->kind() == Kind::Document ? NSStringView() : self.node->URIView();
  return URI.isEmpty() ? py::none() : toStr(URI);
}

py::object prefixOf(const Node& self) {
  const NSStringView prefix = self.node->prefixView();
  return prefix.isEmpty() ? py::none() : toStr(prefix);
}

py::object URIOf(const Node& self) {
  const NSXMLDocument* document = self.node->rootDocument();
  return document ? toStrOrNone(document->documentURI()) : py::none();
}

// --- attributes and namespaces -------------------------------------------------------------------

py::dict attributesOf(const Node& self) {
  py::dict attributes;
  const auto* element = dyn_cast<NSXMLElement>(static_cast<const NSObject*>(self.node.get()));
  if (!element) return attributes;
  for (const NSXMLNode* attribute = element->firstAttribute(); attribute;
       attribute = NSXMLElement::nextAttribute(attribute)) {
    attributes[toStr(attribute->nameView())] = toStr(attribute->textView());
  }
  return attributes;
}

py::object attributeNamed(const Node& self, const py::object& name, const py::object& otherwise) {
  const auto* element = dyn_cast<NSXMLElement>(static_cast<const NSObject*>(self.node.get()));
  const Ref<NSString> text =
      NSString::stringWithUTF8(fromArgument(name, "the name of an attribute"));
  const NSXMLNode* found = element && text ? element->attributeForName(text->view()) : nullptr;
  return found ? toStr(found->textView()) : otherwise;
}

// Those in scope, by prefix; None is the default one.
py::dict namespacesOf(const Node& self) {
  std::vector<const NSXMLElement*> elements;  // from the innermost one
  for (const NSXMLNode* node = self.node.get(); node; node = node->parent()) {
    const auto* element = dyn_cast<NSXMLElement>(static_cast<const NSObject*>(node));
    if (element) elements.push_back(element);
  }
  py::dict namespaces;
  for (auto element = elements.rbegin(); element != elements.rend(); ++element) {
    for (const NSXMLNode* node = (*element)->firstNamespace(); node;
         node = NSXMLElement::nextNamespace(node)) {
      const NSStringView prefix = node->nameView();
      const py::object key = prefix.isEmpty() ? py::none() : toStr(prefix);
      if (node->textView().isEmpty()) {
        namespaces.attr("pop")(key, py::none());
      } else {
        namespaces[key] = toStr(node->textView());
      }
    }
  }
  return namespaces;
}

// --- walking -------------------------------------------------------------------------------------

py::list childrenOf(const Node& self) {
  py::list children;
  for (const NSXMLNode* child = self.node->firstChild(); child; child = child->nextSibling()) {
    children.append(nodeToPython(child));
  }
  return children;
}

// Keeps the tree; the nodes are found one by one.
struct Walk {
  Ref<NSXMLNode> top;
  const NSXMLNode* next;
  bool isDeep;  // all below the top in place of its children
};

const NSXMLNode* following(const Walk& walk) {
  if (!walk.isDeep) return walk.next->nextSibling();
  if (const NSXMLNode* child = walk.next->firstChild()) return child;
  for (const NSXMLNode* node = walk.next; node && node != walk.top.get(); node = node->parent()) {
    if (const NSXMLNode* sibling = node->nextSibling()) return sibling;
  }
  return nullptr;
}

py::object nextOf(Walk& walk) {
  if (!walk.next) throw py::stop_iteration();
  const NSXMLNode* found = walk.next;
  walk.next = following(walk);
  return nodeToPython(found);
}

py::object childAt(const Node& self, const py::object& index) {
  const auto count = static_cast<Py_ssize_t>(self.node->childCount());
  const Py_ssize_t place = placeAmong(count, index, "a child is asked for by an int");
  if (place < 0) throw py::index_error("no such child");
  return nodeToPython(self.node->childAtIndex(static_cast<uint32_t>(place)));
}

// --- output --------------------------------------------------------------------------------------

py::object XMLOf(const Node& self, bool indent) {
  std::string text;
  {
    const Unlocked released;
    if (indent) {
      XQueryWriteIndentedXML(*self.node, [&](std::string_view piece) {
        text += piece;
        return true;
      });
    } else {
      self.node->appendXMLTo(text);
    }
  }
  return toStr(text);
}

// The beginning of a text, on one line.
py::object beginningOf(const py::object& text) {
  constexpr Py_ssize_t most = 40;
  const py::object words = py::str(" ").attr("join")(text.attr("split")());
  if (PyUnicode_GetLength(words.ptr()) <= most) return words;
  PyObject* cut = PyUnicode_Substring(words.ptr(), 0, most);
  if (!cut) throw py::error_already_set();
  return py::reinterpret_steal<py::object>(cut) + toStr(std::string_view("\u2026"));
}

py::object representation(const Node& self) {
  const py::str shape("<xquery.Node {}{}{}>");
  const py::object name = toStrOrNone(self.node->name());
  const py::object shownName = name.is_none() ? py::str("") : py::str(" ") + name;
  py::object content;
  if (self.node->kind() == Kind::Document) {
    content = URIOf(self);
  } else {
    content = beginningOf(textOf(self));
  }
  const bool isShown = !content.is_none() && py::len(content) > 0;
  return shape.attr("format")(
      kindOf(self), shownName,
      isShown ? py::object(py::str(" ") + py::repr(content)) : py::object(py::str("")));
}

// --- comparison ----------------------------------------------------------------------------------

// Nodes of different trees are in an order that stays as long as both trees live.
int compare(const Node& a, const Node& b) {
  if (a.node.get() == b.node.get()) return 0;
  const NSXMLNode* rootOfA = a.node->rootNode();
  const NSXMLNode* rootOfB = b.node->rootNode();
  if (rootOfA == rootOfB) return NSXMLNode::compareOrder(a.node.get(), b.node.get());
  return std::less<>()(rootOfA, rootOfB) ? -1 : 1;
}

template <class Test>
auto comparing(Test test) {
  return [test](const Node& self, const py::object& other) -> py::object {
    if (!py::isinstance<Node>(other)) {
      return py::reinterpret_borrow<py::object>(Py_NotImplemented);
    }
    return py::bool_(test(compare(self, other.cast<const Node&>())));
  };
}

// Copies of what does not change are the same object.
py::object itself(const py::object& self, const py::args&) {
  return self;
}

[[noreturn]] py::object refusePickling(const Node&, py::args) {
  throw py::type_error("a node cannot be pickled: send its xml(), and parse that");
}

void addProperties(py::class_<Node>& node) {
  node.def_property_readonly("kind", kindOf,
                             "One of \"document\", \"element\", \"attribute\", \"text\", "
                             "\"comment\", \"processing-instruction\" and \"namespace\".");
  node.def_property_readonly(
      "name", [](const Node& self) { return toStrOrNone(self.node->name()); },
      "As it is written, prefix included; None for a node without a name.");
  node.def_property_readonly(
      "local_name",
      [](const Node& self) {
        return self.node->hasName() ? toStr(self.node->localNameView())
                                    : toStrOrNone(self.node->name());
      },
      "Without the prefix.");
  node.def_property_readonly("prefix", prefixOf, "None for none.");
  node.def_property_readonly("namespace", namespaceOf,
                             "The URI of the namespace of the name; None for none.");
  node.def_property_readonly("text", textOf,
                             "The string value: the own text, or all the text below.");
  node.def_property_readonly(
      "attributes", attributesOf,
      "The attributes of an element by name, as it is written; a new dict each time.");
  node.def_property_readonly("namespaces", namespacesOf,
                             "The namespaces in scope by prefix; None is that of the default one.");
  node.def_property_readonly("children", childrenOf, "A new list.");
  node.def_property_readonly("uri", URIOf,
                             "Where the document was read from, as far as that is known.");
  node.def_property_readonly(
      "path", [](const Node& self) { return toStrOrNone(self.node->XPath()); },
      "The path that leads from the root to this node alone.");
  node.def_property_readonly(
      "parent", [](const Node& self) { return nodeOrNone(self.node->parent()); },
      "None for a root.");
  node.def_property_readonly(
      "root", [](const Node& self) { return nodeToPython(self.node->rootNode()); },
      "The topmost node.");
  node.def_property_readonly(
      "document", [](const Node& self) { return nodeOrNone(self.node->rootDocument()); },
      "The document that the node is in; None for a tree without one.");
  node.def_property_readonly(
      "next", [](const Node& self) { return nodeOrNone(self.node->nextSibling()); },
      "The sibling after this one, or None.");
  node.def_property_readonly(
      "previous", [](const Node& self) { return nodeOrNone(self.node->previousSibling()); },
      "The sibling before this one, or None.");
}

void addComparison(py::class_<Node>& node) {
  node.def("__eq__", comparing([](int order) { return order == 0; }));
  node.def("__ne__", comparing([](int order) { return order != 0; }));
  node.def("__lt__", comparing([](int order) { return order < 0; }));
  node.def("__le__", comparing([](int order) { return order <= 0; }));
  node.def("__gt__", comparing([](int order) { return order > 0; }));
  node.def("__ge__", comparing([](int order) { return order >= 0; }));
  // Nodes lie at multiples of 8.
  node.def("__hash__", [](const Node& self) {
    return static_cast<Py_hash_t>(reinterpret_cast<uintptr_t>(self.node.get()) >> 3);
  });
}

}  // namespace

py::object nodeToPython(const NSXMLNode* node) {
  return py::cast(Node{Ref<NSXMLNode>(const_cast<NSXMLNode*>(node))});
}

py::object nodeOrNone(const NSXMLNode* node) {
  return node ? nodeToPython(node) : py::none();
}

constexpr const char* documentation = R"doc(A node of a document, or one that a query has made.

Trees are not changed from Python, and any number of threads may read one. A node keeps its tree.
What the module copy makes of a node is the node itself; copy() makes a tree of its own.
Nodes are equal when they are the same one, and are ordered as in the document. Iterating gives the
children; len() counts them, and a node is true whether it has some or not.

>>> import xquery
>>> books = xquery.parse("examples/books.xml")
>>> book = books.find("//book[1]")
>>> book.kind, book.name, book.get("isbn"), book.find("price").text
('element', 'book', '0-306-40615-2', '24.50')
>>> [child.name for child in book if child.kind == "element"]
['title', 'author', 'author', 'year', 'price']
>>> book.find_all("author/string()")
<xquery.Result ['Ada Moss', 'Peter Stone']>
>>> book.parent < book and book == books.find("/*/book[1]")
True
>>> book.find("year").xml()
'<year>1998</year>'
)doc";

void addNodes(py::module_& module) {
  py::class_<Walk>(module, "_Walk")
      .def("__iter__", [](py::object self) { return self; })
      .def("__next__", nextOf);
  py::class_<Node> node(module, "Node", py::is_final(), documentation);
  addProperties(node);
  addComparison(node);
  node.def("get", attributeNamed, py::arg("name"), py::arg("default") = py::none(),
           "The value of an attribute by its name as written.");
  node.def("xml", XMLOf, py::kw_only(), py::arg("indent") = false,
           "As XML, with the namespaces that it needs; indented for people to read.");
  node.def("find", findFirst, py::arg("path"),
           "The first item of what a path, or any other query, answers for the node, or "
           "None.\n\nNothing is loaded for it.");
  node.def("find_all", findAll, py::arg("path"), "All the items, as a Result.");
  node.def(
      "walk",
      [](const Node& self) {
        return Walk{self.node, self.node.get(), true};
      },
      "The node and all that are below it, attributes apart, in document order.");
  node.def(
      "copy",
      [](const Node& self) {
        const Ref<NSXMLNode> copy = self.node->copy();
        return nodeToPython(copy.get());
      },
      "A tree of its own, without a parent.");
  node.def("__iter__", [](const Node& self) {
    return Walk{self.node, self.node->firstChild(), false};
  });
  node.def("__len__", [](const Node& self) { return self.node->childCount(); });
  node.def("__bool__", [](const Node&) { return true; });
  node.def("__getitem__", childAt);
  node.def("__str__", textOf);
  node.def("__repr__", representation);
  node.def("__copy__", itself);
  node.def("__deepcopy__", itself);
  node.def("__reduce_ex__", refusePickling);
}

}  // namespace xquery::python
