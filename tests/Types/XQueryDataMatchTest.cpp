#include "Platform/Base/ProcessorTime.h"
#include "Types/XQueryDataMatch.h"
#include "TypesTestSupport.h"

namespace xquery {
namespace {

std::string shown(const std::optional<XQueryDataRange>& range) {
  if (!range) return "none";
  return std::to_string(range->position) + "+" + std::to_string(range->length);
}

Ref<NSData> data(std::string_view bytes) {
  return NSData::dataWithBytes(std::string(bytes));
}

Ref<NSArray> anyOf(std::initializer_list<std::string_view> patterns) {
  std::vector<Value> objects;
  for (const std::string_view pattern : patterns) objects.push_back(data(pattern));
  return NSArray::arrayWithObjects(std::move(objects));
}

std::string shown(const Value& result) {
  if (!result) return "none";
  if (const NSData* slice = dyn_cast<NSData>(result)) return std::string(slice->bytes());
  std::string text;
  for (const Value& slice : cast<NSArray>(result)->objects()) {
    text += "[" + std::string(cast<NSData>(slice)->bytes()) + "]";
  }
  return text;
}

std::string first(std::string_view bytes, const Ref<NSCounted>& start, const Ref<NSCounted>& end) {
  return shown(XQueryDataMatch(*data(bytes), start.get(), end.get(), false));
}

std::string all(std::string_view bytes, const Ref<NSCounted>& start, const Ref<NSCounted>& end) {
  return shown(XQueryDataMatch(*data(bytes), start.get(), end.get(), true));
}

TEST(DataFind, GivesTheFirstOccurrenceInTheRange) {
  EXPECT_EQ(shown(DataFind("abcabc", "bc", 0, 6)), "1+2");
  EXPECT_EQ(shown(DataFind("abcabc", "bc", 2, 4)), "4+2");
  EXPECT_EQ(shown(DataFind("abcabc", "bc", 2, 3)), "none");
  EXPECT_EQ(shown(DataFind("abcabc", "x", 0, 6)), "none");
}

TEST(DataFind, ARangeOutsideTheDataOrTooShortFindsNothing) {
  EXPECT_EQ(shown(DataFind("abc", "a", 0, 4)), "none");
  EXPECT_EQ(shown(DataFind("abc", "a", 4, 0)), "none");
  EXPECT_EQ(shown(DataFind("abc", "abc", 1, 2)), "none");
  EXPECT_EQ(shown(DataFind("abc", "c", 1, SIZE_MAX)), "none");
}

TEST(DataMatchStart, AnEmptyPatternMatchesWhereTheSearchBegins) {
  EXPECT_EQ(shown(DataMatchStart("abc", "", 2)), "2+0");
  EXPECT_EQ(shown(DataMatchStart("abc", "", 3)), "3+0");
  EXPECT_EQ(shown(DataMatchStart("abc", "c", 1)), "2+1");
  EXPECT_EQ(shown(DataMatchStart("abc", "c", 3)), "none");
}

TEST(DataMatchEnd, AnEmptyPatternMatchesAtTheEnd) {
  EXPECT_EQ(shown(DataMatchEnd("abc", "", 1)), "3+0");
  EXPECT_EQ(shown(DataMatchEnd("abc", "", 3)), "3+0");
  EXPECT_EQ(shown(DataMatchEnd("abc", "", 4)), "none");
  EXPECT_EQ(shown(DataMatchEnd("", "", 0)), "none");
  EXPECT_EQ(shown(DataMatchEnd("abc", "b", 0)), "1+1");
}

TEST(DataMatch, TheSliceIncludesBothDelimiters) {
  EXPECT_EQ(first("xx<a>yy", data("<"), data(">")), "<a>");
  EXPECT_EQ(first("xx<a>yy", nullptr, data(">")), "xx<a>");
  EXPECT_EQ(first("xx<a>yy", data("<"), nullptr), "<a>yy");
  EXPECT_EQ(first("xx", nullptr, nullptr), "xx");
  EXPECT_EQ(first("xx", data(""), data("")), "xx");
  EXPECT_EQ(first("", nullptr, nullptr), "none");
  EXPECT_EQ(first("xx<a", data("<"), data(">")), "none");
  EXPECT_EQ(first("a>", data("<"), data(">")), "none");
}

TEST(DataMatch, TheEndIsSearchedFromTheEndOfTheStart) {
  EXPECT_EQ(first("||a|", data("|"), data("|")), "||");
  EXPECT_EQ(first("aXa", data("aXa"), data("a")), "none");
}

TEST(DataMatch, AlternativesAreTriedInTheirOrder) {
  EXPECT_EQ(first("1b2a3.", anyOf({"a", "b"}), data(".")), "a3.");
  EXPECT_EQ(first("1b2", anyOf({"a", "b"}), anyOf({"x", "2"})), "b2");
  EXPECT_EQ(first("1b2", anyOf({}), nullptr), "none");
}

TEST(DataMatchAll, EachSearchResumesAtTheEndOfThePreviousMatch) {
  EXPECT_EQ(all("<a>.<b><c", data("<"), data(">")), "[<a>][<b>]");
  EXPECT_EQ(all("aaaa", data("a"), data("a")), "[aa][aa]");
  EXPECT_EQ(all("a.b.c", nullptr, data(".")), "[a.][b.]");
}

TEST(DataMatchAll, AlternativesKeepTheirOrderAfterOneIsExhausted) {
  EXPECT_EQ(all("b1.a2.b3;b4.", anyOf({"a", "b"}), anyOf({";", "."})), "[a2.b3;][b4.]");
  EXPECT_EQ(all("a.b", anyOf({"x", ""}), anyOf({"y", "."})), "[a.]");
}

// Looking again and again for patterns that are not there would take minutes. No time is told under
// AddressSanitizer, which itself reads all the bytes that are left before each search.
TEST(DataMatchAll, AbsentAlternativesAreLookedForOnce) {
  std::string bytes;
  while (bytes.size() < 500000) bytes += "<>";
  [[maybe_unused]] const double start = processorSeconds();
  const Ref<NSData> searched = NSData::dataWithBytes(std::move(bytes));
  const Value slices =
      XQueryDataMatch(*searched, anyOf({"absent", "<"}).get(), anyOf({"missing", ">"}).get(), true);
  EXPECT_EQ(cast<NSArray>(slices)->count(), 250000U);
#ifndef XQUERY_SANITIZED
  EXPECT_LT(processorSeconds() - start, 5);
#endif
}

TEST(DataMatchAll, StopsAtAnEmptyMatch) {
  EXPECT_EQ(all("abc", nullptr, nullptr), "[abc]");
  EXPECT_EQ(all("xbc", data("b"), nullptr), "[bc]");
}

TEST(DataMatchAll, AnswersNullWhenNothingMatches) {
  EXPECT_EQ(all("abc", data("x"), data("y")), "none");
  EXPECT_EQ(all("", nullptr, nullptr), "none");
}

}  // namespace
}  // namespace xquery
