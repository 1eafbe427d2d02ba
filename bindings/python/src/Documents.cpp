// Documents from files and from bytes.
#include "Errors.h"
#include "Nodes.h"
#include "Queries.h"
#include <xquery/Projection.h>

namespace xquery::python {
namespace {

uint32_t optionsOf(bool isHTML, bool stripsSpace) {
  uint32_t options = stripsSpace ? NSXMLNodeOptionsNone : NSXMLNodePreserveWhitespace;
  if (isHTML) options |= NSXMLDocumentTidyHTML;
  return options;
}

py::object documentOrRaise(const Ref<NSXMLDocument>& document, const NSXMLParseError& error,
                           const std::string& name) {
  if (PyErr_CheckSignals() != 0) throw py::error_already_set();
  if (!document) raise(error, name);
  return nodeToPython(document.get());
}

std::string pathFrom(const py::bytes& path) {
  return static_cast<std::string>(path);
}

// `query` may be null: then the document is read whole.
py::object parseFile(const py::bytes& path, bool isHTML, bool stripsSpace, const Compiled* query) {
  const std::string name = pathFrom(path);
  const uint32_t options = optionsOf(isHTML, stripsSpace);
  NSXMLParseError error;
  Ref<NSXMLDocument> document;
  {
    const Unlocked released;
    document = query ? XQueryProjectedDocumentWithFile(*query->query, name, options, &error)
                     : NSXMLDocument::documentWithFile(name, options, &error);
  }
  return documentOrRaise(document, error, name);
}

py::object parseBytes(const py::buffer& buffer, const std::string& name, bool isHTML,
                      bool stripsSpace, const Compiled* query) {
  const py::buffer_info information = buffer.request();
  const std::string_view bytes(static_cast<const char*>(information.ptr),
                               static_cast<size_t>(information.size * information.itemsize));
  const uint32_t options = optionsOf(isHTML, stripsSpace);
  NSXMLParseError error;
  Ref<NSXMLDocument> document;
  {
    const Unlocked released;
    document = query ? XQueryProjectedDocumentWithData(*query->query, bytes, options, &error)
                     : NSXMLDocument::documentWithData(bytes, options, &error);
  }
  return documentOrRaise(document, error, name);
}

// Of a document that nobody else has seen.
void setURI(const Node& document, const py::str& URI) {
  if (auto* own = dyn_cast<NSXMLDocument>(static_cast<NSObject*>(document.node.get()))) {
    own->setURI(NSString::stringWithUTF8(fromStr(URI)));
  }
}

py::object fileURL(const py::bytes& path) {
  const Ref<NSURL> URL = NSURL::fileURLWithPath(pathFrom(path));
  return URL ? toStr(URL->absoluteString()->view()) : py::none();
}

// A reference against an absolute base; None where either is none.
py::object resolve(const py::str& reference, const py::str& base) {
  const Ref<NSURL> start = NSURL::URLWithString(NSString::stringWithUTF8(fromStr(base)));
  const Ref<NSString> text = NSString::stringWithUTF8(fromStr(reference));
  const Ref<NSURL> URL = start && text ? NSURL::URLWithString(text, *start) : nullptr;
  return URL ? toStr(URL->absoluteString()->view()) : py::none();
}

}  // namespace

void addDocuments(py::module_& module) {
  module.def("parse_file", parseFile);
  module.def("parse_bytes", parseBytes);
  module.def("set_uri", setURI);
  module.def("file_url", fileURL);
  module.def("resolve", resolve);
}

}  // namespace xquery::python
