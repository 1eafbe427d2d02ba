// Highway, as the source of vector instructions: this file is compiled once for every kind of
// processor, and the first call chooses among them. Its headers are included here only. Its library
// is not linked, and the choice is our own: loading that library takes longer than the command does
// to start.
#include "Platform/Reading/ByteMarks.h"
#include "Platform/Reading/VectorCode.h"
#include "Platform/Reading/Widening.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <iterator>
#include <type_traits>

// Vectors of 64 bytes are wanted where lanes can be moved together by a mask as well, which is what
// makes widening several times as fast.
#define HWY_WANT_AVX3_DL
#define HWY_DISABLED_TARGETS HWY_AVX3
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "Platform/Reading/Highway.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace xquery {
namespace HWY_NAMESPACE {
namespace {

#if HWY_TARGET == HWY_SCALAR || __BYTE_ORDER__ != __ORDER_LITTLE_ENDIAN__

void markByVectors(const char* bytes, size_t count, ByteMarks* marks) {
  markBytesPlainly(bytes, count, marks);
}

Widened widenByVectors(std::string_view bytes, char16_t* units) {
  return widenSomePlainly(bytes, units);
}

#else

namespace hn = hwy::HWY_NAMESPACE;

using Bytes = hn::CappedTag<uint8_t, bytesPerMarks>;
using Vector = hn::Vec<Bytes>;

// --- marks -----------------------------------------------------------------------------------

// A bit for each byte that has one of the classes.
HWY_INLINE void storeClasses(Bytes tag, Vector classes, uint8_t wanted, uint8_t* bits) {
  hn::StoreMaskBits(tag, hn::Ne(hn::And(classes, hn::Set(tag, wanted)), hn::Zero(tag)), bits);
}

HWY_ATTR void markByVectors(const char* bytes, size_t count, ByteMarks* marks) {
  const Bytes tag;
  const size_t lanes = hn::Lanes(tag);
  const Vector lower = hn::LoadDup128(tag, byteclasses::lower);
  const Vector upper = hn::LoadDup128(tag, byteclasses::upper);
  for (; count; --count, bytes += bytesPerMarks, ++marks) {
    for (size_t index = 0; index < bytesPerMarks; index += lanes) {
      const Vector some = hn::LoadU(tag, reinterpret_cast<const uint8_t*>(bytes + index));
      const Vector classes = hn::And(hn::TableLookupBytes(lower, hn::And(some, hn::Set(tag, 15))),
                                     hn::TableLookupBytes(upper, hn::ShiftRight<4>(some)));
      const size_t at = index / 8;
      storeClasses(tag, classes, byteclasses::ofText,
                   reinterpret_cast<uint8_t*>(&marks->text) + at);
      storeClasses(tag, classes, byteclasses::ofValue,
                   reinterpret_cast<uint8_t*>(&marks->value) + at);
      storeClasses(tag, classes, byteclasses::ofName,
                   reinterpret_cast<uint8_t*>(&marks->name) + at);
      hn::StoreMaskBits(tag, hn::TestBit(some, hn::Set(tag, 0x80)),
                        reinterpret_cast<uint8_t*>(&marks->wide) + at);
    }
  }
}

// --- widening --------------------------------------------------------------------------------

HWY_INLINE Vector entries(const uint8_t (&table)[16], Vector places) {
  return hn::TableLookupBytes(hn::LoadDup128(Bytes(), table), places);
}

// Not zero for each byte that makes, with the three before it, something else than UTF-8.
HWY_INLINE Vector misplaced(Vector here, Vector last, Vector last2, Vector last3) {
  const Bytes tag;
  const Vector lastLower = entries(utf8faults::firstLower, hn::And(last, hn::Set(tag, 15)));
  const Vector lastUpper = entries(utf8faults::firstUpper, hn::ShiftRight<4>(last));
  const Vector upper = entries(utf8faults::secondUpper, hn::ShiftRight<4>(here));
  const Vector found = hn::And(hn::And(lastLower, lastUpper), upper);
  // The top bit for third and fourth bytes.
  const Vector later = hn::Or(hn::SaturatedSub(last2, hn::Set(tag, 0xE0 - 0x80)),
                              hn::SaturatedSub(last3, hn::Set(tag, 0xF0 - 0x80)));
  return hn::Xor(hn::And(later, hn::Set(tag, utf8faults::Follows)), found);
}

#if HWY_TARGET == HWY_AVX3_DL
#include "Platform/Reading/WidenByCompressing.h"
#else
#include "Platform/Reading/WidenBySteps.h"
#endif

#endif

}  // namespace
}  // namespace HWY_NAMESPACE
}  // namespace xquery
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace xquery {
namespace {

#define XQUERY_VECTOR_CODE(target) \
  { #target, target::markByVectors, target::widenByVectors }

struct Compiled {
  VectorCode code;
  bool (*canRun)();
};

// The best first; the last is what is compiled for all of them.
constexpr Compiled compiled[] = {
#if HWY_ARCH_X86 && (HWY_TARGETS & HWY_AVX3_DL)
    {XQUERY_VECTOR_CODE(N_AVX3_DL),
     [] {
       return __builtin_cpu_supports("avx512f") && __builtin_cpu_supports("avx512bw") &&
              __builtin_cpu_supports("avx512dq") && __builtin_cpu_supports("avx512vl") &&
              __builtin_cpu_supports("avx512cd") && __builtin_cpu_supports("avx512vbmi") &&
              __builtin_cpu_supports("avx512vbmi2") && __builtin_cpu_supports("bmi2");
     }},
#endif
#if HWY_ARCH_X86 && (HWY_TARGETS & HWY_AVX2)
    {XQUERY_VECTOR_CODE(N_AVX2),
     [] {
       return __builtin_cpu_supports("avx2") && __builtin_cpu_supports("fma") &&
              __builtin_cpu_supports("bmi") && __builtin_cpu_supports("bmi2");
     }},
#endif
#if HWY_ARCH_X86 && (HWY_TARGETS & HWY_SSE4)
    {XQUERY_VECTOR_CODE(N_SSE4),
     [] {
       return __builtin_cpu_supports("sse4.2") && __builtin_cpu_supports("aes") &&
              __builtin_cpu_supports("pclmul");
     }},
#endif
#if HWY_ARCH_X86 && (HWY_TARGETS & HWY_SSSE3)
    {XQUERY_VECTOR_CODE(N_SSSE3), [] { return bool(__builtin_cpu_supports("ssse3")); }},
#endif
    {{"any", HWY_STATIC_DISPATCH(markByVectors), HWY_STATIC_DISPATCH(widenByVectors)},
     [] { return true; }},
};

#undef XQUERY_VECTOR_CODE

}  // namespace

std::vector<VectorCode> vectorCodes() {
  std::vector<VectorCode> codes;
  for (const Compiled& each : compiled) {
    if (each.canRun()) codes.push_back(each.code);
  }
  return codes;
}

namespace {

const VectorCode& bestCode() {
  static const VectorCode& best =
      std::find_if(std::begin(compiled), std::end(compiled), [](const Compiled& each) {
        return each.canRun();
      })->code;
  return best;
}

}  // namespace

void markBytes(const char* bytes, size_t count, ByteMarks* marks) {
  bestCode().mark(bytes, count, marks);
}

Widened widenSome(std::string_view bytes, char16_t* units) {
  return bestCode().widen(bytes, units);
}

}  // namespace xquery
#endif
