// Documents read in both ways.
#pragma once

#include "Platform/Reading/TreeDifference.h"
#include "Platform/Reading/XMLDocuments.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <string>
#include <string_view>

namespace xquery::readingtest {

constexpr uint32_t allOptions[] = {
    0,
    NSXMLNodePreserveWhitespace,
    NSXMLNodePreserveCDATA,
    NSXMLNodePreserveWhitespace | NSXMLNodePreserveCDATA,
};

// Of a text that stays, as many bytes at a time.
inline TextInput inPieces(std::string_view text, size_t size) {
  return [text, size](char* buffer, size_t most) mutable {
    const size_t count = std::min({most, size, text.size()});
    if (count) std::memcpy(buffer, text.data(), count);
    text.remove_prefix(count);
    return static_cast<ptrdiff_t>(count);
  };
}

inline Ref<NSXMLDocument> read(std::string_view text, XMLWay way,
                               uint32_t options = NSXMLNodePreserveWhitespace) {
  TextSource source(text);
  NSXMLParseError error;
  return readDocument(source, options, error, way);
}

// With windows and pieces of such a size.
inline Ref<NSXMLDocument> readInPieces(std::string_view text, size_t size,
                                       uint32_t options = NSXMLNodePreserveWhitespace) {
  TextSource source(inPieces(text, size), {}, size, size);
  NSXMLParseError error;
  return readDocument(source, options, error, XMLWay::Own);
}

// Whether our reader takes the text; if it does, libxml2 makes the same of it.
inline bool isTakenWith(uint32_t options, std::string_view text) {
  const auto own = read(text, XMLWay::Own, options);
  if (!own) return false;
  const auto other = read(text, XMLWay::LibXML, options);
  EXPECT_TRUE(other) << "libxml2 refuses " << text;
  if (other) {
    EXPECT_EQ(differenceOfTrees(own.get(), other.get()), "") << text;
  }
  return true;
}
inline bool isTaken(std::string_view text) {
  bool isTaken = false;
  for (const uint32_t options : allOptions) isTaken = isTakenWith(options, text);
  return isTaken;
}

// Whether libxml2 does.
inline bool isRefused(std::string_view text) {
  return !read(text, XMLWay::LibXML);
}

}  // namespace xquery::readingtest
