#include "Platform/Reading/ByteMarks.h"
#include "Platform/Reading/VectorCode.h"

#include <gtest/gtest.h>

#include <array>
#include <cstring>
#include <string_view>
#include <vector>

namespace xquery {
namespace {

constexpr size_t blocks = 4;
using Bytes = std::array<char, blocks * bytesPerMarks>;
using Marks = std::array<ByteMarks, blocks>;

bool isControl(unsigned char byte) {
  return byte < 0x20;
}

// What the marks stand for, byte by byte.
ByteMarks markOf(unsigned char byte) {
  const auto is = [byte](std::string_view some) {
    return byte < 0x80 && some.find(static_cast<char>(byte)) != some.npos;
  };
  const bool isLine = byte == '\t' || byte == '\n';
  return {(isControl(byte) && !isLine) || is("<&>"), isControl(byte) || is("<&>\"'"),
          isControl(byte) || is(" =/<>"), byte >= 0x80};
}

bool isBit(uint64_t marks, size_t index) {
  return (marks >> index & 1U) != 0;
}

void expectMarks(const Bytes& bytes, const Marks& marks) {
  for (size_t at = 0; at < bytes.size(); ++at) {
    const ByteMarks& found = marks[at / bytesPerMarks];
    const size_t index = at % bytesPerMarks;
    const ByteMarks expected = markOf(static_cast<unsigned char>(bytes[at]));
    EXPECT_EQ(isBit(found.text, index), expected.text) << at;
    EXPECT_EQ(isBit(found.value, index), expected.value) << at;
    EXPECT_EQ(isBit(found.name, index), expected.name) << at;
    EXPECT_EQ(isBit(found.wide, index), expected.wide) << at;
  }
}

using Marking = void (*)(const char*, size_t, ByteMarks*);

// Whatever vectors the processor has.
std::vector<Marking> allWays() {
  std::vector<Marking> ways = {markBytes, markBytesPlainly};
  for (const VectorCode& code : vectorCodes()) ways.push_back(code.mark);
  return ways;
}

TEST(ByteMarks, EveryByteIsMarkedForWhatItMayEnd) {
  for (const Marking mark : allWays()) {
    Bytes bytes;
    for (size_t at = 0; at < bytes.size(); ++at) bytes[at] = static_cast<char>(at);
    Marks marks;
    mark(bytes.data(), blocks, marks.data());
    expectMarks(bytes, marks);
  }
}

TEST(ByteMarks, TheSameInEveryPlace) {
  for (const Marking mark : allWays()) {
    for (size_t shift = 1; shift < bytesPerMarks; ++shift) {
      Bytes bytes;
      for (size_t at = 0; at < bytes.size(); ++at) bytes[at] = static_cast<char>(at * 7 + shift);
      Marks marks;
      mark(bytes.data(), blocks, marks.data());
      expectMarks(bytes, marks);
    }
  }
}

TEST(ByteMarks, OnlySoManyAreWritten) {
  for (const Marking mark : allWays()) {
    const Bytes bytes = {};
    Marks marks = {};
    mark(bytes.data(), 2, marks.data());
    EXPECT_EQ(marks[1].text, ~uint64_t{0});
    EXPECT_EQ(marks[2].text, 0U);
  }
}

}  // namespace
}  // namespace xquery
