#include "Errors.h"

#include <array>

namespace xquery::python {
namespace {

// In the order of XQueryErrorCategory.
constexpr std::array categories{
    "syntax", "names", "types", "values", "loading", "limit", "raised by the query", "internal"};

py::object toPython(const std::optional<XQuerySourcePlace>& place) {
  if (!place) return py::none();
  return known().place(toStrOrNone(place->moduleURL), place->line, place->column, place->length,
                       toStr(place->sourceLine ? place->sourceLine->view() : NSStringView()));
}

py::object toPython(const std::vector<XQueryErrorCall>& calls) {
  py::tuple result(calls.size());
  for (size_t index = 0; index < calls.size(); ++index) {
    result[index] = known().call(toStrOrNone(calls[index].function), toPython(calls[index].place));
  }
  return result;
}

// The line and the column that are known of an error without a place of its own.
py::object placeOf(const XQueryError& error) {
  if (const auto place = error.place()) return toPython(place);
  if (error.line() <= 0) return py::none();
  XQuerySourcePlace place{error.moduleURL(), error.line(), error.column(), 0, error.sourceLine()};
  return toPython(std::optional(place));
}

// The arguments of the classes of errors, by their names.
py::dict describe(const NSError& error) {
  py::dict fields;
  fields["number"] = error.code();
  fields["description"] = toStr(error.description()->view());
  const auto* own = dyn_cast<XQueryError>(static_cast<const NSObject*>(&error));
  if (!own) {
    const auto* information = error.userInfo();
    fields["message"] =
        toStrOrNone(information ? information->errorMessage : Ref<NSString>(nullptr));
    fields["category"] = "internal";
    return fields;
  }
  fields["message"] = own->msg() ? toStr(own->msg()->view()) : py::str("");
  fields["category"] = categories.at(static_cast<size_t>(own->category()));
  fields["place"] = placeOf(*own);
  fields["calls"] = toPython(own->calls());
  fields["calls_left_out"] = own->callsLeftOut();
  return fields;
}

py::object make(const NSError& error) {
  const auto* own = dyn_cast<XQueryError>(static_cast<const NSObject*>(&error));
  const bool isLimit = own && own->category() == XQueryErrorCategory::Limit;
  return (isLimit ? known().limitError : known().error)(**describe(error));
}

[[noreturn]] void raise(const py::object& error) {
  PyErr_SetObject(reinterpret_cast<PyObject*>(Py_TYPE(error.ptr())), error.ptr());
  throw py::error_already_set();
}

}  // namespace

void raise(const NSError& error) {
  raise(make(error));
}

void raiseCompileError(const NSArray& errors) {
  const auto* first = cast<NSError>(errors.objectAtIndex(0));
  const auto* own = dyn_cast<XQueryError>(errors.objectAtIndex(0));
  if (own && own->category() == XQueryErrorCategory::Limit) raise(*first);
  py::list all;
  for (const Value& error : errors.objects()) all.append(make(*cast<NSError>(error)));
  py::dict fields = describe(*first);
  fields["errors"] = all;
  raise(known().compileError(**fields));
}

void raise(const NSXMLParseError& error, const std::string& name) {
  raise(known().documentError(toStr(error.message), toStr(name), error.line, error.column));
}

}  // namespace xquery::python
