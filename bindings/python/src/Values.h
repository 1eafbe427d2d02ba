// Items of the library as objects of Python, and the other way.
#pragma once

#include "Module.h"
#include <xquery/Values.h>

namespace xquery::python {

// What an item arrives as. The table is in docs/python.md.
py::object toPython(const NSObject& item);

// A value for a variable or a context item: an item, or what gives items, in any depth. Raises
// TypeError for what is no value of the language and ValueError for what its type does not hold.
Value fromPython(py::handle object);

// The names of a dictionary without the dollar sign, and the values for them.
XQueryVariables variablesFrom(const py::dict& given);

// Dates, times and durations, with the classes of their own where Python's cannot hold the value.
py::object dateToPython(const Value& value, XQueryItemType type);
py::object durationToPython(const Value& value, XQueryItemType type);
// Null for another object than one of Python's own dates, times and durations.
Value dateFromPython(py::handle object);

// The value of a result that never fails for what it is given, or the error of it as ValueError.
Value valueOrRaise(XQueryResult<Value> result);

}  // namespace xquery::python
