#include "Nodes.h"
#include "Values.h"

namespace xquery::python {
namespace {

py::object decimalToPython(const std::string& digits) {
  return known().decimal(toStr(digits));
}

// The limit that Python sets to the digits of an int in a text does not hold for a Decimal.
py::object integerToPython(const Value& value) {
  const NSNumber& number = *cast<NSNumber>(value);
  if (number.storage() == NSNumber::Storage::Int64) return py::int_(number.longLongValue());
  if (number.storage() == NSNumber::Storage::UInt64)
    return py::int_(number.unsignedLongLongValue());
  if (const auto small = XQueryReadInteger(value)) return py::int_(*small);
  const auto digits = XQueryReadDecimal(value);
  const py::object decimal = decimalToPython(digits ? *digits : XQueryItemStringValue(*value));
  return steal(PyNumber_Long(decimal.ptr()));
}

py::object numberToPython(const Value& value, XQueryItemType type) {
  const NSNumber& number = *cast<NSNumber>(value);
  if (number.isBoolean()) return py::bool_(number.boolValue());
  if (XQueryIsIntegerType(type)) return integerToPython(value);
  if (type == XQueryItemType::Decimal) return decimalToPython(number.stringValue());
  return py::float_(number.doubleValue());
}

py::object bytesToPython(std::string_view bytes) {
  return py::bytes(bytes.data(), bytes.size());
}

py::object binaryToPython(const Value& value, XQueryItemType type) {
  const auto bytes = XQueryReadBinary(value);
  if (!bytes) return bytesToPython(XQueryItemStringValue(*value));
  const py::object plain = bytesToPython(*bytes);
  return type == XQueryItemType::HexBinary ? known().hexBinary(plain) : plain;
}

py::object nameToPython(const Value& value) {
  const auto name = XQueryReadQName(value);
  if (!name) return toStr(XQueryItemStringValue(*value));
  return known().qName(toStr(name->localName),
                       name->namespaceURI.empty() ? py::none() : toStr(name->namespaceURI),
                       name->prefix.empty() ? py::none() : toStr(name->prefix));
}

py::object otherToPython(const Value& value, XQueryItemType type) {
  switch (type) {
    case XQueryItemType::AnyURI:
      return known().URI(toStr(XQueryItemStringValue(*value)));
    case XQueryItemType::QName:
      return nameToPython(value);
    case XQueryItemType::Notation:
      return known().notation(toStr(XQueryItemStringValue(*value)));
    case XQueryItemType::HexBinary:
    case XQueryItemType::Base64Binary:
      return binaryToPython(value, type);
    case XQueryItemType::Duration:
    case XQueryItemType::YearMonthDuration:
    case XQueryItemType::DayTimeDuration:
      return durationToPython(value, type);
    default:
      return XQueryIsDateType(type) ? dateToPython(value, type)
                                    : toStr(XQueryItemStringValue(*value));
  }
}

}  // namespace

py::object toPython(const NSObject& item) {
  if (item.isNode()) return nodeToPython(cast<NSXMLNode>(&item));
  if (const auto* text = dyn_cast<NSString>(&item)) return toStr(text->view());
  if (const auto* data = dyn_cast<NSData>(&item)) return bytesToPython(data->bytes());
  const Value value(const_cast<NSObject*>(&item));
  const XQueryItemType type = XQueryTypeOfItem(item);
  // The two ordered durations are numbers to the library.
  const bool isDuration =
      type == XQueryItemType::YearMonthDuration || type == XQueryItemType::DayTimeDuration;
  return isa<NSNumber>(&item) && !isDuration ? numberToPython(value, type)
                                             : otherToPython(value, type);
}
}  // namespace xquery::python
