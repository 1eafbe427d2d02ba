// xquery --split.
#include "cli/Command.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <string>
#include <vector>

using command::Outcome;
using command::readFile;
using command::shell;
using command::TemporaryDirectory;
using command::waitUntil;
using command::xquery;
using testing::HasSubstr;
using testing::StartsWith;

namespace {

using Texts = std::vector<std::string>;

// The text of every file of the folder, by name.
Texts piecesIn(const std::string& folder) {
  Texts paths, texts;
  for (const auto& entry : std::filesystem::directory_iterator(folder)) {
    paths.push_back(entry.path().string());
  }
  std::sort(paths.begin(), paths.end());
  for (const std::string& path : paths) texts.push_back(readFile(path));
  return texts;
}

const std::string declaration = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n";

Outcome split(const std::string& path, const std::string& records, const std::string& input,
              const std::string& folder, const std::string& text = "", const Texts& options = {}) {
  Texts arguments = options;
  arguments.insert(arguments.end(), {"--split", path, "--records", records, input, folder});
  return xquery(arguments, text);
}

// What becomes of a text.
Texts pieces(const std::string& path, const std::string& records, const std::string& text,
             const Texts& options = {}) {
  const TemporaryDirectory directory;
  const std::string folder = directory.path("parts");
  const Outcome outcome = split(path, records, "-", folder, text, options);
  EXPECT_EQ(outcome.status, 0) << outcome.err;
  EXPECT_EQ(outcome.err, "");
  return piecesIn(folder);
}

TEST(SplitCommand, WritesSoManyRecordsIntoEachPieceAndNamesIt) {
  const TemporaryDirectory directory;
  const std::string folder = directory.path("made/by it");
  const std::string input = directory.write("a.xml", "<a><b>1</b>x<b>2</b><c/><b>3</b></a>");
  const Outcome outcome = split("/a/b", "2", input, folder);
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.err, "");
  EXPECT_EQ(outcome.out, folder + "/part-00000001.xml\n" + folder + "/part-00000002.xml\n");
  EXPECT_EQ(piecesIn(folder), (Texts{declaration + "<a>\n<b>1</b>\n<b>2</b>\n</a>\n",
                                     declaration + "<a>\n<b>3</b>\n</a>\n"}));
}

TEST(SplitCommand, KeepsTheStartTagsAroundRecords) {
  EXPECT_EQ(
      pieces("/p:a/q:b/r", "1",
             "<!DOCTYPE p:a [<!ATTLIST r kind CDATA 'k'>]><!--c-->"
             "<p:a xmlns:p='u' one='1 &lt; 2' p:two='&#10;'>"
             "<q:b xmlns:q='v' xmlns='w'><r xmlns=''>1<p:s/></r></q:b>"
             "<q:b xmlns:q='v' lang='&quot;'><r q:x='2'/></q:b></p:a>",
             {"--namespace", "p=u", "--namespace", "q=v"}),
      (Texts{declaration + "<p:a xmlns:p=\"u\" one=\"1 &lt; 2\" p:two=\"&#xA;\">\n"
                           "<q:b xmlns:q=\"v\" xmlns=\"w\">\n<r xmlns=\"\" kind=\"k\">1<p:s/></r>\n"
                           "</q:b>\n</p:a>\n",
             declaration + "<p:a xmlns:p=\"u\" one=\"1 &lt; 2\" p:two=\"&#xA;\">\n"
                           "<q:b xmlns:q=\"v\" lang=\"&quot;\">\n<r q:x=\"2\" kind=\"k\"/>\n"
                           "</q:b>\n</p:a>\n"}));
}

// Elements that look alike are still two, with records of both or none in between.
TEST(SplitCommand, TellsTheElementsAroundRecordsApart) {
  EXPECT_EQ(pieces("/a/b/c", "9", "<a><b><c/><x/><c/></b><b/><b><c/></b><d><c/></d></a>"),
            (Texts{declaration + "<a>\n<b>\n<c/>\n<c/>\n</b>\n<b>\n<c/>\n</b>\n</a>\n"}));
  EXPECT_EQ(pieces("/a/*/c", "9", "<a><b><c/></b><d><c/></d></a>"),
            (Texts{declaration + "<a>\n<b>\n<c/>\n</b>\n<d>\n<c/>\n</d>\n</a>\n"}));
  EXPECT_EQ(pieces("//c", "3", "<a><b><c/></b><b><d><c/></d><c/></b><c/></a>"),
            (Texts{declaration + "<a>\n<b>\n<c/>\n</b>\n<b>\n<d>\n<c/>\n</d>\n<c/>\n</b>\n</a>\n",
                   declaration + "<a>\n<c/>\n</a>\n"}));
}

TEST(SplitCommand, TakesWhatThePathGives) {
  const std::string text = "<a><b i='1'><c>1</c><c>2</c></b><b/><b i='3'><c>3</c></b></a>";
  EXPECT_EQ(pieces("/a/b[@i > 1]", "5", text),
            Texts{declaration + "<a>\n<b i=\"3\"><c>3</c></b>\n</a>\n"});
  EXPECT_EQ(pieces("/a/b/c", "2", text),
            (Texts{declaration + "<a>\n<b i=\"1\">\n<c>1</c>\n<c>2</c>\n</b>\n</a>\n",
                   declaration + "<a>\n<b i=\"3\">\n<c>3</c>\n</b>\n</a>\n"}));
  EXPECT_EQ(pieces("/a/none", "1", text), Texts{});
  EXPECT_EQ(pieces("declare variable $i external; /a/b[@i = $i]", "1", text, {"--var", "i=3"}),
            Texts{declaration + "<a>\n<b i=\"3\"><c>3</c></b>\n</a>\n"});
}

// A record within a record is in a piece once.
TEST(SplitCommand, WritesNothingTwice) {
  EXPECT_EQ(pieces("//b", "1", "<a><b>1<b>2</b></b><b><c><b/></c></b></a>"),
            (Texts{declaration + "<a>\n<b>1<b>2</b></b>\n</a>\n",
                   declaration + "<a>\n<b><c><b/></c></b>\n</a>\n"}));
}

// A look at all that is above each of them would take minutes.
TEST(SplitCommand, PassesOverElementsWithinARecordHoweverDeepTheyAre) {
  constexpr size_t depth = 200'000;
  std::string begin, end;
  for (size_t i = 0; i < depth; ++i) begin += "<b>", end += "</b>";
  const std::string record = begin + "x" + end;
  const std::string text = "<a>" + record + "<b/></a>";
  EXPECT_EQ(pieces("//b", "5", text, {"--timeout", "20"}),
            (Texts{declaration + "<a>\n" + record + "\n<b/>\n</a>\n"}));
}

TEST(SplitCommand, WritesNoOtherThingsThanElementsOfTheDocument) {
  const std::string text = "<a><b i='1'/></a>";
  for (const auto& [path, type] :
       {std::pair{"/a/b/@i", "attribute()"}, std::pair{"count(/a/b)", "xs:integer"},
        std::pair{"for $b in /a/b return document { $b }", "document-node()"}}) {
    const TemporaryDirectory directory;
    const Outcome outcome = split(path, "1", "-", directory.path("parts"), text);
    EXPECT_EQ(outcome.status, 1) << path;
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(outcome.err, "xquery: --split: the path gives an item of type " + std::string(type) +
                               ", which is no element\n");
    EXPECT_EQ(piecesIn(directory.path("parts")), Texts{});
  }
  const TemporaryDirectory directory;
  const std::string loaded = "doc('" + directory.write("other.xml", "<a><b/></a>") + "')/a/b";
  for (const std::string& made :
       {std::string("<c/>"), std::string("document { <c/> }/c"), loaded}) {
    const std::string folder = directory.path("made" + std::to_string(made.size()));
    const Outcome outcome = split("for $b in /a/b return " + made, "1", "-", folder, text);
    EXPECT_EQ(outcome.err,
              "xquery: --split: the path gives an element that is not the document's\n")
        << made;
    EXPECT_EQ(piecesIn(folder), Texts{});
  }
  const Outcome turned = split("for $b in /a/b return ($b/d, $b/c)", "1", "-",
                               directory.path("turned"), "<a><b><c/><d/></b></a>");
  EXPECT_EQ(turned.err,
            "xquery: --split: the path gives elements in another order than the document's\n");
}

TEST(SplitCommand, AnswersTheSameOverThePieces) {
  const TemporaryDirectory directory;
  std::string text = "<site xmlns:x='urn:x' year='2004'><regions>";
  for (int item = 0; item < 100; ++item) {
    if (item % 7 == 0) text += (item > 0 ? "</region>" : "") + std::string("<region n='r'>");
    const std::string number = std::to_string(item);
    text += "\n<item id='i" + number + "'><x:price cur='&amp;'>" + number +
            "</x:price><note>a <b>bold</b> tale &lt;</note></item>";
  }
  const std::string input = directory.write("site.xml", text + "</region></regions></site>");
  const std::string query =
      "for $i in /site[@year = 2004]/regions/region[@n]/item[*:price > 3] return "
      "<found id='{ $i/@id }'>{ $i/note, $i/*:price }</found>";
  const std::string whole = xquery({"-e", query, input}).out;
  EXPECT_THAT(whole, StartsWith("<found id=\"i4\">"));
  for (const std::string records : {"1", "6", "7", "99", "100", "1000"}) {
    const std::string folder = directory.path("by" + records);
    ASSERT_EQ(split("/site/regions/region/item", records, input, folder).status, 0);
    EXPECT_EQ(xquery({"-e", query, folder}).out, whole) << records;
  }
}

TEST(SplitCommand, ReadsPackedAndDeclaredInput) {
  const TemporaryDirectory directory;
  const Outcome outcome = shell(
      "printf '<!DOCTYPE a [<!ENTITY e \"\xC3\xA9\">]><a><b>&e;</b><b/></a>' | gzip | "
      "\"$0\" --split /a/b --records 1 - \"$1\" > /dev/null && cat \"$1\"/*",
      {directory.path("parts")});
  EXPECT_EQ(outcome.out,
            declaration + "<a>\n<b>\xC3\xA9</b>\n</a>\n" + declaration + "<a>\n<b/>\n</a>\n");
}

TEST(SplitCommand, WantsAFolderWithNothingInIt) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("file", "text");
  const Outcome full = split("/a/b", "1", "-", directory.path(""), "<a><b/></a>");
  EXPECT_EQ(full.status, 3);
  EXPECT_THAT(full.err, HasSubstr("the folder is not empty"));
  EXPECT_EQ(piecesIn(directory.path("")), Texts{"text"});
  const Outcome none = split("/a/b", "1", "-", file, "<a><b/></a>");
  EXPECT_EQ(none.status, 3);
  EXPECT_THAT(none.err, StartsWith("xquery: cannot write " + file + ": "));
  std::filesystem::create_directory(directory.path("empty"));
  EXPECT_EQ(split("/a/b", "1", "-", directory.path("empty"), "<a><b/></a>").status, 0);
}

TEST(SplitCommand, WantsToBeUsedRightly) {
  const TemporaryDirectory directory;
  const std::string folder = directory.path("parts");
  const auto status = [&](const Texts& arguments) { return xquery(arguments, "<a/>").status; };
  EXPECT_EQ(status({"--split", "/a", "-", folder}), 2);
  EXPECT_EQ(status({"--records", "1", "-e", "/a", "-"}), 2);
  EXPECT_EQ(status({"--split", "/a", "--records", "1", "-"}), 2);
  EXPECT_EQ(status({"--split", "/a", "--records", "1", "-", folder, "more"}), 2);
  EXPECT_EQ(status({"--split", "/a", "--records", "1", "-", ""}), 2);
  for (const std::string number : {"0", "-1", "1.5", "1000000001", "x"}) {
    EXPECT_EQ(status({"--split", "/a", "--records", number, "-", folder}), 2) << number;
  }
  for (const Texts& options : {Texts{"-e", "/a"}, Texts{"--html"}, Texts{"-o", folder},
                               Texts{"--as", "xml"}, Texts{"--types"}, Texts{"--jobs", "2"}}) {
    Texts arguments{"--split", "/a", "--records", "1", "-", folder};
    arguments.insert(arguments.begin(), options.begin(), options.end());
    const Outcome outcome = xquery(arguments, "<a/>");
    EXPECT_EQ(outcome.status, 2);
    EXPECT_THAT(outcome.err, StartsWith("xquery: --split excludes " + options.front()));
  }
  EXPECT_FALSE(std::filesystem::exists(folder));
}

TEST(SplitCommand, RefusesPathsBeforeItReads) {
  const TemporaryDirectory directory;
  const std::string folder = directory.path("parts");
  const Outcome wrong = split("/a/b[", "1", "/no/such/file", folder);
  EXPECT_EQ(wrong.status, 1);
  EXPECT_THAT(wrong.err, StartsWith("XQueryError:"));
  const Outcome refused = split("reverse(/a/b)", "1", "/no/such/file", folder);
  EXPECT_EQ(refused.status, 1);
  EXPECT_THAT(refused.err, HasSubstr("cannot be evaluated as a stream"));
  EXPECT_FALSE(std::filesystem::exists(folder));
  EXPECT_EQ(split("/a/b", "1", "/no/such/file", folder).status, 3);
  EXPECT_EQ(split("/a/b", "1", "-", folder, "<a/>", {"--plan"}).out,
            "record: /a/b\nresult: items as they are found\n");
}

TEST(SplitCommand, KeepsWholePiecesWhereTheRestIsBad) {
  const TemporaryDirectory directory;
  const std::string folder = directory.path("parts");
  const std::string text = "<a>\n<b>1</b>\n<b>2</b>\n<b>3</b>\n<b>4</c>\n</a>";
  const Outcome outcome = split("/a/b", "2", "-", folder, text);
  EXPECT_EQ(outcome.status, 3);
  EXPECT_THAT(outcome.err, StartsWith("standard input:5:"));
  EXPECT_EQ(outcome.out, folder + "/part-00000001.xml\n");
  EXPECT_EQ(piecesIn(folder), Texts{declaration + "<a>\n<b>1</b>\n<b>2</b>\n</a>\n"});
  const std::string other = directory.path("other");
  EXPECT_EQ(split("for $b in /a/b where 1 idiv (3 - xs:integer($b)) >= 0 return $b", "1", "-",
                  other, text)
                .status,
            1);
  EXPECT_EQ(piecesIn(other).size(), 2U);
}

// Of a file system without room the limit of a file's size gives the same errors.
TEST(SplitCommand, TellsThatAPieceCouldNotBeWritten) {
  const TemporaryDirectory directory;
  const std::string folder = directory.path("parts");
  const Outcome outcome = shell(
      "ulimit -f 64; { printf '<a>'; yes '<b>text</b>' | head -n 2; printf '<b>'; "
      "yes text | head -n 100000; printf '</b></a>'; } | "
      "\"$0\" --split /a/b --records 1 - \"$1\"",
      {folder});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.err, "xquery: cannot write " + folder + "/part-00000003.xml: File too large\n");
  EXPECT_EQ(piecesIn(folder).size(), 2U);
}

TEST(SplitCommand, TellsThatANameCouldNotBeWritten) {
  const TemporaryDirectory directory;
  const Outcome outcome =
      shell("printf '<a><b/><b/></a>' | \"$0\" --split /a/b --records 1 - \"$1\" > /dev/full",
            {directory.path("parts")});
  EXPECT_EQ(outcome.status, 3);
  EXPECT_EQ(outcome.err, "xquery: cannot write standard output: No space left on device\n");
}

// Of the endless input one piece after the other is made; nothing hidden is left either.
TEST(SplitCommand, LeavesWholePiecesAtAnInterrupt) {
  for (const std::string signal : {"INT", "TERM"}) {
    const TemporaryDirectory directory;
    const std::string folder = directory.path("parts");
    const Outcome outcome =
        shell("(" + waitUntil("[ -e \"$1/part-00000003.xml\" ]") +
                  "kill -s $2 $(cat \"$1.pid\")) & "
                  "{ printf '<a>'; exec yes '<b>text</b>'; } | "
                  "sh -c 'echo $$ > \"$1.pid\"; exec \"$0\" --split /a/b --records 1000 - \"$1\"' "
                  "\"$0\" \"$1\" > \"$1.names\" 2> \"$1.messages\"; wait; "
                  "ls -A \"$1\" | grep -vc '^part-[0-9]*.xml$'; cat \"$1.messages\"; "
                  "xargs cat < \"$1.names\" 2>&1 > \"$1.all\"; tail -qn 1 \"$1\"/* | sort -u",
              {folder, signal});
    EXPECT_EQ(outcome.out, "0\n</a>\n") << signal;
  }
}

TEST(SplitCommand, NamesAPieceBeforeTheNextOneIsRead) {
  const TemporaryDirectory directory;
  const std::string names = directory.write("names", "");
  const Outcome outcome = shell("{ printf '<a><b>1</b><b>'; " + waitUntil("[ -s \"$1\" ]") +
                                    "cat \"$(cat \"$1\")\" > \"$1.seen\"; echo '</b></a>'; } | "
                                    "\"$0\" --split /a/b --records 1 - \"$2\" > \"$1\"",
                                {names, directory.path("parts")});
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(readFile(names + ".seen"), declaration + "<a>\n<b>1</b>\n</a>\n");
}

#if defined(NDEBUG) && !defined(XQUERY_SANITIZED)
constexpr int records = 250'000;  // 100 MB
#else
constexpr int records = 5'000;
#endif

TEST(SplitCommand, TakesNoMoreMemoryHoweverLongTheInputIs) {
  const TemporaryDirectory directory;
  const std::string record = "<b i='1'><c>1</c><d>" + std::string(368, 'x') + "</d></b>";
  const std::string count = std::to_string(records);
  const Outcome outcome =
      shell("{ echo '<a>'; yes \"$1\" | head -n " + count + "; echo '</a>'; } | " +
                "\"$0\" --split /a/b --records " + count +
                " - \"$2\" > /dev/null; "
                "grep -c '<b i=\"1\"><c>1</c><d>x*</d></b>$' \"$2\"/*",
            {record, directory.path("parts")});
  EXPECT_EQ(outcome.out, count + "\n");
#if !defined(XQUERY_SANITIZED)
  EXPECT_LT(outcome.mostMemory, size_t{64} << 20);
#endif
}

}  // namespace
