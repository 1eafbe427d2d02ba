#include "Expr/LiteralCopies.h"

#include "Platform/Base/Counting.h"
#include "Platform/Base/LastingObjects.h"
#include "Platform/Tree/Credit.h"
#include "Types/XQueryDate.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryString.h"

#include <memory>

namespace xquery {
namespace {

// What is done with a longer text takes so long that counting it does not show.
constexpr uint32_t longestCopy = 1024;

bool isShortText(const NSObject* object) {
  const auto* text = dyn_cast<XQueryString>(object);
  return text && text->typeID() == XQueryTypeString && text->length() <= longestCopy;
}

Ref<NSCounted> copyOf(const NSObject* object) {
  const LastingObjects lasting;
  if (const auto* number = dyn_cast<XQueryNumber>(object)) return XQueryNumber::copyOf(*number);
  if (const auto* date = dyn_cast<XQueryDate>(object)) {
    return XQueryDate::xqueryDateWithInstant(date->instant(), date->timeZone(), date->typeID());
  }
  return XQueryString::stringWithView(cast<XQueryString>(object)->view());
}

}  // namespace

// Of other kinds of objects, and of those that are never counted, there is one.
uint32_t XQueryLiteralCopies::placeOf(const NSObject* stored) {
  if (!stored) return anyPlace;
  if (stored->isNode()) return inTree;
  const bool isCopied = isa<XQueryNumber>(stored) || isa<XQueryDate>(stored) || isShortText(stored);
  return isCopied && !NSCounting::isImmortal(*cast<NSCounted>(stored)) ? threadPlace() : anyPlace;
}

XQueryLiteralCopies::XQueryLiteralCopies(Value stored)
    : _stored(std::move(stored)), _place(placeOf(_stored.get())) {}

XQueryLiteralCopies::~XQueryLiteralCopies() {
  const std::unique_ptr<Place[]> places(_places.load(std::memory_order_acquire));
  if (!places) return;
  for (uint32_t place = 0; place < threadPlaceCount(); ++place) {
    NSObject* copy = places[place].load(std::memory_order_acquire);
    if (copy) NSCounting::release(*cast<NSCounted>(copy));
  }
}

XQueryLiteralCopies::Place* XQueryLiteralCopies::places() const {
  Place* known = _places.load(std::memory_order_acquire);
  if (known) return known;
  auto made = std::make_unique<Place[]>(threadPlaceCount());
  if (!_places.compare_exchange_strong(known, made.get(), std::memory_order_acq_rel)) return known;
  return made.release();
}

Value XQueryLiteralCopies::copyAt(uint32_t place) const {
  if (_place == inTree) {
    NSXMLCredit::take(cast<NSXMLNode>(_stored.get()));
    return _stored;
  }
  Place& at = places()[place];
  NSObject* known = at.load(std::memory_order_acquire);
  if (known) return known;
  Ref<NSCounted> made = copyOf(_stored.get());
  if (!at.compare_exchange_strong(known, made.get(), std::memory_order_acq_rel)) return known;
  return Ref<NSCounted>(made.detach());
}

}  // namespace xquery
