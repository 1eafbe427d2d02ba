#include "Module.h"

#include "Callbacks.h"

PYBIND11_MODULE(_xquery, module) {
  using namespace xquery::python;
  // The stubs have the signatures.
  pybind11::options options;
  options.disable_function_signatures();
  module.doc() = "The part of the package xquery that is in C++. Use the package.";
  addKnown(module);
  addNodes(module);
  addResults(module);
  addSettings(module);
  addQueries(module);
  addDocuments(module);
  addStreams(module);
  addCallbacks(module);
}
