// The scanner's rules beyond the single tokens: transitions, names, literals, comments, extensions,
// errors, lines and logs. ScannerTokensTest.cpp has the tokens one by one.
#include "Parser/ScannerHarness.h"

#include <gtest/gtest.h>

#include <cstdlib>

namespace xquery {
namespace {

using Strings = std::vector<std::string>;

std::string only(const Scanned& scanned) {
  return scanned.errors.size() == 1 ? scanned.errors.front()
                                    : std::to_string(scanned.errors.size()) + " errors";
}

// The description of an error of the scanner; lines are printed counted from 1.
std::string error(const std::string& message, int line) {
  return "XQueryError:3 - \"" + message + "\" at line:" + std::to_string(line);
}

std::u16string literal(std::string_view text) {
  Ref<XQueryParser> parser = XQueryParser::unparsedParserWithSource(NSString::stringWithUTF8(text));
  const XQueryParser::Session session(*parser);
  XQueryScanner& scanner = parser->scanner();
  scanner.XQueryScannerInit(XQueryStateDEFAULT);
  XQueryTokenValue value;
  EXPECT_EQ(scanner.XQlex(value), kTokenStringLiteral);
  EXPECT_EQ(scanner.state(), XQueryStateOPERATOR);
  return cast<NSString>(value.value)->view().utf16();
}

// --- start -------------------------------------------------------------------------------------

TEST(Scanner, StartsInTheStateItIsGiven) {
  EXPECT_EQ(Scanned("<a", XQueryStateDEFAULT).tokens[0].code, kTokenLessThanConstructor);
  EXPECT_EQ(Scanned("<a", XQueryStateOPERATOR).tokens[0].code, kTokenLessThanCompare);
  EXPECT_EQ(Scanned("a", XQueryStateVARNAME).tokens[0].code, kTokenVarName);
  EXPECT_EQ(Scanned("a", XQueryStateINITIAL).tokens[0].code, kTokenQName);
}

TEST(Scanner, NothingYieldsNoToken) {
  EXPECT_TRUE(Scanned("").tokens.empty());
  EXPECT_TRUE(Scanned(" \t\r\n (: nothing :) \n").tokens.empty());
  EXPECT_EQ(Scanned("\n\n").endLine, 2);
}

TEST(Scanner, InitForgetsThePreviousScan) {
  Scanned first("\n\n<a>{\"unfinished");
  const Scanned second("1");
  EXPECT_EQ(second.names(), "IntegerLiteral");
  EXPECT_EQ(second.tokens[0].line, 0);
  EXPECT_TRUE(second.tokens[0].stack.empty());
}

// --- transitions -------------------------------------------------------------------------------

TEST(Scanner, FunctionDeclarationWithTypes) {
  const Scanned scanned(
      "declare function local:f($a as element()*, $b as xs:int?) as item()+ { $a };");
  EXPECT_EQ(scanned.names(),
            "DeclareFunction QNameParenLeft DollarSign VarName As ElementParenLeft ParenRight "
            "Asterisk Comma DollarSign VarName As QName QuestionMark ParenRightAs "
            "ItemParenLeftParenRight Plus CurlyBraceLeft DollarSign VarName CurlyBraceRight "
            "Semicolon");
  EXPECT_EQ(scanned.endState, XQueryStateDEFAULT);
}

TEST(Scanner, DocumentNodeTestHoldsAnElementTest) {
  const Scanned scanned("document-node(element(a, xs:int?))/b");
  EXPECT_EQ(scanned.names(),
            "DocumentNodeParenLeft ElementParenLeft QName Comma QName QuestionMark ParenRight "
            "ParenRight Solidus QName");
  EXPECT_EQ(scanned.tokens[6].state, XQueryStateKINDTEST);
  EXPECT_EQ(scanned.tokens[7].state, XQueryStateOPERATOR);
}

TEST(Scanner, WhatIsNoOccurrenceIndicatorIsReadAgain) {
  const Scanned scanned("1 instance of xs:int = 2");
  EXPECT_EQ(scanned.names(), "IntegerLiteral InstanceOf QName Equal IntegerLiteral");
  EXPECT_EQ(scanned.tokens[2].state, XQueryStateOCCURRENCEINDICATOR);
}

TEST(Scanner, AfterASingleTypeAnAsteriskMultiplies) {
  EXPECT_EQ(Scanned("1 cast as xs:int * 2").names(),
            "IntegerLiteral CastAs QName Asterisk IntegerLiteral");
  EXPECT_EQ(Scanned("1 cast as xs:int? * 2").names(),
            "IntegerLiteral CastAs QName QuestionMark Asterisk IntegerLiteral");
}

TEST(Scanner, NestedConstructorsReturnToWhereTheyStood) {
  const Scanned scanned("<a b=\"{1}x\"><!--c--><?t d?><![CDATA[e]]>{<f/>} g</a> = 1");
  EXPECT_EQ(scanned.names(),
            "LessThanConstructor QName QName Equal Quote CurlyBraceLeft IntegerLiteral "
            "CurlyBraceRight QuoteAttContentChar Quote GreaterThan XMLCommentStart Char "
            "XMLCommentEnd PIStart PITarget Char PIEnd CDATAStart Char CDATAEnd CurlyBraceLeft "
            "LessThanConstructor QName SolidusGreaterThan CurlyBraceRight ElementContentCharWS "
            "ElementContentChar LessThanSolidus QName GreaterThan Equal IntegerLiteral");
  EXPECT_EQ(scanned.tokens.back().stack, std::vector<int>());
}

TEST(Scanner, WhiteSpaceAfterATargetStartsItsContent) {
  const Scanned scanned("<?t  a ?>");
  EXPECT_EQ(scanned.names(), "PIStart PITarget Char Char PIEnd");
  EXPECT_EQ(scanned.tokens[1].state, XQueryStatePROCESSING_INSTRUCTION);
  EXPECT_EQ(scanned.tokens[2].state, XQueryStatePROCESSING_INSTRUCTION_CONTENT);
  EXPECT_EQ(scanned.units(), u"a ");
  EXPECT_EQ(Scanned("<?t?>").names(), "PIStart PITarget PIEnd");
  EXPECT_EQ(Scanned("<?"
                    "?>")
                .names(),
            "PIStart PIEnd");
}

TEST(Scanner, ATargetMayHaveColonsButMayNotBeXml) {
  EXPECT_EQ(Scanned("<?a:b:c?>").tokens[1].text, "a:b:c");
  EXPECT_EQ(Scanned("<?xml-stylesheet?>").tokens[1].text, "xml-stylesheet");
  EXPECT_EQ(only(Scanned("<?XmL ?>")), error("invalid token (X) - <?XmL ?>", 1));
}

TEST(Scanner, ImportsTakeLocations) {
  const Scanned scanned("import module namespace p = \"u\" at \"a\", 'b'; 1");
  EXPECT_EQ(scanned.names(),
            "ImportModule Namespace NCName Equal StringLiteral AtStringLiteral Comma StringLiteral "
            "Semicolon IntegerLiteral");
  EXPECT_EQ(Scanned("import schema default element namespace 'u' at 'a';").names(),
            "ImportSchema DefaultElement Namespace StringLiteral AtStringLiteral Semicolon");
}

TEST(Scanner, AnUnmatchedBraceLeavesTheStateAlone) {
  const Scanned scanned("}}} 1");
  EXPECT_EQ(scanned.names(), "CurlyBraceRight CurlyBraceRight CurlyBraceRight IntegerLiteral");
}

// --- names and keywords ------------------------------------------------------------------------

TEST(Scanner, KeywordsWhereAnOperandStandsAreNames) {
  EXPECT_EQ(Scanned("for/return").names(), "QName Solidus QName");
  EXPECT_EQ(Scanned("div div div").names(), "QName Div QName");
  EXPECT_EQ(Scanned("if + then").names(), "QName Plus QName");
  EXPECT_EQ(Scanned("declare").names(), "QName");
  EXPECT_EQ(Scanned("empty()").names(), "QNameParenLeft ParenRight");
  EXPECT_EQ(Scanned("item()").names(), "QNameParenLeft ParenRight");
  EXPECT_EQ(Scanned("element").names(), "QName");
  EXPECT_EQ(Scanned("child:a").names(), "QName");
  EXPECT_EQ(Scanned("for:x").tokens[0].text, "for:x");
}

TEST(Scanner, TheLongestRunWins) {
  EXPECT_EQ(Scanned("ancestor-or-self::a").names(), "AncestorOrSelfColonColon QName");
  EXPECT_EQ(Scanned("forest").names(), "QName");
  EXPECT_EQ(Scanned("format-number (1)").names(), "QNameParenLeft IntegerLiteral ParenRight");
  EXPECT_EQ(Scanned("element a {").tokens[0].text, "a");
  EXPECT_EQ(Scanned("element a/b").names(), "QName Error");
  EXPECT_EQ(Scanned("a ) ascending", XQueryStateOPERATOR).names(), "Error");
  EXPECT_EQ(Scanned(") ascending", XQueryStateOPERATOR).names(), "ParenRight Ascending");
}

TEST(Scanner, AKeywordAfterAnOperandEndsWhereItsLettersEnd) {
  EXPECT_EQ(Scanned("a div-3").names(), "QName Div Minus IntegerLiteral");
  EXPECT_EQ(Scanned("a eq\"b\"").names(), "QName Eq StringLiteral");
  EXPECT_EQ(Scanned("a or.").names(), "QName Or Period");
  EXPECT_EQ(only(Scanned("a orange")), error("invalid token (o) - a orange", 1));
  EXPECT_EQ(only(Scanned("a mod2")), error("invalid token (m) - a mod2", 1));
  EXPECT_EQ(only(Scanned("a or_b")), error("invalid token (o) - a or_b", 1));
  EXPECT_EQ(only(Scanned("a or\xC3\xA9")), error("invalid token (o) - a or\xC3\xA9", 1));
}

TEST(Scanner, NamesHaveHyphensPeriodsDigitsAndLettersOfAllScripts) {
  EXPECT_EQ(Scanned("a-b.c_1").tokens[0].text, "a-b.c_1");
  EXPECT_EQ(Scanned("\xC3\xA9t\xC3\xA9:\xD0\xB6\xE4\xB8\xAD").tokens[0].text,
            "\xC3\xA9t\xC3\xA9:\xD0\xB6\xE4\xB8\xAD");
  EXPECT_EQ(Scanned("a\xC2\xB7").tokens[0].text, "a\xC2\xB7");  // a middle dot inside a name
  EXPECT_EQ(Scanned("a - b").names(), "QName Minus QName");
}

TEST(Scanner, ANameEndsBeforeACharacterThatIsNoneOfItsOwn) {
  const Scanned times("a\xC3\x97");
  EXPECT_EQ(times.tokens[0].text, "a");
  EXPECT_EQ(only(times), error("invalid token (\xC3\x97) - a\xC3\x97", 1));
  EXPECT_EQ(only(Scanned("\xC3\x97")), error("invalid token (\xC3\x97) - \xC3\x97", 1));
  EXPECT_EQ(only(Scanned("\xC2\xB7")), error("invalid token (\xC2\xB7) - \xC2\xB7", 1));
  // No letter lies outside the BMP.
  EXPECT_EQ(only(Scanned("\xF0\x90\x90\x80")),
            error("invalid token (\xF0\x90\x90\x80) - \xF0\x90\x90\x80", 1));
  const Scanned colon("a:1");
  EXPECT_EQ(colon.tokens[0].text, "a");
  EXPECT_EQ(only(colon), error("invalid token (:) - a:1", 1));
}

TEST(Scanner, Wildcards) {
  EXPECT_EQ(Scanned("*:a/p:*/*").names(),
            "AsteriskColonNCName Solidus NCNameColonAsterisk Solidus Asterisk");
  EXPECT_EQ(only(Scanned("*:*")), error("invalid token (:) - *:*", 1));
  EXPECT_EQ(Scanned("* * *").names(), "Asterisk Asterisk Asterisk");
}

TEST(Scanner, WordsOfOneTokenMayHaveWhiteSpaceAndCommentsBetweenThem) {
  const Scanned scanned("declare (: a (: b :) :)\n variable(::pragma :) $x := 1");
  EXPECT_EQ(scanned.tokens[0].code, kTokenQName);  // a pragma is no white space
  EXPECT_EQ(Scanned("declare (: a (: b :) :)\n variable (: :) $x").names(),
            "DeclareVariableDollarSign VarName");
  EXPECT_EQ(Scanned("a instance\n(: :)of xs:int").names(), "QName InstanceOf QName");
  EXPECT_EQ(Scanned("f (: \":)\" :) :) (").names(), "QName Error");
  EXPECT_EQ(Scanned("f (: ( :) (").names(), "QNameParenLeft");
  EXPECT_EQ(Scanned("element(:c:)a(:c:){").names(), "ElementQNameCurlyBraceLeft");
  EXPECT_EQ(Scanned("child :: a").names(), "ChildColonColon QName");
  EXPECT_EQ(Scanned("declare (: (:: pragma a:b :) ::) :) ordering").names(), "DeclareOrdering");
}

TEST(Scanner, ARunOfWordsKeepsTheLineOfItsFirst) {
  const Scanned scanned("declare\nvariable\n$x");
  EXPECT_EQ(scanned.tokens[0].line, 0);
  EXPECT_EQ(scanned.tokens[1].line, 2);
}

// --- numbers -----------------------------------------------------------------------------------

TEST(Scanner, Numbers) {
  EXPECT_EQ(Scanned("1 to 2").names(), "IntegerLiteral To IntegerLiteral");
  EXPECT_EQ(Scanned("1.e3").tokens[0].code, kTokenDoubleLiteral);
  EXPECT_EQ(Scanned("00.50").tokens[0].text, "00.50");
  EXPECT_EQ(Scanned("1e").names(), "IntegerLiteral Error");
  EXPECT_EQ(Scanned("1 2").names(), "IntegerLiteral Error");
  EXPECT_EQ(Scanned("1..2").names(), "DecimalLiteral Error");
  EXPECT_EQ(Scanned("1-2").names(), "IntegerLiteral Minus IntegerLiteral");
}

// --- literals and references -------------------------------------------------------------------

TEST(Scanner, ADoubledDelimiterIsOneCharacter) {
  EXPECT_EQ(literal("\"a\"\"b\""), u"a\"b");
  EXPECT_EQ(literal("'a''b'"), u"a'b");
  EXPECT_EQ(literal("\"a''b\""), u"a''b");
  EXPECT_EQ(literal("''''"), u"'");
  EXPECT_EQ(literal("''"), u"");
}

TEST(Scanner, LiteralsKnowTheReferences) {
  EXPECT_EQ(literal("'&lt;&gt;&amp;&quot;&apos;'"), u"<>&\"'");
  EXPECT_EQ(literal("'&#65;&#x42;&#x3b1;'"), u"AB\u03B1");
}

TEST(Scanner, CharacterReferencesOutsideTheBMPAreCodeUnitZero) {
  EXPECT_EQ(literal("\"&#65536;\""), std::u16string(1, u'\0'));
  EXPECT_EQ(literal("\"&#x1F600;\""), std::u16string(1, u'\0'));
  EXPECT_EQ(literal("\"&#65535;&#xFFFF;\""), u"\uFFFF\uFFFF");
  EXPECT_EQ(literal("\"a&#;b&#x;c\""), std::u16string(u"a\0b\0c", 5));
  EXPECT_EQ(literal("\"&#99999999999999999999;\""), std::u16string(1, u'\0'));
}

TEST(Scanner, LiteralsKeepCharactersOfAllKinds) {
  EXPECT_EQ(literal("'\xC3\xA9\xE4\xB8\xAD\xF0\x9F\x98\x80'"), u"\u00E9\u4E2D\U0001F600");
  EXPECT_EQ(literal("'(: {} <a> :)'"), u"(: {} <a> :)");
}

TEST(Scanner, ALiteralHasTheLineOfItsOpeningQuote) {
  const Scanned scanned("\n\"a\n\nb\" + 1");
  EXPECT_EQ(scanned.tokens[0].line, 1);
  EXPECT_EQ(scanned.tokens[0].text, "a\n\nb");
  EXPECT_EQ(scanned.tokens[1].line, 3);
  EXPECT_EQ(Scanned("xquery\nversion\n'1.0'").tokens[0].line, 2);
}

TEST(Scanner, CharRefToUnicode) {
  EXPECT_EQ(CharRefToUnicode("&#65;"), u'A');
  EXPECT_EQ(CharRefToUnicode("&#x41;"), u'A');
  EXPECT_EQ(CharRefToUnicode("&#xaF;"), u'\u00AF');
  EXPECT_EQ(CharRefToUnicode("&#;"), 0);
  EXPECT_EQ(CharRefToUnicode("&#x;"), 0);
  EXPECT_EQ(CharRefToUnicode("&#6a5;"), 605) << "in decimal, what is no digit counts as 0";
  EXPECT_EQ(CharRefToUnicode("&#x4g1;"), 0x401) << "in hexadecimal it only shifts";
  EXPECT_EQ(CharRefToUnicode("&#65536;"), 0);
  EXPECT_EQ(CharRefToUnicode("&#x10000;"), 0);
  EXPECT_EQ(CharRefToUnicode("&#4294967361;"), 0) << "2^32 + 65";
}

TEST(Scanner, PredefinedEntityToUnicode) {
  EXPECT_EQ(PredefinedEntityToUnicode("&amp;"), u'&');
  EXPECT_EQ(PredefinedEntityToUnicode("&apos;"), u'\'');
  EXPECT_EQ(PredefinedEntityToUnicode("&gt;"), u'>');
  EXPECT_EQ(PredefinedEntityToUnicode("&lt;"), u'<');
  EXPECT_EQ(PredefinedEntityToUnicode("&quot;"), u'"');
  EXPECT_EQ(PredefinedEntityToUnicode("&nbsp;"), 0);
}

TEST(Scanner, UTF8ToUnicodeGivesTheFirstCodeUnit) {
  EXPECT_EQ(UTF8ToUnicode("A"), u'A');
  EXPECT_EQ(UTF8ToUnicode("\xC3\xA9"), u'\u00E9');
  EXPECT_EQ(UTF8ToUnicode("\xE4\xB8\xAD"), u'\u4E2D');
  EXPECT_EQ(UTF8ToUnicode("\xF0\x9F\x98\x80"), 0xD83D);
}

TEST(Scanner, UniCodeToUTF8WritesOneToThreeBytes) {
  char bytes[3];
  EXPECT_EQ(UniCodeToUTF8(0x7F, bytes), 1);
  EXPECT_EQ(UniCodeToUTF8(0x80, bytes), 2);
  EXPECT_EQ(std::string(bytes, 2), "\xC2\x80");
  EXPECT_EQ(UniCodeToUTF8(0x7FF, bytes), 2);
  EXPECT_EQ(UniCodeToUTF8(0x800, bytes), 3);
  EXPECT_EQ(std::string(bytes, 3), "\xE0\xA0\x80");
  EXPECT_EQ(UniCodeToUTF8(0xFFFF, bytes), 3);
  EXPECT_EQ(std::string(bytes, 3), "\xEF\xBF\xBF");
}

TEST(Scanner, ContentOutsideTheBMPIsItsHighSurrogate) {
  EXPECT_EQ(Scanned("\xF0\x9F\x98\x80", XQueryStateELEMENT_CONTENT).units(),
            std::u16string(1, 0xD83D));
}

// --- comments, pragmas and extensions ------------------------------------------------------------

TEST(Scanner, CommentsNest) {
  EXPECT_EQ(Scanned("(: outer (: inner :) still comment :) 1").names(), "IntegerLiteral");
  EXPECT_EQ(Scanned("1 (: a :) + (: b\n\n :) 2").tokens[2].line, 2);
  EXPECT_EQ(Scanned("(: :( :: ) ( :) 1").names(), "IntegerLiteral");
}

TEST(Scanner, ACommentMayStandInEveryStateOfExpressionsAndTypes) {
  const Scanned scanned(
      "for (: :) $ (: :) x (: :) as (: :) element (: :) ( (: :) a (: :) , (: :) b (: :) ) (: :) * "
      "(: :) in (: :) 1 (: :) cast as (: :) xs:int");
  EXPECT_TRUE(scanned.errors.empty());
  EXPECT_EQ(scanned.names(),
            "ForDollarSign VarName As ElementParenLeft QName Comma QName ParenRight Asterisk In "
            "IntegerLiteral CastAs QName");
}

TEST(Scanner, PragmasAreIgnored) {
  const Scanned scanned("(:: pragma p:x content ::) 1");
  EXPECT_TRUE(scanned.errors.empty());
  EXPECT_EQ(scanned.names(), "IntegerLiteral");
  EXPECT_EQ(Scanned("(::pragma p:x::)1").names(), "IntegerLiteral");
}

TEST(Scanner, ExtensionsAreRejectedAtTheirLine) {
  const Scanned scanned("\n(::\nextension e:x data ::) 1");
  EXPECT_EQ(only(scanned),
            "XQueryError:14 - \"must-understand extension not supported (e:x data)\" at line:3");
  EXPECT_EQ(scanned.names(), "IntegerLiteral");
  EXPECT_EQ(only(Scanned("(:: extension e:x ::) 1")),
            "XQueryError:14 - \"must-understand extension not supported (e:x )\" at line:1");
  EXPECT_EQ(only(Scanned("(:: extension x a : :) b ::) 1")),
            "XQueryError:14 - \"must-understand extension not supported (x a : :) b)\" at line:1");
}

TEST(Scanner, InsideACommentPragmasAndExtensionsAreIgnored) {
  EXPECT_TRUE(Scanned("(: (:: pragma p:x content ::) :) 1").errors.empty());
  EXPECT_TRUE(Scanned("(: (:: extension p:x content :) ::) :) 1").errors.empty());
  EXPECT_EQ(Scanned("(: (:: extension p:x content ::) :) 1").names(), "IntegerLiteral");
}

TEST(Scanner, OtherKeysAreInvalid) {
  EXPECT_EQ(only(Scanned("(:: other x ::) 1")), error("invalid token (o) - (:: other x ::) 1", 1));
  EXPECT_EQ(only(Scanned("(:: pragmatic ::) 1")),
            error("invalid token (p) - (:: pragmatic ::) 1", 1));
  EXPECT_EQ(only(Scanned("(:: pragma ::) 1")), error("invalid token (:) - (:: pragma ::) 1", 1));
}

// --- errors ------------------------------------------------------------------------------------

TEST(Scanner, MessagesOfInvalidTokensDependOnTheState) {
  EXPECT_EQ(only(Scanned("#")), error("invalid token (#) - #", 1));
  EXPECT_EQ(only(Scanned("'a\x01'")), error("invalid token (\x01) in string literal - 'a\x01'", 1));
  EXPECT_EQ(only(Scanned("\"&\"")), error("invalid token (&) in string literal - \"&\"", 1));
  EXPECT_EQ(only(Scanned("declare xmlspace keep;")),
            error("invalid token (k) expected (preserve or strip) - declare xmlspace keep;", 1));
  EXPECT_EQ(only(Scanned("(:: extension x \x01 ::)")),
            error("invalid token (\x01) expected extension - (:: extension x \x01 ::)", 1));
  EXPECT_EQ(only(Scanned("(:: pragma x \x01 ::)")),
            error("invalid token (\x01) expected pragma - (:: pragma x \x01 ::)", 1));
}

TEST(Scanner, OnlyFiveEntitiesAreKnown) {
  EXPECT_EQ(only(Scanned("'&nbsp;'")), error("invalid token (&) in string literal - '&nbsp;'", 1));
  EXPECT_EQ(only(Scanned("&nbsp;", XQueryStateELEMENT_CONTENT)),
            error("invalid token (&) - &nbsp;", 1));
  EXPECT_EQ(only(Scanned("&amp", XQueryStateQUOT_ATTRIBUTE_CONTENT)),
            error("invalid token (&) - &amp", 1));
  EXPECT_EQ(only(Scanned("'&#x4g;'")), error("invalid token (&) in string literal - '&#x4g;'", 1));
}

TEST(Scanner, ContentHasCharactersThatNeedEscaping) {
  EXPECT_EQ(only(Scanned("a}", XQueryStateELEMENT_CONTENT)), error("invalid token (}) - a}", 1));
  EXPECT_EQ(only(Scanned("a<", XQueryStateQUOT_ATTRIBUTE_CONTENT)),
            error("invalid token (<) - a<", 1));
  EXPECT_EQ(only(Scanned("\x02", XQueryStateXML_COMMENT)), error("invalid token (\x02) - \x02", 1));
}

TEST(Scanner, AnInvalidTokenIsOneWholeCharacter) {
  EXPECT_EQ(only(Scanned("1\n \xF0\x9F\x98\x80")),
            error("invalid token (\xF0\x9F\x98\x80) -  \xF0\x9F\x98\x80", 2));
  EXPECT_EQ(only(Scanned("\xEF\xBF\xBF")), error("invalid token (\xEF\xBF\xBF) - \xEF\xBF\xBF", 1));
  const Scanned nul(std::string_view("1 \0", 3));
  EXPECT_EQ(nul.names(), "IntegerLiteral Error");
  EXPECT_EQ(nul.tokens[1].text, std::string("invalid token (\0)", 17));
}

TEST(Scanner, EndInsideACommentNamesTheLineOfTheLastOpening) {
  EXPECT_EQ(only(Scanned("1\n(: a\n\n")), error("comment not terminated  - (: a", 2));
  EXPECT_EQ(only(Scanned("(: a\n(: b\n:)\n")), error("comment not terminated  - (: b", 2));
  EXPECT_EQ(Scanned("1\n(: a\n\n").tokens.back().line, 1);
  EXPECT_EQ(Scanned("1\n(: a\n\n").endLine, 3) << "the counter stands where the scan stands";
}

TEST(Scanner, EndInsideAnExtensionOrPragmaNamesTheLineOfTheLastOpening) {
  EXPECT_EQ(only(Scanned("(: :)\n\n(:: extension x a\n")),
            error("extension not terminated  - (:: extension x a", 3));
  EXPECT_EQ(only(Scanned("\n(: :)\n(:: pragma x a\n")),
            error("pragma not terminated  - (:: pragma x a", 3));
}

TEST(Scanner, EndInsideALiteralNamesItsOpening) {
  EXPECT_EQ(only(Scanned("\n\n\"a\nb\n")), error("String not terminated  - \"a", 3));
  EXPECT_EQ(only(Scanned("'a\"")), error("String not terminated  - 'a\"", 1));
}

TEST(Scanner, EndElsewhereEndsTheTokens) {
  for (int state = 0; state < XQueryStateCount; ++state) {
    const bool isBetweenTokens =
        (state < XQueryStateEXPR_COMMENT || state > XQueryStatePRAG_CONTENT) &&
        state != XQueryStateSTRING_LITERAL_QUOTE && state != XQueryStateSTRING_LITERAL_APOS;
    if (!isBetweenTokens) continue;
    const Scanned scanned("", state);
    EXPECT_TRUE(scanned.tokens.empty()) << sXQueryStateStrings[state];
    EXPECT_TRUE(scanned.errors.empty()) << sXQueryStateStrings[state];
  }
}

TEST(Scanner, NoByteSequenceStopsTheScan) {
  // Every pair of bytes in every state; what the decoder rejects never reaches the scanner.
  for (int state = 0; state < XQueryStateCount; ++state) {
    for (int first = 0; first < 128; ++first) {
      for (const int second :
           {0, 10, 34, 38, 39, 40, 42, 45, 47, 58, 60, 62, 91, 93, 97, 123, 125}) {
        const char text[] = {static_cast<char>(first), static_cast<char>(second)};
        const Scanned scanned(std::string_view(text, 2), state, {XQueryStateELEMENT_CONTENT});
        EXPECT_LE(scanned.tokens.size(), 2u);
      }
    }
  }
}

// --- logs --------------------------------------------------------------------------------------

class ScannerLog : public testing::Test {
 protected:
  // What the scan of `text` writes.
  static Strings logged(std::string_view text, int state, bool tokens, bool states, bool source) {
    Scanned warmUp("");  // the environment is read at the first scan
    sXQueryLogTokens = tokens;
    sXQueryLogStates = states;
    sXQueryLogTokenSource = source;
    testing::internal::CaptureStderr();
    Scanned scanned(text, state);
    const std::string output = testing::internal::GetCapturedStderr();
    sXQueryLogTokens = sXQueryLogStates = sXQueryLogTokenSource = false;
    Strings lines;
    for (size_t start = 0; start < output.size();) {
      const size_t end = output.find('\n', start);
      lines.push_back(output.substr(start, end - start));
      start = end + 1;
    }
    return lines;
  }
};

TEST_F(ScannerLog, TokensWithTheirValues) {
  EXPECT_EQ(logged("\na + 'b'", XQueryStateDEFAULT, true, false, false),
            (Strings{"token:kTokenQName(395) line:1 value:a", "token:kTokenPlus(389) line:1 value:",
                     "token:kTokenStringLiteral(413) line:1 value:b", "token:(0) line:1 value:"}));
}

TEST_F(ScannerLog, CharactersAreHexadecimal) {
  EXPECT_EQ(logged("a{{\xE4\xB8\xAD", XQueryStateELEMENT_CONTENT, true, false, false),
            (Strings{"token:kTokenElementContentChar(321) line:0 value:0x0061",
                     "token:kTokenCurlyBraceLeftCurlyBraceLeft(291) line:0 value:{",
                     "token:kTokenElementContentChar(321) line:0 value:0x4E2D",
                     "token:(0) line:0 value:"}));
}

TEST_F(ScannerLog, SourcesOfTokens) {
  EXPECT_EQ(logged("for $x", XQueryStateDEFAULT, true, false, true),
            (Strings{"token:kTokenForDollarSign(338) line:0 value: source:for $",
                     "token:kTokenVarName(429) line:0 value:x source:x",
                     "token:(0) line:0 value: source:"}));
  EXPECT_EQ(logged("'a''&lt;'", XQueryStateDEFAULT, true, false, true)[0],
            "token:kTokenStringLiteral(413) line:0 value:a'< source:'a''&lt;'");
  EXPECT_EQ(logged("&#65;", XQueryStateELEMENT_CONTENT, true, false, true)[0],
            "token:kTokenCharRef(282) line:0 value:0x0041 source:&#65;");
}

TEST_F(ScannerLog, StateChanges) {
  EXPECT_EQ(logged("{1}", XQueryStateDEFAULT, false, true, false),
            (Strings{"State Push:OPERATOR", "State Set:OPERATOR", "State Pop"}));
  EXPECT_EQ(logged("+ +", XQueryStateDEFAULT, false, true, false), Strings{})
      << "setting the current state is no change";
}

TEST_F(ScannerLog, SourceIsKeptOnlyWhenLogged) {
  EXPECT_EQ(Scanned("a").tokens[0].source, "");
}

TEST_F(ScannerLog, AZeroDoesNotSwitchOffWhatTheDefaultSwitchesOn) {
  const char* const name = "XQUERY_TEST_SWITCH";
  ::unsetenv(name);
  EXPECT_FALSE(XQScannerGetEnv(name, false));
  EXPECT_TRUE(XQScannerGetEnv(name, true));
  ::setenv(name, "", 1);
  EXPECT_TRUE(XQScannerGetEnv(name, true));
  ::setenv(name, "0", 1);
  EXPECT_FALSE(XQScannerGetEnv(name, false));
  EXPECT_TRUE(XQScannerGetEnv(name, true));
  ::setenv(name, "no", 1);
  EXPECT_TRUE(XQScannerGetEnv(name, false));
  ::unsetenv(name);
}

TEST_F(ScannerLog, TheDefaultGoesForAllSwitches) {
  ::setenv("XQUERY_LOG_DEFAULT", "1", 1);
  ::setenv("XQUERY_LOG_TOKENS", "0", 1);
  XQScannerReadSwitches();
  const bool all = sXQueryLogTokens && sXQueryLogStates && sXQueryLogTokenSource && XQdebug == 1;
  ::unsetenv("XQUERY_LOG_DEFAULT");
  ::setenv("XQUERY_LOG_TOKENS", "1", 1);
  XQScannerReadSwitches();
  const bool one = sXQueryLogTokens && !sXQueryLogStates && !sXQueryLogTokenSource && XQdebug == 0;
  ::unsetenv("XQUERY_LOG_TOKENS");
  XQScannerReadSwitches();
  EXPECT_TRUE(all);
  EXPECT_TRUE(one);
  EXPECT_FALSE(sXQueryLogTokens);
}

}  // namespace
}  // namespace xquery
