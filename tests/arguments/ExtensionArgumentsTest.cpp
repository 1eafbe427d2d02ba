// The engine's own functions: queries in queries, nodes as text, and bytes.
#include "arguments/Driver.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <map>

namespace xquery::arguments {
namespace {

const Node& node(const Sequence& value) {
  if (value.size() != 1 || !value[0].isNode()) throw Refused();
  return *value[0].node;
}

// --- queries in queries --------------------------------------------------------------------------

bool isName(const std::string& text) {
  const auto isNameCharacter = [](char c) { return std::isalnum(c) || c == '-' || c == '_'; };
  return !text.empty() && std::isalpha(text[0]) &&
         std::all_of(text.begin(), text.end(), isNameCharacter);
}

bool hasElements(const Node& node) {
  return node.label == "library" || node.label == "r" || node.label == "plain";
}

// The texts of the samples as queries: what is no number and no constructor is the path to a child
// element, which none of the nodes has, or nothing that compiles.
Sequence answerOf(const std::string& query, const Sequence& focus) {
  static const std::map<std::string, Item> numbers = {
      {"1", integer(1)},         {"2004", integer(2004)},    {"-0.5", {13, "-0.5"}},
      {"2.7 ", {13, "2.7"}},     {"2004-05", integer(1999)}, {"2004-05-06", integer(1993)},
      {"--02-29", integer(-27)},
  };
  const auto found = numbers.find(query);
  if (found != numbers.end()) return one(found->second);
  if (query == "<a/>") return one({0, "node <a/>"});
  if (!isName(query) && query != "p:abcd" && query != "urn:p") throw Refused();
  for (const Item& item : focus) {
    if (!item.isNode()) throw Refused();
    // A prefix that is not bound fails when there is an element to compare with.
    if (!isName(query) && hasElements(*item.node)) throw Refused();
  }
  return {};
}

Sequence eval(const Call& call) {
  Attempts attempt;
  const std::string query = attempt([&] { return stringOf(call[0]); });
  attempt.finish();
  return answerOf(query, call.count() > 1 ? call[1] : Sequence());
}

// Of a node and a query; `failing` says how the failure of the query shows.
Rule queried(const char* failing) {
  return [=](const Call& call) {
    Attempts attempt;
    attempt([&] { return &node(call[0]); });
    const std::string query = attempt([&] { return stringOf(call[1]); });
    attempt.finish();
    try {
      return answerOf(query, call[0]);
    } catch (Refused) {
      call.orElse(failing);
      throw;
    }
  };
}

// A path that selects no nodes may be a failure or none.
Sequence nodesByPath(const Call& call) {
  Attempts attempt;
  attempt([&] { return &node(call[0]); });
  const std::string path = attempt([&] { return stringOf(call[1]); });
  attempt.finish();
  try {
    const Sequence answer = answerOf(path, call[0]);
    if (!answer.empty()) call.orElse("*");
    return answer;
  } catch (Refused) {
    call.orElse("error *");
    throw;
  }
}

// --- nodes as text -------------------------------------------------------------------------------

Sequence stringFromNode(const Call& call) {
  const std::string XML = node(call[0]).XML;
  call.orElse("8 " + XML);
  return one(string(XML));
}

Sequence pathOfNode(const Call& call) {
  node(call[0]);
  return one(anyOf(9));
}

// Only one text of the samples is XML; tidied as HTML, any is.
Sequence nodeFromString(const Call& call) {
  Attempts attempt;
  const std::string text = attempt([&] { return stringOf(call[0]); });
  const std::string options = call.count() > 1 ? attempt([&] { return stringOf(call[1]); }) : "";
  attempt.finish();
  if (options.find_first_of("hxT") != options.npos) {
    call.orRefused();
  } else if (text != "<a/>") {
    throw Refused();
  }
  call.orElse("node *");
  return one({0, "node *"});
}

// --- bytes ---------------------------------------------------------------------------------------

std::string bytesOf(const std::string& hexadecimal) {
  std::string bytes;
  for (size_t i = 0; i + 1 < hexadecimal.size(); i += 2) {
    bytes += static_cast<char>(std::stoi(hexadecimal.substr(i, 2), nullptr, 16));
  }
  return bytes;
}

std::string hexadecimalOf(const std::string& bytes) {
  std::string text;
  for (const unsigned char byte : bytes) {
    text += "0123456789ABCDEF"[byte >> 4];
    text += "0123456789ABCDEF"[byte & 15];
  }
  return text;
}

bool isASCII(const std::string& bytes) {
  return std::all_of(bytes.begin(), bytes.end(), [](unsigned char c) { return c < 0x80; });
}

// The charset that the argument names, "utf-8" without one. What names none is refused.
std::string charset(const Call& call) {
  if (call.count() < 2) return "utf-8";
  const std::string name = stringOf(call[1]);
  if (name != "US-ASCII") throw Refused();
  return name;
}

Sequence binaryFromString(const Call& call) {
  Attempts attempt;
  const std::string text = attempt([&] { return stringOf(call[0]); });
  const std::string name = attempt([&] { return charset(call); });
  attempt.finish();
  if (name == "US-ASCII" && !isASCII(text)) throw Refused();
  return one({26, hexadecimalOf(text)});
}

// Whatever bytes the samples have, they are UTF-8 only where they are ASCII.
Sequence stringFromBinary(const Call& call) {
  Attempts attempt;
  const std::string bytes = attempt([&] { return bytesOf(castTo(call[0], 26).text); });
  attempt([&] { return charset(call); });
  attempt.finish();
  if (!isASCII(bytes)) throw Refused();
  call.orElse("8 " + bytes);
  return one(string(bytes));
}

// From the one binary type to the other; what is taken for a binary value besides is open.
Rule converted(int from, int to) {
  return [=](const Call& call) {
    const bool isBinary = call[0].size() == 1 && call[0][0].type == from;
    if (!isBinary) {
      call.orRefused();
      call.orElse("error 6 *");
      call.orElse(std::to_string(to) + " *");
    }
    return one(castTo(call[0], to));
  };
}

Sequence binaryLength(const Call& call) {
  const size_t length = castTo(call[0], 26).text.size() / 2;
  return one(integer(static_cast<int64_t>(length)));
}

// The range from the start pattern to the end of the end pattern; an empty start is where the
// search begins, an empty end where the data ends.
std::optional<std::pair<size_t, size_t>> found(const std::string& data, const std::string& start,
                                               const std::string& end, size_t from) {
  if (data.empty()) return std::nullopt;
  size_t first = from;
  if (!start.empty()) {
    if (from >= data.size()) return std::nullopt;
    first = data.find(start, from);
    if (first == data.npos) return std::nullopt;
  }
  const size_t rest = first + start.size();
  if (rest > data.size()) return std::nullopt;
  if (end.empty()) return std::pair(first, data.size());
  const size_t last = data.find(end, rest);
  if (last == data.npos) return std::nullopt;
  return std::pair(first, last + end.size());
}

Rule finding(bool isAll) {
  return [=](const Call& call) {
    Attempts attempt;
    std::string parts[3];
    for (size_t i = 0; i < 3; ++i) {
      parts[i] = attempt([&] { return bytesOf(castTo(call[i], 26).text); });
    }
    attempt.finish();
    Sequence ranges;
    size_t from = 0;
    while (const auto range = found(parts[0], parts[1], parts[2], from)) {
      if (isAll && (range->first == range->second || range->second <= from)) break;
      const std::string bytes = parts[0].substr(range->first, range->second - range->first);
      ranges.push_back({0, "data " + hexadecimalOf(bytes)});
      from = range->second;
      if (!isAll) break;
    }
    if (ranges.empty()) throw Refused();
    return ranges;
  };
}

Sequence nothing(const Call&) {
  throw Refused();
}

}  // namespace

const std::vector<Function>& extensionFunctions() {
  static const std::vector<Function> functions = {
      {"ext:_test", 2, 2, queried("refused")},
      {"ext:eval", 1, 2, eval},
      {"ext:string-from-node", 1, 1, stringFromNode},
      {"ext:node-from-string", 1, 2, nodeFromString},
      {"ext:binary-from-string", 1, 2, binaryFromString},
      {"ext:string-from-binary", 1, 2, stringFromBinary},
      {"ext:binary-hex-to-base64", 1, 1, converted(26, 25)},
      {"ext:binary-base64-to-hex", 1, 1, converted(25, 26)},
      {"ext:binary-length", 1, 1, binaryLength},
      {"ext:binary-insert", 0, 5, nothing},
      {"ext:binary-remove", 0, 5, nothing},
      {"ext:binary-find", 3, 3, finding(false)},
      {"ext:binary-find-all", 3, 3, finding(true)},
      {"ext:real-date-time", 0, 0, [](const Call&) { return one(anyOf(21, "20")); }},
      {"ext:node-xquery", 2, 2, queried("error *")},
      {"ext:node-xpath", 2, 2, nodesByPath},
      {"ext:xpath-for-node", 1, 1, pathOfNode},
  };
  return functions;
}

TEST(ExtensionArguments, EndAsTheRulesSay) {
  expectRules(extensionFunctions());
}

}  // namespace xquery::arguments
