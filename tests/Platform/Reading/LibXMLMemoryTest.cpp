// What libxml2 takes while it reads counts like memory of our own.
#include "Platform/Base/Abandoned.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Reading/IgnorantHandler.h"
#include "Platform/Reading/LibXML.h"
#include "Platform/Reading/LibXMLMemory.h"
#include "xquery/XMLNode.h"

#include <gtest/gtest.h>
#include <libxml/xmlerror.h>
#include <libxml/xmlmemory.h>

#include <algorithm>
#include <functional>
#include <span>
#include <string>
#include <thread>

namespace xquery {
namespace {

using readingtest::IgnorantHandler;

constexpr int64_t MiB = int64_t{1} << 20;

struct Ended {};

// Ends the work of the thread at a look where its values take more than they may, and notes the
// most that it has seen.
class Ceiling final : public WorkWatcher {
 public:
  explicit Ceiling(int64_t bytes) : _start(workMeter.valueBytes), _outer(workMeter) {
    workMeter.watcher = this;
    workMeter.stepsLeft = 0;
    workMeter.mostValueBytes = _start + bytes;
  }
  ~Ceiling() {
    workMeter.watcher = _outer.watcher;
    workMeter.stepsLeft = _outer.stepsLeft;
    workMeter.mostValueBytes = _outer.mostValueBytes;
    workMeter.wasRefused = _outer.wasRefused;
  }
  void lookAtWork() override {
    workMeter.stepsLeft = 1024;
    _most = std::max(_most, workMeter.valueBytes - _start);
    if (workMeter.valueBytes > workMeter.mostValueBytes) throw Ended();
  }
  int64_t most() const { return _most; }

 private:
  const int64_t _start;
  int64_t _most = 0;
  const WorkMeter _outer;
};

// A document that begins and then goes on without end.
struct Endless {
  const char* what;
  std::string beginning;
  std::function<std::string(size_t)> part;
};

std::string name(size_t index) {
  return "n" + std::to_string(index);
}

const Endless endless[] = {
    {"an attribute's value", "<a b='", [](size_t) { return std::string(1000, 'c'); }},
    {"a comment", "<a><!--", [](size_t) { return std::string(1000, 'c'); }},
    {"an instruction", "<a><?b ", [](size_t) { return std::string(1000, 'c'); }},
    {"a section", "<a><![CDATA[", [](size_t) { return std::string(1000, ']'); }},
    {"the text of an entity", "<!DOCTYPE a [<!ENTITY b '",
     [](size_t) { return std::string(1000, 'c'); }},
    {"entities", "<!DOCTYPE a [",
     [](size_t index) { return "<!ENTITY " + name(index) + " 'text'>"; }},
    {"names of elements", "<a>", [](size_t index) { return "<" + name(index) + "/>"; }},
    {"names of attributes", "<a>", [](size_t index) { return "<b " + name(index) + "='c'/>"; }},
    {"levels", "<a>", [](size_t) { return "<b>"; }},
    {"levels of namespaces", "<a>",
     [](size_t index) { return "<b xmlns:" + name(index) + "='u'>"; }},
};

// Whether it was ended before so much had been read.
bool isEnded(const Endless& document, int64_t ceiling, size_t mostRead) {
  size_t parts = 0;
  size_t bytes = 0;
  std::string held = document.beginning;
  const LibXMLReader read = [&](char* buffer, size_t size) -> ptrdiff_t {
    if (bytes > mostRead) return -1;
    while (held.size() < size) held += document.part(parts++);
    const size_t count = held.copy(buffer, size);
    held.erase(0, count);
    bytes += count;
    return static_cast<ptrdiff_t>(count);
  };
  const Ceiling watching(ceiling);
  IgnorantHandler handler;
  NSXMLParseError error;
  try {
    static_cast<void>(parseWithLibXML(read, handler, error));
  } catch (const Ended&) {
    return true;
  }
  ADD_FAILURE() << document.what << ": " << error.message;
  return false;
}

TEST(LibXMLMemory, CountsWhileADocumentIsRead) {
  for (const Endless& document : endless) {
    const int64_t before = workMeter.valueBytes;
    EXPECT_TRUE(isEnded(document, 4 * MiB, size_t{16} << 20)) << document.what;
    EXPECT_EQ(workMeter.valueBytes, before) << document.what;
  }
}

// The last of them go on in small blocks; one large block goes at once.
TEST(LibXMLMemory, WhatAnEndedParserHasIsFreedByAnotherThreadAndCountedUntilThen) {
  waitForAbandonedValues();
  settleAbandonedValues();
  for (const Endless& document : std::span(endless).last(5)) {
    const int64_t before = workMeter.valueBytes;
    {
      AbandonedValues abandoned;
      abandonedValues = &abandoned;
      EXPECT_TRUE(isEnded(document, 2 * MiB, size_t{16} << 20)) << document.what;
      abandonedValues = nullptr;
      EXPECT_GE(workMeter.valueBytes, before + 3 * MiB / 2) << document.what;
    }
    waitForAbandonedValues();
    settleAbandonedValues();
    EXPECT_EQ(workMeter.valueBytes, before) << document.what;
  }
}

// libxml2 keeps the last error of a thread, and with it the text that was at fault.
TEST(LibXMLMemory, IsGivenBackWhereADocumentFails) {
  for (const std::string beginning : {"<a><![CDATA[", "<a><!--", "<a b='", "<a><?b "}) {
    EXPECT_FALSE(NSXMLDocument::documentWithData(beginning + std::string(MiB, 'c'), 0));
    const xmlError* const last = xmlGetLastError();
    EXPECT_TRUE(!last || !last->str1) << beginning;
  }
}

TEST(LibXMLMemory, TextThatIsNotYetANodeCounts) {
  const std::string text = "<a>" + std::string(8 * MiB, 'b') + "</a>";
  const Ceiling watching(1024 * MiB);
  EXPECT_TRUE(NSXMLDocument::documentWithData(text, 0));
  EXPECT_GE(watching.most(), 7 * MiB);
}

TEST(LibXMLMemory, RoomForTextIsCountedBeforeItIsTaken) {
  const std::string text = "<a>" + std::string(6 * MiB, 'b') + "</a>";
  const Ceiling watching(3 * MiB);
  EXPECT_FALSE(NSXMLDocument::documentWithData(text, 0));
  EXPECT_TRUE(workMeter.wasRefused);
  EXPECT_LE(watching.most(), 3 * MiB);
}

TEST(LibXMLMemory, IsOfTheThreadThatReads) {
  const int64_t before = workMeter.valueBytes;
  LibXMLMemory::begin();
  const LibXMLValueBytes counted;
  std::thread([] { xmlFree(xmlMalloc(1000)); }).join();
  void* const given = xmlMalloc(1000);
  EXPECT_GE(workMeter.valueBytes, before + 1000);
  EXPECT_LE(workMeter.valueBytes, before + 1100);
  {
    const LibXMLValueBytes inner;
    xmlFree(xmlRealloc(xmlMalloc(1000), 3000));
    EXPECT_LE(workMeter.valueBytes, before + 1100);
  }
  void* const larger = xmlRealloc(given, 5000);
  EXPECT_GE(workMeter.valueBytes, before + 5000);
  xmlFree(larger);
  EXPECT_EQ(workMeter.valueBytes, before);
}

}  // namespace
}  // namespace xquery
