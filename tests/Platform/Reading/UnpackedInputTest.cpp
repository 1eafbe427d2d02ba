#include "Platform/Reading/EndlessDocuments.h"
#include "Platform/Reading/PackedText.h"
#include "Platform/Reading/ReaderTestSupport.h"
#include "Platform/Reading/UnpackedInput.h"

#include <gtest/gtest.h>

#include <new>
#include <string>
#include <vector>

namespace xquery {
namespace {

using packing::Format;
using packing::formats;
using readingtest::Ceiling;
using readingtest::inPieces;
using readingtest::MiB;

std::string text(size_t size) {
  std::string all;
  for (size_t at = 0; all.size() < size; ++at) all += "<e>" + std::to_string(at * at) + "</e>";
  all.resize(size);
  return all;
}

// All of it; of what fails, what came before.
std::string readAll(UnpackedInput& unpacked, size_t room) {
  const TextInput input = unpacked.input();
  std::vector<char> buffer(room);
  std::string all;
  for (ptrdiff_t count = 0; (count = input(buffer.data(), room)) > 0;) {
    all.append(buffer.data(), static_cast<size_t>(count));
  }
  return all;
}

struct Reading {
  std::string text;
  std::string failure;
};

Reading readingOf(std::string_view packed, size_t piece = 65536,
                  uint64_t mostBytes = uint64_t{1} << 40) {
  UnpackedInput unpacked(inPieces(packed, piece), {}, mostBytes);
  std::string all = readAll(unpacked, 4096);
  return {all, unpacked.failure()};
}

std::string failureOf(std::string_view packed) {
  return readingOf(packed).failure;
}

// --- text --------------------------------------------------------------------------------------

TEST(UnpackedInput, IsTheTextThatWasPacked) {
  const std::string all = text(100000);
  for (const Format& format : formats) {
    const std::string packed = format.pack(all);
    for (const size_t piece : {7, 4096, 1000000}) {
      for (const size_t room : {100, 65536, 1000000}) {
        UnpackedInput unpacked(inPieces(packed, piece));
        EXPECT_TRUE(unpacked.isPacked());
        EXPECT_TRUE(readAll(unpacked, room) == all) << format.name << " " << piece << " " << room;
        ASSERT_EQ(unpacked.failure(), "");
        char byte = 0;
        EXPECT_EQ(unpacked.input()(&byte, 1), 0) << "the end stays the end";
      }
    }
  }
}

TEST(UnpackedInput, MembersOneAfterAnotherAreOneText) {
  for (const Format& format : formats) {
    const std::string nothing = format.pack("");
    const std::string packed =
        nothing + format.pack("<a>") + nothing + nothing + format.pack("x</a>") + nothing;
    for (const size_t piece : {1, 65536}) {
      EXPECT_EQ(readingOf(packed, piece).text, "<a>x</a>") << format.name;
      EXPECT_EQ(readingOf(packed, piece).failure, "") << format.name;
      EXPECT_EQ(readingOf(nothing, piece).text, "");
      EXPECT_EQ(readingOf(nothing, piece).failure, "");
    }
  }
}

TEST(UnpackedInput, ZerosMayFollowWhereTheFormatHasThem) {
  for (const Format& format : formats) {
    const std::string member = format.pack("<a/>");
    for (const size_t piece : {1, 65536}) {
      const std::string packed = member + format.padding;
      EXPECT_EQ(readingOf(packed, piece).text, "<a/>") << format.name;
      EXPECT_EQ(readingOf(packed, piece).failure, "") << format.name;
      EXPECT_EQ(readingOf(packed + member, piece).text, "<a/><a/>") << format.name;
    }
  }
  EXPECT_EQ(failureOf(packing::xz("<a/>") + std::string(5, '\0')),
            "the xz data is followed by something else");
  EXPECT_EQ(failureOf(packing::bzip2("<a/>") + std::string(4, '\0')),
            "the bzip2 data is followed by something else");
}

TEST(UnpackedInput, FramesThatAreToBeSkippedAreNone) {
  const std::string skipped("\x53\x2A\x4D\x18\x03\0\0\0abc", 11);
  EXPECT_EQ(readingOf(skipped + packing::zstd("<a/>") + skipped).text, "<a/>");
  EXPECT_EQ(failureOf(skipped + packing::zstd("<a/>") + skipped), "");
}

TEST(UnpackedInput, PlainTextIsHandedOnAsItComes) {
  const std::string all = text(1000);
  std::vector<const char*> asked;
  const TextInput pieces = inPieces(all, 1);
  UnpackedInput plain([&](char* buffer, size_t size) {
    asked.push_back(buffer);
    return pieces(buffer, size);
  });
  EXPECT_FALSE(plain.isPacked());
  EXPECT_EQ(asked.size(), 1U) << "the first byte tells";
  EXPECT_FALSE(plain.rewinding());
  const TextInput input = plain.input();
  char buffer[16];
  EXPECT_EQ(input(buffer, sizeof buffer), 1);
  EXPECT_EQ(buffer[0], all[0]);
  EXPECT_EQ(input(buffer, sizeof buffer), 1);
  EXPECT_EQ(buffer[0], all[1]);
  EXPECT_EQ(asked.back(), buffer);
  EXPECT_EQ(readAll(plain, 7), all.substr(2));
}

TEST(UnpackedInput, TextsThatAreShorterThanAnyStartArePlain) {
  for (const std::string_view all : {"", "<", "\x1F", "\x1F\x8B", "\xFD", "BZh"}) {
    for (const size_t piece : {1, 100}) {
      UnpackedInput plain(inPieces(all, piece));
      EXPECT_FALSE(plain.isPacked());
      EXPECT_EQ(readAll(plain, 64), all);
    }
  }
}

// --- once more ---------------------------------------------------------------------------------

TEST(UnpackedInput, IsReadAgainWhetherOrNotTheInputCanBe) {
  const std::string all = text(60000);
  for (const Format& format : formats) {
    const std::string packed = format.pack(all.substr(0, 1000)) + format.pack(all.substr(1000));
    TextInput file = inPieces(packed, 5000);
    const TextRewinding rewind = [&] {
      file = inPieces(packed, 5000);
      return true;
    };
    for (const bool isFile : {true, false}) {
      rewind();
      UnpackedInput unpacked([&](char* buffer, size_t size) { return file(buffer, size); },
                             isFile ? rewind : TextRewinding());
      for (const size_t before : {0, 300, 30000, 60000, 0}) {
        char byte = 0;
        for (size_t at = 0; at < before; ++at) ASSERT_EQ(unpacked.input()(&byte, 1), 1);
        ASSERT_TRUE(unpacked.rewinding()());
        EXPECT_TRUE(readAll(unpacked, 4096) == all) << format.name << " " << before;
        ASSERT_TRUE(unpacked.rewinding()());
      }
    }
  }
}

TEST(UnpackedInput, PlainFilesAreReadAgain) {
  TextInput file = inPieces("<a/>", 1);
  UnpackedInput plain([&](char* buffer, size_t size) { return file(buffer, size); },
                      [&] {
                        file = inPieces("<b/>", 100);
                        return true;
                      });
  EXPECT_EQ(readAll(plain, 10), "<a/>");
  ASSERT_TRUE(plain.rewinding()());
  EXPECT_EQ(readAll(plain, 10), "<b/>");
}

// --- bad bytes ---------------------------------------------------------------------------------

TEST(UnpackedInput, WhatIsCutShortFailsBehindItsText) {
  const std::string all = text(200);
  for (const Format& format : formats) {
    const std::string packed = format.pack(all);
    const std::string expected = std::string("the ") + format.name + " data ends too soon";
    for (size_t length = longestPackedStart; length < packed.size(); ++length) {
      const Reading cut = readingOf(std::string_view(packed).substr(0, length));
      EXPECT_EQ(cut.failure, expected) << length;
      EXPECT_TRUE(all.starts_with(cut.text)) << format.name << " " << length;
    }
    EXPECT_EQ(failureOf(packed + packed.substr(0, packed.size() / 2)), expected);
  }
}

TEST(UnpackedInput, AByteThatChangedIsFoundOrDoesNotMatter) {
  const std::string all = text(200);
  for (const Format& format : formats) {
    const std::string packed = format.pack(all);
    size_t found = 0;
    for (size_t at = longestPackedStart; at < packed.size(); ++at) {
      std::string damaged = packed;
      damaged[at] = static_cast<char>(damaged[at] ^ 0x11);
      const Reading reading = readingOf(damaged);
      EXPECT_TRUE(!reading.failure.empty() || reading.text == all) << format.name << " " << at;
      if (reading.failure == std::string("the ") + format.name + " data is damaged") ++found;
    }
    EXPECT_GT(found, packed.size() / 2) << format.name;
  }
}

TEST(UnpackedInput, WhatFollowsMustBeMoreOfTheSame) {
  for (const Format& format : formats) {
    const std::string member = format.pack("<a/>");
    const std::string expected =
        std::string("the ") + format.name + " data is followed by something else";
    for (const Format& other : formats) {
      if (&other == &format) continue;
      EXPECT_EQ(failureOf(member + other.pack("<b/>")), expected) << other.name;
    }
    for (const std::string garbage : {"x", "<b/>", "several bytes that are no packed text"}) {
      EXPECT_EQ(failureOf(member + garbage), expected) << garbage;
      EXPECT_EQ(readingOf(member + garbage).text, "<a/>");
    }
  }
}

TEST(UnpackedInput, AnInputThatFailsIsNoFaultOfThePackedBytes) {
  const std::string packed = packing::gzip(text(100000));
  for (const size_t most : {size_t{0}, size_t{5}, packed.size() / 2, packed.size()}) {
    UnpackedInput unpacked([&, at = size_t{0}](char* buffer, size_t) mutable -> ptrdiff_t {
      if (at == most) return -1;
      *buffer = packed[at++];
      return 1;
    });
    char buffer[1000];
    ptrdiff_t count = 0;
    while ((count = unpacked.input()(buffer, sizeof buffer)) > 0) continue;
    EXPECT_LT(count, 0) << most;
    EXPECT_EQ(unpacked.failure(), "");
  }
}

// --- limits ------------------------------------------------------------------------------------

TEST(UnpackedInput, MoreTextThanAllowedIsRefused) {
  const std::string all = text(100000);
  for (const Format& format : formats) {
    const std::string packed = format.pack(all);
    EXPECT_EQ(readingOf(packed, 4096, all.size()).failure, "");
    EXPECT_EQ(readingOf(packed, 4096, all.size() - 1).failure,
              std::string("the ") + format.name + " data unpacks to too much text");
  }
}

TEST(UnpackedInput, TextOutOfAllProportionIsRefused) {
  constexpr size_t memberBytes = size_t{16} << 20;
  const std::string member = packing::zstd(std::string(memberBytes, ' '));
  ASSERT_GT(memberBytes, 2 * UnpackedInput::mostRatio * member.size());
  constexpr size_t most = UnpackedInput::bytesAtAnyRatio / memberBytes;
  std::string packed;
  for (size_t index = 0; index < most; ++index) packed += member;
  const auto lengthOf = [](std::string_view bytes, std::string& failure) {
    UnpackedInput unpacked(inPieces(bytes, 1000));
    std::vector<char> buffer(1 << 16);
    uint64_t length = 0;
    for (ptrdiff_t count = 0; (count = unpacked.input()(buffer.data(), buffer.size())) > 0;) {
      length += static_cast<uint64_t>(count);
    }
    failure = unpacked.failure();
    return length;
  };
  std::string failure;
  EXPECT_EQ(lengthOf(packed, failure), UnpackedInput::bytesAtAnyRatio);
  EXPECT_EQ(failure, "");
  EXPECT_LE(lengthOf(packed + member, failure), UnpackedInput::bytesAtAnyRatio);
  EXPECT_EQ(failure, "the zstd data unpacks to too much text");
}

// Bytes of the header that say how much memory unpacking takes, changed to an amount that packing
// would need far more for.
std::string xzWithWindow(std::string_view all, char size) {
  std::string packed = packing::xz(all);
  constexpr size_t header = 12;  // of the stream
  const size_t length = (static_cast<unsigned char>(packed[header]) + size_t{1}) * 4;
  packed[header + 4] = size;
  const uint32_t check =
      lzma_crc32(reinterpret_cast<const uint8_t*>(packed.data()) + header, length - 4, 0);
  std::memcpy(packed.data() + header + length - 4, &check, 4);
  return packed;
}
std::string zstdWithWindow(std::string_view all, int bits) {
  std::string packed = packing::zstd(all);
  packed[5] = static_cast<char>((bits - 10) << 3);
  return packed;
}

TEST(UnpackedInput, TakesNoMoreMemoryThanItMay) {
  constexpr char oneGiB = 36, sixteenMiB = 24, sixtyFourMiB = 28;
  const std::string all = text(1000);
  EXPECT_EQ(failureOf(xzWithWindow(all, oneGiB)), "the xz data takes too much memory to unpack");
  EXPECT_EQ(failureOf(zstdWithWindow(all, 30)), "the zstd data takes too much memory to unpack");
  EXPECT_EQ(readingOf(xzWithWindow(all, sixtyFourMiB)).text, all);
  EXPECT_EQ(readingOf(zstdWithWindow(all, 27)).text, all);

  const int64_t before = workMeter.valueBytes;
  {
    const Ceiling watching(32 * MiB);
    EXPECT_EQ(readingOf(xzWithWindow(all, sixteenMiB)).text, all);
    EXPECT_EQ(readingOf(zstdWithWindow(all, 24)).text, all);
  }
  for (const std::string& packed : {xzWithWindow(all, sixtyFourMiB), zstdWithWindow(all, 26)}) {
    const Ceiling watching(32 * MiB);
    EXPECT_THROW(readingOf(packed), std::bad_alloc);
    EXPECT_TRUE(workMeter.wasRefused);
  }
  EXPECT_EQ(workMeter.valueBytes, before);
}

TEST(UnpackedInput, MayBeReadByAThreadThatGaveBackMoreMemoryThanItTook) {
  constexpr size_t bytes = size_t{1} << 40;
  uncountValueBytes(bytes);
  EXPECT_EQ(readingOf(packing::xz("<a/>")).text, "<a/>");
  EXPECT_EQ(readingOf(packing::zstd("<a/>")).text, "<a/>");
  countValueBytes(bytes);
}

TEST(UnpackedInput, CountsTheMemoryThatItTakes) {
  for (const Format& format : formats) {
    const std::string packed = format.pack(text(100000));
    const int64_t before = workMeter.valueBytes;
    {
      UnpackedInput unpacked(inPieces(packed, 1000));
      char byte = 0;
      ASSERT_EQ(unpacked.input()(&byte, 1), 1);
      EXPECT_GT(workMeter.valueBytes, before + 40000) << format.name;
    }
    EXPECT_EQ(workMeter.valueBytes, before) << format.name;
  }
}

TEST(UnpackedInput, EndsAtAnyLook) {
  const std::string spaces(size_t{2} << 20, ' ');
  for (const Format& format : formats) {
    std::string nothing;
    for (int member = 0; member < 1000; ++member) nothing += format.pack("");
    for (const std::string& packed : {format.pack(spaces), nothing}) {
      const int64_t before = workMeter.valueBytes;
      for (const int look : {0, 1, 20}) {
        const LookCounter looks(look);
        EXPECT_THROW(readingOf(packed), Ended) << format.name << " " << look;
      }
      EXPECT_EQ(workMeter.valueBytes, before) << format.name;
    }
  }
}

}  // namespace
}  // namespace xquery
