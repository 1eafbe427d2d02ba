// Errors of the library as exceptions of Python.
#pragma once

#include "Module.h"

namespace xquery::python {

// All of these leave by py::error_already_set; the interpreter's lock is held.

// xquery.Error, or xquery.LimitError for a limit.
[[noreturn]] void raise(const NSError& error);
// xquery.CompileError with all of them; there must be one.
[[noreturn]] void raiseCompileError(const NSArray& errors);
// xquery.DocumentError, of a document by that name.
[[noreturn]] void raise(const NSXMLParseError& error, const std::string& name);

}  // namespace xquery::python
