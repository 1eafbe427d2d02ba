#include "Platform/Text/ICUText.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/Blocks.h"
#include "Platform/Text/UTF16.h"

#include <unicode/uchar.h>
#include <unicode/unorm2.h>
#include <unicode/ustring.h>
#include <unicode/utf16.h>

#include <algorithm>
#include <array>
#include <limits>
#include <new>
#include <numeric>
#include <vector>

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

struct Mark {
  UChar32 point;
  uint8_t combiningClass;
};

// By their classes, of which there are few; those of one class stay as they are.
void orderMarks(std::vector<Mark>& marks) {
  if (marks.size() <= longRun) {
    std::stable_sort(marks.begin(), marks.end(), [](const Mark& a, const Mark& b) {
      return a.combiningClass < b.combiningClass;
    });
    return;
  }
  WorkPacer pacer;
  std::array<size_t, UINT8_MAX + 2> places{};  // where the next mark of a class goes
  for (const Mark& mark : marks) {
    pacer.turn();
    ++places[mark.combiningClass + size_t{1}];
  }
  std::partial_sum(places.begin(), places.end(), places.begin());
  std::vector<Mark> ordered(marks.size());
  for (const Mark& mark : marks) {
    pacer.turn();
    ordered[places[mark.combiningClass]++] = mark;
  }
  marks.swap(ordered);
}

// The text decomposed, each run of marks in canonical order; an equivalent text.
std::u16string orderedDecomposition(std::u16string_view text, const UNormalizer2* decomposer) {
  std::u16string result;
  std::vector<Mark> marks;
  const auto append = [&](UChar32 point) {
    char16_t units[2];
    size_t count = 0;
    U16_APPEND_UNSAFE(units, count, point);
    result.append(units, count);
  };
  const auto flush = [&] {
    orderMarks(marks);
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

constexpr size_t pieceLength = 8192;
constexpr size_t unitsPerStep = 512;  // of converting

// The results of the pieces of a text, which is cut only where `mayCut` says that it makes no
// difference, so that a long text can be left in the middle.
template <class MayCut, class Convert>
std::u16string inPieces(std::u16string_view text, MayCut mayCut, Convert convert) {
  std::u16string result;
  WorkPacer pacer;
  while (text.size() > pieceLength) {
    size_t length = pieceLength;
    for (; length < text.size(); ++length) {
      pacer.turn();
      const Neighbours at = neighboursAt(text, length);
      const bool insidePair = U16_IS_LEAD(at.before) && U16_IS_TRAIL(at.after);
      if (!insidePair && mayCut(at)) break;
    }
    appendInBlocks(result, std::u16string_view(convert(text.substr(0, length))));
    text.remove_prefix(length);
    checkWork(length / unitsPerStep);
  }
  if (result.empty()) return convert(text);
  appendInBlocks(result, std::u16string_view(convert(text)));
  return result;
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

// Whether a sigma is final depends on the first characters before and after it that are not
// ignorable. Where a text is cut they are told to each piece: by a letter of its own beside the
// cut, which is taken off the result again. So the text can be cut anywhere, whatever it consists
// of.
class CutForLowerCase {
 public:
  explicit CutForLowerCase(std::u16string_view text) : _text(text) {}

  std::u16string run() {
    std::u16string result;
    result.reserve(_text.size());
    bool afterLetter = false;
    for (size_t from = 0; from < _text.size();) {
      const size_t end = endOfPiece(from);
      const std::u16string_view piece = _text.substr(from, end - from);
      std::u16string mapped = lowerCased(piece, afterLetter, isLetterNext(end));
      appendInBlocks(result, std::u16string_view(mapped));
      afterLetter = endsInLetter(piece, afterLetter);
      from = end;
      checkWork(1 + piece.size() / unitsPerStep);
    }
    return result;
  }

 private:
  static constexpr char16_t letter = u'a';

  static bool isIgnorable(UChar32 point) {
    return u_hasBinaryProperty(point, UCHAR_CASE_IGNORABLE) != 0;
  }
  static bool isCased(UChar32 point) { return u_hasBinaryProperty(point, UCHAR_CASED) != 0; }

  // Not between the halves of a pair.
  size_t endOfPiece(size_t from) const {
    size_t end = std::min(from + pieceLength, _text.size());
    if (end < _text.size() && U16_IS_LEAD(_text[end - 1]) && U16_IS_TRAIL(_text[end])) ++end;
    return end;
  }
  // Whether the first character from there on that is not ignorable is a letter. It is looked for
  // once, however many pieces it is away.
  bool isLetterNext(size_t from) {
    WorkPacer pacer;
    for (_next = std::max(_next, from); _next < _text.size();) {
      pacer.turn();
      size_t after = _next;
      UChar32 point = 0;
      U16_NEXT(_text.data(), after, _text.size(), point);
      if (!isIgnorable(point)) return isCased(point);
      _next = after;
    }
    return false;
  }
  // The same of the last one of a piece; `before` when it has none.
  static bool endsInLetter(std::u16string_view piece, bool before) {
    for (size_t at = piece.size(); at > 0;) {
      UChar32 point = 0;
      U16_PREV(piece.data(), 0, at, point);
      if (!isIgnorable(point)) return isCased(point);
    }
    return before;
  }
  static std::u16string lowerCased(std::u16string_view piece, bool afterLetter, bool beforeLetter) {
    std::u16string text;
    if (afterLetter) text += letter;
    text += piece;
    if (beforeLetter) text += letter;
    std::u16string mapped = caseMapped(text, u_strToLower);
    if (beforeLetter) mapped.pop_back();
    if (afterLetter) mapped.erase(0, 1);
    return mapped;
  }

  std::u16string_view _text;
  size_t _next = 0;  // what lies between the end of the last piece and here is ignorable
};

}  // namespace

std::u16string upperCasedText(std::u16string_view text) {
  return inPieces(
      text, [](Neighbours) { return true; },
      [](std::u16string_view piece) { return caseMapped(piece, u_strToUpper); });
}

std::u16string lowerCasedText(std::u16string_view text) {
  return text.size() <= pieceLength ? caseMapped(text, u_strToLower) : CutForLowerCase(text).run();
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
  std::u16string text;
  text.reserve(points.size());
  WorkPacer pacer;
  for (const int32_t point : points) {
    pacer.turn();
    if (point < 0 || point > UCHAR_MAX_VALUE || U_IS_SURROGATE(point)) return std::nullopt;
    makeRoom(text, 2);
    appendUTF16(text, static_cast<char32_t>(point));
  }
  return text;
}

std::optional<std::vector<int32_t>> codePointsOfText(std::u16string_view text) {
  std::vector<int32_t> points;
  points.reserve(text.size());
  WorkPacer pacer;
  for (size_t index = 0; index < text.size();) {
    pacer.turn();
    UChar32 point = 0;
    U16_NEXT(text.data(), index, text.size(), point);
    if (U_IS_SURROGATE(point)) return std::nullopt;
    points.push_back(point);
  }
  return points;
}

}  // namespace xquery
