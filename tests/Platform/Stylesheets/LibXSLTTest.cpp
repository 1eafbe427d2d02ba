// Stylesheets and documents that would nest, work or grow without end, and the threads they run on.
#include "Platform/Base/ThreadTestSupport.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Reading/LibXMLMemory.h"
#include "Platform/Stylesheets/LibXSLT.h"
#include "Platform/Stylesheets/StylesheetTestSupport.h"
#include "xquery/Exception.h"

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <string>
#include <thread>
#include <vector>

namespace xquery {
namespace {

using namespace stylesheettest;

// --- nesting -------------------------------------------------------------------------------------

TEST(LibXSLT, EndsRecursionWithoutEnd) {
  const std::string why = applied("<a/>", stylesheet("<xsl:template match='/' name='t'>"
                                                     "<xsl:call-template name='t'/>"
                                                     "</xsl:template>"));
  EXPECT_TRUE(fails(why)) << why;
  EXPECT_TRUE(fails(applied("<a/>", stylesheet("<xsl:template match='/'><xsl:apply-templates "
                                               "select='/'/></xsl:template>"))));
  EXPECT_TRUE(fails(applied("<a/>", stylesheet("<xsl:variable name='v' select='$v'/>"
                                               "<xsl:template match='/'>"
                                               "<xsl:value-of select='$v'/></xsl:template>"))));
}

TEST(LibXSLT, RecursesAsDeepAsTemplatesMay) {
  const std::string style = stylesheet(
      "<xsl:template match='/'><xsl:call-template name='t'/></xsl:template>"
      "<xsl:template name='t'><xsl:param name='n' select='900'/><xsl:choose><xsl:when test='$n'>"
      "<a><xsl:call-template name='t'><xsl:with-param name='n' select='$n - 1'/>"
      "</xsl:call-template></a></xsl:when><xsl:otherwise><b/></xsl:otherwise></xsl:choose>"
      "</xsl:template>");
  EXPECT_EQ(applied("<a/>", style).size(), 900 * 7 + 4);
}

std::string nested(std::string_view open, std::string_view close, size_t levels,
                   std::string_view inside = "") {
  std::string text;
  for (size_t level = 0; level < levels; ++level) text += open;
  text += inside;
  for (size_t level = 0; level < levels; ++level) text += close;
  return text;
}

TEST(LibXSLT, TakesDocumentsUpToTheirBound) {
  const std::string count = root("<r><xsl:value-of select='count(//a)'/></r>");
  const size_t most = LibXSLTMostDocumentLevels;
  EXPECT_EQ(applied(nested("<a>", "</a>", most), count), "<r>10000</r>");
  EXPECT_EQ(applied(nested("<a>", "</a>", most + 1), count),
            "(none: the document nests too deeply)");
  EXPECT_EQ(applied(nested("<a>", "</a>", 1000000), count),
            "(none: the document nests too deeply)");
  EXPECT_EQ(applied(nested("<a>", "</a>", most), copyOf).size(), most * 7 - 3);
}

TEST(LibXSLT, TakesStylesheetsUpToTheirBound) {
  const auto style = [](size_t levels) { return root(nested("<a>", "</a>", levels)); };
  // Two levels are the stylesheet and the template.
  EXPECT_EQ(applied("<a/>", style(LibXSLTMostStylesheetLevels - 2)).size(),
            (LibXSLTMostStylesheetLevels - 2) * 7 - 3);
  EXPECT_TRUE(fails(applied("<a/>", style(LibXSLTMostStylesheetLevels - 1))));
  EXPECT_TRUE(fails(applied("<a/>", root(nested("<xsl:if test='1'>", "</xsl:if>", 300000)))));
  EXPECT_EQ(applied("<a/>", root(nested("<xsl:if test='1'>", "</xsl:if>", 2900, "<r/>"))), "<r/>");
}

TEST(LibXSLT, TakesExpressionsOfAnyNesting) {
  const auto select = [](const std::string& expression) {
    return applied("<a/>", root("<r><xsl:value-of select='" + expression + "'/></r>"));
  };
  EXPECT_EQ(select(nested("(", ")", 100, "1")), "<r>1</r>");
  EXPECT_TRUE(fails(select(nested("(", ")", 100000, "1"))));
  EXPECT_TRUE(fails(select(nested("a[", "]", 100000, "a"))));
  EXPECT_TRUE(fails(select(nested("1+", "", 100000, "1"))));
  EXPECT_TRUE(fails(select(nested("count(", ")", 100000, "a"))));
}

// Puts a tree into itself again and again, so that it nests by far deeper than any template.
TEST(LibXSLT, EndsTreesThatNestWithoutBound) {
  const std::string style = stylesheet(
      "<xsl:template match='/'><xsl:call-template name='t'/></xsl:template>"
      "<xsl:template name='t'><xsl:param name='v'/><xsl:param name='n' select='1000'/>"
      "<xsl:choose><xsl:when test='$n'><xsl:call-template name='t'>"
      "<xsl:with-param name='n' select='$n - 1'/><xsl:with-param name='v'>" +
      nested("<a>", "</a>", 2900, "<xsl:copy-of select='$v'/>") +
      "</xsl:with-param></xsl:call-template></xsl:when>"
      "<xsl:otherwise><xsl:copy-of select='$v'/></xsl:otherwise></xsl:choose></xsl:template>");
  EXPECT_EQ(applied("<a/>", style), "(none: the result nests too deeply)");
}

// --- limits of the evaluation --------------------------------------------------------------------

// Ends the work of its thread once that many milliseconds have passed.
class Deadline final : public WorkWatcher {
 public:
  explicit Deadline(int milliseconds)
      : _end(std::chrono::steady_clock::now() + std::chrono::milliseconds(milliseconds)) {
    workMeter.watcher = this;
  }
  ~Deadline() {
    workMeter.watcher = nullptr;
    workMeter.wasRefused = false;
    workMeter.stepsLeft = WorkMeter::manySteps;
    workMeter.mostValueBytes = INT64_MAX;
  }
  void lookAtWork() override {
    const bool isPast = std::chrono::steady_clock::now() >= _end;
    if (isPast || workMeter.wasRefused) throw NSException("ended", nullptr);
  }

 private:
  std::chrono::steady_clock::time_point _end;
};

TEST(LibXSLT, EndsAtADeadline) {
  const std::string xml = "<a>" + nested("<b/>", "", 20000) + "</a>";
  const std::string slowExpression =
      root("<r><xsl:value-of select='count(//*[count(//*[count(//*) > 0]) > 0])'/></r>");
  for (const std::string& style : {doubling(500), slowExpression}) {
    const auto doc = document(xml);
    const auto begin = std::chrono::steady_clock::now();
    const Deadline deadline(50);
    EXPECT_THROW(applied(*doc, style), NSException);
    // Either takes longer than anybody has time; how late a busy machine is does not matter here.
    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(20));
  }
}

// Takes libxslt a time in proportion to the square of the number, more than a second for 20,000, in
// one step that nothing can tell to stop.
Ref<NSXMLDocument> longTexts(size_t length) {
  return document("<a><b>" + std::string(length, 'b') + "</b><c>" + std::string(length, 'c') +
                  "</c></a>");
}
const std::string slowStep =
    root("<r><xsl:value-of select=\"string-length(translate(/a/b, /a/c, ''))\"/></r>");

TEST(LibXSLT, IsLeftBehindWhereItCannotBeStopped) {
  waitForTheLastThread();
  const auto doc = longTexts(30000);
  for (int turn = 0; turn < 2; ++turn) {
    const Deadline deadline(10);
    EXPECT_THROW(applied(*doc, slowStep), NSException);
    EXPECT_GT(threadCount(), 1) << "the call waited for the thread";
  }
  EXPECT_EQ(applied(*doc, root("<r/>")), "<r/>");
}

// What is left behind uses libraries that release what they share when the process ends.
TEST(LibXSLTDeathTest, TheProcessEndsAtOnceWhileOneIsLeftBehind) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  const auto leaveAndEnd = [] {
    const auto doc = longTexts(1'000'000);
    try {
      const Deadline deadline(10);
      applied(*doc, slowStep);
    } catch (const NSException&) {
      std::exit(0);
    }
    std::exit(1);
  };
  // To wait for it would take minutes. A busy machine can lengthen an attempt.
  auto least = std::chrono::steady_clock::duration::max();
  for (int times = 0; times < 5 && least > std::chrono::seconds(8); ++times) {
    const auto begin = std::chrono::steady_clock::now();
    EXPECT_EXIT(leaveAndEnd(), testing::ExitedWithCode(0), "^$");
    least = std::min(least, std::chrono::steady_clock::now() - begin);
  }
  EXPECT_LT(least, std::chrono::seconds(8));
}

TEST(LibXSLT, WaitsForItsTurnWhileManyAreLeftBehind) {
  waitForTheLastThread();
  const int most = LibXSLTMostLeftBehind.exchange(2);
  const auto doc = longTexts(30000);
  // On a busy machine one may come to its end before it can be left behind.
  for (int turn = 0; turn < 20 && LibXMLMemory::threadsLeftBehind() < 2; ++turn) {
    const Deadline deadline(10);
    EXPECT_THROW(applied(*doc, slowStep), NSException);
  }
  {
    const Deadline deadline(30);
    EXPECT_THROW(applied(*doc, root("<r/>")), NSException);
  }
  EXPECT_EQ(applied(*doc, root("<r/>")), "<r/>");
  LibXSLTMostLeftBehind = most;
}

TEST(LibXSLT, EndsWhereTreesTakeTooMuchMemory) {
  const std::string style = doubling(40, "<x/>");
  const auto doc = document("<a/>");
  const Deadline deadline(100000);
  workMeter.mostValueBytes = workMeter.valueBytes + (int64_t{16} << 20);
  const auto begin = std::chrono::steady_clock::now();
  EXPECT_THROW(applied(*doc, style), NSException);
  EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(20));
}

TEST(LibXSLT, RunsOnSeveralThreadsAtOnce) {
  waitForTheLastThread();
  const auto doc = document("<a><b>1</b><b>2</b></a>");
  std::vector<std::thread> threads;
  std::vector<int> wrong(4);
  for (size_t index = 0; index < wrong.size(); ++index) {
    threads.emplace_back([&wrong, &doc, index] {
      for (int turn = 0; turn < 50; ++turn) {
        const std::string name = "r" + std::to_string(index);
        const std::string made = "<" + name + ">3</" + name + ">";
        wrong[index] +=
            applied(*doc, root("<" + name + "><xsl:value-of select='sum(//b)'/></" + name + ">")) !=
            made;
        wrong[index] += !fails(applied(*doc, root("<xsl:value-of select='$" + name + "'/>")));
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(wrong, std::vector<int>(4));
}

}  // namespace
}  // namespace xquery
