// Walks, constructors, serialisation, and giving back what was made.
#include "LimitRows.h"

namespace bench {
namespace {

std::string wide() {
  return "<r>" + repeated("<e>text</e>", 300'000) + "</r>";
}
std::string deep() {
  return repeated("<e>", 200'000) + repeated("</e>", 200'000);
}
std::string deepWithBases() {
  return repeated("<e xml:base='a/'>", 50'000) + repeated("</e>", 50'000);
}
std::string nested() {
  return repeated("<a><b/>", 10'000) + repeated("<c/>", 10'000) + repeated("</a>", 10'000);
}
std::string deepNamespaces() {
  return repeated("<e xmlns:p@='u@'>", 5'000) + repeated("</e>", 5'000);
}
std::string keyed() {
  return "<r>" + repeated("<e id='i@' ref='i@'>@</e>", 300'000) + "</r>";
}

constexpr const char* often = "for $i in 1 to 1000000 ";

}  // namespace

std::vector<LimitRow> treeRows() {
  return {
      // --- walks
      {"walk: descendants", "for $i in 1 to 1000000 return count(//missing)", {}, wide},
      {"walk: siblings", "count(//e[count(following-sibling::e) < 0])", {}, wide},
      {"walk: preceding", "count(//e[preceding::missing])", {}, wide},
      {"walk: following", "count(//e[following::missing])", {}, wide},
      {"walk: ancestors", "count(//e[count(ancestor::e) < 0])", {}, deep},
      {"walk: descendants of all", "count(//e[count(.//e) < 0])", {}, deep},
      {"walk: three steps",
       "count(//a//b[.//b = //missing or count(ancestor::a) < 0])",
       {},
       nested},
      {"walk: descendant steps", "count(//a//a//a//c)", {}, nested},
      {"walk: positions", "count(//e[position() = last()][2])", {}, deep},
      {"walk: backwards", "count(//e/preceding-sibling::e[200000])", {}, wide},
      {"walk: union", "for $i in 1 to 1000000 return count(//e | //text())", {}, wide},
      {"walk: except", "for $i in 1 to 1000000 return count((//e, //e) except //e[1])", {}, wide},
      {"walk: document order", "for $i in 1 to 1000000 return count(reverse(//e)/..)", {}, wide},
      {"walk: node comparison",
       "count(for $x in //e, $y in //e where $x << $y return 1)",
       {},
       wide},
      {"walk: several trees",
       "let $t := for $i in 1 to 100000 return <a/> for $i in 1 to 1000000 return count($t | "
       "reverse($t))"},
      {"walk: string values", "for $i in 1 to 1000000 return string-length(string(/))", {}, wide},
      {"walk: string value of each", "count(//e[string(.) = 'x'])", {}, deep},
      {"walk: atomized", "for $i in 1 to 1000000 return count(data(//e))", {}, wide},
      {"walk: deep-equal",
       "for $i in 1 to 1000000 where not(deep-equal(/, /)) return $i",
       {},
       wide},
      {"walk: deep-equal, deep",
       "for $i in 1 to 1000000 where not(deep-equal(/, /)) return $i",
       {},
       deep},
      {"walk: base-uri", "count(//e[base-uri(.) = 'x'])", {}, deepWithBases},
      {"walk: in-scope-prefixes",
       "for $e in //e return count(in-scope-prefixes($e))",
       {},
       deepNamespaces},
      {"walk: resolve-QName",
       "for $e in //e return count(resolve-QName('p0:x', $e))",
       {},
       deepNamespaces},
      {"walk: lang", "count(//e[lang('en')])", {}, deep},
      {"walk: id", "for $i in 1 to 1000000 return count(id('i7 i8 i9'))", {}, keyed},
      {"walk: id of many", "count(id(string-join(//@ref, ' ')))", {}, keyed},
      {"walk: path of each", "count(//e[ext:xpath-for-node(.) = 'x'])", {}, wide},
      {"walk: path of each, deep", "count(//e[ext:xpath-for-node(.) = 'x'])", {}, deep},
      {"walk: key join",
       "count(for $x in //e, $y in //e where $x/@id = $y/@ref and $y = 'x' return 1)",
       {},
       keyed},
      // --- constructors
      {"make: elements", "count(<a>{for $i in 1 to 30000000 return <b/>}</a>/b)"},
      {"make: attributes",
       "count(<a>{for $i in 1 to 1000000 return attribute {concat('a', $i)} {$i}}</a>/@*)"},
      {"make: texts", "count(<a>{for $i in 1 to 30000000 return 'text'}</a>)"},
      {"make: one long text", "count(<a>{for $i in 1 to 30000000 return text {'abcdefgh'}}</a>)"},
      {"make: nesting",
       "declare function local:f($n, $i) { if ($i = 0) then $n else local:f(<a>{$n}</a>, $i - 1) "
       "}; "
       "count(local:f(<b/>, 90000)//a)"},
      {"make: doubling",
       "declare function local:f($n) { local:f(<a>{$n, $n}</a>) }; local:f(<b/>)"},
      {"make: copies", "for $i in 1 to 1000000 return count(<x>{/}</x>)", {}, wide},
      {"make: deep copies", "for $i in 1 to 1000000 return count(<x>{/}</x>)", {}, deep},
      {"make: comments", "count(<a>{for $i in 1 to 10000000 return comment {'abc'}}</a>)"},
      {"make: namespaces",
       "count(<a>{for $i in 1 to 300000 return element {QName(concat('u', $i), concat('p', $i, "
       "':e'))} {()}}</a>)"},
      {"make: names",
       "count(<a>{for $i in 1 to 10000000 return element {concat('e', $i)} {()}}</a>)"},
      {"make: documents", "count(for $i in 1 to 10000000 return document {<a/>})"},
      // --- writing
      {"write: wide",
       "for $i in 1 to 1000000 return string-length(ext:string-from-node(/))",
       {},
       wide},
      {"write: deep",
       "for $i in 1 to 1000000 return string-length(ext:string-from-node(/))",
       {},
       deep},
      {"write: namespaces",
       "for $e in //e return string-length(ext:string-from-node($e))",
       {},
       deepNamespaces},
      {"write: each", "count(//e[string-length(ext:string-from-node(.)) = 0])", {}, deep},
      {"write: and read",
       "for $i in 1 to 1000000 return count(ext:node-from-string(ext:string-from-node(/)))",
       {},
       wide},
      // --- giving back
      {"free: list",
       "let $s := for $i in 1 to 3000000 return concat('a', $i) for $i in 1 to 100000000 where $i "
       "< 0 return $s"},
      {"free: trees",
       "let $s := for $i in 1 to 600000 return <a/> for $i in 1 to 100000000 where $i < 0 return "
       "$s"},
      {"free: tree",
       "let $s := <a>{for $i in 1 to 1000000 return <b>x</b>}</a> for $i in 1 to 100000000 where "
       "$i < 0 return $s"},
  };
}

}  // namespace bench
