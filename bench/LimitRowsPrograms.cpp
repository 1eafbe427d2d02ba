// Recursion, inner queries, stylesheets, loading, compiling.
#include "LimitRows.h"

namespace bench {
namespace {

constexpr const char* often = "for $i in 1 to 1000000 ";

// The stylesheet is the document that the query loads.
std::string applied(const std::string& document = "document {<a/>}") {
  return "count(ext:xslt-uri(" + document + ", 'app:a'))";
}
std::string stylesheet(const std::string& content, const std::string& attributes = "") {
  return "<xsl:stylesheet version='1.0' xmlns:xsl='http://www.w3.org/1999/XSL/Transform' " +
         attributes + ">" + content + "</xsl:stylesheet>";
}
std::string root(const std::string& content) {
  return stylesheet("<xsl:template match='/'>" + content + "</xsl:template>");
}
std::string recursive(const std::string& content) {
  return stylesheet(
      "<xsl:template match='/'><r><xsl:call-template name='t'/></r></xsl:template>"
      "<xsl:template name='t'><xsl:param name='n' select='1000'/>" +
      content + "</xsl:template>");
}
const std::string again =
    "<xsl:call-template name='t'><xsl:with-param name='n' select='$n - 1'/>"
    "</xsl:call-template>";
std::string wide() {
  return "<a>" + repeated("<b k='@'>x</b>", 100'000) + "</a>";
}
std::string apply() {
  return applied();
}
std::string applyToItem() {
  return applied("/");
}

}  // namespace

std::vector<LimitRow> programRows() {
  return {
      // --- recursion
      {"recursion: endless", "declare function local:f($n) { local:f($n + 1) + 1 }; local:f(1)"},
      {"recursion: endless, with a loop",
       "declare function local:f($n) { for $x in ($n, 1) return local:f($x) + 1 }; local:f(1)"},
      {"recursion: endless, in predicates",
       "declare function local:f($n) { (1, 2)[local:f($n + 1) = 1] }; local:f(1)"},
      {"recursion: endless, constructing",
       "declare function local:f($n) { <a>{local:f($n + 1)}</a> }; local:f(1)"},
      {"recursion: branching",
       "declare function local:f($n) { if ($n < 2) then 1 else local:f($n - 1) + local:f($n - 2) "
       "}; local:f(80)"},
      {"recursion: deadline inside",
       "declare function local:f($n) { if ($n = 0) then count(for $i in 1 to 100000000 where $i < "
       "0 "
       "return $i) else local:f($n - 1) + 1 }; local:f(80000)"},
      {"recursion: errors swallowed deep inside",
       "declare function local:f($n) { if ($n = 0) then count((1 to 100000000)[. < 'a']) else "
       "local:f($n - 1) + 1 }; local:f(50000)"},
      // --- inner queries
      {"inner: one tag of many attributes",
       "ext:eval(concat('<a ', string-join(for $i in 1 to 400000 return concat('a', $i, "
       "'=&quot;&quot;'), ' '), '/>'))"},
      {"inner: line feeds before an error",
       [] { return doubledText("\n\n\n\n\n\n\n\n", 21) + "return ext:eval(concat($s, '&lt;'))"; }},
      {"inner: parentheses",
       [] {
         return doubledText("((((((((((((((((", 13) +
                "let $t := translate($s, '(', ')') return ext:eval(concat($s, '1', $t))";
       }},
      {"inner: a long sum",
       [] { return doubledText("1+1+1+1+1+1+1+1+", 17) + "return ext:eval(concat($s, '1'))"; }},
      {"inner: a long literal",
       [] {
         return doubledText("0123456789abcdef", 22) +
                "return ext:eval(concat('&quot;', $s, '&quot;'))";
       }},
      {"inner: a long path",
       [] { return doubledText("a/a/a/a/a/a/a/a/", 17) + "return ext:eval(concat($s, 'a'))"; }},
      {"inner: variables",
       "ext:eval(concat(string-join(for $i in 1 to 100000 return concat('declare variable $v', $i, "
       "' := 1;'), ' '), '1'))"},
      {"inner: functions",
       "ext:eval(concat(string-join(for $i in 1 to 100000 return concat('declare function "
       "local:f', "
       "$i, '() { 1 };'), ' '), '1'))"},
      {"inner: namespaces",
       "ext:eval(concat(string-join(for $i in 1 to 100000 return concat('declare namespace p', $i, "
       "' = &quot;u', $i, '&quot;;'), ' '), '1'))"},
      {"inner: comments nested",
       [] {
         return doubledText("(:(:(:(:(:(:(:(:", 17) +
                "let $t := translate($s, '(:', ':)') return ext:eval(concat($s, $t, '1'))";
       }},
      {"inner: many", "for $i in 1 to 10000000 return ext:eval('1 + 1')"},
      {"inner: in one another",
       "declare function local:f($q, $n) { if ($n = 0) then $q else "
       "local:f(concat('ext:eval(&quot;', "
       "replace($q, '&quot;', '&quot;&quot;'), '&quot;)'), $n - 1) }; ext:eval(local:f('1', 20))"},
      {"inner: for each node", "count(//b[ext:node-xquery(., 'count(//b)') = 0])", {}, wide},
      // --- stylesheets
      {"stylesheet: doubling work", apply,
       [] { return recursive("<xsl:if test='$n'>" + again + again + "</xsl:if>"); }},
      {"stylesheet: doubling output", apply,
       [] { return recursive("<x/><xsl:if test='$n'>" + again + again + "</xsl:if>"); }},
      {"stylesheet: doubling text", apply,
       [] {
         return stylesheet(
             "<xsl:template match='/'><r><xsl:call-template name='t'/></r></xsl:template>"
             "<xsl:template name='t'><xsl:param name='s' select=\"'xx'\"/>"
             "<xsl:call-template name='t'><xsl:with-param name='s' "
             "select='concat($s, $s)'/></xsl:call-template></xsl:template>");
       }},
      {"stylesheet: expression", applyToItem,
       [] {
         return root("<r><xsl:value-of select='count(//*[count(//*[count(//*) > 0]) > 0])'/></r>");
       },
       wide},
      {"stylesheet: union", applyToItem,
       [] { return root("<r><xsl:value-of select='count(//b|//@k|//b)'/></r>"); }, wide},
      {"stylesheet: translate", applyToItem,
       [] {
         return root("<r><xsl:value-of select=\"translate(/, translate(/, 'x', 'y'), '')\"/></r>");
       },
       wide},
      {"stylesheet: keys", applyToItem,
       [] {
         return stylesheet(
             "<xsl:key name='k' match='b' use='@k'/><xsl:template match='/'><r>"
             "<xsl:value-of select=\"count(key('k', //@k))\"/></r></xsl:template>");
       },
       wide},
      {"stylesheet: sort", applyToItem,
       [] {
         return root(
             "<r><xsl:for-each select='//b'><xsl:sort "
             "select='string(//b[@k=current()/@k])'/></xsl:for-each></r>");
       },
       wide},
      {"stylesheet: copies", applyToItem,
       [] {
         return root("<r><xsl:for-each select='//b'><xsl:copy-of select='/'/></xsl:for-each></r>");
       },
       wide},
      {"stylesheet: variables", apply,
       [] { return stylesheet(repeated("<xsl:variable name='v@' select='1'/>", 100'000)); }},
      {"stylesheet: templates", apply,
       [] { return stylesheet(repeated("<xsl:template match='a' priority='@'/>", 100'000)); }},
      {"stylesheet: variables inside the bound", apply,
       [] { return stylesheet(repeated("<xsl:variable name='v@' select='1'/>", 6'500)); }},
      {"stylesheet: decimal formats inside the bound", apply,
       [] { return stylesheet(repeated("<xsl:decimal-format name='d@'/>", 6'500)); }},
      {"stylesheet: instructions inside the bound", apply,
       [] { return root(repeated("<xsl:value-of select='1'/>", 160'000)); }},
      {"stylesheet: imports itself", apply,
       [] { return stylesheet("<xsl:import href='app:b'/>"); }},
      // --- loading
      {"load: a silent host", "count(doc('silent:a'))"},
      {"load: a silent server", "count(doc('SILENT-SERVER'))"},
      {"load: an endless answer", "count(doc('ENDLESS-SERVER'))"},
      {"load: refused documents", "for $i in 1 to 100000000 return doc(concat('refused:', $i))"},
      {"load: missing documents", "for $i in 1 to 100000000 return doc(concat('missing:', $i))"},
      {"load: bodies", "for $i in 1 to 100000000 return ext:uri-body(concat('app:', $i))",
       "0123456789abcdef"},
      {"load: large bodies", "for $i in 1 to 100000000 return ext:uri-body(concat('app:', $i))",
       [] { return std::string(1'000'000, 'x'); }},
      // --- compiling
      {"compile: a query of 6 MB",
       [] { return "1" + repeated(" + 1", 1'500'000); },
       {},
       {},
       Door::Compile},
      {"compile: parentheses",
       [] { return repeated("(", 1'000'000) + "1" + repeated(")", 1'000'000); },
       {},
       {},
       Door::Compile},
      {"compile: elements",
       [] { return repeated("<a b='{1}'>{1}</a>,", 200'000) + "1"; },
       {},
       {},
       Door::Compile},
      {"compile: attributes of one tag",
       [] { return "<a " + repeated("a@='' ", 400'000) + "/>"; },
       {},
       {},
       Door::Compile},
      {"compile: functions",
       [] { return repeated("declare function local:f@($a) { $a };", 100'000) + "1"; },
       {},
       {},
       Door::Compile},
      {"compile: variables",
       [] { return repeated("declare variable $v@ := 1;", 200'000) + "1"; },
       {},
       {},
       Door::Compile},
      {"compile: comments",
       [] { return repeated("(: x :)", 2'000'000) + "1"; },
       {},
       {},
       Door::Compile},
      {"compile: blanks before an error",
       [] { return std::string(50'000'000, '\n') + "<"; },
       {},
       {},
       Door::Compile},
      {"compile: steps that are expressions",
       [] { return repeated("a/(b)/", 100'000) + "a"; },
       {},
       {},
       Door::Compile},
      {"compile: predicates of one step",
       [] { return "a" + repeated("[b = 1]", 100'000); },
       {},
       {},
       Door::Compile},
      {"compile: clauses",
       [] { return repeated("let $x := a[b] ", 100'000) + "return $x"; },
       {},
       {},
       Door::Compile},
      {"compile: imports from a silent server",
       [] {
         std::string text;
         for (int index = 0; index < 10; ++index) {
           text += "import module namespace m" + std::to_string(index) + " = 'urn:m" +
                   std::to_string(index) + "' at 'SILENT-SERVER" + std::to_string(index) + "';";
         }
         return text + "1";
       },
       {},
       {},
       Door::Compile},
  };
}

}  // namespace bench
