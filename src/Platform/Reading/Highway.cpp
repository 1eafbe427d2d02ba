// Highway, as the source of vector instructions: this file is compiled once for every kind of
// processor, and the first call chooses among them. Its headers are included here only. Its library
// is not linked, and the choice is our own: loading that library takes longer than the command does
// to start.
#include "Platform/Reading/ByteMarks.h"

#include <cstring>

// Half of the vectors' width is enough: what is marked is read a byte at a time.
#define HWY_DISABLED_TARGETS (HWY_AVX3 | HWY_AVX3_DL)
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

#else

namespace hn = hwy::HWY_NAMESPACE;

using Bytes = hn::CappedTag<uint8_t, bytesPerMarks>;
using Vector = hn::Vec<Bytes>;

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

#endif

}  // namespace
}  // namespace HWY_NAMESPACE
}  // namespace xquery
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace xquery {
namespace {

using Marking = void (*)(const char* bytes, size_t count, ByteMarks* marks);

// The best that the processor has, or what is compiled for all of them.
Marking bestMarking() {
#if HWY_ARCH_X86 && (HWY_TARGETS & HWY_AVX2)
  if (__builtin_cpu_supports("avx2") && __builtin_cpu_supports("fma") &&
      __builtin_cpu_supports("bmi") && __builtin_cpu_supports("bmi2")) {
    return N_AVX2::markByVectors;
  }
#endif
#if HWY_ARCH_X86 && (HWY_TARGETS & HWY_SSE4)
  if (__builtin_cpu_supports("sse4.2") && __builtin_cpu_supports("aes") &&
      __builtin_cpu_supports("pclmul")) {
    return N_SSE4::markByVectors;
  }
#endif
#if HWY_ARCH_X86 && (HWY_TARGETS & HWY_SSSE3)
  if (__builtin_cpu_supports("ssse3")) return N_SSSE3::markByVectors;
#endif
  return HWY_STATIC_DISPATCH(markByVectors);
}

}  // namespace

void markBytes(const char* bytes, size_t count, ByteMarks* marks) {
  static const Marking best = bestMarking();
  best(bytes, count, marks);
}

}  // namespace xquery
#endif
