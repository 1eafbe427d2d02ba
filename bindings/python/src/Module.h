// What the families of the extension module know of each other.
//
// The module `_xquery` holds what has to be quick or needs the library: nodes, results, values,
// compiled queries and their evaluation. The package `xquery` around it is Python.
//
// Rules that hold everywhere:
//   - the interpreter's lock is released while the library compiles, evaluates or reads, and held
//     wherever a Python object is touched
//   - objects of Python that the library calls back are kept during the call alone, or by
//     `Settings`, which the collector of cycles can look into; so no cycle hides in the library
//   - classes and functions of Python that are needed often are looked up once and never given
//     back, since the order in which things go when a process ends is nobody's to know
#pragma once

#include "Lock.h"
#include <xquery/xquery.h>

#include <pybind11/pybind11.h>
#include <string>
#include <string_view>

namespace xquery::python {

namespace py = pybind11;

void addKnown(py::module_& module);
void addNodes(py::module_& module);
void addResults(py::module_& module);
void addSettings(py::module_& module);
void addQueries(py::module_& module);
void addDocuments(py::module_& module);
void addStreams(py::module_& module);

// What is made or asked for often and is written in Python.
struct Known {
  py::handle decimal, mapping;
  py::handle place, call, error, limitError, compileError, documentError, warnOfMissing;
  py::handle URI, untyped, notation, hexBinary, qName, dateTime, date, time, duration,
      monthDuration, gYearMonth, gYear, gMonthDay, gMonth, gDay;
};
// Looked up when the package has been imported, by one thread, and never given back.
const Known& known();

// Text of the library as a str; what is no text becomes U+FFFD.
py::object toStr(NSStringView text);
py::object toStr(std::string_view utf8);
// The same, None for no text.
py::object toStrOrNone(const Ref<NSString>& text);
// Raises ValueError for a str with a surrogate of its own.
std::string fromStr(const py::handle& text);

// The text of an argument; raises TypeError for what is no str, by what it should be.
std::string fromArgument(const py::object& text, const char* what);

// Which of so many an index means, one below 0 counting from the end; -1 for none of them. Raises
// TypeError for what is no index, which begins with that text.
Py_ssize_t placeAmong(Py_ssize_t count, const py::object& index, const char* expected);

// What a function of Python's C interface answers: a reference of the caller's own, or null where
// it has failed, which is raised.
py::object steal(PyObject* object);

// --- collection of cycles ------------------------------------------------------------------------

// What an object of one of the module's classes holds; null for one that is not made yet.
template <class T>
T* madeObject(PyObject* self) {
  const auto holder = reinterpret_cast<py::detail::instance*>(self)->get_value_and_holder();
  return holder.holder_constructed() ? static_cast<T*>(holder.value_ptr()) : nullptr;
}

// For the set-up of a class whose objects keep objects of Python.
inline void takePartInCollection(PyHeapTypeObject* type, traverseproc traverse, inquiry clear) {
  type->ht_type.tp_flags |= Py_TPFLAGS_HAVE_GC;
  type->ht_type.tp_traverse = traverse;
  type->ht_type.tp_clear = clear;
}

}  // namespace xquery::python
