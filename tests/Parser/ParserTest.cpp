// The driver: errors and their lines, setters, input, threads, hostile queries.
#include "Parser/XQueryParser.h"
#include "Parser/XQueryScanner.h"
#include "Parser/XQueryTokens.h"
#include "Platform/Base/ProcessorTime.h"
#include "Platform/Text/TextTestSupport.h"
#include "xquery/Exception.h"

#include <gtest/gtest.h>

#include <atomic>
#include <barrier>
#include <cstdlib>
#include <functional>
#include <random>
#include <thread>

namespace xquery {
namespace {

Ref<XQueryParser> parsed(std::string_view query) {
  return XQueryParser::parserWithSource(NSString::stringWithUTF8(query));
}

std::vector<std::string> errorsOf(std::string_view query) {
  std::vector<std::string> result;
  const auto parser = parsed(query);
  for (const auto& error : parser->errors()) {
    result.push_back(error->localizedDescription()->utf8());
  }
  return result;
}

using Strings = std::vector<std::string>;

bool isBlank(std::string_view text) {
  return text.find_first_not_of(" \t\r\n") == text.npos;
}

// --- results -----------------------------------------------------------------------------------

TEST(Parser, AQueryOfNothingIsValidAndHasNoModule) {
  for (const char* query : {"", " ", "\n\t\r", "(: nothing :)", "(:: pragma p:x y ::)"}) {
    const auto parser = parsed(query);
    EXPECT_TRUE(parser->errors().empty()) << query;
    EXPECT_FALSE(parser->parsedModule()) << query;
  }
}

TEST(Parser, AMainModuleHasItemsBodyAndVersion) {
  const auto parser = parsed("xquery version '1.0'; declare namespace p = 'u'; 1");
  const auto& module = parser->parsedModule();
  ASSERT_TRUE(module);
  EXPECT_EQ(module->prologItems().size(), 1u);
  EXPECT_TRUE(module->body());
  EXPECT_EQ(module->version()->utf8(), "1.0");
  EXPECT_FALSE(parsed("1")->parsedModule()->version());
  EXPECT_TRUE(parsed("1")->parsedModule()->prologItems().empty());
}

TEST(Parser, AnEncodingDeclarationIsDropped) {
  const auto parser = parsed("xquery version '1.0' encoding 'anything'; 1");
  EXPECT_EQ(parser->parsedModule()->version()->utf8(), "1.0");
}

TEST(Parser, ALibraryModuleHasNoBody) {
  const auto parser = parsed("xquery version '1.0'; module namespace p = 'u';");
  ASSERT_TRUE(parser->parsedModule());
  EXPECT_FALSE(parser->parsedModule()->body());
  EXPECT_EQ(parser->parsedModule()->version()->utf8(), "1.0");
}

TEST(Parser, KeepsItsSource) {
  const Ref<NSString> source = NSString::stringWithASCII("1");
  EXPECT_EQ(XQueryParser::parserWithSource(source)->source(), source);
}

TEST(Parser, AFailedParseHasNoModule) {
  EXPECT_FALSE(parsed("1 +")->parsedModule());
  EXPECT_FALSE(parsed("1 #")->parsedModule());
}

// --- errors ------------------------------------------------------------------------------------

TEST(Parser, SyntaxErrorsNameTheTokenAndTheLine) {
  EXPECT_EQ(errorsOf("1 = 2 = 3"),
            Strings{"XQueryError:3 - \"parse error invalid token (=)- 1 = 2 = 3\" at line:1"});
  EXPECT_EQ(errorsOf("1,\n\n  )"),
            Strings{"XQueryError:3 - \"parse error invalid token ())-   )\" at line:3"});
}

TEST(Parser, AtTheEndTheTokenIsEmpty) {
  EXPECT_EQ(errorsOf("1 +"),
            Strings{"XQueryError:3 - \"parse error invalid token ()- 1 +\" at line:1"});
  EXPECT_EQ(errorsOf("1 +\n"),
            Strings{"XQueryError:3 - \"parse error invalid token ()- \" at line:2"});
}

TEST(Parser, WhatTheScannerComplainsOfIsOneError) {
  EXPECT_EQ(errorsOf("1 #"), Strings{"XQueryError:3 - \"invalid token (#) - 1 #\" at line:1"});
  EXPECT_EQ(errorsOf("1\n(: a\n"),
            Strings{"XQueryError:3 - \"comment not terminated  - (: a\" at line:2"});
  EXPECT_EQ(errorsOf("declare xmlspace strip; declare xmlspace strip; 1 #").size(), 2u);
}

// Its line is that of the last "(:" that opened, be it the pragma's own.
TEST(Parser, APragmaThatDoesNotEndIsAnError) {
  const auto error = [](const std::string& sourceLine, int line) {
    return Strings{"XQueryError:3 - \"pragma not terminated  - " + sourceLine +
                   "\" at line:" + std::to_string(line)};
  };
  EXPECT_EQ(errorsOf("1 (::"), error("1 (::", 1));
  EXPECT_EQ(errorsOf("1\n(:: \n"), error("(:: ", 2));
  EXPECT_EQ(errorsOf("1\n\n(:: pragma"), Strings{"XQueryError:3 - \"invalid token (p) - (:: "
                                                 "pragma\" at line:3"});
  EXPECT_EQ(errorsOf("1\n\n (:: pragma "), error(" (:: pragma ", 3));
  EXPECT_EQ(errorsOf("1\n(:: pragma p:x"), error("(:: pragma p:x", 2));
  EXPECT_EQ(errorsOf("(: a :)\n(:: pragma p:x data\n\n"), error("(:: pragma p:x data", 2));
  EXPECT_EQ(errorsOf("1\n(:: extension "), error("(:: extension ", 2));
  EXPECT_EQ(errorsOf("(: a\n(:: pragma p:x data"), error("(:: pragma p:x data", 2));
  EXPECT_EQ(errorsOf("1\n(:: extension e:x data"),
            Strings{"XQueryError:3 - \"extension not terminated  - (:: extension e:x data\" at "
                    "line:2"});
}

TEST(Parser, ExtensionsFailAndPragmasDoNot) {
  EXPECT_EQ(errorsOf("(:: extension e:x data ::) 1"),
            Strings{"XQueryError:14 - \"must-understand extension not supported (e:x data)\" "
                    "at line:1"});
  EXPECT_TRUE(errorsOf("(:: pragma e:x data ::) 1").empty());
  EXPECT_TRUE(parsed("(:: pragma e:x data ::) 1")->parsedModule());
}

TEST(Parser, SourceLinesAreCountedFromZero) {
  const auto parser = parsed("one\ntwo\r\n\nfour");
  EXPECT_EQ(parser->sourceLine(0)->utf8(), "one");
  EXPECT_EQ(parser->sourceLine(1)->utf8(), "two");
  EXPECT_EQ(parser->sourceLine(2)->utf8(), "");
  EXPECT_EQ(parser->sourceLine(3)->utf8(), "four");
  EXPECT_EQ(parser->sourceLine(4)->utf8(), "");
  EXPECT_EQ(parser->sourceLine(-1)->utf8(), "");
  EXPECT_EQ(parser->errors().front()->line(), 2);
  EXPECT_EQ(parsed("#")->errors().front()->line(), 1);
}

TEST(Parser, ErrorsAreLoggedWhenTheEnvironmentSaysSo) {
  ::setenv("XQUERY_LOG", "1", 1);
  testing::internal::CaptureStderr();
  const auto parser = parsed("(:: extension e:x data ::) 1 #");
  const std::string log = testing::internal::GetCapturedStderr();
  ::unsetenv("XQUERY_LOG");
  EXPECT_NE(log.find("\nmust-understand extension not supported (e:x data)\n"), std::string::npos);
  EXPECT_NE(log.find("\ninvalid token (#) - (:: extension e:x data ::) 1 #\n"), std::string::npos);
  testing::internal::CaptureStderr();
  EXPECT_FALSE(parsed("1 #")->parsedModule());
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

TEST(Parser, TheTextIsLoggedBeforeTheErrorAndAnExtensionsAfterIt) {
  ::setenv("XQUERY_LOG", "1", 1);
  testing::internal::CaptureStderr();
  parsed("1 #");
  const std::string token = testing::internal::GetCapturedStderr();
  testing::internal::CaptureStderr();
  parsed("(:: extension e:x data ::) 1");
  const std::string extension = testing::internal::GetCapturedStderr();
  ::unsetenv("XQUERY_LOG");
  EXPECT_EQ(token,
            "invalid token (#) - 1 #\n"
            "XQueryError:3 - \"invalid token (#) - 1 #\" at line:1\n");
  EXPECT_EQ(extension,
            "XQueryError:14 - \"must-understand extension not supported (e:x data)\" at line:1\n"
            "must-understand extension not supported (e:x data)\n");
}

TEST(Parser, AFatalFailureIsRecordedWithoutALineAndRaised) {
  const auto parser = XQueryParser::unparsedParserWithSource(NSString::empty());
  const XQueryParser::Session session(*parser);
  try {
    XQueryFatalError("out of dynamic memory in yy_create_buffer()");
    FAIL();
  } catch (const NSException& exception) {
    EXPECT_EQ(exception.name(), "XQueryLexFatalErr");
    EXPECT_EQ(exception.reason()->utf8(), "out of dynamic memory in yy_create_buffer()");
  }
  ASSERT_EQ(parser->errors().size(), 1u);
  EXPECT_EQ(parser->errors()[0]->localizedDescription()->utf8(),
            "XQueryError:3 - \"out of dynamic memory in yy_create_buffer()\"");
}

// --- setters -----------------------------------------------------------------------------------

struct Setter {
  const char* declaration;
  int64_t number;
  const char* message;
};

const Setter setters[] = {
    {"declare xmlspace strip;", 68, "Prolog contains more than one xmlspace declaration"},
    {"declare default collation 'u';", 38,
     "Prolog contains more than one default collation declaration"},
    {"declare base-uri 'u';", 32, "Prolog contains more than one base URI declaration"},
    {"declare construction strip;", 67, "Prolog contains more than one construction declaration"},
    {"declare ordering ordered;", 65, "Prolog contains more than one ordering mode declaration"},
    {"declare default order empty least;", 69,
     "Prolog contains more than one empty ordering declaration"},
    {"declare inherit-namespaces yes;", 55,
     "Prolog contains more than one inherit-namespaces declaration"},
};

TEST(Parser, ASecondSetterOfAKindIsAnErrorAtItsLine) {
  for (const Setter& setter : setters) {
    std::string query = setter.declaration;
    query += "\n\n";
    query += setter.declaration;
    query += "\n1";
    const auto parser = parsed(query);
    ASSERT_EQ(parser->errors().size(), 1u) << query;
    EXPECT_EQ(parser->errors()[0]->err(), setter.number);
    EXPECT_EQ(parser->errors()[0]->msg()->utf8(), setter.message);
    EXPECT_EQ(parser->errors()[0]->line(), 3) << query;
  }
}

TEST(Parser, TheLineOfASecondSetterIsThatOfItsFirstWord) {
  const auto parser = parsed("declare xmlspace strip; declare\nxmlspace\nstrip\n;\n1");
  ASSERT_EQ(parser->errors().size(), 1u);
  EXPECT_EQ(parser->errors()[0]->line(), 1);
}

TEST(Parser, EverySetterMayStandOnceInAnyOrder) {
  std::string query;
  for (const Setter& setter : setters) query = setter.declaration + query;
  EXPECT_TRUE(errorsOf(query + "1").empty());
  EXPECT_TRUE(errorsOf(query + "1").empty()) << "the next parse starts afresh";
}

TEST(Parser, AThirdSetterIsASecondError) {
  EXPECT_EQ(
      errorsOf("declare xmlspace strip; declare xmlspace strip; declare xmlspace strip; 1").size(),
      2u);
}

TEST(Parser, AnUnknownSetterFlagIsIgnored) {
  const auto parser = XQueryParser::unparsedParserWithSource(NSString::empty());
  const XQueryParser::Session session(*parser);
  for (const unsigned flag : {0U, 3U, 128U}) {
    parser->XQueryParserSetSetterFlag(flag, 0);
    parser->XQueryParserSetSetterFlag(flag, 0);
  }
  EXPECT_TRUE(parser->errors().empty());
}

// --- input -------------------------------------------------------------------------------------

TEST(Parser, HandsOutItsSourceInPieces) {
  const auto parser =
      XQueryParser::unparsedParserWithSource(NSString::stringWithUTF8("ab\xC3\xA9"));
  char buffer[8] = {};
  EXPECT_EQ(parser->readChars(3, buffer), 3u);
  EXPECT_EQ(std::string(buffer, 3), "ab\xC3");
  EXPECT_EQ(parser->readChars(8, buffer), 1u);
  EXPECT_EQ(buffer[0], '\xA9');
  EXPECT_EQ(parser->readChars(8, buffer), 0u);
}

std::string readBy(std::u16string_view source, size_t piece) {
  const auto parser = XQueryParser::unparsedParserWithSource(NSString::stringWithUTF16(source));
  std::string result(parser->remainingBytes(), '\0');
  size_t length = 0;
  while (const size_t count = parser->readChars(piece, result.data() + length)) length += count;
  EXPECT_EQ(length, result.size());
  return result;
}

TEST(Parser, EveryLineEndIsReadAsALineFeed) {
  EXPECT_EQ(readBy(u"a\rb\r\nc\nd\n\re\r\r\n", 1), "a\nb\nc\nd\n\ne\n\n");
  EXPECT_EQ(readBy(u"\r", 8), "\n");
  // Wherever the text is divided while it is converted.
  for (size_t length = 65534; length < 65539; ++length) {
    const std::u16string text(length, u'\x00E9');
    const std::string bytes = repeated("\xC3\xA9", length);
    EXPECT_TRUE(readBy(text + u"\r\n1", 1 << 20) == bytes + "\n1") << length;
    EXPECT_TRUE(readBy(text + u"\r1", 1 << 20) == bytes + "\n1") << length;
    EXPECT_TRUE(readBy(text + u"\xD83D\xDE00", 1 << 20) == bytes + "\xF0\x9F\x98\x80") << length;
  }
}

TEST(Parser, LinesAreCountedByEveryLineEnd) {
  for (const char* query :
       {"1,\n\n#", "1,\r\r#", "1,\r\n\r\n#", "'\r\n'\r#", "1 (: \r :)\r\n#", "<a>\r\n</a>\r#"}) {
    const auto parser = parsed(query);
    ASSERT_EQ(parser->errors().size(), 1u) << query;
    EXPECT_EQ(parser->errors()[0]->line(), 3) << query;
    EXPECT_EQ(parser->errors()[0]->msg()->utf8(), "invalid token (#) - #") << query;
  }
}

TEST(Parser, AByteOrderMarkAtTheStartIsSkipped) {
  EXPECT_EQ(readBy(u"\xFEFF\x0031", 8), "1");
  EXPECT_EQ(readBy(u"\xFEFF\xFEFF", 8), "\xEF\xBB\xBF");
  EXPECT_EQ(errorsOf("\xEF\xBB\xBF#"),
            Strings{"XQueryError:3 - \"invalid token (#) - #\" at line:1"});
  EXPECT_EQ(errorsOf("1 \xEF\xBB\xBF").size(), 1u);
}

TEST(Parser, ALoneSurrogateIsReadAsTheReplacementCharacter) {
  const auto parser = XQueryParser::parserWithSource(NSString::stringWithUTF16(u"'\xD800'"));
  EXPECT_TRUE(parser->errors().empty());
}

TEST(Parser, ANulByteIsAnInvalidToken) {
  const auto parser = parsed(std::string_view("1 \0 2", 5));
  ASSERT_FALSE(parser->errors().empty());
  EXPECT_EQ(parser->errors()[0]->msg()->utf8(), std::string("invalid token (\0) - 1 \0 2", 25));
}

// --- threads -------------------------------------------------------------------------------------

TEST(Parser, ThereIsNoCurrentParserOutsideAParse) {
  EXPECT_EQ(XQueryParser::currentParser(), nullptr);
  const auto parser = parsed("1");
  EXPECT_EQ(XQueryParser::currentParser(), nullptr);
  {
    const auto other = XQueryParser::unparsedParserWithSource(NSString::empty());
    const XQueryParser::Session session(*other);
    EXPECT_EQ(XQueryParser::currentParser(), other.get());
    EXPECT_TRUE(parsed("2")->parsedModule());
    EXPECT_EQ(XQueryParser::currentParser(), other.get()) << "another parse has come and gone";
    std::thread([] { EXPECT_EQ(XQueryParser::currentParser(), nullptr); }).join();
  }
  EXPECT_EQ(XQueryParser::currentParser(), nullptr);
}

TEST(Parser, SeveralThreadsMayParse) {
  std::atomic<int> failures = 0;
  std::vector<std::thread> threads;
  for (int index = 0; index < 4; ++index) {
    threads.emplace_back([index, &failures] {
      const std::string line(static_cast<size_t>(index), '\n');
      for (int round = 0; round < 200; ++round) {
        if (!parsed(line + "a/b[c = 'd'] + 1")->errors().empty()) ++failures;
        const auto wrong = parsed(line + "1 = 2 = 3");
        if (wrong->errors().size() != 1 || wrong->errors()[0]->line() != index + 1) ++failures;
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(failures, 0);
}

TEST(Parser, ParsesGoOnSideBySide) {
  constexpr int count = 4;
  std::barrier meet(count);
  std::atomic<int> failures = 0;
  std::vector<std::thread> threads;
  for (int index = 0; index < count; ++index) {
    threads.emplace_back([&] {
      const auto parser = XQueryParser::unparsedParserWithSource(NSString::stringWithASCII("'a'"));
      const XQueryParser::Session session(*parser);
      meet.arrive_and_wait();  // all of them are in the midst of a parse
      parser->scanner().XQueryScannerInit(XQueryStateDEFAULT);
      XQueryTokenValue value;
      if (parser->scanner().XQlex(value) != kTokenStringLiteral) ++failures;
      meet.arrive_and_wait();
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(failures, 0);
}

// --- long and deep queries -----------------------------------------------------------------------

TEST(Parser, DeepNestingIsParsed) {
  EXPECT_TRUE(parsed(repeated("(", 100000) + "1" + repeated(")", 100000))->parsedModule());
  EXPECT_TRUE(parsed(repeated("<a>", 10000) + repeated("</a>", 10000))->parsedModule());
  EXPECT_TRUE(parsed(repeated("if (1) then 2 else ", 10000) + "3")->parsedModule());
  EXPECT_TRUE(parsed(repeated("local:f(", 10000) + repeated(")", 10000))->parsedModule());
  EXPECT_TRUE(parsed(repeated("a[", 10000) + "1" + repeated("]", 10000))->parsedModule());
}

TEST(Parser, NestingThatDoesNotEndIsAnErrorAtTheEnd) {
  const auto parser = parsed(repeated("(", 100000));
  ASSERT_EQ(parser->errors().size(), 1u);
  EXPECT_EQ(parser->errors()[0]->msg()->utf8().find("parse error invalid token ()- (("), 0u);
  EXPECT_FALSE(parser->parsedModule());
}

double parseSeconds(const std::string& query) {
  const double start = processorSeconds();
  const auto parser = parsed(query);
  const double elapsed = processorSeconds() - start;
  // What cannot be compiled is parsed all the same.
  EXPECT_TRUE(parser->errors().empty() || parser->errors()[0]->err() == 0)
      << parser->errors()[0]->msg()->utf8().substr(0, 80);
  return elapsed;
}

void expectLinear(const std::function<std::string(size_t)>& query, size_t size) {
  EXPECT_TRUE(growsInProportion([&](size_t each) { return parseSeconds(query(each)); }, size))
      << query(4);
}

TEST(Parser, LongQueriesTakeLinearTime) {
  expectLinear([](size_t count) { return "1" + repeated("+1", count); }, 100000);
  expectLinear([](size_t count) { return "a" + repeated("/a", count); }, 100000);
  expectLinear([](size_t count) { return "1" + repeated(",1", count); }, 100000);
  expectLinear([](size_t count) { return "a" + repeated("[1]", count); }, 100000);
  expectLinear([](size_t count) { return repeated("- ", count) + "1"; }, 800000);
  expectLinear([](size_t count) { return "\"" + std::string(count, 'x') + "\""; }, 8000000);
  expectLinear([](size_t count) { return "\"" + repeated("\"\"", count) + "\""; }, 1000000);
  expectLinear([](size_t count) { return std::string(count, 'x'); }, 8000000);
  expectLinear([](size_t count) { return std::string(count, ' ') + "1"; }, 8000000);
  expectLinear([](size_t count) { return "1(:" + std::string(count, '-') + ":)"; }, 8000000);
  expectLinear([](size_t count) { return repeated("(: ", count) + repeated(":)", count) + "1"; },
               800000);
  expectLinear([](size_t count) { return "1" + repeated("(: a :) + (: b :) a", count); }, 80000);
  expectLinear([](size_t count) { return "<a>" + std::string(count, 'x') + "</a>"; }, 800000);
  expectLinear([](size_t count) { return "declare (:" + std::string(count, 'x') + ":)"; }, 8000000);
}

TEST(Parser, MutatedQueriesEndInAModuleOrAnError) {
  const std::string seeds[] = {
      "xquery version '1.0'; declare namespace p = 'u'; declare variable $x as xs:int? := 1; $x",
      "for $a in //book[price > 10.5e3] where $a/@id = 'x' order by $a descending return <r "
      "a='{1}'>"
      "{$a} &amp;&#65; <![CDATA[c]]><!--d--><?e f?></r>",
      "typeswitch (.) case element(a, b?)* return 1 default $d return (: x (: y :) :) f($d, *:n)",
      "(:: pragma p:q r ::) declare function local:f($a) as item()+ { validate lax { 1 } }; 1 to 2",
  };
  const std::string bits = "(:){}<>/\"'&;$*@=.,-+ \n1ae\xC3\xA9";
  std::minstd_rand random(20041029);
  const auto below = [&random](size_t limit) { return random() % limit; };
  for (int round = 0; round < 4000; ++round) {
    std::string query = seeds[below(std::size(seeds))];
    for (size_t changes = 1 + below(4); changes > 0; --changes) {
      const size_t at = below(query.size());
      switch (below(3)) {
        case 0:
          query.erase(at, 1 + below(6));
          break;
        case 1:
          query.insert(at, 1, bits[below(bits.size())]);
          break;
        default:
          query.insert(at, query.substr(below(query.size()), below(12)));
          break;
      }
      if (query.empty()) query = "1";
    }
    const auto source = NSString::stringWithUTF8(query);
    if (!source) continue;  // half a character
    const auto parser = XQueryParser::parserWithSource(source);
    EXPECT_TRUE(parser->parsedModule() || !parser->errors().empty() || isBlank(query)) << query;
    for (const auto& error : parser->errors()) EXPECT_TRUE(error->msg()) << query;
  }
}

TEST(Parser, ALongNameOfOtherLettersTakesLinearTime) {
  expectLinear([](size_t count) { return repeated("\xC3\xA9", count); }, 800000);
}

}  // namespace
}  // namespace xquery
