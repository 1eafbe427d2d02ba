#include "Platform/Reading/MarkedText.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <string_view>

namespace xquery {
namespace {

// A text with nothing behind it that may be read: AddressSanitizer sees it.
class Exactly {
 public:
  explicit Exactly(std::string_view text) : _bytes(new char[text.size()]), _size(text.size()) {
    std::copy(text.begin(), text.end(), _bytes.get());
    marked.start(begin(), end());
  }
  const char* begin() const { return _bytes.get(); }
  const char* end() const { return begin() + _size; }
  MarkedText marked;

 private:
  std::unique_ptr<char[]> _bytes;
  size_t _size;
};

TEST(MarkedText, TheEndIsFoundWhereverItIs) {
  for (size_t length = 0; length < 400; ++length) {
    Exactly text(std::string(length, 'x') + "<y");
    uint64_t wide = 0;
    EXPECT_EQ(text.marked.textEnd(text.begin(), wide), text.begin() + length);
    EXPECT_EQ(wide, 0U);
    EXPECT_EQ(text.marked.textEnd(text.begin() + length + 1, wide), text.end());
  }
}

TEST(MarkedText, WhereNothingIsFoundItIsTheEndOfTheText) {
  for (size_t length : {0, 1, 63, 64, 65, 16383, 16384, 16385, 100000}) {
    Exactly text(std::string(length, 'x'));
    uint64_t wide = 0;
    EXPECT_EQ(text.marked.textEnd(text.begin(), wide), text.end()) << length;
    Exactly name(std::string(length, 'x'));
    EXPECT_EQ(name.marked.nameEnd(name.begin(), wide), name.end()) << length;
    Exactly value(std::string(length, 'x'));
    EXPECT_EQ(value.marked.valueEnd(value.begin(), wide), value.end()) << length;
  }
}

TEST(MarkedText, BlocksFollowOneAnother) {
  for (size_t length = 16300; length < 16500; ++length) {
    Exactly text(std::string(length, 'x') + "=" + std::string(length, 'y') + "<");
    uint64_t wide = 0;
    const char* const equals = text.marked.nameEnd(text.begin(), wide);
    EXPECT_EQ(equals, text.begin() + length);
    EXPECT_EQ(text.marked.textEnd(equals + 1, wide), text.end() - 1);
  }
}

TEST(MarkedText, WhatIsNotASCIICountsUpToTheEndThatIsFound) {
  for (size_t before = 0; before < 200; before += 3) {
    for (size_t after = 0; after < 200; after += 7) {
      Exactly text(std::string(before, 'x') + "\xC3\xA9" + std::string(after, 'x') + "<\xC3\xA9>");
      uint64_t wide = 0;
      const char* const found = text.marked.textEnd(text.begin(), wide);
      EXPECT_EQ(found, text.end() - 4);
      EXPECT_NE(wide, 0U);
      wide = 0;
      Exactly plain(std::string(before + after, 'x') + "<\xC3\xA9>");
      plain.marked.textEnd(plain.begin(), wide);
      EXPECT_EQ(wide, 0U);
    }
  }
}

}  // namespace
}  // namespace xquery
