// What is asked of many items again and again, so that rules find it worth their while.
#include "Plan/ProgramGenerator.h"

namespace xquery::plantest {

std::string ProgramGenerator::many() {
  const std::string list = _random.oneOf(
      {"//*", "//a", "//b", "//@x", "//*/@y", "data(//@*)", "//*/..", "//b/*", "(//*, <b x='1'/>)",
       "(//@x, 1, 'u', 2.5, 3e0)", "(//@x, xs:date('2004-10-29'))", variable()});
  return _random.below(6) ? "(" + list + ")[position() < " + _random.oneOf({"9", "10", "14"}) + "]"
                          : list;
}

std::string ProgramGenerator::keyOf(const std::string& item) {
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

std::string ProgramGenerator::match(const std::string& item) {
  static const std::vector<std::string> operators = {
      " = ", " = ", " = ", " < ", " >= ", " != ", " eq ", " lt ", " is "};
  const std::string other = _random.below(4) ? keyOf(variable()) : operand(1);
  if (_random.below(6) == 0) {
    return "(some $w in " + item + _random.oneOf({"/*", "/@*", "/.."}) + " satisfies " +
           keyOf("$w") + _random.oneOf(operators) + other + ")";
  }
  if (_random.below(8) == 0) return "starts-with(" + keyOf(item) + ", " + other + ")";
  if (_random.below(10) == 0) return difference(keyOf(item), other);
  return _random.below(2) ? keyOf(item) + _random.oneOf(operators) + other
                          : other + _random.oneOf(operators) + keyOf(item);
}

std::string ProgramGenerator::difference(const std::string& one, const std::string& other) {
  const std::string function = _random.oneOf({"string", "string", "number", "data", "zero-or-one"});
  const auto both = [&](const std::string& between) {
    return function + "(" + one + ")" + between + function + "(" + other + ")";
  };
  return _random.oneOf({"(compare(" + one + ", " + other + ") = 0)",
                        "(0 eq compare(" + both(", ") + "))", "deep-equal(" + both(", ") + ")",
                        "(" + both(" - ") + " = 0)"});
}

std::string ProgramGenerator::matches(const std::string& item) {
  if (item != "." && _random.below(8) == 0) {
    return item + "[" + match(".") + "]" +
           _random.oneOf({"", "", "/@x", "[" + match(".") + "]", "/*[" + match(".") + "]"});
  }

  if (_random.below(6) == 0) return twoMatches(item);
  std::string text = _random.below(3) ? match(item) : phrased(item);
  while (_random.below(3) == 0) {
    text += " and " + (_random.below(3) ? match(item) : match(variable()));
  }
  return text;
}

std::string ProgramGenerator::phrased(const std::string& item) {
  const std::string one = match(item);
  const std::string other = _random.below(3) ? match(item) : match(variable());
  return _random.oneOf({"(" + one + " or " + other + ")", "(" + one + " or " + other + ")",
                        "boolean(" + one + ")", "not(" + one + ")", "not(not(" + one + "))",
                        "not(" + one + " and " + other + ")",
                        "not(not(" + one + ") or " + other + ")", "((" + one + ") = true())",
                        "(false() eq (" + one + "))", "(if (" + one + ") then true() else false())",
                        "(if (" + one + ") then " + other + " else ())",
                        "(if (" + one + ") then () else " + other + ")",
                        "(if (" + one + ") then true() else " + other + ")",
                        "(if (" + one + ") then " + other + " else true())"});
}

std::string ProgramGenerator::twoMatches(const std::string& item) {
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

std::string ProgramGenerator::joined(int depth) {
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
  if (_random.below(6) == 0) return filtered(depth);
  if (_random.below(8) == 0) return stretch();
  if (_random.below(6) == 0) return earlier();
  if (_random.below(8) == 0) return positions();
  std::string text = "for $u in " + many() + " ";
  return "(" + text +
         within("$u",
                [&] {
                  const std::string clause =
                      _random.oneOf({"let $v := " + keyOf("$u"), "for $v in " + keyOf("$u"),
                                     "for $v in " + many(), "for $v at $n in " + many(),
                                     "for $v in " + many() + "[" + match(".") + "]",
                                     "for $v in //b[" + match(".") + "]"});
                  if (_random.below(8) == 0) {
                    return "let $v := " + match("$u") + " where " + _random.oneOf({"", "not"}) +
                           "($v)" + _random.oneOf({"", " and " + match("$u")}) + " return $u";
                  }
                  return clause + within("$v", [&] {
                           std::string rest = " where " + matches(_random.oneOf({"$u", "$v"}));
                           if (_random.below(4) == 0) {
                             return " return " + _random.oneOf({"$u", "$v"}) + "[" + match(".") +
                                    "]" + _random.oneOf({"", "/@x", "[@y]"});
                           }
                           return rest + " return " + (_random.below(2) ? "$v" : expr(depth - 1));
                         });
                }) +
         ")";
}

std::string ProgramGenerator::conditional(int depth) {
  const bool isSum = _random.below(2) == 0;
  const std::string clause = "for $u in " + many() + " ";
  return within("$u", [&] {
    const std::string condition = "return if (" + matches("$u") + ") then ";
    if (_random.below(5) == 0) return "(" + clause + condition + "() else " + expr(depth - 1) + ")";
    const std::string value = _random.oneOf({"1", "$u", "2.5", "$u/@x", "-0e0", "'u'"});
    return isSum ? "(sum(" + clause + condition + value + " else 0))"
                 : "(" + clause + condition + expr(depth - 1) + " else ())";
  });
}

std::string ProgramGenerator::counted(int depth) {
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
      return "sum(" + clause + "where " + within("$u", [&] { return matches("$u"); }) + " return " +
             _random.oneOf({"1", "2", "-1", "0.5"}) + _random.oneOf({")", ", 0)", ", ())"});
    default:
      return "(" +
             _random.oneOf(
                 {"count(", "count(", "exists(", "empty(", "1 < count(", "boolean(", "not("}) +
             list + "))";
  }
}

std::string ProgramGenerator::first(int depth) {
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

std::string ProgramGenerator::chain() {
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

std::string ProgramGenerator::filtered(int depth) {
  const std::string clause =
      _random.oneOf({"for $v in $u/*", "for $v in $u/@*", "let $v := $u/@x", "for $v at $n in //b",
                     "let $v := $u/* for $n in $v", "for $v in (1, 'u')", "for $v in $u/.."});
  const auto condition = [&] {
    if (_random.below(5) == 0) return match(_random.oneOf({"$u", "$v"}));
    return _random.oneOf({"$u/@x = 'u'", "$u/@y", "not($u/*)", "$v = '1'", "exists($u/c)",
                          "$u/@x = $v", "$u/.. is $v/..", "$u/@x = string($o/@x)", "$u/@x > 1",
                          "count($u/*) > 1", "(some $w in $u/* satisfies $w = '2')"});
  };
  std::string text = "(for $u in " + _random.oneOf({"//a", "//b", "/a/*", many()}) + " " + clause;
  return text + within("$u", [&] {
           std::string rest = " where " + condition();
           while (_random.below(3)) rest += " and " + condition();
           return rest + " return " + _random.oneOf({"$v", "<b>{$u}</b>", expr(depth - 1)}) + ")";
         });
}

std::string ProgramGenerator::stretch() {
  const std::string list = _random.oneOf({"//*", "//*/@x", "(//a | //b)", "//node()", many()});
  const std::string up = _random.oneOf({"ancestor::a", "ancestor-or-self::*", "..", "../..",
                                        "ancestor::node()", "ancestor-or-self::b"});
  const std::string node = _random.oneOf({variable(), "$o", "$l"});
  return "(let $l := " + list + " return $l[" + _random.oneOf({"", "", "@x and "}) + "(" + up +
         " intersect " + node + ")]" + _random.oneOf({"", "[@y]", "[last()]", "/..", "[2]"}) + ")";
}

std::string ProgramGenerator::earlier() {
  const std::string step = _random.oneOf({"", "/@x", "/@y", "/*", "/.."});
  const std::string sides = _random.oneOf({"$u", "$u/@x", "$u/*", "$o/@x", "'1'", "2"}) + " = $l[" +
                            _random.oneOf({"position() < $n", "$n >= position()"}) + "]" + step;
  return "(let $l := " + many() + " for $u at $n in " + _random.oneOf({"$l", "$l", "($l, $l)"}) +
         " where " + _random.oneOf({"", "not"}) + "(" + sides + ") return $u)";
}

std::string ProgramGenerator::positions() {
  if (_random.below(2)) return asked();
  const std::string list = _random.oneOf({"data(//@x)", "//*", "(//@*, 1, 2.5, 'u')", many()});
  return "(let $l := " + list + " for $u in " + many() + " return " +
         _random.oneOf({"", "count", "exists"}) + "(index-of($l, " +
         _random.oneOf({"string($u)", "$u", "number($u)", "data($u/@x)", "string($o/@x)"}) + ")))";
}

// Places that are worked out, of lists and of steps.
std::string ProgramGenerator::asked() {
  const std::string list =
      _random.oneOf({"$l", "$l", "$l", "(1 to 5)", "//*", "$l/*", "//b/@*", "(//b, 'u')"});
  const std::string place = _random.oneOf(
      {"$n", "$n - 1", "$u", "$u/@x", "number($u)", "count($u/*)", "($n, 2)", "$n = 2",
       "position() = $n", "position() = ($n to $n + 1)", "$n eq position()", "string($u)"});
  return "(let $l := " + many() + " for $u at $n in " + _random.oneOf({"$l", "(1, 2, 3)"}) +
         " return " + _random.oneOf({"", "count", "exists", "sum"}) + "(" + list + "[" + place +
         "]" + _random.oneOf({"", "/..", "[1]", "[$n]", "/*"}) + "))";
}

std::string ProgramGenerator::lookedUp(int depth) {
  const std::string key =
      _random.oneOf({"@x", "@x", "c", ".", "b/@x", ".//c", "@*", "./c", "c/text()", "text()"});
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
  if (_random.below(3) == 0) return lookedUpInList(condition);
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

std::string ProgramGenerator::lookedUpInList(
    const std::function<std::string(const std::string&)>& condition) {
  const std::string list =
      _random.oneOf({"//b", "/a/b", "//b", "/a/*", "//*[c]", "//b[@x]", "//b/@x", "(//c, //b)",
                     "(//b)[position() < 60]", "(//b, <b x='1'/>)", "reverse(//b)", "//@*"});
  const std::string probes = _random.oneOf({"('1', '2', '1')", "(//b)[position() < 5]/@x",
                                            "('u', 1, '')", "(//b, 'v')[position() < 9]"});
  const std::string start = "(let $l := " + list + " for $o in " + probes + " return ";
  return start +
         within(
             "$l",
             [&] {
               return within("$o", [&]() -> std::string {
                 const std::string each = _random.oneOf({"$u in $l", "$u in $l", "$u in " + list});
                 switch (_random.below(7)) {
                   case 0:
                     return "$l[" + condition(".") + "]";
                   case 1:
                     return "count($l[" + condition(".") + "])";
                   case 2:
                     return "(" + _random.oneOf({"$l = $o", "$o = $l", "not($l = ($o, '2'))"}) +
                            ")";
                   case 3:
                     return "(some " + each + " satisfies " + condition("$u") + ")";
                   case 4:
                     return "(every " + each + " satisfies not(" + condition("$u") + "))";
                   case 5:
                     return "exists(for " + each + " where " + condition("$u") + " return $u)";
                   default:
                     return "(for " + each + " where " + condition("$u") + " return " +
                            _random.oneOf({"$u", "$u/@x", "<b>{$u}</b>"}) + ")";
                 }
               });
             }) +
         ")";
}

std::string ProgramGenerator::negatedFor(const std::string& kind, const std::string& condition) {
  return kind == "every" && _random.below(3) ? "not(" + condition + ")" : condition;
}

std::string ProgramGenerator::join(int depth) {
  std::string text =
      "for $o in (//a)[position() < " + _random.oneOf({"4", "4", "12"}) + "] return (";
  return "(" + text + within("$o", [&] { return joined(depth - 1); }) + "))";
}

}  // namespace xquery::plantest
