#include "Results.h"

#include "Values.h"

#include <vector>

namespace xquery::python {
namespace {

struct ResultIterator {
  Result result;
  size_t next = 0;
};

py::list pieceOf(const Result& result, size_t from, size_t most) {
  const size_t end = std::min(result.count, from + most);
  py::list piece(end - from);
  for (size_t index = from; index < end; ++index) {
    PyList_SET_ITEM(piece.ptr(), static_cast<Py_ssize_t>(index - from),
                    toPython(*result.item(index)).release().ptr());
  }
  return piece;
}

py::object nextOf(ResultIterator& iterator) {
  if (iterator.next >= iterator.result.count) throw py::stop_iteration();
  return toPython(*iterator.result.item(iterator.next++));
}

py::object itemAt(const Result& self, const py::object& index) {
  const Py_ssize_t place = placeAmong(static_cast<Py_ssize_t>(self.count), index,
                                      "an item is asked for by an int or a slice");
  if (place < 0) throw py::index_error("the result has " + std::to_string(self.count) + " items");
  return toPython(*self.item(static_cast<size_t>(place)));
}

Result sliceOf(const Result& self, const py::slice& slice) {
  Py_ssize_t start = 0, stop = 0, step = 0;
  if (PySlice_Unpack(slice.ptr(), &start, &stop, &step) < 0) throw py::error_already_set();
  const Py_ssize_t count =
      PySlice_AdjustIndices(static_cast<Py_ssize_t>(self.count), &start, &stop, step);
  const ptrdiff_t first = static_cast<ptrdiff_t>(self.first) + start * self.step;
  return {self.items, count > 0 ? static_cast<size_t>(first) : 0, static_cast<size_t>(count),
          self.step * step};
}

py::object firstOf(const Result& self, const py::object& otherwise) {
  return self.count == 0 ? otherwise : toPython(*self.item(0));
}

py::object oneOf(const Result& self) {
  if (self.count == 1) return toPython(*self.item(0));
  throw py::value_error("the result has " + std::to_string(self.count) + " items, not one");
}

py::list typesOf(const Result& self) {
  py::list types;
  for (size_t index = 0; index < self.count; ++index) {
    types.append(toStr(XQueryItemTypeName(*self.item(index))));
  }
  return types;
}

py::list stringsOf(const Result& self) {
  py::list strings(self.count);
  for (size_t index = 0; index < self.count; ++index) {
    const NSObject& item = *self.item(index);
    const auto* text = dyn_cast<NSString>(&item);
    const py::object string = text            ? toStr(text->view())
                              : item.isNode() ? toStr(cast<NSXMLNode>(&item)->stringValue()->view())
                                              : toStr(XQueryItemStringValue(item));
    strings[index] = string;
  }
  return strings;
}

size_t countOf(const Result& self, const py::object& value) {
  size_t count = 0;
  for (size_t index = 0; index < self.count; ++index) {
    if (toPython(*self.item(index)).equal(value)) ++count;
  }
  return count;
}

size_t indexOf(const Result& self, const py::object& value, const py::object& start,
               const py::object& stop) {
  const py::object range = steal(PySlice_New(start.ptr(), stop.ptr(), nullptr));
  Py_ssize_t from = 0, end = 0, step = 0;
  if (PySlice_Unpack(range.ptr(), &from, &end, &step) < 0) throw py::error_already_set();
  PySlice_AdjustIndices(static_cast<Py_ssize_t>(self.count), &from, &end, step);
  for (Py_ssize_t index = from; index < end; ++index) {
    if (toPython(*self.item(static_cast<size_t>(index))).equal(value)) {
      return static_cast<size_t>(index);
    }
  }
  throw py::value_error("no such item");
}

// Results do not change.
py::object itself(const py::object& self, const py::args&) {
  return self;
}

[[noreturn]] py::object refusePickling(const Result&, const py::args&) {
  throw py::type_error("a result cannot be pickled: send to_list(), and the xml() of nodes");
}

// Equal to another result, a list or a tuple of equal items.
py::object isEqual(const Result& self, const py::object& other) {
  const bool isSequence =
      py::isinstance<Result>(other) || PyList_Check(other.ptr()) || PyTuple_Check(other.ptr());
  if (!isSequence) return py::reinterpret_borrow<py::object>(Py_NotImplemented);
  if (py::len(other) != self.count) return py::bool_(false);
  size_t index = 0;
  for (const py::handle item : py::iter(other)) {
    if (index >= self.count || !toPython(*self.item(index)).equal(item)) return py::bool_(false);
    ++index;
  }
  return py::bool_(index == self.count);
}

py::object representation(const Result& self) {
  constexpr size_t most = 5;
  std::string shown = fromStr(py::repr(pieceOf(self, 0, most)));
  if (self.count > most) {
    shown.pop_back();
    shown += ", ... " + std::to_string(self.count) + " items]";
  }
  return toStr("<xquery.Result " + shown + ">");
}

}  // namespace

Value Result::value() const {
  if (first == 0 && step == 1 && items && count == items->count()) return Value(items);
  std::vector<Value> some;
  some.reserve(count);
  for (size_t index = 0; index < count; ++index) some.emplace_back(item(index));
  return NSArray::arrayWithObjects(std::move(some));
}

constexpr const char* documentation = R"doc(The items of a result, as an immutable sequence.

An item becomes an object of Python when it is asked for; docs/python.md has the types. Slices are
results as well.

>>> import xquery
>>> items = xquery.query("1 to 10")
>>> len(items), items[0], items[-1], items[2:4]
(10, 1, 10, <xquery.Result [3, 4]>)
>>> sum(items)
55
>>> items == list(range(1, 11))
True
)doc";

void addResults(py::module_& module) {
  py::class_<ResultIterator>(module, "_ResultIterator")
      .def("__iter__", [](py::object self) { return self; })
      .def("__next__", nextOf)
      .def("__length_hint__",
           [](const ResultIterator& self) { return self.result.count - self.next; });
  py::class_<Result> result(module, "Result", py::is_final(), documentation);
  result.def("__len__", [](const Result& self) { return self.count; });
  result.def("__getitem__", sliceOf);
  result.def("__getitem__", itemAt);
  result.def("__iter__", [](const Result& self) { return ResultIterator{self}; });
  result.def("__eq__", isEqual);
  result.attr("__hash__") = py::none();
  result.def("__repr__", representation);
  result.def("__copy__", itself);
  result.def("__deepcopy__", itself);
  result.def("__reduce_ex__", refusePickling);
  result.def("index", indexOf, py::arg("value"), py::arg("start") = 0, py::arg("stop") = py::none(),
             "The place of the first item that equals the value; ValueError for none.");
  result.def("count", countOf, py::arg("value"), "How many items equal the value.");
  result.def("first", firstOf, py::arg("default") = py::none(),
             "The first item, or the value given where there is none.");
  result.def("one", oneOf, "The only item; ValueError where there is another number of them.");
  result.def(
      "to_list", [](const Result& self) { return pieceOf(self, 0, self.count); }, "All items.");
  result.def("strings", stringsOf, "The string values of all items.");
  result.def_property_readonly("types", typesOf, "The types of all items, as a query writes them.");
}

}  // namespace xquery::python
