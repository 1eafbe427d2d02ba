#include "Platform/Base/Counting.h"
#include "Platform/Base/LastingObjects.h"
#include "Platform/Dates/ICUTimeZone.h"
#include "xquery/Date.h"

namespace xquery {

namespace {

// A zone of rules that never change is one of a fixed offset.
struct OffsetOrRules {
  int32_t offset = 0;
  std::unique_ptr<const ICUTimeZone> rules;

  explicit OffsetOrRules(std::unique_ptr<const ICUTimeZone> zone) : rules(std::move(zone)) {
    if (!rules->isFixed()) return;
    offset = rules->offsetAt(0).total();
    rules.reset();
  }
};

NSTimeZone* shared(Ref<NSTimeZone> zone) {
  NSCounting::makeImmortal(*zone);
  return zone.detach();
}

}  // namespace

NSTimeZone::NSTimeZone(int32_t offset, std::unique_ptr<const ICUTimeZone> rules)
    : NSCounted(Kind::TimeZone), _offset(offset), _rules(std::move(rules)) {}

NSTimeZone::~NSTimeZone() = default;

Ref<NSTimeZone> NSTimeZone::timeZoneForSecondsFromGMT(int32_t seconds) {
  if (seconds == 0) return GMT();
  return make<NSTimeZone>(seconds, nullptr);
}

Ref<NSTimeZone> NSTimeZone::timeZoneWithName(std::string_view name) {
  auto rules = ICUTimeZone::named(name);
  if (!rules) return nullptr;
  OffsetOrRules zone(std::move(rules));
  return make<NSTimeZone>(zone.offset, std::move(zone.rules));
}

NSTimeZone* NSTimeZone::GMT() {
  static NSTimeZone* const zone = [] {
    const LastingObjects lasting;
    return shared(make<NSTimeZone>(0, nullptr));
  }();
  return zone;
}

NSTimeZone* NSTimeZone::localTimeZone() {
  static NSTimeZone* const zone = [] {
    const LastingObjects lasting;
    OffsetOrRules local(ICUTimeZone::ofProcess());
    return shared(make<NSTimeZone>(local.offset, std::move(local.rules)));
  }();
  return zone;
}

int32_t NSTimeZone::secondsFromGMT(const NSInstant& at) const {
  return _rules ? _rules->offsetAt(at.seconds).total() : _offset;
}

bool NSTimeZone::isDaylightSavingTime(const NSInstant& at) const {
  return _rules && _rules->offsetAt(at.seconds).daylight != 0;
}

int32_t NSTimeZone::secondsFromGMTForClock(int64_t seconds) const {
  return _rules ? _rules->offsetForClock(seconds).total() : _offset;
}

}  // namespace xquery
