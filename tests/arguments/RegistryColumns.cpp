#include "arguments/RegistryColumns.h"

#include "Functions/XQueryBuiltInFunction.h"
#include "Types/XQueryItemKinds.h"
#include "xquery/Collection.h"

#include <map>

namespace xquery::arguments {
namespace {

using Row = XQueryBuiltInFunction::Registration;

const Row& rowOf(const std::string& function) {
  static const std::map<std::string, const Row*> rows = [] {
    std::map<std::string, const Row*> found;
    for (const Row& row : XQueryBuiltInFunction::registrations()) {
      const char* prefix = row.namespaceID == XQueryNamespaceFN    ? "fn:"
                           : row.namespaceID == XQueryNamespaceXS  ? "xs:"
                           : row.namespaceID == XQueryNamespaceXDT ? "xdt:"
                                                                   : "ext:";
      found[prefix + std::string(row.localName)] = &row;
    }
    return found;
  }();
  return *rows.at(function);
}

XQueryItemKinds kindsOf(const Sequence& items, const Value& value) {
  XQueryItemKinds kinds = XQueryItems::None;
  const auto* array = dyn_cast<NSArray>(value);
  for (size_t i = 0; i < items.size(); ++i) {
    kinds |= XQueryKindsOfItem(array ? *array->objectAtIndex(i) : *value);
  }
  return kinds;
}

XQueryItemKinds kindsOfAnswer(const Row& row, const Call& call) {
  XQueryItemKinds kinds = row.answer.kinds & XQueryItems::Any;
  for (size_t i = 0; i < call.count(); ++i) {
    const XQueryItemKinds own = kindsOf(call[i], call.arguments[i]->value);
    if (i == 0 && (row.answer.kinds & XQueryBuiltInFunction::OfFirst)) kinds |= own;
    if (row.answer.kinds & XQueryBuiltInFunction::OfAll) kinds |= own;
    if (i == 0 && (row.answer.kinds & XQueryBuiltInFunction::AtomizedFirst)) {
      kinds |= XQueryAtomizedKinds(own);
    }
  }
  return kinds;
}

}  // namespace

bool rowTakesAsRule(const Function& function) {
  const Row& row = rowOf(function.name);
  for (size_t count = 0; count <= 5; ++count) {
    if (row.takes(count) != (count >= function.least && count <= function.most)) return false;
  }
  return true;
}

std::string contradictionInRow(const std::string& function, const Call& call,
                               const NSArray* answer) {
  const Row& row = rowOf(function);
  const bool mayFail = !row.has(XQueryBuiltInFunction::NeverFails) || !row.takes(call.count());
  if (!answer) return mayFail ? "" : "it fails";
  if (!row.takes(call.count())) return "it takes so many arguments";
  const size_t count = answer->count();
  if (count < row.answer.least || (row.answer.most < 2 && count > row.answer.most)) {
    return "it answers " + std::to_string(count) + " items";
  }
  if (row.has(XQueryBuiltInFunction::KeepsCount) && count != call[0].size()) {
    return "it answers another number of items";
  }
  const XQueryItemKinds kinds = kindsOfAnswer(row, call);
  for (const Value& item : answer->objects()) {
    if ((XQueryKindsOfItem(*item) & kinds) == 0) return "it answers " + show(*item);
  }
  return "";
}

}  // namespace xquery::arguments
