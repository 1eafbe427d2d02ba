// Texts between the library and Python, both ways.
#include "Module.h"

#include <bit>
#include <cstring>

namespace xquery::python {

py::object steal(PyObject* object) {
  if (!object) throw py::error_already_set();
  return py::reinterpret_steal<py::object>(object);
}

py::object toStr(NSStringView text) {
  PyObject* result = nullptr;
  if (text.isWide()) {
    int order = std::endian::native == std::endian::little ? -1 : 1;
    result = PyUnicode_DecodeUTF16(reinterpret_cast<const char*>(text.wideUnits()),
                                   static_cast<Py_ssize_t>(text.length()) * 2, "replace", &order);
  } else {
    result = PyUnicode_New(text.length(), 127);
    if (result && text.length() > 0) {
      std::memcpy(PyUnicode_1BYTE_DATA(result), text.asciiUnits(), text.length());
    }
  }
  return steal(result);
}

py::object toStr(std::string_view utf8) {
  return steal(PyUnicode_DecodeUTF8(utf8.data(), static_cast<Py_ssize_t>(utf8.size()), "replace"));
}

py::object toStrOrNone(const Ref<NSString>& text) {
  return text ? toStr(text->view()) : py::none();
}

std::string fromArgument(const py::object& text, const char* what) {
  if (PyUnicode_Check(text.ptr())) return fromStr(text);
  throw py::type_error(std::string(what) + " is a str, not " + Py_TYPE(text.ptr())->tp_name);
}

Py_ssize_t placeAmong(Py_ssize_t count, const py::object& index, const char* expected) {
  if (!PyIndex_Check(index.ptr())) {
    throw py::type_error(std::string(expected) + ", not by " + Py_TYPE(index.ptr())->tp_name);
  }
  const Py_ssize_t number = PyNumber_AsSsize_t(index.ptr(), nullptr);  // the nearest there is
  if (number == -1 && PyErr_Occurred()) throw py::error_already_set();
  const Py_ssize_t place = number < 0 ? number + count : number;
  return place >= 0 && place < count ? place : -1;
}

std::string fromStr(const py::handle& text) {
  Py_ssize_t size = 0;
  const char* utf8 = PyUnicode_AsUTF8AndSize(text.ptr(), &size);
  if (!utf8) throw py::error_already_set();
  return {utf8, static_cast<size_t>(size)};
}

}  // namespace xquery::python
