#include "xquery/LimitedWork.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <sys/mman.h>
#include <unistd.h>

namespace xquery {
namespace {

using Milliseconds = std::chrono::milliseconds;

std::string messageOf(const Ref<XQueryError>& error) {
  return error ? std::to_string(error->err()) + " " + error->msg()->utf8() : "none";
}

std::string longDocument() {
  std::string text = "<a>";
  for (int n = 0; n < 2'000'000; ++n) text += "<b c='1'/>";
  return text + "</a>";
}

TEST(LimitedWork, ThatIsDoneGivesNoError) {
  Ref<NSXMLDocument> document;
  EXPECT_FALSE(XQueryWithinLimits(
      {}, [&] { document = NSXMLDocument::documentWithData("<a/>", NSXMLNodeOptionsNone); }));
  EXPECT_TRUE(document);
}

TEST(LimitedWork, EndsReadingAtEachLimit) {
  const std::string text = longDocument();
  Ref<NSXMLDocument> document;
  const auto readWithin = [&](const XQueryLimits& limits) {
    document = nullptr;
    return messageOf(XQueryWithinLimits(
        limits, [&] { document = NSXMLDocument::documentWithData(text, NSXMLNodeOptionsNone); }));
  };
  XQueryLimits time;
  time.duration = Milliseconds(5);
  EXPECT_EQ(readWithin(time), "0 limit: deadline passed");
  EXPECT_FALSE(document);
  XQueryLimits memory;
  memory.memoryCeiling = uint64_t{4} << 20;
  EXPECT_EQ(readWithin(memory), "0 limit: memory ceiling reached");
  EXPECT_FALSE(document);
  XQueryLimits flag;
  flag.cancelled = std::make_shared<std::atomic<bool>>(true);
  EXPECT_EQ(readWithin(flag), "0 limit: evaluation cancelled") << "at once";
}

// The flag is raised once a first piece has been read.
TEST(LimitedWork, EndsReadingAFileWhenItIsCancelled) {
  const std::string text = longDocument();
  const int file = ::memfd_create("document", MFD_CLOEXEC);
  ASSERT_GE(file, 0);
  ASSERT_EQ(::write(file, text.data(), text.size()), static_cast<ssize_t>(text.size()));
  ASSERT_EQ(::lseek(file, 0, SEEK_SET), 0);
  XQueryLimits limits;
  limits.cancelled = std::make_shared<std::atomic<bool>>(false);
  uint64_t bytesRead = 0;
  const auto progress = [&](uint64_t bytes, uint64_t) {
    bytesRead = bytes;
    limits.cancelled->store(true);
  };
  const auto error = XQueryWithinLimits(limits, [&] {
    static_cast<void>(NSXMLDocument::documentWithFile("/proc/self/fd/" + std::to_string(file),
                                                      NSXMLNodeOptionsNone, nullptr, progress));
  });
  ::close(file);
  EXPECT_EQ(messageOf(error), "0 limit: evaluation cancelled");
  EXPECT_GT(bytesRead, 0u);
  EXPECT_LT(bytesRead, text.size());
}

TEST(LimitedWork, PassesOnWhatTheWorkThrows) {
  EXPECT_THROW((void)XQueryWithinLimits({}, [] { throw std::runtime_error("mine"); }),
               std::runtime_error);
}

TEST(LimitedWork, InsideOtherWorkEndsAtTheLimitsOfBoth) {
  XQueryLimits outer;
  outer.duration = Milliseconds(0);
  Ref<XQueryError> inside;
  bool isReached = false;
  const auto error = XQueryWithinLimits(outer, [&] { isReached = true; });
  EXPECT_FALSE(isReached);
  EXPECT_EQ(messageOf(error), "0 limit: deadline passed");
  XQueryLimits inner;
  inner.duration = Milliseconds(0);
  EXPECT_FALSE(XQueryWithinLimits({}, [&] { inside = XQueryWithinLimits(inner, [] {}); }));
  EXPECT_EQ(messageOf(inside), "0 limit: deadline passed");
}

}  // namespace
}  // namespace xquery
