#include "Platform/Base/RangeRuns.h"

#include "Platform/Base/Sanitizers.h"

#include <algorithm>
#include <bit>
#include <new>
#include <sys/mman.h>
#include <sys/resource.h>
#include <utility>

#if XQUERY_ADDRESS_SANITIZER
#include <sanitizer/asan_interface.h>
#include <sanitizer/lsan_interface.h>
#endif

namespace xquery {

namespace {

constexpr size_t pageBytes = 4096;
constexpr size_t largePageBytes = size_t{2} << 20;
// What a small process uses comes in small pages.
constexpr size_t smallPagesBytes = size_t{4} << 20;

char* roundedUp(char* address, size_t bytes) {
  return address + -reinterpret_cast<uintptr_t>(address) % bytes;
}
char* roundedDown(char* address, size_t bytes) {
  return address - reinterpret_cast<uintptr_t>(address) % bytes;
}

#if XQUERY_ADDRESS_SANITIZER
constexpr bool isSanitized = true;
void forbid(const void* begin, size_t bytes) {
  ASAN_POISON_MEMORY_REGION(begin, bytes);
}
void permit(const void* begin, size_t bytes) {
  ASAN_UNPOISON_MEMORY_REGION(begin, bytes);
}
// What nodes refer to is in use.
void showToLeakChecker(const void* begin, size_t bytes) {
  __lsan_register_root_region(begin, bytes);
}
void hideFromLeakChecker(const void* begin, size_t bytes) {
  __lsan_unregister_root_region(begin, bytes);
}
#else
constexpr bool isSanitized = false;
void forbid(const void*, size_t) {}
void permit(const void*, size_t) {}
void showToLeakChecker(const void*, size_t) {}
void hideFromLeakChecker(const void*, size_t) {}
#endif

// Reserving more would leave too little for what is not in the range, where the process may not
// take all addresses that there are.
size_t mostToReserve() {
  rlimit space;
  if (getrlimit(RLIMIT_AS, &space) != 0 || space.rlim_cur == RLIM_INFINITY) return SIZE_MAX;
  constexpr size_t others = size_t{128} << 20;  // the program, its libraries
  const size_t all = space.rlim_cur;
  return all > 2 * others ? (all - others) / 2 : all / 4;
}

char* reserved(size_t bytes) {
  void* const memory =
      ::mmap(nullptr, bytes, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
  return memory == MAP_FAILED ? nullptr : static_cast<char*>(memory);
}

void unreserve(char* begin, char* end) {
  if (begin != end) ::munmap(begin, static_cast<size_t>(end - begin));
}

}  // namespace

// --- the range -------------------------------------------------------------------------------

int RangeRuns::adviseSystem(void* begin, size_t bytes, int advice) noexcept {
  return ::madvise(begin, bytes, advice);
}

RangeRuns::RangeRuns(size_t mostBytes, Advise advise) : _advise(advise) {
  reserve(std::min(mostBytes, windowBytes));
}

RangeRuns::~RangeRuns() {
  if (!_begin) return;
  permit(_begin, static_cast<size_t>(_usableEnd - _begin));
  hideFromLeakChecker(_begin, _size);
  ::munmap(_begin, _size);
}

// As much of it as lies within one window, which of two whole windows is one.
void RangeRuns::reserve(size_t bytes) {
  size_t wanted = bytes == windowBytes ? 2 * windowBytes : bytes;
  wanted = std::min(wanted, mostToReserve() / pageBytes * pageBytes);
  char* begin = nullptr;
  while (wanted >= pageBytes && !(begin = reserved(wanted))) {
    wanted = wanted / 2 / pageBytes * pageBytes;
  }
  if (!begin) return;  // a range without room
  char* end = begin + wanted;
  char* const border = roundedUp(begin, windowBytes);
  if (border < end) {
    char* const nextBorder = std::min(end, border + windowBytes);
    const bool isFirstLarger = border - begin > nextBorder - border;
    char* const from = isFirstLarger ? begin : border;
    char* const to = isFirstLarger ? border : nextBorder;
    unreserve(begin, from);
    unreserve(to, end);
    begin = from;
    end = to;
  }
  _begin = _top = _usableEnd = begin;
  _size = static_cast<size_t>(end - begin);
  showToLeakChecker(_begin, _size);
}

bool RangeRuns::makeUsable(char* end) {
  char* const rangeEnd = _begin + _size;
  if (end <= _usableEnd) return true;
  if (end > rangeEnd) return false;
  char* const before = _usableEnd;
  for (const size_t step : {largePageBytes, pageBytes}) {
    char* const wanted = std::min(roundedUp(end, step), rangeEnd);
    const auto bytes = static_cast<size_t>(wanted - before);
    if (::mprotect(before, bytes, PROT_READ | PROT_WRITE) != 0) continue;
    _usableEnd = wanted;
    char* const large = std::max(before, _begin + smallPagesBytes);
    if (large < wanted) _advise(large, static_cast<size_t>(wanted - large), MADV_HUGEPAGE);
    return true;
  }
  return false;
}

void RangeRuns::giveBack(char* begin, char* end) {
  begin = roundedUp(begin, pageBytes);
  end = roundedDown(end, pageBytes);
  if (begin < end) _advise(begin, static_cast<size_t>(end - begin), MADV_DONTNEED);
}

// Where the system does not take offers, the pages go back at once.
void RangeRuns::offer(char* begin, char* end) {
  if (begin >= end) return;
  if (_advise(begin, static_cast<size_t>(end - begin), MADV_FREE) != 0) giveBack(begin, end);
}

void RangeRuns::giveBackIdle() noexcept {
  const std::lock_guard guard(*this);
  releaseIdle();
  for (FreeRun* first : _bins) {
    for (FreeRun* run = first; run; run = run->next) {
      giveBack(reinterpret_cast<char*>(run + 1), run->after()->address());
    }
  }
  giveBack(_top, _usableEnd);
}

// --- bins ------------------------------------------------------------------------------------

// One for each small size, then some for each doubling.
size_t RangeRuns::binOf(size_t units) {
  if (units < exactBins) return units;
  constexpr auto exactBits = static_cast<int>(std::bit_width(exactBins)) - 1;
  constexpr auto doublingBits = static_cast<int>(std::bit_width(binsPerDoubling)) - 1;
  const auto bits = static_cast<int>(std::bit_width(units)) - 1;
  const size_t part = (units >> (bits - doublingBits)) % binsPerDoubling;
  return exactBins + static_cast<size_t>(bits - exactBits) * binsPerDoubling + part;
}

// The first one from there on that has a run; `binCount` for none.
size_t RangeRuns::binFrom(size_t bin) const {
  for (size_t word = bin / 64; word < _filledBins.size(); ++word) {
    const uint64_t bits =
        word == bin / 64 ? _filledBins[word] & (UINT64_MAX << bin % 64) : _filledBins[word];
    if (bits) return word * 64 + static_cast<size_t>(std::countr_zero(bits));
  }
  return binCount;
}

void RangeRuns::link(Run* run) {
  permit(run, sizeof(FreeRun));
  run->set(run->units(), true);
  const size_t bin = binOf(run->units());
  auto* const linked = static_cast<FreeRun*>(run);
  linked->previous = nullptr;
  linked->next = _bins[bin];
  if (linked->next) linked->next->previous = linked;
  _bins[bin] = linked;
  _filledBins[bin / 64] |= uint64_t{1} << bin % 64;
}

void RangeRuns::unlink(FreeRun* run) {
  if (run->next) run->next->previous = run->previous;
  if (run->previous) {
    run->previous->next = run->next;
    return;
  }
  const size_t bin = binOf(run->units());
  _bins[bin] = run->next;
  if (!run->next) _filledBins[bin / 64] &= ~(uint64_t{1} << bin % 64);
}

// Runs of the own bin may be smaller; all in higher ones are large enough.
RangeRuns::FreeRun* RangeRuns::fitting(size_t units) {
  const size_t own = binOf(units);
  int looks = 8;
  for (FreeRun* run = _bins[own]; run && looks--; run = run->next) {
    if (run->units() >= units) return run;
  }
  const size_t bin = binFrom(own + 1);
  return bin < binCount ? _bins[bin] : nullptr;
}

// --- taking ----------------------------------------------------------------------------------

// Leaves the run that many units if the rest is enough for a run.
void RangeRuns::cut(Run* run, size_t units) {
  const size_t rest = run->units() - units;
  if (rest < fewestUnits) return;
  run->set(units, run->isFree());
  Run* const added = run->after();
  permit(added, sizeof(Run));
  added->unitsBefore = static_cast<uint32_t>(units);
  added->set(rest, true);
  added->after()->unitsBefore = static_cast<uint32_t>(rest);  // the top is never next to a free run
  link(added);
}

RangeRuns::Run* RangeRuns::takeFree(size_t units) {
  FreeRun* const run = fitting(units);
  if (!run) return nullptr;
  unlink(run);
  cut(run, units);
  run->set(run->units(), false);
  return run;
}

RangeRuns::Run* RangeRuns::takeKept(size_t units) {
  for (size_t at = _keptCount; at-- > 0;) {
    Run* const run = _kept[at];
    if (run->units() < units || run->units() > units + units / 8) continue;
    Run** const place = _kept.data() + at;
    std::move(place + 1, _kept.data() + _keptCount, place);
    --_keptCount;
    _keptBytes -= run->units() * unit;
    return run;
  }
  return nullptr;
}

RangeRuns::Run* RangeRuns::takeTop(size_t units) {
  if (units > static_cast<size_t>(_begin + _size - _top) / unit) return nullptr;
  if (!makeUsable(_top + units * unit)) return nullptr;
  auto* const run = reinterpret_cast<Run*>(_top);
  permit(run, sizeof(Run));
  run->unitsBefore = _unitsBeforeTop;
  run->set(units, false);
  _top += units * unit;
  _unitsBeforeTop = static_cast<uint32_t>(units);
  return run;
}

RangeRuns::Run* RangeRuns::takeRun(size_t units) {
  if (units * unit >= largeBytes) {
    if (Run* const run = takeKept(units)) return run;
  }
  if (Run* const run = takeFree(units)) return run;
  if (Run* const run = takeTop(units)) return run;
  releaseIdle();
  Run* const run = takeFree(units);
  return run ? run : takeTop(units);
}

void* RangeRuns::take(size_t bytes) {
  if (bytes >= windowBytes - unit) throw std::bad_alloc();
  const std::lock_guard guard(*this);
  Run* const run = takeRun(unitsFor(bytes));
  if (!run) throw std::bad_alloc();
  permit(run->block(), bytesOf(run->units()));
  return run->block();
}

// Those that there are of this very size; else some side by side.
RangeRuns::Block* RangeRuns::takeChain(size_t bytes, size_t count) {
  const size_t units = unitsFor(bytes);
  const std::lock_guard guard(*this);
  Block* first = nullptr;
  for (FreeRun*& ofThisSize = _bins[binOf(units)]; ofThisSize && count > 0; --count) {
    first = chained(takeFree(units), first);
  }
  if (first) return first;
  if (Run* const run = takeRun(units * count)) return split(run, units);
  Run* const run = takeRun(units);
  if (!run) throw std::bad_alloc();
  return chained(run, nullptr);
}

RangeRuns::Block* RangeRuns::chained(Run* run, Block* next) {
  permit(run->block(), bytesOf(run->units()));
  return ::new (run->block()) Block{next};
}

// The last one takes what is left over.
RangeRuns::Block* RangeRuns::split(Run* run, size_t units) {
  Run* const end = run->after();
  permit(run, static_cast<size_t>(end->address() - run->address()));
  Block* first = nullptr;
  for (size_t left = run->units(); left > 0; left -= run->units(), run = run->after()) {
    if (first) run->unitsBefore = static_cast<uint32_t>(units);
    run->set(left < 2 * units ? left : units, false);
    first = chained(run, first);
  }
  const auto last = static_cast<uint32_t>(runOf(first)->units());
  (end->address() == _top ? _unitsBeforeTop : end->unitsBefore) = last;
  return first;
}

// --- giving back -----------------------------------------------------------------------------

RangeRuns::FreeRoom RangeRuns::release(Run* run) {
  forbid(run->block(), bytesOf(run->units()));
  if (Run* const after = run->after(); after->address() != _top && after->isFree()) {
    unlink(static_cast<FreeRun*>(after));
    run->set(run->units() + after->units(), false);
    forbid(after, sizeof(FreeRun));
  }
  if (run->unitsBefore && run->before()->isFree()) {
    Run* const before = run->before();
    unlink(static_cast<FreeRun*>(before));
    before->set(before->units() + run->units(), false);
    forbid(run, sizeof(Run));
    run = before;
  }
  if (run->after()->address() == _top) {
    _top = run->address();
    _unitsBeforeTop = run->unitsBefore;
    return {_top, _usableEnd};
  }
  run->after()->unitsBefore = static_cast<uint32_t>(run->units());
  link(run);
  return {run->address(), run->after()->address()};
}

void RangeRuns::releaseToSystem(Run* run) {
  char* const begin = run->address();
  char* const end = run->after()->address();
  const FreeRoom room = release(run);
  char* const from = std::max(roundedDown(begin, largePageBytes),
                              roundedUp(room.begin + sizeof(FreeRun), largePageBytes));
  char* const to = std::min(roundedUp(end, largePageBytes), roundedDown(room.end, largePageBytes));
  offer(from, to);
}

void RangeRuns::releaseIdle() {
  for (size_t at = 0; at < _keptCount; ++at) release(_kept[at]);
  _keptCount = _keptBytes = 0;
  for (Run*& waiting : _waiting) {
    if (Run* const run = std::exchange(waiting, nullptr)) release(run);
  }
}

void RangeRuns::keep(Run* run) {
  const size_t bytes = run->units() * unit;
  size_t leaving = 0;
  while (leaving < _keptCount &&
         (_keptCount - leaving == _kept.size() || _keptBytes + bytes > mostKeptBytes)) {
    Run* const oldest = _kept[leaving++];
    _keptBytes -= oldest->units() * unit;
    releaseToSystem(oldest);
  }
  std::move(_kept.data() + leaving, _kept.data() + _keptCount, _kept.data());
  _keptCount -= leaving;
  if (bytes > mostKeptBytes) {
    releaseToSystem(run);
    return;
  }
  _kept[_keptCount++] = run;
  _keptBytes += bytes;
}

void RangeRuns::give(Run* run) {
  forbid(run->block(), bytesOf(run->units()));
  if (run->units() * unit >= largeBytes) {
    keep(run);
    return;
  }
  if (isSanitized) {
    std::swap(run, _waiting[_nextWaiting]);
    _nextWaiting = (_nextWaiting + 1) % _waiting.size();
    if (!run) return;
  }
  release(run);
}

void RangeRuns::give(void* block) noexcept {
  const std::lock_guard guard(*this);
  give(runOf(block));
}

void RangeRuns::giveChain(Block* first) noexcept {
  const std::lock_guard guard(*this);
  while (first) give(runOf(std::exchange(first, first->next)));
}

}  // namespace xquery
