// What is asked of siblings, and of what precedes and follows, from one node after another.
#include "Plan/PlanTesting.h"

#include <string>

namespace xquery {
namespace {

using namespace plantest;

// Two lists of items and others between them, some without a key, some with several, and nested
// ones behind them.
const Value& items() {
  static const Value parsed = [] {
    std::string text = "<r>";
    for (int list = 0; list < 2; ++list) {
      text += "<l>t";
      for (int i = 0; i < 26; ++i) {
        text += "<i n='" + std::to_string(i) + "' k='" + std::to_string(i * i % 11) + "'>";
        if (i % 7 != 2) text += "<p>" + std::to_string(i * i % (14 + list)) + "</p>";
        if (i % 5 == 4) text += "<p>x" + std::to_string(i % 4) + "</p>";
        text += i % 6 == 1 ? "</i><o k='3'/>" : "</i>";
      }
      text += "</l>";
    }
    for (int i = 0; i < 8; ++i) text += "<i><p>" + std::to_string(i % 6) + "</p>";
    for (int i = 0; i < 8; ++i) text += "</i>";
    return document(text + "<i><p>3</p></i></r>");
  }();
  return parsed;
}

constexpr const char* orderings[] = {"", "declare ordering unordered; "};

TEST(Siblings, ArePickedByTheirKeys) {
  for (const char* axis : {"preceding-sibling", "following-sibling"}) {
    for (const char* path :
         {"::i[p = $i/p]", "::i[@k = $i/@k]/@n", "::*[@k = $i/@k][1]", "::i[p < $i/p][@n > 20]/p",
          "::i[p = $i/p or @k = $i/@k]", "::i[@k = $i/@k and p/text() = $i/p]",
          "::i[number(p) = number($i/@k)]", "::i[p = $i/p]/..", "::i[p[1] eq $i/p[1]]",
          "::node()[p = $i/p]", "::i[@k = $i/@k]/preceding-sibling::o[1]"}) {
      const std::string found = std::string("$i/") + axis + path;
      for (const std::string ordering : orderings) {
        for (const std::string& asked : {found, "(count(" + found + "), not(" + found + "))"}) {
          sameBothWays(ordering + "for $i in //i return " + asked, items());
        }
      }
    }
  }
  EXPECT_EQ(choicesOf("step-joins", "for $i in //i return $i/preceding-sibling::i[p = $i/p]"), 1U);
}

TEST(Siblings, AreListedOnce) {
  for (const char* axis : {"preceding-sibling", "following-sibling"}) {
    for (const char* path : {"::i", "::*", "::text()", "::z", "::i[@k > 3]", "::i[p > 2]/p[1]",
                             "::i[@n > ../i[2]/@n][p]/@k", "::i[xs:integer(p) > 5]", "::i[p][2]",
                             "::o[@k]/..", "::i[@k = 3]/preceding-sibling::i[1]/@n"}) {
      const std::string found = std::string(axis) + path;
      for (const std::string ordering : orderings) {
        for (const std::string& asked :
             {found, "count(" + found + ")", "empty(" + found + ")", "count(" + found + ") > 13"}) {
          sameBothWays(ordering + "for $i in (//i, //o, //l/text()) return $i/(" + asked + ")",
                       items());
        }
        sameBothWays(ordering + "//i[count(" + found + ") mod 3 = 1]/@n", items());
      }
    }
  }
  EXPECT_EQ(choicesOf("step-joins", "for $i in //i return count($i/preceding-sibling::i[@k > 3])"),
            1U);
}

TEST(Siblings, ArePickedByConditionsBehind) {
  for (const char* axis : {"preceding-sibling::", "following-sibling::"}) {
    for (const char* condition :
         {"$j/p = $i/p", "$i/@k = $j/@k and $j/p > 3", "$j/@k = $i/@k and $j/p = $i/p", "$j/p = 3",
          "$j/p = $i/p or $j/@k = $i/@k"}) {
      for (const char* step : {"i", "*", "i/p/..", "i[@k]"}) {
        const std::string clause = std::string("$j in $i/") + axis + step;
        sameBothWays("for $i in //i, " + clause + " where " + condition + " return ($i/@n, $j/@n)",
                     items());
        sameBothWays(
            "for $i in //i where some " + clause + " satisfies " + condition + " return $i/@n",
            items());
        sameBothWays("for $i in //i where not(every " + clause + " satisfies " + condition +
                         ") return $i/@n",
                     items());
      }
    }
  }
  for (const char* text :
       {"for $i in //i, $j in $i/following-sibling::i where $j/p = $i/p return $j",
        "//i[some $j in following-sibling::i satisfies $j/p = 3]"}) {
    sameBothWays(text, items());
  }
  EXPECT_EQ(choicesOf("step-joins",
                      "for $i in //i, $j in $i/following-sibling::i where $j/p = $i/p return $j"),
            1U);
}

TEST(Siblings, AreComparedInATable) {
  for (const char* axis :
       {"preceding-sibling::", "following-sibling::", "preceding::", "following::"}) {
    for (const char* path : {"i/p", "*/@k", "p", "node()", "z/p"}) {
      for (const char* value : {"p", "3", "(p, @k)", "string(p[1])", "z"}) {
        const std::string found = std::string(axis) + path;
        const std::string comparison = std::string(value) + " = " + found;
        sameBothWays("for $i in //i return $i/(" + comparison + ")", items());
        sameBothWays("(//i, //o, //p)[" + found + " = " + value + "]/(@n, @k)", items());
      }
    }
  }
  for (const char* text : {"//i[not(p = preceding-sibling::i/p)]", "//p[. = following::p]",
                           "for $i in //i return $i/preceding-sibling::*/@k = $i/@k"}) {
    EXPECT_EQ(choicesOf("earlier items", text), 1U) << text;
  }
}

TEST(Siblings, AreComparedAsTheyAreWhereThatMayBeAnError) {
  for (const char* text :
       {"for $i in (//i, 1) return $i/preceding-sibling::i/p = 3",
        "for $i in (//i, //i/@n, //p/text(), /, /r) return $i/following-sibling::*/@k = $i/../@k",
        "for $i in (//i/@n, /, /r, //p/text()) return $i/preceding::p = '3'",
        "for $i in //i return $i/@n = xs:date($i/preceding-sibling::i[1]/p)",
        "for $i in //i return xs:date('2004-10-29') = $i/preceding-sibling::i/p",
        "for $i in //i return exactly-one($i/p) = $i/preceding-sibling::i/p",
        "for $i in //i return $i/preceding-sibling::i/p = exactly-one($i/p)",
        "for $i in //i return xs:integer($i/@n) = $i/preceding-sibling::i/@k",
        "for $i in //i return xs:integer($i/@n) = $i/following-sibling::i/p"}) {
    sameBothWays(text, items());
  }
}

TEST(Siblings, AreFoundAgainWhereTreesGrow) {
  for (const char* text :
       {"let $l := <l>{for $n in 1 to 30 return <i k='{$n mod 7}'/>}</l> "
        "return $l/i[@k = preceding-sibling::i/@k]/count(preceding-sibling::i)",
        "for $n in 1 to 3 let $l := <l>{//l[1]/i}</l> for $i in $l/i return ("
        "count($i/preceding-sibling::i), $i/p = $i/preceding-sibling::i/p)",
        "let $i := for $n in 1 to 30 return <i k='{$n mod 7}'/> return ("
        "for $x in $i return count($x/following-sibling::i), <l>{$i}</l>, "
        "for $x in $i return count($x/following-sibling::i))",
        "declare function local:before($i) { count($i/preceding-sibling::i[p]) }; "
        "for $i in //i return (local:before($i), <x xmlns='u'>{local:before($i)}</x>)",
        "for $i in //i return <x xmlns='u'>{$i/p = $i/preceding-sibling::i/p}</x>"}) {
    sameBothWays(text, items());
  }
}

}  // namespace
}  // namespace xquery
