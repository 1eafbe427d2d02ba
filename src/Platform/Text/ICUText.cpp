#include "Platform/Text/ICUText.h"

#include "Platform/Base/WorkMeter.h"

#include <unicode/uchar.h>
#include <unicode/unorm2.h>
#include <unicode/ustring.h>
#include <unicode/utf16.h>

#include <algorithm>
#include <array>
#include <limits>
#include <new>

namespace xquery {

namespace {

// The library counts in 32 bits with a sign.
int32_t checkedCount(size_t length) {
  if (length > std::numeric_limits<int32_t>::max()) throw std::bad_alloc();
  return static_cast<int32_t>(length);
}

// What `convert(buffer, capacity, status)` writes, where it answers the length that the whole
// result has. A result that is longer than expected is computed twice. Nothing when it fails.
template <class Text, class Convert>
std::optional<Text> converted(size_t expectedLength, Convert convert) {
  Text result;
  result.resize(expectedLength);
  for (;;) {
    UErrorCode status = U_ZERO_ERROR;
    const int32_t length = convert(result.data(), checkedCount(result.size()), &status);
    if (status == U_BUFFER_OVERFLOW_ERROR) {
      result.resize(static_cast<size_t>(length));
      continue;
    }
    if (U_FAILURE(status)) return std::nullopt;
    result.resize(static_cast<size_t>(length));
    return result;
  }
}

// The only way in which the conversions that take any text can fail.
std::u16string orOutOfMemory(std::optional<std::u16string> text) {
  if (!text) throw std::bad_alloc();
  return *std::move(text);
}

const UNormalizer2* normalizer(NSNormalizationForm form) {
  using Instance = const UNormalizer2* (*)(UErrorCode*);
  constexpr std::array<Instance, 4> instances = {unorm2_getNFCInstance, unorm2_getNFDInstance,
                                                 unorm2_getNFKCInstance, unorm2_getNFKDInstance};
  UErrorCode status = U_ZERO_ERROR;
  const UNormalizer2* instance = instances[static_cast<size_t>(form)](&status);
  if (U_FAILURE(status)) throw std::bad_alloc();
  return instance;
}

bool startsWithMark(UChar32 point) {
  return point >= 0x300 && u_getIntPropertyValue(point, UCHAR_LEAD_CANONICAL_COMBINING_CLASS) != 0;
}

// The library puts each mark in its place among those before it, which over a run of a million
// marks takes the square of the run. Runs as long as this are put in order beforehand.
constexpr size_t longRun = 128;

bool hasLongRunOfMarks(std::u16string_view text) {
  size_t run = 0;
  WorkPacer pacer;
  for (size_t index = 0; index < text.size();) {
    pacer.turn();
    UChar32 point = 0;
    U16_NEXT(text.data(), index, text.size(), point);
    run = startsWithMark(point) ? run + 1 : 0;
    if (run >= longRun) return true;
  }
  return false;
}

// The text decomposed, each run of marks in canonical order; an equivalent text.
std::u16string orderedDecomposition(std::u16string_view text, const UNormalizer2* decomposer) {
  struct Mark {
    UChar32 point;
    uint8_t combiningClass;
  };
  std::u16string result;
  std::vector<Mark> marks;
  const auto append = [&](UChar32 point) {
    char16_t units[2];
    size_t count = 0;
    U16_APPEND_UNSAFE(units, count, point);
    result.append(units, count);
  };
  const auto flush = [&] {
    std::stable_sort(marks.begin(), marks.end(), [](const Mark& a, const Mark& b) {
      return a.combiningClass < b.combiningClass;
    });
    for (const Mark& mark : marks) append(mark.point);
    marks.clear();
  };
  const auto add = [&](UChar32 point) {
    const uint8_t combiningClass = unorm2_getCombiningClass(decomposer, point);
    if (combiningClass != 0) {
      marks.push_back({point, combiningClass});
    } else {
      flush();
      append(point);
    }
  };
  WorkPacer pacer;
  for (size_t index = 0; index < text.size();) {
    pacer.turn();
    UChar32 point = 0;
    U16_NEXT(text.data(), index, text.size(), point);
    char16_t parts[64];  // no decomposition is longer than 18 units
    UErrorCode status = U_ZERO_ERROR;
    const int32_t length =
        unorm2_getDecomposition(decomposer, point, parts, std::size(parts), &status);
    if (U_FAILURE(status) || length < 0) {
      add(point);
      continue;
    }
    for (int32_t part = 0; part < length;) {
      U16_NEXT(parts, part, length, point);
      add(point);
    }
  }
  flush();
  return result;
}

std::u16string normalizedBy(const UNormalizer2* instance, std::u16string_view text) {
  return orOutOfMemory(converted<std::u16string>(
      text.size() + text.size() / 4 + 16, [&](char16_t* out, int32_t capacity, UErrorCode* status) {
        return unorm2_normalize(instance, text.data(), checkedCount(text.size()), out, capacity,
                                status);
      }));
}

// --- long texts ----------------------------------------------------------------------------------

// The code points on the two sides of an index; a lone surrogate is itself.
struct Neighbours {
  UChar32 before;
  UChar32 after;
};

Neighbours neighboursAt(std::u16string_view text, size_t index) {
  Neighbours found{};
  size_t next = index;
  U16_NEXT(text.data(), next, text.size(), found.after);
  U16_PREV(text.data(), 0, index, found.before);
  return found;
}

// The results of the pieces of a text, which is cut only where `mayCut` says that it makes no
// difference, so that a long text can be left in the middle.
template <class MayCut, class Convert>
std::u16string inPieces(std::u16string_view text, MayCut mayCut, Convert convert) {
  constexpr size_t pieceLength = 8192;
  constexpr size_t unitsPerStep = 512;
  std::u16string result;
  while (text.size() > pieceLength) {
    size_t length = pieceLength;
    for (; length < text.size(); ++length) {
      const Neighbours at = neighboursAt(text, length);
      const bool insidePair = U16_IS_LEAD(at.before) && U16_IS_TRAIL(at.after);
      if (!insidePair && mayCut(at)) break;
    }
    result += convert(text.substr(0, length));
    text.remove_prefix(length);
    checkWork(length / unitsPerStep);
  }
  if (result.empty()) return convert(text);
  return result += convert(text);
}

// Whether a sigma is final depends on the letters around it and around ignorable characters beside
// it.
bool endsSearchForFinalSigma(UChar32 point) {
  constexpr UChar32 sigma = 0x3A3;
  return point != sigma && !u_hasBinaryProperty(point, UCHAR_CASE_IGNORABLE);
}

using CaseMapping = int32_t (*)(char16_t*, int32_t, const char16_t*, int32_t, const char*,
                                UErrorCode*);

// The empty name is that of the root locale; a null one would mean the process's.
std::u16string caseMapped(std::u16string_view text, CaseMapping mapping) {
  return orOutOfMemory(converted<std::u16string>(
      text.size(), [&](char16_t* out, int32_t capacity, UErrorCode* status) {
        return mapping(out, capacity, text.data(), checkedCount(text.size()), "", status);
      }));
}

}  // namespace

std::u16string upperCasedText(std::u16string_view text) {
  return inPieces(
      text, [](Neighbours) { return true; },
      [](std::u16string_view piece) { return caseMapped(piece, u_strToUpper); });
}

std::u16string lowerCasedText(std::u16string_view text) {
  return inPieces(
      text,
      [](Neighbours at) {
        return endsSearchForFinalSigma(at.before) && endsSearchForFinalSigma(at.after);
      },
      [](std::u16string_view piece) { return caseMapped(piece, u_strToLower); });
}

std::u16string normalizedText(std::u16string_view text, NSNormalizationForm form) {
  const UNormalizer2* instance = normalizer(form);
  const bool compatible = form == NSNormalizationForm::KC || form == NSNormalizationForm::KD;
  const UNormalizer2* decomposer =
      normalizer(compatible ? NSNormalizationForm::KD : NSNormalizationForm::D);
  return inPieces(
      text, [&](Neighbours at) { return unorm2_hasBoundaryBefore(instance, at.after) != 0; },
      [&](std::u16string_view piece) {
        return hasLongRunOfMarks(piece)
                   ? normalizedBy(instance, orderedDecomposition(piece, decomposer))
                   : normalizedBy(instance, piece);
      });
}

std::optional<std::u16string> textWithCodePoints(const std::vector<int32_t>& points) {
  return converted<std::u16string>(
      points.size(), [&](char16_t* out, int32_t capacity, UErrorCode* status) {
        int32_t length = 0;
        u_strFromUTF32(out, capacity, &length, points.data(), checkedCount(points.size()), status);
        return length;
      });
}

std::optional<std::vector<int32_t>> codePointsOfText(std::u16string_view text) {
  return converted<std::vector<int32_t>>(
      text.size(), [&](int32_t* out, int32_t capacity, UErrorCode* status) {
        int32_t length = 0;
        u_strToUTF32(out, capacity, &length, text.data(), checkedCount(text.size()), status);
        return length;
      });
}

}  // namespace xquery
