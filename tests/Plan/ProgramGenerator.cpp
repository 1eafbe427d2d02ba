#include "Plan/ProgramGenerator.h"

namespace xquery::plantest {

std::string ProgramGenerator::document() {
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

std::string ProgramGenerator::program() {
  _functions.clear();
  std::string text;
  _variables = {};
  if (_random.below(3) == 0) text += "declare variable $g := " + expr(2) + ";\n";
  _hasGlobal = !text.empty();
  if (_random.below(2) == 0) text += function("local:f", "");
  if (_random.below(3) == 0) text += function("local:r", "local:r");
  if (_random.below(4)) return text + expr(5);
  const std::string path = pathDown();
  text += "declare variable $h := " + path + ";\ndeclare function local:h() { " + path + " };\n";
  return text + "(" + inParts("$h") + ", " + inParts("local:h()") + ", (let $h := " + path +
         " return " + inParts("$h") + "), " + loopsInParts() + ", " + expr(2) + ")";
}

std::string ProgramGenerator::element(int depth) {
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

std::string ProgramGenerator::function(const std::string& name, const std::string& recursion) {
  _variables = {"$p"};
  std::string body = _random.below(4) ? expr(3) : "$p[" + matches(".") + "]";
  if (!recursion.empty()) {
    body = "if (not($p castable as xs:integer) or number($p) < 1 or number($p) > 6) then " + body +
           " else (" + expr(1) + ", " + recursion + "(number($p) - 1))";
  }
  _variables = {};
  _functions.push_back(name);
  return "declare function " + name + "($p) {" + body + "};\n";
}

std::string ProgramGenerator::literal() {
  return _random.oneOf({"1", "2", "3", "10", "2.5", "1e0", "'u'", "'1'", "'a'", "()", "''"});
}

std::string ProgramGenerator::constant() {
  static const std::vector<std::string> operators = {" + ", " * ", " div ", " = ", " < ", " eq "};
  return "(" + literal() + _random.oneOf(operators) + literal() + ")";
}

std::string ProgramGenerator::variable() {
  if (_variables.empty()) return _hasGlobal && _random.below(2) ? "$g" : ".";
  return _variables[_random.below(_variables.size())];
}

std::string ProgramGenerator::expr(int depth) {
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

}  // namespace xquery::plantest
