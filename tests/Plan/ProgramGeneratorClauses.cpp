// Clauses, constructors and calls.
#include "Plan/ProgramGenerator.h"

namespace xquery::plantest {

std::string ProgramGenerator::flwor(int depth) {
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

std::string ProgramGenerator::quantified(int depth) {
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

std::string ProgramGenerator::constructor(int depth) {
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

std::string ProgramGenerator::growingTree(int depth) {
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
                                            : "{if (" + comparison(depth - 1) + ") then " + inner +
                                                  " else element d {" + _random.oneOf(nodes) +
                                                  ", attribute x {2}}}";
  return "(let $n := <a><b/></a>, $m := <a><c/></a> return <a>" + part() + loop + part() + "</a>)";
}

std::string ProgramGenerator::call(int depth) {
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
    return "subsequence(" + items + ", " + _random.oneOf({"1", "2", "1, 1", "2, 2", "0, 3"}) + ")";
  }
  if (_random.below(5) == 0) {
    return "(" + path(depth - 1) + ")" +
           _random.oneOf({"[1]", "[2]", "[position() <= 2]", "[position() < 2]",
                          "[3 >= position()]", "[last()]", "[last() - 1]", "[last() - 1]/..",
                          "[position() eq last()]"});
  }
  return functions[_random.below(functions.size())] + "(" + expr(depth - 1) + ")";
}

// The variable of a case can be read behind it, where something may have been left in its place.
std::string ProgramGenerator::typeswitch(int depth) {
  const std::string text = "(typeswitch (" + expr(depth - 1) + ") case $t as element() return " +
                           within("$t", [&] { return expr(depth - 1); }) + " default return " +
                           (_random.below(4) == 0 ? "$t" : expr(depth - 1)) + ")";
  return _random.below(4) == 0 ? "(" + text + ", $t)" : text;
}

std::string ProgramGenerator::other(int depth) {
  switch (_random.below(5)) {
    case 0:
      return "(if (" + comparison(depth - 1) + ") then " + expr(depth - 1) + " else " +
             expr(depth - 1) + ")";
    case 1:
      return typeswitch(depth);
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

}  // namespace xquery::plantest
