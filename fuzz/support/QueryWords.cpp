#include "support/QueryWords.h"

#include "xquery/XQuery.h"

#include <algorithm>
#include <deque>
#include <string>

namespace xquery::fuzz {

const Words& literals() {
  static const Words words = {"1",
                              "2",
                              "0",
                              "-1",
                              "2.5",
                              "1e0",
                              "'u'",
                              "'1'",
                              "''",
                              "()",
                              ".",
                              "$i",
                              "$j",
                              "$g",
                              "$p",
                              "$n",
                              "$t",
                              "(1, 2, 3)",
                              "1 to 5",
                              "//a",
                              "@x",
                              "//@x",
                              "last()",
                              "*",
                              "..",
                              "/",
                              "position()",
                              "true()",
                              "'a'",
                              "<a/>",
                              "1e400",
                              "'NaN'",
                              "'2004-10-29'",
                              "'P1D'",
                              "'&#x10FFFF;'",
                              "99999999999999999999",
                              "0.000000000000000000001",
                              "text()",
                              "(<b x='1'/>, <a/>)",
                              "(# p #)"};
  return words;
}

const Words& axes() {
  static const Words words = {"",
                              "",
                              "",
                              "",
                              "@",
                              "self::",
                              "child::",
                              "descendant::",
                              "descendant-or-self::",
                              "parent::",
                              "ancestor::",
                              "ancestor-or-self::",
                              "following::",
                              "following-sibling::",
                              "preceding::",
                              "preceding-sibling::",
                              "attribute::",
                              "namespace::"};
  return words;
}

const Words& nodeTests() {
  static const Words words = {"a",
                              "b",
                              "c",
                              "x",
                              "*",
                              "a",
                              "b",
                              "*:a",
                              "p:*",
                              "node()",
                              "text()",
                              "comment()",
                              "processing-instruction()",
                              "processing-instruction('a')",
                              "element()",
                              "element(a)",
                              "element(a, xs:string)",
                              "attribute(x)",
                              "document-node()",
                              "(a | b)",
                              "string(.)",
                              "position()",
                              ".",
                              ".."};
  return words;
}

const Words& binaryOperators() {
  static const Words words = {" + ",  " - ",     " * ",         " div ",    " idiv ", " mod ",
                              " = ",  " != ",    " < ",         " <= ",     " > ",    " >= ",
                              " eq ", " ne ",    " lt ",        " le ",     " gt ",   " ge ",
                              " is ", " << ",    " >> ",        " and ",    " or ",   " to ",
                              " | ",  " union ", " intersect ", " except ", ", "};
  return words;
}

const Words& orderModifiers() {
  static const Words words = {"", " descending", " ascending", " empty least",
                              " descending empty greatest"};
  return words;
}

const Words& atomicTypes() {
  static const Words words = {"xs:string",
                              "xs:boolean",
                              "xs:double",
                              "xs:float",
                              "xs:decimal",
                              "xs:anyURI",
                              "xs:QName",
                              "xs:gYearMonth",
                              "xs:gYear",
                              "xs:gMonthDay",
                              "xs:gDay",
                              "xs:gMonth",
                              "xs:dateTime",
                              "xs:date",
                              "xs:time",
                              "xs:duration",
                              "xs:base64Binary",
                              "xs:hexBinary",
                              "xs:NOTATION",
                              "xdt:yearMonthDuration",
                              "xdt:dayTimeDuration",
                              "xdt:untypedAtomic",
                              "xs:normalizedString",
                              "xs:token",
                              "xs:language",
                              "xs:Name",
                              "xs:NCName",
                              "xs:ID",
                              "xs:IDREF",
                              "xs:ENTITY",
                              "xs:NMTOKEN",
                              "xs:integer",
                              "xs:nonNegativeInteger",
                              "xs:positiveInteger",
                              "xs:nonPositiveInteger",
                              "xs:negativeInteger",
                              "xs:long",
                              "xs:int",
                              "xs:short",
                              "xs:byte",
                              "xs:unsignedLong",
                              "xs:unsignedInt",
                              "xs:unsignedShort",
                              "xs:unsignedByte"};
  return words;
}

const Words& sequenceTypes() {
  static const Words words = {"item()*",
                              "item()",
                              "node()",
                              "node()?",
                              "element()",
                              "element(a)*",
                              "attribute()",
                              "attribute(x)+",
                              "text()",
                              "document-node()",
                              "xs:integer",
                              "xs:integer?",
                              "xs:string*",
                              "xs:decimal",
                              "xs:double",
                              "xdt:untypedAtomic",
                              "xdt:anyAtomicType*",
                              "empty()",
                              "comment()",
                              "processing-instruction()",
                              "xs:date?"};
  return words;
}

const Words& prologItems() {
  static const Words words = {"declare namespace p = 'urn:p';",
                              "declare default element namespace 'urn:p';",
                              "declare default function namespace 'urn:p';",
                              "declare base-uri 'http://h/a/';",
                              "declare ordering unordered;",
                              "declare construction preserve;",
                              "declare default order empty greatest;",
                              "declare xmlspace preserve;",
                              "declare boundary-space preserve;",
                              "declare default collation 'urn:c';",
                              "declare variable $e external;",
                              "import schema 'urn:s';",
                              "import module namespace m = 'urn:m';",
                              "module namespace p = 'urn:p';",
                              "xquery version '1.0';",
                              "declare function p:h() external;",
                              "declare validation skip;",
                              "declare inherit-namespaces no;",
                              "declare copy-namespaces no-preserve, inherit;"};
  return words;
}

namespace {

constexpr std::string_view libraryNamespaces[][2] = {
    {"http://www.w3.org/2001/XMLSchema", "xs:"},
    {"http://libxquery.example/xquery/2004/10/functions", "ext:"}};

// What answers anew each time, or goes to see.
bool isLeftOut(std::string_view name) {
  return name.starts_with("current-") || name == "real-date-time" || name == "uri-body" ||
         name.starts_with("xslt") || name == "doc";
}

std::string_view prefixOf(const XQueryFunctionName& name) {
  for (const auto& [URI, prefix] : libraryNamespaces) {
    if (name.namespaceURI == URI) return prefix;
  }
  return name.namespaceURI.find("datatypes") == std::string::npos ? "" : "xdt:";
}

}  // namespace

const Words& functionNames() {
  static const Words words = [] {
    static std::deque<std::string> texts = {"local:f", "local:g"};
    for (const XQueryFunctionName& name : XQueryLibraryFunctions()) {
      if (isLeftOut(name.localName)) continue;
      texts.push_back(std::string(prefixOf(name)) + name.localName);
    }
    std::sort(texts.begin(), texts.end());
    return Words(texts.begin(), texts.end());
  }();
  return words;
}

const Words& queryWords() {
  static const Words words = [] {
    Words all = {"for",         "let",         "where",
                 "return",      "order by",    "stable",
                 "some",        "every",       "satisfies",
                 "if",          "then",        "else",
                 "typeswitch",  "case",        "default",
                 "cast as",     "castable as", "treat as",
                 "instance of", "in",          "at",
                 ":=",          "(:",          ":)",
                 "(::",         "::)",         "<a>",
                 "</a>",        "<a",          "/>",
                 "<!--",        "-->",         "<?a",
                 "?>",          "<![CDATA[",   "]]>",
                 "{",           "}",           "{{",
                 "}}",          "&lt;",        "&#x41;",
                 "ordered {",   "unordered {", "validate {",
                 "text {",      "comment {",   "document {",
                 "element {",   "attribute {", "namespace p {",
                 "'",           "\"",          ";",
                 ",",           "(",           ")",
                 "[",           "]",           "$",
                 ".",           "..",          "//"};
    for (const Words* more : {&literals(), &axes(), &nodeTests(), &binaryOperators(),
                              &atomicTypes(), &sequenceTypes(), &prologItems(), &functionNames()}) {
      all.insert(all.end(), more->begin(), more->end());
    }
    return all;
  }();
  return words;
}

}  // namespace xquery::fuzz
