// Functions of Python that the library calls: loaders, and who hears of traces and of documents
// that are missing. They may be called on threads of the library's own.
#pragma once

#include "Module.h"

#include <memory>

namespace xquery::python {

struct Settings;

// Whether the interpreter's lock may be asked for. Threads of the library live on when the
// interpreter ends, which then ends each thread that asks, by unwinding it, and C++ does not
// survive that. So nothing is asked for once the end has begun, and a thread that was in a function
// of Python at that moment stays where it is for as long as the process has left.
bool isInterpreterAlive();

// For every purpose `load`, but for library modules `modules` where it is not None; either may be
// None.
std::shared_ptr<XQueryLoader> makeLoader(const py::object& load, const py::object& modules);

// Calls the functions of the settings, which must live as long as it is used. Without a function
// traces are written to the log, and missing documents are warnings.
std::shared_ptr<XQueryClient> makeClient(const Settings& settings);

void addCallbacks(py::module_& module);

}  // namespace xquery::python
