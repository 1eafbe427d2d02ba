// Widening as `Widening.h` describes it. For `Highway.cpp` alone, which includes this once for
// every kind of processor but those that `WidenByCompressing.h` is for.

using Sixteen = hn::FixedTag<uint8_t, 16>;
using Some = hn::Vec<Sixteen>;
using Units = hn::FixedTag<uint16_t, 8>;
using Points = hn::FixedTag<uint32_t, 4>;
using PointVector = hn::Vec<Points>;

constexpr size_t bytesOfBlock = 64;
// A step reads and writes as much, whatever it takes and makes.
constexpr size_t bytesOfStep = 16;
// Where the last step of a block may begin: the end of a character shows at the byte behind it.
constexpr size_t stepsEnd = bytesOfBlock - WideningTables::bytesLookedAt;
// How far a fault reaches back. Where a character begins, zeros do as well as what is there.
constexpr size_t bytesBefore = 3;

// Not zero for each byte that makes the text something else than XML's.
HWY_INLINE Vector faults(const uint8_t* bytes) {
  const Bytes tag;
  const Vector here = hn::LoadU(tag, bytes);
  const Vector last = hn::LoadU(tag, bytes - 1);
  const Vector last2 = hn::LoadU(tag, bytes - 2);
  // U+FFFE and U+FFFF.
  const auto isNone =
      hn::And(hn::And(hn::Eq(last2, hn::Set(tag, 0xEF)), hn::Eq(last, hn::Set(tag, 0xBF))),
              hn::Eq(hn::Or(here, hn::Set(tag, 1)), hn::Set(tag, 0xBF)));
  return hn::Or(misplaced(here, last, last2, hn::LoadU(tag, bytes - bytesBefore)),
                hn::VecFromMask(tag, isNone));
}

// Looks at a block that a character begins, and at the bytes before it. Whether it is text, but for
// what its last character may lack; `ends` has a bit for each byte but the last one that is the
// last of a character.
HWY_INLINE bool readBlock(const uint8_t* bytes, uint64_t& ends) {
  const Bytes tag;
  Vector bad = hn::Zero(tag);
  uint64_t starts = 0;
  for (size_t at = 0; at < bytesOfBlock; at += hn::Lanes(tag)) {
    bad = hn::Or(bad, faults(bytes + at));
    const Vector upper = hn::And(hn::LoadU(tag, bytes + at), hn::Set(tag, 0xC0));
    uint64_t bits = 0;
    hn::StoreMaskBits(tag, hn::Ne(upper, hn::Set(tag, 0x80)), reinterpret_cast<uint8_t*>(&bits));
    starts |= bits << at;
  }
  ends = starts >> 1;
  return hn::AllTrue(tag, hn::Eq(bad, hn::Zero(tag)));
}

HWY_INLINE void storeASCII(Some bytes, char16_t* to) {
  const Units units;
  const Some zero = hn::Zero(Sixteen());
  auto* const out = reinterpret_cast<uint16_t*>(to);
  hn::StoreU(hn::ZipLower(units, bytes, zero), units, out);
  hn::StoreU(hn::ZipUpper(units, bytes, zero), units, out + hn::Lanes(units));
}

// Eight characters of two bytes.
HWY_INLINE void storePairs(Some bytes, char16_t* to) {
  const Units units;
  const auto pairs = hn::BitCast(units, bytes);
  const auto upper = hn::ShiftLeft<6>(hn::And(pairs, hn::Set(units, 0x1F)));
  const auto lower = hn::And(hn::ShiftRight<8>(pairs), hn::Set(units, 0x3F));
  hn::StoreU(hn::Or(upper, lower), units, reinterpret_cast<uint16_t*>(to));
}

// Characters of one or two bytes, in lanes.
HWY_INLINE void storeShort(Some lanes, char16_t* to) {
  const Units units;
  const auto pairs = hn::BitCast(units, lanes);
  const auto lower = hn::And(pairs, hn::Set(units, 0x7F));
  const auto upper = hn::ShiftRight<2>(hn::And(pairs, hn::Set(units, 0x1F00)));
  hn::StoreU(hn::Or(lower, upper), units, reinterpret_cast<uint16_t*>(to));
}

// Of characters in lanes, the code points.
HWY_INLINE PointVector points(Some lanes) {
  const Points tag;
  const auto all = hn::BitCast(tag, lanes);
  const auto first = hn::And(all, hn::Set(tag, 0x7F));
  const auto second = hn::ShiftRight<2>(hn::And(all, hn::Set(tag, 0x3F00)));
  // A lead of three bytes has a bit here that bytes which go on have not.
  const auto lead = hn::ShiftRight<1>(hn::And(all, hn::Set(tag, 0x400000)));
  const auto third = hn::ShiftRight<4>(hn::Xor(hn::And(all, hn::Set(tag, 0x3F0000)), lead));
  const auto fourth = hn::ShiftRight<6>(hn::And(all, hn::Set(tag, 0x07000000)));
  return hn::Or(hn::Or(first, second), hn::Or(third, fourth));
}

// Of three characters. Which of them take two units is nothing that a processor could foresee.
HWY_INLINE char16_t* storePoints(PointVector found, char16_t* to) {
  uint32_t each[4];
  hn::StoreU(found, Points(), each);
  for (size_t which = 0; which < 3; ++which) {
    const uint32_t point = each[which];
    const bool isPair = point >= 0x10000;
    const uint32_t units = 0xDC00D7C0 + (point >> 10) + ((point & 0x3FF) << 16);
    const uint32_t stored = isPair ? units : point;
    std::memcpy(to, &stored, sizeof stored);
    to += isPair ? 2 : 1;
  }
  return to;
}

// Widens a block that is text from its beginning until so many bytes are done; answers how many
// that came to.
HWY_INLINE size_t widenBlock(const WideningTables& tables, const uint8_t* bytes, uint64_t ends,
                             size_t wanted, char16_t*& to) {
  const Sixteen tag;
  size_t at = 0;
  while (at < wanted) {
    const Some here = hn::LoadU(tag, bytes + at);
    const uint64_t next = ends >> at;
    if ((next & 0xFFFF) == 0xFFFF) {
      storeASCII(here, to);
      to += 16;
      at += 16;
      continue;
    }
    if ((next & 0xFFFF) == 0xAAAA) {
      storePairs(here, to);
      to += 8;
      at += 16;
      continue;
    }
    const WideningTables::Step step = tables.steps[next % std::size(tables.steps)];
    const Some lanes = hn::TableLookupBytesOr0(here, hn::Load(tag, tables.shuffles[step.shuffle]));
    if (step.shuffle < WideningTables::firstOfFour) {
      storeShort(lanes, to);
      to += 6;
    } else if (step.shuffle < WideningTables::firstOfThree) {
      hn::StoreU(hn::TruncateTo(hn::FixedTag<uint16_t, 4>(), points(lanes)),
                 hn::FixedTag<uint16_t, 4>(), reinterpret_cast<uint16_t*>(to));
      to += 4;
    } else {
      to = storePoints(points(lanes), to);
    }
    at += step.bytes;
  }
  return at;
}

// Fewer bytes than two such parts.
template <size_t Part>
HWY_INLINE void copyFew(uint8_t* to, const uint8_t* from, size_t count) {
  if (count & Part) {
    std::memcpy(to, from, Part);
    to += Part;
    from += Part;
  }
  if constexpr (Part > 1) copyFew<Part / 2>(to, from, count);
}

// At most so many bytes, in pieces that overlap: how many there are is nothing that a processor
// could foresee.
template <size_t Most>
HWY_INLINE void copySome(uint8_t* to, const uint8_t* from, size_t count) {
  constexpr size_t piece = 16;
  if (count < piece) return copyFew<piece / 2>(to, from, count);
  for (size_t at = 0; at < Most; at += piece) {
    const size_t place = std::min(at, count - piece);
    std::memcpy(to + place, from + place, piece);
  }
}

// A block is read where it is, and its units are put where they belong, if so much may be read from
// its beginning on and so many units be written.
constexpr size_t bytesInReach = bytesOfBlock + bytesOfStep;
constexpr size_t unitsInReach = stepsEnd + bytesOfStep;

// What a text begins with, which has nothing before it that may be read.
HWY_INLINE bool readFirstBlock(const uint8_t* bytes, uint64_t& ends) {
  uint8_t copy[bytesOfStep + bytesOfBlock] = {};
  std::memcpy(copy + bytesOfStep, bytes, bytesOfBlock);
  return readBlock(copy + bytesOfStep, ends);
}

// So many bytes in a place of their own, with zeros behind them.
HWY_INLINE Widened widenCopy(const WideningTables& tables, const uint8_t* bytes, size_t count,
                             char16_t* units) {
  uint64_t ends = 0;
  if (!readBlock(bytes, ends)) return {0, 0};
  char16_t* to = units;
  size_t done = widenBlock(tables, bytes, ends, std::min(count, stepsEnd), to);
  if (done > count) {
    to -= done - count;
    done = count;
  }
  return {done, static_cast<size_t>(to - units)};
}

// The same where there may be room for no more units than bytes.
HWY_INLINE Widened widenCopyApart(const WideningTables& tables, const uint8_t* bytes, size_t count,
                                  char16_t* units) {
  char16_t made[unitsInReach];
  const Widened part = widenCopy(tables, bytes, count, made);
  copySome<sizeof made>(reinterpret_cast<uint8_t*>(units), reinterpret_cast<const uint8_t*>(made),
                        part.units * sizeof(char16_t));
  return part;
}

// Of a text that has nothing around it that may be read, and is too short for a block that could be
// read where it is.
HWY_INLINE Widened widenShort(const WideningTables& tables, std::string_view bytes,
                              char16_t* units) {
  uint8_t copy[bytesOfStep + 2 * bytesInReach] = {};
  copySome<bytesInReach>(copy + bytesOfStep, reinterpret_cast<const uint8_t*>(bytes.data()),
                         bytes.size());
  Widened all{0, 0};
  while (all.bytes < bytes.size()) {
    const Widened part = widenCopyApart(tables, copy + bytesOfStep + all.bytes,
                                        bytes.size() - all.bytes, units + all.units);
    if (!part.bytes) break;
    all.bytes += part.bytes;
    all.units += part.units;
  }
  return all;
}

// The last bytes of a text that has more than are in reach.
HWY_INLINE Widened widenEnd(const WideningTables& tables, const uint8_t* end, size_t count,
                            size_t room, char16_t* units) {
  uint8_t copy[bytesOfStep + 2 * bytesInReach] = {};
  std::memcpy(copy + bytesOfStep, end - bytesInReach, bytesInReach);
  const uint8_t* const bytes = copy + bytesOfStep + bytesInReach - count;
  return room < unitsInReach ? widenCopyApart(tables, bytes, count, units)
                             : widenCopy(tables, bytes, count, units);
}

HWY_ATTR Widened widenByVectors(std::string_view bytes, char16_t* units) {
  static const WideningTables tables;
  if (bytes.size() < bytesInReach) return widenShort(tables, bytes, units);
  const auto* const begin = reinterpret_cast<const uint8_t*>(bytes.data());
  size_t done = 0;
  char16_t* to = units;
  while (done < std::min(bytes.size(), widenedAtOnce)) {
    const size_t left = bytes.size() - done;
    if (left < bytesInReach) {
      const auto made = static_cast<size_t>(to - units);
      const Widened part = widenEnd(tables, begin + bytes.size(), left, bytes.size() - made, to);
      if (!part.bytes) break;
      done += part.bytes;
      to += part.units;
      continue;
    }
    uint64_t ends = 0;
    const uint8_t* const block = begin + done;
    if (!(done ? readBlock(block, ends) : readFirstBlock(block, ends))) break;
    done += widenBlock(tables, block, ends, stepsEnd, to);
  }
  return {done, static_cast<size_t>(to - units)};
}
