// Paths, conditions and what is compared.
#include "Plan/ProgramGenerator.h"

namespace xquery::plantest {

std::string ProgramGenerator::nodeTest() {
  return _random.oneOf({"a", "b", "c", "*", "a", "b", "text()", "node()", "*:a"});
}

std::string ProgramGenerator::predicate(int depth) {
  switch (_random.below(12)) {
    case 11:
      return "[" + range(depth) + "]";
    case 10:
      return "[" + computedPosition(depth) + "]";
    case 0:
      return "[" +
             _random.oneOf({"1", "2", "last()", "last() - 1", "position() = last()",
                            "position() < 3", "position() = 1", "last() > 1"}) +
             "]";
    case 1:
      return "[" +
             _random.oneOf({"@x", "b", "c/a", "not(@y)", "b and @x", "not(a or @y = 1)",
                            "ancestor::b", "not(. = 'u') and c", "exists(b[. = 2])",
                            "not(preceding-sibling::a)", "following-sibling::b or @x",
                            "b[last() > 1]", "preceding-sibling::b = 'u'",
                            "empty(following-sibling::node())"}) +
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

std::string ProgramGenerator::computedPosition(int depth) {
  const std::string number =
      _random.oneOf({"count(" + path(depth - 1) + ")", "number(" + variable() + ")", variable(),
                     "xs:integer('u')", "position()", "sum((1, 0.5))"});
  return number + _random.oneOf({" + 1", " - 1", " * 1.5", " + last()", " idiv 0", " mod 3"});
}

std::string ProgramGenerator::range(int depth) {
  static const std::vector<std::string> orders = {" <= ", " < ",  " >= ", " > ",
                                                  " le ", " lt ", " ge ", " gt "};
  const auto number = [&] {
    return _random.oneOf({"count(" + path(depth - 1) + ")", "number(" + variable() + ")",
                          variable(), "xs:integer('u')", "sum((1, 0.5))", "2", "2.5", "()", "-1",
                          "1e0", "number('u')", "xs:decimal('2.0')", "last()", "(1, 3)",
                          "string-length(string(" + variable() + "))"});
  };
  const std::string own = _random.below(3) ? "position()" + _random.oneOf(orders) + number()
                                           : number() + _random.oneOf(orders) + "position()";
  if (_random.below(3)) return own;
  return own + " and " + (_random.below(4) ? "(" + range(depth) + ")" : comparison(depth - 1));
}

std::string ProgramGenerator::nameCondition() {
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

std::string ProgramGenerator::membership(int depth) {
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

std::string ProgramGenerator::nearbyNode() {
  const std::string found =
      _random.oneOf({"ancestor::a", "ancestor-or-self::b", "ancestor::node()", "../b", "a", "@x",
                     "b/text()", variable() + "/c", variable() + "/ancestor::a",
                     "preceding-sibling::a", "following-sibling::*/c"});
  const std::string both =
      _random.below(2) ? found + " intersect " + variable() : variable() + " intersect " + found;
  return _random.oneOf({"", "not", "exists", "c and ", "not(@x) or "}) + "(" + both + ")";
}

std::string ProgramGenerator::existence(int depth) {
  std::string nodes = _random.below(3) ? "." + step(depth) : path(depth);
  if (depth > 0 && _random.below(4) == 0) nodes = "(" + setOfPaths(depth) + ")";
  if (depth > 0 && _random.below(6) == 0) nodes = "(" + askedOfNames(depth) + ")";
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

std::string ProgramGenerator::askedOfNames(int depth) {
  const auto condition = [&] {
    return _random.oneOf({"$k/ancestor::a", "not($k/parent::b)", "count($k/ancestor::*) > 2",
                          "name($k) = 'a'", "local-name($k/..) eq 'b'", "$k/..",
                          "(some $w in $k/ancestor::* satisfies $w/self::b)", "$l", "exists($l)",
                          "count($l) < 2", "$l/parent::a", "$k/b", comparison(depth - 1)});
  };
  std::string text = "for $k in " + _random.oneOf({"//a", "//b", "//*", "/a/b", "//a//b", "/a//c",
                                                   "//text()", "//a/b", path(depth - 1)});
  text += " let $l := " + _random.oneOf({"$k/ancestor::b", "count($k/ancestor::a)", "$k/..",
                                         "$k/ancestor::*[2]", "$k/c", variable()});
  text += " where " + condition() + _random.oneOf({"", " and ", " or "});
  if (text.ends_with(" ")) text += condition();
  return text + " return " + _random.oneOf({"$k", "$k", "1", "$l", "$k/.."});
}

std::string ProgramGenerator::step(int depth) {
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

std::string ProgramGenerator::pathInside() {
  const std::string inner = _random.oneOf(
      {"//a", "//b/c", "/a/*", "//a | //b", "//a, //b", "(//a | //c), //b", "//a//b", "//*:a",
       "/a//c/..", "//@x", "//b[1]", "//a, $x", "(//a)/b", "((//a))", "//*/..", "//a, /a/b", "/"});
  if (_random.below(6) == 0) return "(" + setOfPaths(1) + ")";
  const bool hasVariable = inner.ends_with("$x");
  return "(" + (hasVariable ? "//a, " + variable() : inner) + ")";
}

std::string ProgramGenerator::setOfPaths(int depth) {
  const auto set = [&] {
    return _random.oneOf({"//a",
                          "//b",
                          "//a//b",
                          "/a/b",
                          "//b/c",
                          "//*",
                          "//*[self::a or self::c]",
                          "//a[ancestor::b]",
                          "//b[parent::a]",
                          "//(a | b)",
                          "//@x",
                          "//c/..",
                          "//a[@x]",
                          "(//a | //b)/c",
                          "/a//*",
                          "//a[@x = '1']",
                          "/a/*[b or @y]",
                          "//@y",
                          "/a//b[c]",
                          "//a[x > 1]/b",
                          "/a/b/c//a",
                          variable(),
                          path(depth - 1)});
  };
  static const std::vector<std::string> operators = {" | ", " intersect ", " except ", " union "};
  std::string text = set() + _random.oneOf(operators) + set();
  if (_random.below(2)) text = "(" + text + ")" + _random.oneOf(operators) + set();
  if (_random.below(3) == 0) text = set() + _random.oneOf(operators) + "(" + text + ")";
  return text;
}

std::string ProgramGenerator::standsForPath(int depth) {
  const std::string use = _random.oneOf(
      {"$m" + step(depth), "$m[" + comparison(depth - 1) + "]" + step(depth), "count($m/b)",
       "($m)/a", "($m/a, $m/b)", "$m[1]", "(let $n := $m/b return $n[@x = '1'])",
       "(for $i in $m where $i/@x = " + literal() + " return $i/b)"});
  return "(let $m := " +
         _random.oneOf({"(/)", "//a", "/a/b", "//b/c", "/a/*", "//@x", "/a", "//a[1]"}) +
         " return " + use + ")";
}

std::string ProgramGenerator::path(int depth) {
  if (depth > 1 && _random.below(16) == 0) return standsForPath(depth - 1);
  std::string text = _random.oneOf({"", "", variable(), variable(), ".", pathInside()});
  if (text == "." && _random.below(2)) text = "(" + expr(depth - 1) + ")";
  const size_t steps = 1 + _random.below(3);
  for (size_t i = 0; i < steps; ++i) text += step(depth);
  if (_random.below(8) == 0) {
    text += _random.oneOf({"/position()", "/last()", "/string(position())", "/data(.)", "/(., 1)",
                           "/concat(position(), last())", "/string(@x)", "/name()",
                           "/xs:integer(@x)", "/(if (@x) then a else b)/string()"});
  }
  if (_random.below(8) == 0) text += "/(" + expr(depth - 1) + ")";
  return text;
}

std::string ProgramGenerator::comparison(int depth) {
  static const std::vector<std::string> operators = {" = ",  " = ",  " != ", " < ", " > ",
                                                     " >= ", " eq ", " lt ", " ne "};
  return operand(depth) + _random.oneOf(operators) + operand(depth);
}

std::string ProgramGenerator::operand(int depth) {
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

// Mostly one that goes down from the document by names alone.
std::string ProgramGenerator::pathDown() {
  return _random.oneOf({"/a", "//a", "/a/b", "//b", "/a/*", "//@x", "/a//b", "(/a/b/c)", "//a//b",
                        "/a/b/@x", "//b[@x]", "*", "(//a | //b)", "//text()"});
}

// What is asked of a variable or a function that stands for such a path.
std::string ProgramGenerator::inParts(const std::string& whole) {
  const auto use = [&] {
    const std::string filtered = whole + "[" + match(".") + "]";
    const std::string loop = " $u in " + whole + " ";
    switch (_random.below(8)) {
      case 0:
        return filtered + _random.oneOf({"", "/@x", "/*", "/..", "[@y]", "[1]", "/string(@x)"});
      case 1:
        return _random.oneOf({"count(", "exists(", "empty(", "not("}) + whole + ")";
      case 2:
        return "(for" + loop +
               within("$u", [&] { return "where " + matches("$u") + " return $u)"; });
      case 3:
        return "(some" + loop + within("$u", [&] { return "satisfies " + match("$u") + ")"; });
      case 4:
        return "(for $o in 1 to 3 return " + whole + "[@x = string($o)])";
      case 5:
        return "(//a)[position() < 4][" + whole + "/@x = @x]";
      default:
        return whole + _random.oneOf({"/b", "/*/@x", "//b", "/..", "[@x][@y]/*", "[b]", "/b[1]"});
    }
  };
  const std::string last = _random.below(6) ? use() : whole + _random.oneOf({"", "[2]"});
  return "(" + use() + ", " + use() + ", " + last + ")";
}

std::string ProgramGenerator::loopsInParts() {
  const std::string further = _random.oneOf({"/b", "/*", "/b/c", "/@x", "/b[1]", "/*[@x]", "//b"});
  return "(for $u in " + pathDown() + ", $v in $u" + further + " where " + matches("$v") +
         " return " + _random.oneOf({"$v", "$v", "($v, 1)", "$v/..", "$u"}) + ")";
}

}  // namespace xquery::plantest
