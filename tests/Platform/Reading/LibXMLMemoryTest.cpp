// What libxml2 takes while it reads counts like memory of our own.
#include "Platform/Base/Abandoned.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Reading/EndlessDocuments.h"
#include "Platform/Reading/IgnorantHandler.h"
#include "Platform/Reading/LibXML.h"
#include "Platform/Reading/LibXMLMemory.h"
#include "xquery/XMLNode.h"

#include <gtest/gtest.h>
#include <libxml/xmlerror.h>
#include <libxml/xmlmemory.h>

#include <span>
#include <string>
#include <thread>

namespace xquery {
namespace {

using readingtest::Ceiling;
using readingtest::Endless;
using readingtest::endless;
using readingtest::IgnorantHandler;
using readingtest::MiB;

// Whether it was ended before so much had been read.
bool isEnded(const Endless& document, int64_t ceiling, size_t mostRead) {
  const Ceiling watching(ceiling);
  IgnorantHandler handler;
  NSXMLParseError error;
  try {
    static_cast<void>(parseWithLibXML(inputOf(document, mostRead), handler, error));
  } catch (const Ended&) {
    return true;
  }
  ADD_FAILURE() << document.what << ": " << error.message;
  return false;
}

TEST(LibXMLMemory, CountsWhileADocumentIsRead) {
  for (const Endless& document : endless) {
    const int64_t before = workMeter.valueBytes;
    EXPECT_TRUE(isEnded(document, 2 * MiB, size_t{16} << 20)) << document.what;
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
