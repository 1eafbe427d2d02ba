// Documents that take long to read, or much memory.
#include "LimitRows.h"

namespace bench {
namespace {

constexpr const char* readXML = "count(doc('app:a')//node())";
constexpr const char* readHTML = "count(doc('app:a.html')//node())";

std::string withSubset(const std::string& declarations, const std::string& body = "<r/>") {
  return "<!DOCTYPE r [" + declarations + "]>" + body;
}

}  // namespace

std::vector<LimitRow> readingRows() {
  return {
      // --- document type declarations ------------------------------------------------------------
      {"dtd: defaulted attributes", readXML,
       [] { return withSubset("<!ATTLIST r " + repeated("a@ CDATA 'x' ", 100'000) + ">"); }},
      {"dtd: tokens of an enumeration", readXML,
       [] { return withSubset("<!ATTLIST r a (t" + repeated("|t@", 200'000) + ") #IMPLIED>"); }},
      {"dtd: notations of an attribute", readXML,
       [] {
         return withSubset("<!ATTLIST r a NOTATION (n" + repeated("|n@", 200'000) + ") #IMPLIED>");
       }},
      {"dtd: attribute lists", readXML,
       [] { return withSubset(repeated("<!ATTLIST e@ a CDATA 'x'>", 150'000)); }},
      {"dtd: attribute lists of one element", readXML,
       [] { return withSubset(repeated("<!ATTLIST r a@ CDATA #IMPLIED>", 100'000)); }},
      {"dtd: names in a content model", readXML,
       [] { return withSubset("<!ELEMENT r (a" + repeated("|a@", 300'000) + ")*>"); }},
      {"dtd: content model of 8 MiB", readXML,
       [] { return withSubset("<!ELEMENT r (a" + repeated(",a", 4 << 20) + ")>"); }},
      {"dtd: nested content model", readXML,
       [] {
         return withSubset("<!ELEMENT r " + repeated("(", 2000) + "a" + repeated(")", 2000) + ">");
       }},
      {"dtd: entities", readXML, [] { return withSubset(repeated("<!ENTITY e@ 'x'>", 300'000)); }},
      {"dtd: entities of entities", readXML,
       [] {
         return withSubset("<!ENTITY e0 'xxxxxxxxxx'>" +
                               repeated("<!ENTITY f@ '&e0;&e0;&e0;&e0;&e0;&e0;&e0;&e0;'>", 2000),
                           "<r>" + repeated("&f@;", 2000) + "</r>");
       }},
      {"dtd: one long entity often", readXML,
       [] {
         return withSubset("<!ENTITY e '" + std::string(100'000, 'x') + "'>",
                           "<r>" + repeated("&e;", 5000) + "</r>");
       }},
      {"dtd: entities in attributes", readXML,
       [] {
         return withSubset("<!ENTITY e '" + std::string(10'000, 'x') + "'>",
                           "<r a='" + repeated("&e;", 20'000) + "'/>");
       }},
      {"dtd: notations", readXML,
       [] { return withSubset(repeated("<!NOTATION n@ SYSTEM 'x'>", 300'000)); }},
      {"dtd: parameter entities", readXML,
       [] { return withSubset(repeated("<!ENTITY % p@ 'x'>", 200'000)); }},
      {"dtd: id attributes", readXML,
       [] {
         return withSubset("<!ATTLIST e id ID #IMPLIED>",
                           "<r>" + repeated("<e id='i@'/>", 500'000) + "</r>");
       }},
      // --- documents -----------------------------------------------------------------------------
      {"xml: attributes of one tag", readXML,
       [] { return "<r " + repeated("a@='' ", 400'000) + "/>"; }},
      {"xml: namespaces of one tag", readXML,
       [] { return "<r " + repeated("xmlns:a@='u@' ", 200'000) + "/>"; }},
      {"xml: namespaces on 60 levels", readXML,
       [] {
         std::string text;
         for (int level = 0; level < 60; ++level) {
           text += "<e " + repeated("xmlns:p" + std::to_string(level) + "_@='u@' ", 5900) + ">";
         }
         return text + repeated("</e>", 60);
       }},
      {"xml: a million levels", readXML,
       [] { return repeated("<e>", 1'000'000) + repeated("</e>", 1'000'000); }},
      {"xml: elements", readXML,
       [] { return "<r>" + repeated("<e a='1'>x</e>", 3'000'000) + "</r>"; }},
      {"xml: one long text", readXML,
       [] { return "<r>" + std::string(150'000'000, 'x') + "</r>"; }},
      {"xml: one long attribute", readXML,
       [] { return "<r a='" + std::string(100'000'000, 'x') + "'/>"; }},
      {"xml: one long comment", readXML,
       [] { return "<r><!--" + std::string(100'000'000, 'x') + "--></r>"; }},
      {"xml: one long instruction", readXML,
       [] { return "<r><?p " + std::string(100'000'000, 'x') + "?></r>"; }},
      {"xml: one long section", readXML,
       [] { return "<r><![CDATA[" + std::string(100'000'000, ']') + "]]></r>"; }},
      {"xml: sections", readXML,
       [] { return "<r>" + repeated("<![CDATA[x]]>", 4'000'000) + "</r>"; }},
      {"xml: character references", readXML,
       [] { return "<r>" + repeated("&#233;", 10'000'000) + "</r>"; }},
      {"xml: one long name", readXML, [] { return "<" + std::string(9'000'000, 'n') + "/>"; }},
      {"xml: names", readXML, [] { return "<r>" + repeated("<e@/>", 1'000'000) + "</r>"; }},
      {"xml: wide text", readXML,
       [] { return "<r>" + repeated("\xE2\x82\xAC", 40'000'000) + "</r>"; }},
      {"xml: blanks before an error", readXML,
       [] { return "<r>" + std::string(100'000'000, '\n') + "</q>"; }},
      // --- HTML ----------------------------------------------------------------------------------
      {"html: empty elements", readHTML, [] { return repeated("<br>", 2'000'000); }},
      {"html: nested elements", readHTML, [] { return repeated("<div>", 200'000); }},
      {"html: inline elements not closed", readHTML, [] { return repeated("<b><i>x", 100'000); }},
      {"html: attributes of one tag", readHTML,
       [] { return "<p " + repeated("a@='' ", 100'000) + ">x"; }},
      {"html: attributes of many tags", readHTML,
       [] { return repeated("<p " + repeated("a@='' ", 4000) + ">x", 60); }},
      {"html: tables", readHTML, [] { return repeated("<table><tr><td>", 50'000); }},
      {"html: fonts", readHTML, [] { return repeated("<font size=1>x<p>", 50'000); }},
      {"html: lists", readHTML, [] { return repeated("<ul><li>", 50'000); }},
      {"html: one long text", readHTML, [] { return "<p>" + std::string(60'000'000, 'x'); }},
      {"html: characters", readHTML, [] { return "<p>" + repeated("&eacute;", 5'000'000); }},
      {"html: comments", readHTML, [] { return repeated("<!-- -- - -->", 2'000'000); }},
  };
}

}  // namespace bench
