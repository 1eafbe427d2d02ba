#include "support/QueryMutator.h"

#include "support/QueryWords.h"

#include <algorithm>

namespace xquery::fuzz {

namespace {

constexpr int mostDepth = 4;

bool isWordByte(char c) {
  const auto byte = static_cast<unsigned char>(c);
  return byte >= 0x80 || (byte >= '0' && byte <= '9') ||
         ((byte | 0x20) >= 'a' && (byte | 0x20) <= 'z') || byte == '_' || byte == '-' ||
         byte == '.' || byte == ':' || byte == '$';
}

char closing(char c) {
  switch (c) {
    case '(':
      return ')';
    case '[':
      return ']';
    case '{':
      return '}';
    default:
      return 0;
  }
}

std::string joined(std::string_view a, std::string_view b, std::string_view c = {}) {
  std::string text(a);
  text += b;
  return text += c;
}

}  // namespace

std::vector<QueryMutator::Span> QueryMutator::fragmentsOf(std::string_view query) {
  std::vector<Span> found;
  std::vector<std::pair<char, size_t>> open;
  size_t word = 0;
  for (size_t i = 0; i <= query.size(); ++i) {
    if (i < query.size() && isWordByte(query[i])) continue;
    if (i > word) found.push_back({word, i - word});
    word = i + 1;
    if (i == query.size()) break;
    if (const char close = closing(query[i])) {
      open.emplace_back(close, i + 1);
    } else if (!open.empty() && open.back().first == query[i]) {
      found.push_back({open.back().second, i - open.back().second});
      open.pop_back();
    }
  }
  return found;
}

void QueryMutator::changeOnce(std::string& query) {
  const auto fragments = fragmentsOf(query);
  if (fragments.empty()) {
    query = expr(2);
    return;
  }
  const Span to = fragments[below(fragments.size())];
  const Span from = fragments[below(fragments.size())];
  const std::string other = query.substr(from.start, from.length);
  const std::string old = query.substr(to.start, to.length);
  switch (below(9)) {
    case 0:
    case 1:
      query.replace(to.start, to.length, other);
      break;
    case 2:
    case 3:
      query.replace(to.start, to.length, expr(static_cast<int>(below(3))));
      break;
    case 4:
      query.replace(to.start, to.length, "");
      break;
    case 5:
      query.replace(to.start, to.length, oneOf(queryWords()));
      break;
    case 6:
      query.replace(to.start, to.length, joined("(", old, ")" + step(1)));
      break;
    case 7:
      query.insert(to.start, joined(" ", oneOf(queryWords()), " "));
      break;
    default:
      query = prologItem() + query;
  }
}

std::string QueryMutator::mutated(std::string query, size_t most) {
  if (below(12) == 0) return program();
  for (size_t times = 1 + below(3); times > 0; --times) {
    const std::string before = query;
    changeOnce(query);
    if (query.size() > most) query = before;
  }
  return query;
}

std::string QueryMutator::program() {
  std::string text;
  while (below(3) == 0) text += prologItem();
  return text + expr(mostDepth);
}

std::string QueryMutator::prologItem() {
  switch (below(5)) {
    case 0:
      return joined("declare variable $g := ", expr(2), ";\n");
    case 1:
      return joined("declare function local:f($p as ", oneOf(sequenceTypes()), ") {") + expr(2) +
             "};\n";
    case 2:
      return joined("declare function local:g($p, $q) {", expr(3), "};\n");
    default:
      return joined(oneOf(prologItems()), "\n");
  }
}

std::string QueryMutator::expr(int depth) {
  if (depth <= 0) return simple();
  switch (below(10)) {
    case 0:
      return simple();
    case 1:
    case 2:
      return path(depth);
    case 3:
    case 4:
      return joined("(", clauses(depth), ")");
    case 5:
      return constructor(depth);
    case 6:
      return joined("(", typed(depth), ")");
    case 7:
      return "(" + expr(depth - 1) + ", " + expr(depth - 1) + ")";
    case 8:
      return joined("(" + expr(depth - 1), oneOf(binaryOperators()), expr(depth - 1) + ")");
    default:
      return call(depth);
  }
}

std::string QueryMutator::simple() {
  return std::string(oneOf(literals()));
}

std::string QueryMutator::step(int depth) {
  std::string text = joined(oneOf({"/", "/", "//"}), oneOf(axes()), oneOf(nodeTests()));
  if (depth > 0 && below(2) == 0) text += "[" + expr(depth - 1) + "]";
  return text;
}

std::string QueryMutator::path(int depth) {
  std::string text =
      below(3) ? std::string(oneOf({"", ".", "$i", "$g", "(//a)"})) : "(" + expr(depth - 1) + ")";
  for (size_t steps = 1 + below(3); steps > 0; --steps) text += step(depth - 1);
  if (below(6) == 0) text += "/(" + expr(depth - 1) + ")";
  return text;
}

std::string QueryMutator::clauses(int depth) {
  std::string text;
  switch (below(4)) {
    case 0:
      text = below(2) ? "some $i in " : "every $i in ";
      if (below(2)) text += expr(depth - 1) + ", $j in ";
      return text + expr(depth - 1) + " satisfies " + expr(depth - 1);
    case 1:
      return "if (" + expr(depth - 1) + ") then " + expr(depth - 1) + " else " + expr(depth - 1);
    default:
      break;
  }
  for (size_t count = 1 + below(3); count > 0; --count) {
    const std::string_view variable = oneOf({"$i", "$j", "$g"});
    if (below(3)) {
      text += joined("for ", variable, below(4) ? "" : " at $n") + " in " + expr(depth - 1) + " ";
    } else {
      text += joined("let ", variable, " := ") + expr(depth - 1) + " ";
    }
  }
  if (below(2)) text += "where " + expr(depth - 1) + " ";
  if (below(3) == 0) text += joined("order by " + expr(depth - 1), oneOf(orderModifiers()), " ");
  return text + "return " + expr(depth - 1);
}

std::string QueryMutator::constructor(int depth) {
  const auto part = [&] { return "{" + expr(depth - 1) + "}"; };
  switch (below(8)) {
    case 0:
      return "<a x='" + part() + "'>" + part() + "</a>";
    case 1:
      return "<p:a xmlns:p='urn:p' p:y='1'>" + part() + "t</p:a>";
    case 2:
      return "element " + (below(2) ? std::string("b ") : part()) + part();
    case 3:
      return "attribute " + (below(2) ? std::string("x ") : part()) + part();
    case 4:
      return "text " + part();
    case 5:
      return "comment " + part();
    case 6:
      return "processing-instruction a " + part();
    default:
      return "document " + part();
  }
}

std::string QueryMutator::typed(int depth) {
  switch (below(3)) {
    case 0:
      return joined("typeswitch (" + expr(depth - 1) + ") case $t as ", oneOf(sequenceTypes()),
                    " return ") +
             expr(depth - 1) + " default $t return " + expr(depth - 1);
    case 1:
      return joined(expr(depth - 1), oneOf({" cast as ", " castable as "}), oneOf(atomicTypes()));
    default:
      return joined(expr(depth - 1), oneOf({" instance of ", " treat as "}),
                    oneOf(sequenceTypes()));
  }
}

std::string QueryMutator::call(int depth) {
  std::string text = joined(oneOf(functionNames()), "(");
  for (size_t count = below(4); count > 0; --count) {
    text += expr(depth - 1);
    if (count > 1) text += ", ";
  }
  return text + ")";
}

}  // namespace xquery::fuzz
