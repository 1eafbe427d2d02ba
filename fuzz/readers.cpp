// XML text, read in both ways: what our reader takes, libxml2 reads as the same tree. The same of
// projections, which our reader takes where it takes the whole. The first byte chooses the options
// and the pieces in which the rest is read.
#include "Platform/Reading/TreeDifference.h"
#include "Platform/Reading/XMLDocuments.h"
#include "Platform/Reading/XMLProjection.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

using namespace xquery;

namespace {

void check(bool isRight, const char* what, const std::string& detail) {
  if (isRight) return;
  std::fprintf(stderr, "%s\n%s\n", what, detail.c_str());
  std::abort();
}

Ref<NSXMLDocument> readInPieces(std::string_view text, uint32_t options, size_t size,
                                const XMLProjection* projection = nullptr) {
  const TextInput input = [text](char* buffer, size_t most) mutable {
    const size_t count = std::min(most, text.size());
    if (count) std::memcpy(buffer, text.data(), count);
    text.remove_prefix(count);
    return static_cast<ptrdiff_t>(count);
  };
  TextSource source(input, {}, size, size);
  NSXMLParseError error;
  return readDocument(source, options, error, XMLWay::Own, projection);
}

// Nothing but the document element; what stands below it by name, with an attribute and its value.
std::array<XMLProjection, 2> projections() {
  std::array<XMLProjection, 2> all;
  XMLProjection& some = all[1];
  const auto below = some.step(XMLProjection::document, true, "b");
  some.need(below, XMLProjection::Itself);
  some.needAttribute(below, "a");
  const auto child = some.step(some.step(XMLProjection::document, false, ""), false, "a");
  some.need(child, XMLProjection::StringValue);
  return all;
}

void checkProjections(std::string_view text, uint32_t options, size_t piece, bool isTaken) {
  static const std::array<XMLProjection, 2> all = projections();
  for (const XMLProjection& projection : all) {
    NSXMLParseError error;
    TextSource source(text);
    const auto own = readDocument(source, options, error, XMLWay::Own, &projection);
    check(!own == !isTaken, "taken depends on what is made", "");
    const auto inPieces = readInPieces(text, options, piece, &projection);
    check(!inPieces == !isTaken, "taken depends on the pieces of what is made", "");
    if (!own) continue;
    TextSource again(text);
    const auto other = readDocument(again, options, error, XMLWay::LibXML, &projection);
    check(other != nullptr, "a projection is refused by libxml2", error.message);
    std::string difference = readingtest::differenceOfTrees(own.get(), other.get());
    check(difference.empty(), "a projection is read differently", difference);
    difference = readingtest::differenceOfTrees(inPieces.get(), other.get());
    check(difference.empty(), "a projection is read differently in pieces", difference);
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  if (size == 0) return 0;
  uint32_t options = 0;
  if (*data & 1U) options |= NSXMLNodePreserveWhitespace;
  if (*data & 2U) options |= NSXMLNodePreserveCDATA;
  const std::string_view text(reinterpret_cast<const char*>(data + 1), size - 1);
  NSXMLParseError error;
  TextSource source(text);
  const auto own = readDocument(source, options, error, XMLWay::Own);
  const auto inPieces = readInPieces(text, options, 1 + (*data >> 2));
  check(!own == !inPieces, "taken depends on the pieces", "");
  checkProjections(text, options, 1 + (*data >> 2), own != nullptr);
  if (!own) return 0;
  TextSource again(text);
  const auto other = readDocument(again, options, error, XMLWay::LibXML);
  check(other != nullptr, "taken but refused by libxml2", error.message);
  std::string difference = readingtest::differenceOfTrees(own.get(), other.get());
  check(difference.empty(), "read differently", difference);
  difference = readingtest::differenceOfTrees(inPieces.get(), other.get());
  check(difference.empty(), "read differently in pieces", difference);
  return 0;
}
