#include "Nodes.h"
#include "Results.h"
#include "Values.h"

#include <vector>

namespace xquery::python {
namespace {

[[noreturn]] void refuse(py::handle object) {
  throw py::type_error("a value of type " + std::string(Py_TYPE(object.ptr())->tp_name) +
                       " has no counterpart in a query");
}

// The digits of a Decimal, without an exponent.
std::string digitsOf(py::handle decimal) {
  return fromStr(steal(PyObject_Format(decimal.ptr(), py::str("f").ptr())));
}

// The library takes no more digits, before and after the point taken together. What certainly has
// more is refused before they are written: an exponent of nine digits asks for as many zeros.
constexpr int64_t mostDigits = 250'000;

Value integerFromPython(py::handle object) {
  int overflow = 0;
  const long long value = PyLong_AsLongLongAndOverflow(object.ptr(), &overflow);
  if (overflow == 0) {
    if (value == -1 && PyErr_Occurred()) throw py::error_already_set();
    return XQueryMakeInteger(value);
  }
  constexpr int64_t bitsOfDigit = 4;  // at most
  if (object.attr("bit_length")().cast<int64_t>() > mostDigits * bitsOfDigit) {
    throw py::value_error("an int of so many digits is out of the range of xs:integer");
  }
  return valueOrRaise(
      XQueryMakeFromText(XQueryItemType::Integer, digitsOf(known().decimal(object))));
}

Value decimalFromPython(py::handle object) {
  if (!object.attr("is_finite")().cast<bool>()) {
    throw py::value_error("xs:decimal has no " + fromStr(py::str(object)));
  }
  if (!object.attr("__bool__")().cast<bool>()) return valueOrRaise(XQueryMakeDecimal("0"));
  const auto exponent = object.attr("adjusted")().cast<int64_t>();
  if (exponent >= mostDigits || exponent < -mostDigits) {
    throw py::value_error("a Decimal of the exponent " + std::to_string(exponent) +
                          " is out of the range of xs:decimal");
  }
  return valueOrRaise(XQueryMakeDecimal(digitsOf(object)));
}

// An object of one of the package's own classes, which says what type it has and is written, as
// text, in the form of that type.
Value ownFromPython(py::handle object, py::handle typeName) {
  const auto type = XQueryTypeNamed(fromStr(typeName));
  if (!type) refuse(object);
  return valueOrRaise(XQueryMakeFromText(*type, fromStr(py::str(object))));
}

// Null for an object of any other class.
py::object typeNameOf(py::handle object) {
  static PyObject* name = PyUnicode_InternFromString("_type_name");
  PyObject* found = PyObject_GetAttr(reinterpret_cast<PyObject*>(Py_TYPE(object.ptr())), name);
  if (!found) PyErr_Clear();
  return py::reinterpret_steal<py::object>(found);
}

Value textFromPython(py::handle object) {
  if (!PyUnicode_CheckExact(object.ptr())) {
    if (const py::object type = typeNameOf(object)) return ownFromPython(object, type);
  }
  return valueOrRaise(XQueryMakeString(fromStr(object)));
}

Value bytesFromPython(py::handle object) {
  const py::bytes bytes = steal(PyBytes_FromObject(object.ptr()));
  const auto view = static_cast<std::string_view>(bytes);
  return py::isinstance(object, known().hexBinary) ? XQueryMakeHexBinary(view)
                                                   : XQueryMakeBase64Binary(view);
}

Value nameFromPython(py::handle object) {
  const auto text = [&](const char* attribute) {
    const py::object value = object.attr(attribute);
    return value.is_none() ? std::string() : fromStr(value);
  };
  return valueOrRaise(XQueryMakeQName({text("namespace"), text("local_name"), text("prefix")}));
}

Value sequenceFromPython(py::handle object) {
  if (Py_EnterRecursiveCall(" while making a sequence of values")) throw py::error_already_set();
  struct Leaving {
    ~Leaving() { Py_LeaveRecursiveCall(); }
  } leaving;
  std::vector<Value> values;
  for (const py::handle item : py::iter(object)) values.push_back(fromPython(item));
  return valueOrRaise(XQueryMakeSequence(values));
}

bool hasSlot(py::handle object, const char* name) {
  return PyObject_HasAttrString(reinterpret_cast<PyObject*>(Py_TYPE(object.ptr())), name) != 0;
}

// Such as the numbers of NumPy, sets and generators.
Value foreignFromPython(py::handle object) {
  if (PyIndex_Check(object.ptr())) return integerFromPython(steal(PyNumber_Index(object.ptr())));
  if (hasSlot(object, "__float__") && !hasSlot(object, "__iter__")) {
    return XQueryMakeDouble(steal(PyNumber_Float(object.ptr())).cast<double>());
  }
  if (!hasSlot(object, "__iter__") || py::isinstance(object, known().mapping)) refuse(object);
  return sequenceFromPython(object);
}

Value otherFromPython(py::handle object) {
  if (PyList_Check(object.ptr()) || PyTuple_CheckExact(object.ptr())) {
    return sequenceFromPython(object);
  }
  if (py::isinstance(object, known().decimal)) return decimalFromPython(object);
  if (const Value date = dateFromPython(object)) return date;
  if (py::isinstance(object, known().qName)) return nameFromPython(object);
  if (const py::object type = typeNameOf(object)) return ownFromPython(object, type);
  PyObject* plain = object.ptr();
  if (PyByteArray_Check(plain) || PyMemoryView_Check(plain)) return bytesFromPython(object);
  return foreignFromPython(object);
}

}  // namespace

Value valueOrRaise(XQueryResult<Value> result) {
  if (result) return *std::move(result);
  throw py::value_error(result.error()->msg() ? result.error()->msg()->utf8() : "no such value");
}

Value fromPython(py::handle object) {
  PyObject* plain = object.ptr();
  if (plain == Py_None) return NSNull::null();
  if (PyUnicode_Check(plain)) return textFromPython(object);
  if (PyBool_Check(plain)) return XQueryMakeBoolean(plain == Py_True);
  if (PyLong_Check(plain)) return integerFromPython(object);
  if (PyFloat_Check(plain)) return XQueryMakeDouble(PyFloat_AS_DOUBLE(plain));
  if (py::isinstance<Node>(object)) return Value(object.cast<const Node&>().node);
  if (py::isinstance<Result>(object)) return object.cast<const Result&>().value();
  if (PyBytes_Check(plain)) return bytesFromPython(object);
  return otherFromPython(object);
}

XQueryVariables variablesFrom(const py::dict& given) {
  XQueryVariables variables;
  for (const auto& [name, value] : given) {
    if (!PyUnicode_Check(name.ptr())) throw py::type_error("the name of a variable is a str");
    variables.insert_or_assign(fromStr(name), fromPython(value));
  }
  return variables;
}

}  // namespace xquery::python
