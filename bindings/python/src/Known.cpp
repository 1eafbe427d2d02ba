#include "Module.h"

namespace xquery::python {
namespace {

Known all;

struct Entry {
  py::handle Known::*place;
  const char* module;
  const char* name;
};

constexpr const char* errors = "xquery._errors";
constexpr const char* values = "xquery._values";

constexpr Entry entries[] = {
    {&Known::decimal, "decimal", "Decimal"},
    {&Known::mapping, "collections.abc", "Mapping"},
    {&Known::place, errors, "Place"},
    {&Known::call, errors, "Call"},
    {&Known::error, errors, "Error"},
    {&Known::limitError, errors, "LimitError"},
    {&Known::compileError, errors, "CompileError"},
    {&Known::documentError, errors, "DocumentError"},
    {&Known::warnOfMissing, errors, "_warn_of_missing"},
    {&Known::URI, values, "URI"},
    {&Known::untyped, values, "Untyped"},
    {&Known::notation, values, "Notation"},
    {&Known::hexBinary, values, "HexBinary"},
    {&Known::qName, values, "QName"},
    {&Known::dateTime, values, "DateTime"},
    {&Known::date, values, "Date"},
    {&Known::time, values, "Time"},
    {&Known::duration, values, "Duration"},
    {&Known::monthDuration, values, "MonthDuration"},
    {&Known::gYearMonth, values, "GYearMonth"},
    {&Known::gYear, values, "GYear"},
    {&Known::gMonthDay, values, "GMonthDay"},
    {&Known::gMonth, values, "GMonth"},
    {&Known::gDay, values, "GDay"},
};

}  // namespace

const Known& known() {
  return all;
}

void addKnown(py::module_& module) {
  module.def("_prepare", [] {
    for (const Entry& entry : entries) {
      const py::object found = py::module_::import(entry.module).attr(entry.name);
      if (!(all.*entry.place)) all.*entry.place = found.inc_ref();
    }
  });
}

}  // namespace xquery::python
