// The ways in which results are written.
#include "cli/Command.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

using command::Outcome;
using command::shell;
using command::TemporaryDirectory;
using command::xquery;
using testing::HasSubstr;

namespace {

constexpr const char* document = "<a x=\"1\"><b>m <i> </i></b><c><d/></c><!--e--></a>";

std::string written(const std::vector<std::string>& options, const std::string& query) {
  std::vector<std::string> arguments = options;
  arguments.insert(arguments.end(), {"-e", query, "-"});
  const Outcome outcome = xquery(arguments, document);
  EXPECT_EQ(outcome.err, "");
  EXPECT_EQ(outcome.status, 0);
  return outcome.out;
}

TEST(Formats, LinesAreWhatThereIsWithoutAny) {
  EXPECT_EQ(written({"--as", "lines"}, "//c, 'a<b', //@x"), "<c><d/></c>\na<b\nx=\"1\"\n");
}

TEST(Formats, XMLIsOneDocument) {
  EXPECT_EQ(written({"--as", "xml"}, "1, 'a<b', //@x, //c, (/)[.//c]"),
            "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<results>\n"
            "<item type=\"xs:integer\">1</item>\n<item type=\"xs:string\">a&lt;b</item>\n"
            "<item type=\"attribute()\" name=\"x\">1</item>\n"
            "<item type=\"element()\"><c><d/></c></item>\n<item type=\"document-node()\">" +
                std::string(document) + "</item>\n</results>\n");
  EXPECT_EQ(written({"--as", "xml"}, "()"),
            "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<results>\n</results>\n");
}

TEST(Formats, JSONIsOneArray) {
  EXPECT_EQ(written({"--as", "json"}, "1, 1.5, 1e30, 1e0 div 0, 1 = 1, 'q\"\\&#10;&#x7F;é'"),
            "[{\"type\":\"xs:integer\",\"value\":1},\n{\"type\":\"xs:decimal\",\"value\":1.5},\n"
            "{\"type\":\"xs:double\",\"value\":1e+30},\n{\"type\":\"xs:double\",\"value\":\"INF\"}"
            ",\n{\"type\":\"xs:boolean\",\"value\":true},\n"
            "{\"type\":\"xs:string\",\"value\":\"q\\\"\\\\\\n\\u007Fé\"}]\n");
  EXPECT_EQ(written({"--as", "json"}, "//d, //@x, //i/text(), //comment(), <p:n xmlns:p='u'/>"),
            "[{\"type\":\"element()\",\"value\":\"\",\"name\":\"d\","
            "\"place\":\"/a[1]/c[1]/d[1]\",\"xml\":\"<d/>\"},\n"
            "{\"type\":\"attribute()\",\"value\":\"1\",\"name\":\"x\",\"place\":\"/a[1]/@x\"},\n"
            "{\"type\":\"text()\",\"value\":\" \",\"place\":\"/a[1]/b[1]/i[1]/text()[1]\"},\n"
            "{\"type\":\"comment()\",\"value\":\"e\",\"place\":\"/a[1]/comment()[1]\"},\n"
            "{\"type\":\"element()\",\"value\":\"\",\"name\":\"p:n\",\"namespace\":\"u\","
            "\"place\":\"/p:n[1]\",\"xml\":\"<p:n xmlns:p=\\\"u\\\"/>\"}]\n");
  EXPECT_EQ(written({"--as", "json"}, "()"), "[]\n");
}

TEST(Formats, HTMLHasNoEndTagsForWhatIsEmptyAndRawScripts) {
  EXPECT_EQ(written({"--as", "html"},
                    "<p class='&lt;'>a&lt;<br/><b/><script>1 &lt; 2</script>"
                    "<svg xmlns='http://www.w3.org/2000/svg'><path/></svg></p>, 'x<y'"),
            "<p class=\"&lt;\">a&lt;<br><b></b><script>1 < 2</script><svg><path></path></svg></p>\n"
            "x&lt;y\n");
  EXPECT_THAT(written({"--as", "html"}, "/"), HasSubstr("<!DOCTYPE html>\n<a x=\"1\">"));
}

TEST(Formats, TextIsValuesWithoutMarkup) {
  EXPECT_EQ(written({"--as", "text"}, "//b, 'a<b', //@x, 1.50"), "m  \na<b\n1\n1.5\n");
}

TEST(Formats, IndentationChangesNoText) {
  EXPECT_EQ(written({"--indent"}, "/a"),
            "<a x=\"1\">\n  <b>m <i> </i></b>\n  <c>\n    <d/>\n  </c>\n  <!--e-->\n</a>\n");
  EXPECT_EQ(written({"--indent"}, "<x> <y xml:space='preserve'><z/>{' '}</y> <w/></x>"),
            "<x>\n  <y xml:space=\"preserve\"><z/> </y>\n  <w/>\n</x>\n");
  EXPECT_THAT(written({"--indent"}, "/"), HasSubstr("?>\n<a x=\"1\">\n  <b>"));
}

TEST(Formats, IndentationDoesNotGrowWithoutBound) {
  const Outcome outcome = shell(
      "\"$0\" --indent -e "
      "'declare function local:f($n) { if ($n = 0) then () else <a>{local:f($n - 1)}</a> }; "
      "local:f(2000)' | wc -c");
  EXPECT_LT(std::stoi(outcome.out), 2 * 2000 * (200 + 5));
}

TEST(Formats, ASeparatorStandsBetweenItemsOnly) {
  EXPECT_EQ(written({"--separator", ", "}, "1 to 3"), "1, 2, 3");
  EXPECT_EQ(written({"--separator", "\\0\\n\\t\\\\"}, "1, 2"), std::string("1\0\n\t\\2", 6));
  EXPECT_EQ(written({"--separator", ""}, "1, 2"), "12");
  const TemporaryDirectory directory;
  const std::string file = directory.write("in", document), other = directory.write("b", "<b/>");
  EXPECT_EQ(xquery({"--separator", ",", "-e", "1, 2", file, file, file}).out, "1,2,1,2,1,2");
  EXPECT_EQ(xquery({"--as", "json", "--with-name", "-e", "//@x", other, file, other}).out,
            "[{\"type\":\"attribute()\",\"input\":\"" + file +
                "\",\"value\":\"1\",\"name\":\"x\",\"place\":\"/a[1]/@x\"}]\n");
}

TEST(Formats, ErrorsAreJSONWithAnArray) {
  const TemporaryDirectory directory;
  const std::string file = directory.write("in", document);
  const Outcome one = xquery({"--as", "json", "-e", "1 +\n 1 idiv 0"});
  EXPECT_EQ(one.err,
            "{\"code\":6,\"message\":\"divide by zero\",\"line\":2,\"category\":\"values\","
            "\"place\":{\"line\":2,\"column\":2,\"length\":8},\"status\":1}\n");
  EXPECT_EQ(one.out, "");
  const Outcome both =
      xquery({"--as", "json", "-e", "1 idiv (2 - xs:integer(//@x) * 2)", file, "/nowhere"});
  EXPECT_EQ(both.err,
            "{\"code\":6,\"message\":\"divide by zero\",\"line\":1,\"category\":\"values\","
            "\"place\":{\"line\":1,\"column\":1,\"length\":33},\"input\":\"" +
                file +
                "\",\"status\":1}\n{\"message\":\"xquery: /nowhere: No such file or "
                "directory\",\"input\":\"/nowhere\",\"status\":3}\n");
  EXPECT_EQ(both.status, 3);
  // A program wants to know of a single input too, and of a stream.
  const auto named = [](int column) {
    return "{\"code\":6,\"message\":\"divide by zero\",\"line\":1,\"category\":\"values\","
           "\"place\":{\"line\":1,\"column\":" +
           std::to_string(column) + ",\"length\":8},\"input\":\"";
  };
  EXPECT_EQ(xquery({"--as", "json", "-e", "1 idiv 0", file}).err,
            named(1) + file + "\",\"status\":1}\n");
  EXPECT_EQ(xquery({"--as", "json", "--stream", "-e", "for $b in /a/b return 1 idiv 0", file}).err,
            named(23) + file + "\",\"status\":1}\n");
  EXPECT_EQ(xquery({"--as", "json", "-e", "1 idiv 0", "-"}, "<a/>").err,
            named(1) + "standard input\",\"status\":1}\n");
}

}  // namespace
