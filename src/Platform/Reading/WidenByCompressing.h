// Widening with vectors of 64 bytes whose lanes a mask can move together. For `Highway.cpp` alone.
//
// Each byte makes the unit of the character that would end there, of itself and of the two bytes
// before it; the units where a character ends are moved together and the others are gone. What a
// character of four bytes makes at its third byte and at its last one has, but for constants, the
// bits of its two units. So a block takes the same steps whatever mixture of characters it holds:
// there is nothing in it for a processor to foresee.

using Signed = hn::RebindToSigned<Bytes>;
using HalfOfBytes = hn::Half<Bytes>;
using Units = hn::RepartitionToWide<Bytes>;
using UnitVector = hn::Vec<Units>;

constexpr size_t bytesOfBlock = 64;
constexpr size_t unitsOfHalf = bytesOfBlock / 2;
static_assert(bytesOfBlock == hn::MaxLanes(Bytes()) && unitsOfHalf == hn::MaxLanes(Units()));

HWY_INLINE hn::Mask<Bytes> byteMask(uint64_t bits) {
  return hn::LoadMaskBits(Bytes(), reinterpret_cast<const uint8_t*>(&bits));
}

HWY_INLINE hn::Mask<Units> unitMask(uint32_t bits) {
  return hn::LoadMaskBits(Units(), reinterpret_cast<const uint8_t*>(&bits));
}

template <class Tag>
HWY_INLINE uint64_t bitsOf(Tag tag, hn::Mask<Tag> mask) {
  uint64_t bits = 0;
  hn::StoreMaskBits(tag, mask, reinterpret_cast<uint8_t*>(&bits));
  return bits;
}

HWY_INLINE uint64_t firstBits(size_t count) {
  return count < bytesOfBlock ? (uint64_t{1} << count) - 1 : ~uint64_t{0};
}

// What goes from block to block, in bits for the bytes of the last one.
struct Widening {
  char16_t* to;
  Vector faults = hn::Zero(Bytes());
  UnitVector largest = hn::Zero(Units());
  uint64_t wide = 0;    // not ASCII
  uint64_t goesOn = 0;  // neither ASCII nor the first byte of a character
  uint64_t fours = 0;   // the first of four bytes, or worse
  uint64_t taken = 0;   // a unit was made there
};

// A block is whole where a byte stands behind it, or it has as many bytes as are left, and zeros
// behind them. The first one has nothing before it that may be read, and zeros there.
struct Whole {};
struct Last {
  size_t bytes;
};

HWY_INLINE size_t bytesIn(Whole) {
  return bytesOfBlock;
}
HWY_INLINE size_t bytesIn(Last last) {
  return last.bytes;
}

HWY_INLINE Vector loadMasked(const uint8_t* block, size_t before, uint64_t bits) {
  // What the mask leaves out is not read: neither need there be memory.
  const auto address = reinterpret_cast<uintptr_t>(block) - before;
  return hn::MaskedLoad(byteMask(bits), Bytes(), reinterpret_cast<const uint8_t*>(address));
}

// The bytes that stand so far before those of the block.
template <bool IsFirst, class Extent>
HWY_INLINE Vector load(const uint8_t* block, size_t before, Extent extent) {
  if constexpr (IsFirst) {
    return loadMasked(block, before, firstBits(bytesIn(extent) + before) & ~firstBits(before));
  } else if constexpr (std::is_same_v<Extent, Last>) {
    return loadMasked(block, before, firstBits(extent.bytes + before));
  } else {
    return hn::LoadU(Bytes(), block - before);
  }
}

HWY_INLINE void storeUnits(UnitVector units, size_t, char16_t* to, Whole) {
  hn::StoreU(units, Units(), reinterpret_cast<uint16_t*>(to));
}
HWY_INLINE void storeUnits(UnitVector units, size_t count, char16_t* to, Last) {
  hn::BlendedStore(units, unitMask(static_cast<uint32_t>(firstBits(count))), Units(),
                   reinterpret_cast<uint16_t*>(to));
}

template <class Extent>
HWY_INLINE void widenASCII(Vector bytes, Extent extent, Widening& state) {
  const size_t count = bytesIn(extent);
  const size_t inFirst = std::min(count, unitsOfHalf);
  const auto lower = hn::PromoteTo(Units(), hn::LowerHalf(HalfOfBytes(), bytes));
  storeUnits(lower, inFirst, state.to, extent);
  if (inFirst < count) {
    const auto upper = hn::PromoteTo(Units(), hn::UpperHalf(HalfOfBytes(), bytes));
    storeUnits(upper, count - inFirst, state.to + inFirst, extent);
  }
  state.to += count;
  state.wide = state.goesOn = state.fours = 0;
  state.taken = firstBits(count);
}

// What each byte makes with those before it that belong to the same character.
struct Parts {
  Vector last;
  Vector middle;
  Vector first;
};

using HalfVector = hn::Vec<HalfOfBytes>;
HWY_INLINE UnitVector unitsOf(HalfVector last, HalfVector middle, HalfVector first) {
  const auto upper = hn::ShiftLeft<12>(hn::PromoteTo(Units(), first));
  const auto inner = hn::ShiftLeft<6>(hn::PromoteTo(Units(), middle));
  return hn::Or(hn::Or(upper, inner), hn::PromoteTo(Units(), last));
}

// Of bytes that make the higher or the lower unit of a character that takes two.
HWY_INLINE UnitVector pairsOf(UnitVector units, uint32_t highs, uint32_t lows) {
  const Units tag;
  const auto high = hn::Add(hn::ShiftRight<4>(units), hn::Set(tag, 0xD7C0));
  const auto low = hn::Or(hn::And(units, hn::Set(tag, 0x3FF)), hn::Set(tag, 0xDC00));
  return hn::IfThenElse(unitMask(highs), high, hn::IfThenElse(unitMask(lows), low, units));
}

template <class Extent>
HWY_INLINE void addUnits(UnitVector units, uint32_t taken, Extent extent, Widening& state) {
  const UnitVector together = hn::Compress(units, unitMask(taken));
  const auto count = static_cast<size_t>(std::popcount(taken));
  storeUnits(together, count, state.to, extent);
  state.largest = hn::Max(state.largest, together);
  state.to += count;
}

template <class Extent>
HWY_INLINE void addParts(const Parts& parts, uint64_t highs, uint64_t lows, Extent extent,
                         Widening& state) {
  const HalfOfBytes half;
  auto lower = unitsOf(hn::LowerHalf(half, parts.last), hn::LowerHalf(half, parts.middle),
                       hn::LowerHalf(half, parts.first));
  auto upper = unitsOf(hn::UpperHalf(half, parts.last), hn::UpperHalf(half, parts.middle),
                       hn::UpperHalf(half, parts.first));
  constexpr unsigned inHalf = unitsOfHalf;
  if (highs | lows) {
    lower = pairsOf(lower, static_cast<uint32_t>(highs), static_cast<uint32_t>(lows));
    upper = pairsOf(upper, static_cast<uint32_t>(highs >> inHalf),
                    static_cast<uint32_t>(lows >> inHalf));
  }
  addUnits(lower, static_cast<uint32_t>(state.taken), extent, state);
  addUnits(upper, static_cast<uint32_t>(state.taken >> inHalf), extent, state);
}

HWY_INLINE bool goesOnBehind(const uint8_t* block, Whole) {
  return (block[bytesOfBlock] & 0xC0) == 0x80;
}
HWY_INLINE bool goesOnBehind(const uint8_t*, Last) {
  return false;
}

template <bool IsFirst, class Extent>
HWY_INLINE void widenBlock(const uint8_t* block, Extent extent, Widening& state) {
  const Bytes tag;
  const Vector here = load<IsFirst>(block, 0, extent);
  const uint64_t wide = bitsOf(tag, hn::TestBit(here, hn::Set(tag, 0x80)));
  constexpr unsigned lastBit = bytesOfBlock - 1;
  if (!wide && !(state.wide >> lastBit)) return widenASCII(here, extent, state);
  const Vector last = load<IsFirst>(block, 1, extent);
  const Vector last2 = load<IsFirst>(block, 2, extent);
  const Vector last3 = load<IsFirst>(block, 3, extent);
  state.faults = hn::Or(state.faults, misplaced(here, last, last2, last3));

  const uint64_t goesOn = bitsOf(
      Signed(), hn::Lt(hn::BitCast(Signed(), here), hn::Set(Signed(), static_cast<int8_t>(0xC0))));
  const uint64_t fours = bitsOf(tag, hn::Eq(hn::Max(here, hn::Set(tag, 0xF0)), here));
  const uint64_t lastGoesOn = goesOn << 1 | state.goesOn >> lastBit;
  const uint64_t known = firstBits(bytesIn(extent));
  const uint64_t highs = (fours << 2 | state.fours >> (lastBit - 1)) & known;
  const uint64_t lows = (fours << 3 | state.fours >> (lastBit - 2)) & known;
  const uint64_t behind = goesOn >> 1 | uint64_t{goesOnBehind(block, extent)} << lastBit;
  state.wide = wide;
  state.goesOn = goesOn;
  state.fours = fours;
  state.taken = (~behind | highs) & known;

  const Vector bits = hn::Set(tag, 0x3F);
  const auto isLater = byteMask(goesOn);
  const Parts parts = {hn::IfThenElse(isLater, hn::And(here, bits), here),
                       hn::IfThenElseZero(isLater, hn::And(last, bits)),
                       hn::IfThenElseZero(byteMask(goesOn & lastGoesOn), last2)};
  addParts(parts, highs, lows, extent, state);
}

// The end of a text of so many bytes, of which as many are left as may be in a block.
template <bool IsFirst>
HWY_INLINE void widenLast(const uint8_t* block, size_t left, Widening& state) {
  widenBlock<IsFirst>(block, Last{left}, state);
  // That a character lacks bytes shows behind them.
  if (left == bytesOfBlock) widenBlock<false>(block + left, Last{0}, state);
}

// Of a character.
constexpr size_t mostUnfinished = 3;

// Behind whole blocks, of whose last character there may be more to come: goes back to where it
// begins. Answers by how many bytes.
HWY_INLINE size_t dropUnfinished(const uint8_t* end, Widening& state) {
  constexpr uint8_t leads[mostUnfinished] = {0xC0, 0xE0, 0xF0};
  for (size_t length = 1; length <= mostUnfinished; ++length) {
    if (*(end - length) < leads[length - 1]) continue;
    state.to -= std::popcount(state.taken >> (bytesOfBlock - length));
    return length;
  }
  return 0;
}

HWY_ATTR Widened widenByVectors(std::string_view bytes, char16_t* units) {
  const auto* const begin = reinterpret_cast<const uint8_t*>(bytes.data());
  Widening state{units};
  size_t done = 0;
  if (bytes.size() <= bytesOfBlock) {
    widenLast<true>(begin, bytes.size(), state);
    done = bytes.size();
  } else {
    widenBlock<true>(begin, Whole(), state);
    done = bytesOfBlock;
    constexpr size_t enough = widenedAtOnce + mostUnfinished;
    for (; bytes.size() - done > bytesOfBlock && done < enough; done += bytesOfBlock) {
      widenBlock<false>(begin + done, Whole(), state);
    }
    if (bytes.size() - done > bytesOfBlock) {
      done -= dropUnfinished(begin + done, state);
    } else {
      widenLast<false>(begin + done, bytes.size() - done, state);
      done = bytes.size();
    }
  }
  const UnitVector last = hn::Set(Units(), 0xFFFF);
  const bool isText =
      hn::AllTrue(Bytes(), hn::Eq(state.faults, hn::Zero(Bytes()))) &&
      hn::AllFalse(Units(), hn::Eq(hn::Or(state.largest, hn::Set(Units(), 1)), last));
  return isText ? Widened{done, static_cast<size_t>(state.to - units)} : Widened{0, 0};
}
