// Functions of Python that the library calls: loaders, and who hears of traces and of documents
// that are missing. They may be called on threads of the library's own.
#pragma once

#include "Module.h"

#include <memory>

namespace xquery::python {

struct Settings;

// Whether threads of the library may ask for the interpreter's lock: not once its end has begun.
bool isInterpreterAlive();

// For every purpose the loader of the settings, but for library modules `modules` where it is not
// None; either may be None.
std::shared_ptr<XQueryLoader> makeLoader(std::shared_ptr<const Settings> settings);

// Calls the functions of the settings, which must live as long as it is used. Without a function
// traces are written to the log, and missing documents are warnings.
std::shared_ptr<XQueryClient> makeClient(const Settings& settings);

void addCallbacks(py::module_& module);

}  // namespace xquery::python
