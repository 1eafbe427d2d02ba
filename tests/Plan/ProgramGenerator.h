// Random programs over random documents. The same seed makes the same.
#pragma once

#include "Expr/RandomChoices.h"

#include <string>
#include <utility>
#include <vector>

namespace xquery::plantest {

class ProgramGenerator {
 public:
  explicit ProgramGenerator(unsigned seed) : _random(seed) {}

  // Elements a, b, c, some in a namespace, with attributes x and y, small numbers and words for
  // texts, instructions with such names. Some documents are large enough to be indexed.
  std::string document() {
    std::string text = "<a xmlns:p='urn:p'>";
    const size_t count = 2 + _random.below(5);
    for (size_t i = 0; i < count; ++i) text += element(3);
    if (_random.below(4) == 0) {
      for (size_t i = 0; i < nodesOfIndexedTree; ++i) text += "<!---->";
      text += element(3);
    }
    if (_random.below(12) == 0) {
      for (size_t i = 0; i < elementsWorthAnIndex; ++i) {
        text += "<b x='" + word() + "'><c>" + word() + "</c></b>";
      }
    }
    return text + "</a>";
  }

  std::string program() {
    _functions.clear();
    std::string text;
    _variables = {};
    if (_random.below(3) == 0) text += "declare variable $g := " + expr(2) + ";\n";
    _hasGlobal = !text.empty();
    if (_random.below(2) == 0) text += function("local:f", "");
    if (_random.below(3) == 0) text += function("local:r", "local:r");
    return text + expr(5);
  }

 private:
  static constexpr size_t nodesOfIndexedTree = 260;
  static constexpr size_t elementsWorthAnIndex = 80;

  std::string element(int depth) {
    const std::string name = _random.oneOf({"a", "b", "c", "a", "b", "c", "a", "p:a"});
    std::string text = "<" + name;
    if (_random.below(2)) text += " x='" + word() + "'";
    if (_random.below(3) == 0) text += " y='" + word() + "'";
    text += ">";
    const size_t count = depth == 0 ? 0 : _random.below(4);
    for (size_t i = 0; i < count; ++i) text += element(depth - 1);
    if (count == 0) text += word();
    if (_random.below(16) == 0) text += "<?a b?>";
    return text + "</" + name + ">";
  }

  std::string word() { return _random.oneOf({"1", "2", "3", "10", "2.5", "u", "v", "", "-1"}); }

  // A function of one parameter. One that calls itself does so with less each time.
  std::string function(const std::string& name, const std::string& recursion) {
    _variables = {"$p"};
    std::string body = _random.below(4) ? expr(3) : "$p[" + matches(".") + "]";
    if (!recursion.empty()) {
      body = "if (not($p castable as xs:integer) or number($p) < 1 or number($p) > 6) then " +
             body + " else (" + expr(1) + ", " + recursion + "(number($p) - 1))";
    }
    _variables = {};
    _functions.push_back(name);
    return "declare function " + name + "($p) {" + body + "};\n";
  }

  std::string literal() {
    return _random.oneOf({"1", "2", "3", "10", "2.5", "1e0", "'u'", "'1'", "'a'", "()", "''"});
  }

  std::string constant() {
    static const std::vector<std::string> operators = {" + ", " * ", " div ", " = ", " < ", " eq "};
    return "(" + literal() + _random.oneOf(operators) + literal() + ")";
  }

  std::string variable() {
    if (_variables.empty()) return _hasGlobal && _random.below(2) ? "$g" : ".";
    return _variables[_random.below(_variables.size())];
  }

  std::string nodeTest() {
    return _random.oneOf({"a", "b", "c", "*", "a", "b", "text()", "node()", "*:a"});
  }

  std::string predicate(int depth) {
    switch (_random.below(11)) {
      case 10:
        return "[" + computedPosition(depth) + "]";
      case 0:
        return "[" +
               _random.oneOf({"1", "2", "last()", "last() - 1", "position() = last()",
                              "position() < 3", "position() = 1"}) +
               "]";
      case 1:
        return "[" +
               _random.oneOf({"@x", "b", "c/a", "not(@y)", "b and @x", "not(a or @y = 1)",
                              "ancestor::b", "not(. = 'u') and c", "exists(b[. = 2])",
                              "not(preceding-sibling::a)", "following-sibling::b or @x",
                              "preceding-sibling::b = 'u'", "empty(following-sibling::node())"}) +
               "]";
      case 2:
        return "[" + nameCondition() + "]";
      case 3:
        return "[" + existence(depth - 1) + "]";
      case 4:
        return "[" + membership(depth - 1) + "]";
      default:
        return "[" + comparison(depth - 1) + "]";
    }
  }

  // A number that may be the same for all items, not be there, or fail.
  std::string computedPosition(int depth) {
    const std::string number =
        _random.oneOf({"count(" + path(depth - 1) + ")", "number(" + variable() + ")", variable(),
                       "xs:integer('u')", "position()", "sum((1, 0.5))"});
    return number + _random.oneOf({" + 1", " - 1", " * 1.5", " + last()", " idiv 0", " mod 3"});
  }

  std::string nameCondition() {
    const std::string condition = _random.oneOf({"name()", "local-name(.)", "name(.)"}) +
                                  _random.oneOf({" = ", " = ", " eq ", " != "}) +
                                  _random.oneOf({"'a'", "'b'", "'x'", "'p:a'", "('a', 'c')"});
    switch (_random.below(4)) {
      case 0:
        return _random.oneOf({"self::a", "self::a or self::b", "self::x or self::y",
                              ". instance of element(a)", "string(node-name(.)) = 'b'",
                              "local-name() = 'a' and string(namespace-uri(.)) = 'urn:p'"});
      case 1:
        return _random.oneOf({"self::b or ", "self::c or self::x or "}) + condition;
      default:
        return condition;
    }
  }

  // One node and a set of nodes.
  std::string membership(int depth) {
    const std::string set = _variables.empty() ? "(" + path(depth) + ")" : variable();
    const std::string node = _random.oneOf({".", ".", "./b", variable()});
    switch (_random.below(5)) {
      case 4:
        return nearbyNode();
      case 0:
        return "exists(" + node + _random.oneOf({" intersect ", " except "}) + set + ")";
      case 1:
        return "count(" + node + " | " + set + ") = count(" + set + ")";
      case 2:
        return "count(" + set + " | " + node + ") > 3";
      default:
        return "(some $w in " + set + " satisfies " +
               (_random.below(2) ? "$w is " + node : node + " is $w") + ")";
    }
  }

  // One node and a few steps.
  std::string nearbyNode() {
    const std::string found =
        _random.oneOf({"ancestor::a", "ancestor-or-self::b", "ancestor::node()", "../b", "a", "@x",
                       "b/text()", variable() + "/c", variable() + "/ancestor::a",
                       "preceding-sibling::a", "following-sibling::*/c"});
    const std::string both =
        _random.below(2) ? found + " intersect " + variable() : variable() + " intersect " + found;
    return _random.oneOf({"", "not", "exists", "c and ", "not(@x) or "}) + "(" + both + ")";
  }

  // What only asks whether there are nodes, or how many.
  std::string existence(int depth) {
    const std::string nodes = _random.below(3) ? "." + step(depth) : path(depth);
    switch (_random.below(4)) {
      case 0:
        return nodes;
      case 1:
        return "count(" + nodes + ")" +
               _random.oneOf({" > 0", " = 0", " >= 2", " lt 2", " ne 0", " <= 1", ""});
      case 2:
        return _random.oneOf({"1 < ", "0 eq ", "2 >= "}) + "count((" + nodes + "))";
      default:
        return _random.oneOf({"exists(", "empty(", "not(", "boolean("}) + nodes + ")";
    }
  }

  std::string step(int depth) {
    std::string text = _random.oneOf({"/", "/", "//"});
    if (_random.below(8) == 0) {
      text += _random.oneOf({"(a | b)", "(a | b | c)", "(@x | @y)", "(a | a)", "(a | @x)"});
      return depth > 0 && _random.below(3) == 0 ? text + predicate(depth) : text;
    }
    text += _random.oneOf({"", "", "", "", "@", "..",
                           "self::", "following-sibling::", "preceding-sibling::", "ancestor::",
                           "ancestor-or-self::", "descendant::", "following::"});
    if (text.ends_with("..")) return text;
    text += text.ends_with("@") ? _random.oneOf({"x", "y", "*"}) : nodeTest();
    if (depth > 0 && _random.below(3) == 0) text += predicate(depth);
    return text;
  }

  std::string path(int depth) {
    std::string text = _random.oneOf({"", "", variable(), variable(), "."});
    if (text == "." && _random.below(2)) text = "(" + expr(depth - 1) + ")";
    const size_t steps = 1 + _random.below(3);
    for (size_t i = 0; i < steps; ++i) text += step(depth);
    if (_random.below(8) == 0) {
      text += _random.oneOf({"/position()", "/last()", "/string(position())", "/data(.)", "/(., 1)",
                             "/concat(position(), last())"});
    }
    if (_random.below(8) == 0) text += "/(" + expr(depth - 1) + ")";
    return text;
  }

  std::string comparison(int depth) {
    static const std::vector<std::string> operators = {" = ",  " = ",  " != ", " < ", " > ",
                                                       " >= ", " eq ", " lt ", " ne "};
    return operand(depth) + _random.oneOf(operators) + operand(depth);
  }

  std::string operand(int depth) {
    switch (_random.below(10)) {
      case 0:
        return literal();
      case 9:
        return constant();
      case 1:
        return "number(" + expr(depth - 1) + ")";
      case 2:
        return _random.oneOf(
                   {"exactly-one(", "zero-or-one(", "string(", "data(", "max(", "count(", "sum("}) +
               path(depth - 1) + ")";
      case 3:
        return "@" + _random.oneOf({"x", "y"});
      case 4:
        return variable();
      case 5:
        return _random.oneOf({"xs:integer(", "xs:integer(", "xs:token(", "xs:NCName("}) +
               _random.oneOf({"'1'", "'u'", "2"}) + ")";
      default:
        return path(depth - 1);
    }
  }

  // With one more variable in scope.
  template <class Make>
  std::string within(const std::string& variable, Make make) {
    _variables.push_back(variable);
    std::string text = make();
    _variables.pop_back();
    return text;
  }

  std::string flwor(int depth) {
    const std::string name = _random.oneOf({"$i", "$j", "$k"});
    const bool isLet = _random.below(3) == 0;
    const bool hasPosition = !isLet && _random.below(5) == 0;
    std::string text = (isLet ? "let " : "for ") + name + (hasPosition ? " at $n" : "") +
                       (isLet ? " := " : " in ") + expr(depth - 1) + " ";
    if (hasPosition) _variables.emplace_back("$n");
    text += within(name, [&] {
      std::string rest;
      if (_random.below(3) == 0) {
        rest = "for $m in " + path(depth - 1) + " ";
        _variables.emplace_back("$m");
      }
      const bool hasInner = !rest.empty();
      if (_random.below(2)) rest += "where " + comparison(depth - 1) + " ";
      if (_random.below(5) == 0) rest += "order by string(" + operand(depth - 1) + ") ";
      rest += "return " + expr(depth - 1);
      if (hasInner) _variables.pop_back();
      return rest;
    });
    if (hasPosition) _variables.pop_back();
    return "(" + text + ")";
  }

  std::string quantified(int depth) {
    const bool isDouble = _random.below(3) == 0;
    std::string text = _random.oneOf({"some", "every"}) + " $q in " + expr(depth - 1);
    text += within("$q", [&] {
      std::string rest;
      if (isDouble) {
        rest = ", $s in " + expr(depth - 1);
        _variables.emplace_back("$s");
      }
      rest += " satisfies " + comparison(depth - 1);
      if (isDouble) _variables.pop_back();
      return rest;
    });
    return "(" + text + ")";
  }

  std::string constructor(int depth) {
    switch (_random.below(6)) {
      case 0:
        return "<b x='{" + operand(depth - 1) + "}'>{" + expr(depth - 1) + "}</b>";
      case 1:
        return "element a {" + expr(depth - 1) + "}";
      case 2:
        return "text {" + expr(depth - 1) + "}";
      case 3:
        return "document {<a>{" + expr(depth - 1) + "}</a>}";
      case 4:
        return growingTree(depth);
      default:
        return "<c>{" + variable() + ", count(" + variable() + "/..)}</c>";
    }
  }

  // Nodes that are looked at while the elements that have taken them in are still being made.
  std::string growingTree(int depth) {
    static const std::vector<std::string> nodes = {"$n",    "$m",      "<b/>", "attribute y {1}",
                                                   "$n/..", "root($m)"};
    static const std::vector<std::string> questions = {
        "$n << $m",
        "$m << $n",
        "count(root($m)//node())",
        "name(root($n))",
        "$m/..",
        "(for $k in ($m | $n | root($n)//a) return name($k))",
        "root($n) is root($m)",
        "base-uri($n)",
        "name($n/following::*[1])"};
    const auto part = [&] {
      return "{" + (_random.below(3) ? _random.oneOf(questions) : _random.oneOf(nodes)) + "}";
    };
    const std::string inner = "<b>" + part() + part() + "<c>" + part() + "</c>" + part() + "</b>";
    const std::string loop = _random.below(2) ? "{for $i in 1 to 2 return " + inner + "}"
                                              : "{if (" + comparison(depth - 1) + ") then " +
                                                    inner + " else element d {" +
                                                    _random.oneOf(nodes) + ", attribute x {2}}}";
    return "(let $n := <a><b/></a>, $m := <a><c/></a> return <a>" + part() + loop + part() +
           "</a>)";
  }

  std::string call(int depth) {
    static const std::vector<std::string> functions = {
        "count",       "exists",    "empty",  "not",         "string",      "distinct-values",
        "reverse",     "boolean",   "data",   "exactly-one", "zero-or-one", "normalize-space",
        "sum",         "max",       "number", "name",        "root",        "unordered",
        "one-or-more", "upper-case"};
    if (!_functions.empty() && _random.below(2)) {
      return _functions[_random.below(_functions.size())] + "(" + expr(depth - 1) + ")";
    }
    if (_random.below(5) == 0) {
      const std::string items = _random.below(2) ? path(depth - 1) : expr(depth - 1);
      return "subsequence(" + items + ", " + _random.oneOf({"1", "2", "1, 1", "2, 2", "0, 3"}) +
             ")";
    }
    if (_random.below(5) == 0) {
      return "(" + path(depth - 1) + ")" +
             _random.oneOf({"[1]", "[2]", "[position() <= 2]", "[position() < 2]",
                            "[3 >= position()]", "[last()]", "[last() - 1]", "[last() - 1]/..",
                            "[position() eq last()]"});
    }
    return functions[_random.below(functions.size())] + "(" + expr(depth - 1) + ")";
  }

  std::string other(int depth) {
    switch (_random.below(5)) {
      case 0:
        return "(if (" + comparison(depth - 1) + ") then " + expr(depth - 1) + " else " +
               expr(depth - 1) + ")";
      case 1: {
        const std::string text =
            "typeswitch (" + expr(depth - 1) + ") case $t as element() return ";
        return "(" + text + within("$t", [&] { return expr(depth - 1); }) + " default return " +
               expr(depth - 1) + ")";
      }
      case 2:
        return "(" + expr(depth - 1) + _random.oneOf({" | ", " intersect ", " except "}) +
               path(depth - 1) + ")";
      case 3:
        return "(" + expr(depth - 1) +
               _random.oneOf({" instance of element()", " castable as xs:integer",
                              " treat as item()*", " cast as xs:double?"}) +
               ")";
      default:
        return "unordered {" + path(depth - 1) + "}";
    }
  }

  // --- joins ---

  // Lists long enough for a table, mostly.
  std::string many() {
    const std::string list =
        _random.oneOf({"//*", "//a", "//b", "//@x", "//*/@y", "data(//@*)", "//*/..", "//b/*",
                       "(//*, <b x='1'/>)", "(//@x, 1, 'u', 2.5, 3e0)",
                       "(//@x, xs:date('2004-10-29'))", variable()});
    return _random.below(6)
               ? "(" + list + ")[position() < " + _random.oneOf({"9", "10", "14"}) + "]"
               : list;
  }

  std::string keyOf(const std::string& item) {
    switch (_random.below(12)) {
      case 0:
        return item;
      case 1:
        return _random.oneOf({"string(", "number(", "data(", "name(", "exactly-one("}) + item + ")";
      case 2:
        return _random.oneOf({"number(", "exactly-one(", "xs:integer(", "zero-or-one("}) + item +
               "/@x)";
      case 3:
        return item + _random.oneOf({"/..", "/*/@x", "//@y", "/ancestor::*/@x", "/text()"});
      case 4:
        return _functions.empty() ? item : _functions.front() + "(" + item + ")";
      case 5:
        return "(2 * " + item + "/@y)";
      default:
        return item + _random.oneOf({"/@x", "/@y", "/@*", "/*"});
    }
  }

  std::string match(const std::string& item) {
    static const std::vector<std::string> operators = {
        " = ", " = ", " = ", " < ", " >= ", " != ", " eq ", " lt ", " is "};
    const std::string other = _random.below(4) ? keyOf(variable()) : operand(1);
    if (_random.below(6) == 0) {
      return "(some $w in " + item + _random.oneOf({"/*", "/@*", "/.."}) + " satisfies " +
             keyOf("$w") + _random.oneOf(operators) + other + ")";
    }
    if (_random.below(8) == 0) return "starts-with(" + keyOf(item) + ", " + other + ")";
    return _random.below(2) ? keyOf(item) + _random.oneOf(operators) + other
                            : other + _random.oneOf(operators) + keyOf(item);
  }

  std::string matches(const std::string& item) {
    if (_random.below(6) == 0) return twoMatches(item);
    std::string text = match(item);
    while (_random.below(3) == 0) {
      text += " and " + (_random.below(3) ? match(item) : match(variable()));
    }
    return text;
  }

  // An equality and something else of the same items, both with one key for most of them.
  std::string twoMatches(const std::string& item) {
    const std::string other = variable();
    const std::string key = _random.oneOf({"/@x", "/@y"});
    const auto side = [&](const std::string& of) { return of + _random.oneOf({"/@x", "/@y"}); };
    const std::string function = _random.oneOf({"", "number", "string", "xs:decimal"});
    const std::string equality = item + key + " = " + other + key;
    const std::string second = function + "(" + side(item) + ")" +
                               _random.oneOf({" < ", " >= ", " = ", " > "}) + function + "(" +
                               side(other) + ")";
    return _random.below(2) ? equality + " and " + second : second + " and " + equality;
  }

  std::string joined(int depth) {
    if (_random.below(3) == 0) {
      return many() + "[" + matches(".") + "]" + (_random.below(4) ? "" : "[" + match(".") + "]");
    }
    if (_random.below(2)) {
      const std::string kind = _random.oneOf({"some", "some", "every"});
      std::string text = kind + " $u in " + many();
      return "(" + text +
             within("$u",
                    [&] {
                      if (_random.below(2)) return " satisfies " + negatedFor(kind, matches("$u"));
                      std::string rest = ", $v in " + (_random.below(2) ? many() : keyOf("$u"));
                      return rest + within("$v", [&] {
                               return " satisfies " +
                                      negatedFor(kind, matches(_random.oneOf({"$u", "$v"})));
                             });
                    }) +
             ")" + (_random.below(4) ? "" : ", " + std::string("$u"));
    }
    if (_random.below(4) == 0) return counted(depth);
    if (_random.below(6) == 0) return first(depth);
    if (_random.below(5) == 0) return conditional(depth);
    if (_random.below(5) == 0) return chain();
    if (_random.below(6) == 0) return earlier();
    if (_random.below(8) == 0) return positions();
    std::string text = "for $u in " + many() + " ";
    return "(" + text +
           within("$u",
                  [&] {
                    const std::string clause =
                        _random.oneOf({"let $v := " + keyOf("$u"), "for $v in " + keyOf("$u"),
                                       "for $v in " + many(), "for $v at $n in " + many()});
                    return clause + within("$v", [&] {
                             std::string rest = " where " + matches(_random.oneOf({"$u", "$v"}));
                             return rest + " return " + (_random.below(2) ? "$v" : expr(depth - 1));
                           });
                  }) +
           ")";
  }

  // The condition of a join in the return clause.
  std::string conditional(int depth) {
    const bool isSum = _random.below(2) == 0;
    const std::string clause = "for $u in " + many() + " ";
    return within("$u", [&] {
      const std::string condition = "return if (" + matches("$u") + ") then ";
      const std::string value = _random.oneOf({"1", "$u", "2.5", "$u/@x", "-0e0", "'u'"});
      return isSum ? "(sum(" + clause + condition + value + " else 0))"
                   : "(" + clause + condition + expr(depth - 1) + " else ())";
    });
  }

  // Of which only the number is asked for, mostly.
  std::string counted(int depth) {
    const std::string clause = "for $u in " + many() + " ";
    const auto item = [&] {
      return _random.oneOf({"$u", "$u", "1", "3", "$u/@x", "(1, $u)", "string($u)", variable()});
    };
    const std::string list = within("$u", [&] {
      switch (_random.below(5)) {
        case 4:
          return _functions.empty() ? many() : _functions.front() + "(" + many() + ")";
        case 0:
          return clause + "return if (" + matches("$u") + ") then " + item() + " else ()";
        case 1:
          return many() + "[" + matches(".") + "]" + _random.oneOf({"", "", "/*"});
        case 2:
          return clause + "where " + matches("$u") + " return " + expr(depth - 1);
        default:
          return clause + "where " + matches("$u") + " return " + item();
      }
    });
    switch (_random.below(4)) {
      case 0:
        return "(let $l := " + list + " return " +
               _random.oneOf({"count($l)", "(count($l), exists($l))", "count(($l)) + 1",
                              "(count($l), $l)", "(if ($l) then 1 else 2)", "not($l)",
                              "(for $n in 1 to 2 where empty($l) return $n)",
                              "(if (empty($l)) then 'u' else boolean($l))"}) +
               ")";
      case 1:
        return "sum(" + clause + "where " + within("$u", [&] { return matches("$u"); }) +
               " return " + _random.oneOf({"1", "2", "-1", "0.5"}) +
               _random.oneOf({")", ", 0)", ", ())"});
      default:
        return "(" +
               _random.oneOf(
                   {"count(", "count(", "exists(", "empty(", "1 < count(", "boolean(", "not("}) +
               list + "))";
    }
  }

  // Of which the first items are asked for: of a path, or of what is sorted.
  std::string first(int depth) {
    const std::string keys =
        _random.oneOf({"$u/@x", "string($u)", "name($u)", "number($u/@x)", "count($u/*)",
                       "$u/@y empty greatest", "xs:integer($u/@x)", "$u/*", "name($u) descending",
                       "string($u/@x) descending, number($u)", "if ($u/@x) then 1 else 'u'"});
    const std::string sorted = within("$u", [&] {
      return "for $u in " + many() + " order by " + keys + " return " +
             _random.oneOf({"$u", "($u/@x, $u)", "<b>{$u/@x}</b>", "string($u)", expr(depth - 1)});
    });
    const std::string unsorted = within("$u", [&] {
      const std::string condition =
          _random.below(3) ? match("$u")
                           : _random.oneOf({"$u/@x", "$u", "$u/@y", "name($u)"}) +
                                 _random.oneOf({" = ", " eq ", " < "}) +
                                 _random.oneOf({"'u'", "'a'", "xs:token('u')", "string($o)"}) +
                                 _random.oneOf({"", " and $u/@y", " or $u/@y = '1'"});
      return "for $u in " + many() + " where " + condition + " return " +
             _random.oneOf({"$u", "($u/@x, $u)", "string($u)"});
    });
    const std::string list = _random.oneOf({sorted, sorted, unsorted, path(depth - 1)});
    const std::string part =
        _random.oneOf({"[1]", "[2]", "[position() <= 3]", "[position() lt 3]", "[last()]"});
    switch (_random.below(4)) {
      case 0:
        return "subsequence((" + list + ")" +
               _random.oneOf({", 1, 1)", ", 2, 3)", ", 0, 2)", ", 2)"});
      case 1:
        return "(let $l := " + list + " return ($l" + part +
               _random.oneOf({"", ", $l[1]", ", subsequence($l, 1, 4)", ", count($l)"}) + "))";
      case 2:
        return "(for $v at $n in (" + list + ") " + _random.oneOf({"", "let $z := $v/* "}) +
               "where " + _random.oneOf({"$n <= 3", "$n = 2", "3 > $n and $v", "$v and $n lt 2"}) +
               " return ($n, $v))";
      default:
        return "(" + list + ")" + part + _random.oneOf({"", "/@x", "/.."});
    }
  }

  // Clauses that are joined through another one.
  std::string chain() {
    const auto few = [&] { return "(" + many() + ")[position() < 10]"; };
    const auto key = [&](const std::string& item) {
      return item + _random.oneOf({"/@x", "/@x", "/@y", "/@*", "/..", ""});
    };
    const auto equality = [&](const std::string& one, const std::string& other) {
      return _random.below(2) ? key(one) + " = " + key(other) : key(other) + " = " + key(one);
    };
    std::vector<std::string> conditions = {equality("$u", "$z"), equality(variable(), "$z")};
    if (_random.below(2)) conditions.push_back(equality("$u", "$z"));
    if (_random.below(2)) conditions.push_back(equality("$u", variable()));
    std::string text = "(for $u in " + few() + ", $z in " + few() + " where ";
    for (size_t left = conditions.size(); left > 0; --left) {
      std::swap(conditions[_random.below(left)], conditions[left - 1]);
      text += conditions[left - 1] + (left > 1 ? " and " : "");
    }
    return text + " return " + _random.oneOf({"$u", "$z", "<b>{$u, $z}</b>"}) + ")";
  }

  // What has come up before in a list.
  std::string earlier() {
    const std::string step = _random.oneOf({"", "/@x", "/@y", "/*", "/.."});
    const std::string sides = _random.oneOf({"$u", "$u/@x", "$u/*", "$o/@x", "'1'", "2"}) +
                              " = $l[" + _random.oneOf({"position() < $n", "$n >= position()"}) +
                              "]" + step;
    return "(let $l := " + many() + " for $u at $n in " + _random.oneOf({"$l", "$l", "($l, $l)"}) +
           " where " + _random.oneOf({"", "not"}) + "(" + sides + ") return $u)";
  }

  // Where values stand in a list.
  std::string positions() {
    const std::string list = _random.oneOf({"data(//@x)", "//*", "(//@*, 1, 2.5, 'u')", many()});
    return "(let $l := " + list + " for $u in " + many() + " return " +
           _random.oneOf({"", "count", "exists"}) + "(index-of($l, " +
           _random.oneOf({"string($u)", "$u", "number($u)", "data($u/@x)", "string($o/@x)"}) +
           ")))";
  }

  // What has a certain value, asked so often that an index of values is worth its making.
  std::string lookedUp(int depth) {
    const std::string key = _random.oneOf({"@x", "@x", "c", ".", "b/@x", ".//c", "@*", "./c"});
    const std::string probe =
        _random.oneOf({"'1'", "'u'", "''", "'2.5'", "1", "$o", "string($o)", operand(1)});
    const std::string equals = _random.oneOf({" = ", " = ", " eq ", " != "}) + probe;
    const auto condition = [&](const std::string& of) {
      const std::string from = of == "." ? key : key == "." ? of : of + "/" + key;
      const std::string inner = _random.oneOf({"$w" + equals, probe + " = $w", "$w" + equals});
      return _random.oneOf(
          {from + equals, from + equals, "some $w in " + from + " satisfies " + inner,
           from + "[." + equals + "]", "exists(" + from + "[." + equals + "])",
           "not(empty(for $w in " + from + " where " + inner + " return $w))",
           "boolean(" + from + "[" + probe + " eq .])", "string(" + from + ")" + equals,
           "data(" + from + ")" + equals, from + equals + " and " + comparison(depth - 1)});
    };
    const std::string path = _random.oneOf({"//b", "//*", "/a/b", "//@x", "(//a | //b)", "/*/*",
                                            "//(b | c)", "(//b)", "/descendant::b", "$g//b"});
    const std::string all = _hasGlobal || !path.starts_with("$") ? path : "//b";
    std::string text = "(for $o in ('1', //b[1]/@x, '2', 1, '1') return ";
    return text + within("$o", [&] {
             if (_random.below(2)) {
               return all + "[" + condition(".") + "]" +
                      _random.oneOf({"", "/..", "/@x", "[1]", predicate(depth - 1)}) + ")";
             }
             const std::string clause =
                 _random.oneOf({"", "let $v := string($u/@x) ", "let $v := $u/c "});
             const std::string where =
                 clause.empty() || _random.below(2) ? condition("$u") : "$v" + equals;
             return "(for $u in " + all + " " + clause + "where " + where + " return $u" +
                    _random.oneOf({"", "/..", "/@x"}) + "))";
           });
  }

  std::string negatedFor(const std::string& kind, const std::string& condition) {
    return kind == "every" && _random.below(3) ? "not(" + condition + ")" : condition;
  }

  // The same condition for one item after another, so that a table is worth its making.
  std::string join(int depth) {
    std::string text =
        "for $o in (//a)[position() < " + _random.oneOf({"4", "4", "12"}) + "] return (";
    return "(" + text + within("$o", [&] { return joined(depth - 1); }) + "))";
  }

  std::string expr(int depth) {
    if (depth <= 0) return _random.below(3) ? variable() : literal();
    switch (_random.below(19)) {
      case 18:
        return lookedUp(depth);
      case 17:
        return "(" + existence(depth) + ")";
      case 0:
        return literal();
      case 1:
        return variable();
      case 2:
        return "(" + expr(depth - 1) + ", " + expr(depth - 1) + ")";
      case 3:
        if (_random.below(2)) return constant();
        return "(" + operand(depth - 1) + _random.oneOf({" + ", " - ", " * ", " div "}) +
               operand(depth - 1) + ")";
      case 4:
        return "(" + comparison(depth - 1) + ")";
      case 5:
      case 6:
        return flwor(depth);
      case 7:
        return quantified(depth);
      case 8:
        return constructor(depth);
      case 9:
        return call(depth);
      case 10:
        return other(depth);
      case 11:
        return "(" + comparison(depth - 1) + _random.oneOf({" and ", " or "}) +
               comparison(depth - 1) + ")";
      case 12:
      case 13:
        return join(depth);
      default:
        return path(depth);
    }
  }

  RandomChoices _random;
  std::vector<std::string> _variables;
  std::vector<std::string> _functions;
  bool _hasGlobal = false;
};

}  // namespace xquery::plantest
