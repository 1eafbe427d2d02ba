#include "Platform/Reading/PackedText.h"
#include "Platform/Reading/Packings.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

std::string nameOf(std::string_view text) {
  const Packing* packing = packingOf(text);
  return packing ? packing->name : "plain";
}

TEST(Packings, AreToldByTheirFirstBytes) {
  for (const packing::Format& format : packing::formats) {
    EXPECT_EQ(nameOf(format.pack("<a/>")), format.name);
    EXPECT_EQ(nameOf(format.pack("")), format.name) << "of no text";
  }
  EXPECT_EQ(nameOf(std::string("\x5A\x2A\x4D\x18\0\0\0\0", 8)), "zstd") << "a frame to be skipped";
}

TEST(Packings, PlainTextIsNone) {
  using namespace std::string_view_literals;
  for (const std::string_view text :
       {""sv, "<a/>"sv, "\xEF\xBB\xBF<a/>"sv, "\xFF\xFE<\0"sv, "\xFE\xFF\0<"sv, "\0<\0a"sv,
        "BZh9 is the name of a format"sv, "BZh91AY"sv, "PK\3\4"sv, "\x1F\x8B"sv, "\x1F\x8B\x07"sv,
        "\xFD"
        "7zXZ"sv,
        "\x28\xB5\x2F"sv}) {
    EXPECT_EQ(nameOf(text), "plain") << text;
  }
}

TEST(Packings, EveryBeginningIsPerhapsOne) {
  for (const packing::Format& format : packing::formats) {
    const std::string packed = format.pack("<a/>");
    const Packing* const known = packingOf(packed);
    ASSERT_TRUE(known);
    bool isCertain = false;
    for (size_t length = 0; length <= packed.size(); ++length) {
      const PackedFit fit = fitOf(*known, std::string_view(packed).substr(0, length));
      EXPECT_NE(fit, PackedFit::No) << format.name << " " << length;
      EXPECT_TRUE(!isCertain || fit == PackedFit::Yes) << format.name << " " << length;
      isCertain = fit == PackedFit::Yes;
      EXPECT_TRUE(isCertain || length < longestPackedStart) << format.name << " " << length;
    }
    EXPECT_EQ(fitOf(*known, "<"), PackedFit::No);
  }
}

}  // namespace
}  // namespace xquery
