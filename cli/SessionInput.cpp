#include "SessionInput.h"

#include <algorithm>
#include <cctype>

namespace cli {
namespace {

constexpr std::string_view blanks = " \t\r\n";

bool isNameByte(char byte) {
  const auto value = static_cast<unsigned char>(byte);
  return value >= 0x80 || std::isalnum(value) || byte == '_' || byte == '-' || byte == '.';
}

bool isNameStart(char byte) {
  return isNameByte(byte) && !std::isdigit(static_cast<unsigned char>(byte)) && byte != '-' &&
         byte != '.';
}

// Words behind which an expression begins, so that a "<" there begins a tag.
constexpr std::string_view operators[] = {
    "return",     "then",      "else",    "in",       "and",       "or",     "to",
    "div",        "idiv",      "mod",     "eq",       "ne",        "lt",     "le",
    "gt",         "ge",        "is",      "isnot",    "if",        "where",  "by",
    "case",       "satisfies", "default", "union",    "intersect", "except", "ascending",
    "descending", "validate",  "ordered", "unordered"};

// Walks the text once. Of what is open it keeps one character each:
//
//   ( [ {   brackets of expressions
//   <       a start tag
//   " '     the value of an attribute, within a tag
//   c       the content of an element
class Reader {
 public:
  explicit Reader(std::string_view text) : _text(text) {}

  SessionInput read() {
    while (_at < _text.size() && !_isCut) step();
    SessionInput input;
    input.isComplete = !_isCut && _open.empty();
    input.declarations = std::move(_declarations);
    input.body = _text.substr(_start);
    if (!_hasBody) input.body.clear();
    return input;
  }

 private:
  void step() {
    const char inside = _open.empty() ? '(' : _open.back();
    if (inside == '<') {
      stepInTag();
    } else if (inside == '"' || inside == '\'') {
      stepInValue(inside);
    } else if (inside == 'c') {
      stepInContent();
    } else {
      stepInExpression();
    }
  }

  bool startsWith(std::string_view what) const { return _text.substr(_at).starts_with(what); }

  // Goes behind the end of what began; without an end the text is cut there.
  bool passed(std::string_view start, std::string_view end) {
    if (!startsWith(start)) return false;
    const size_t found = _text.find(end, _at + start.size());
    _isCut = found == _text.npos;
    _at = _isCut ? _text.size() : found + end.size();
    return true;
  }

  bool passedMarkup() {
    return passed("<!--", "-->") || passed("<![CDATA[", "]]>") || passed("<?", "?>");
  }

  void passComment() {
    size_t depth = 0;
    do {
      if (startsWith("(:")) {
        ++depth;
        _at += 2;
      } else if (startsWith(":)")) {
        --depth;
        _at += 2;
      } else {
        ++_at;
      }
    } while (depth > 0 && _at < _text.size());
    _isCut = depth > 0;
  }

  void stepInExpression() {
    const char byte = _text[_at];
    if (startsWith("(:")) return passComment();
    if (blanks.find(byte) != blanks.npos) {
      ++_at;
      return;
    }
    if (byte == ';' && _open.empty()) return endDeclaration();
    _hasBody = true;
    if (byte == '"' || byte == '\'') {
      const char quote[] = {byte, '\0'};
      passed(quote, quote);
      _isBehindOperand = true;
    } else if (byte == '<' && !_isBehindOperand && beginsConstructor()) {
      if (!passedMarkup()) open('<');
      _isBehindOperand = true;
    } else if (isNameByte(byte)) {
      passName();
    } else {
      stepOverSign(byte);
    }
  }

  bool beginsConstructor() const {
    const char next = _at + 1 < _text.size() ? _text[_at + 1] : '\0';
    return isNameStart(next) || next == '!' || next == '?';
  }

  void passName() {
    const size_t start = _at;
    while (_at < _text.size() && isNameByte(_text[_at])) ++_at;
    const std::string_view name = _text.substr(start, _at - start);
    const char before = start > 0 ? _text[start - 1] : ' ';
    const bool isPlain = before != '$' && before != '/' && before != '@' && before != ':';
    _isBehindOperand = !isPlain || std::find(std::begin(operators), std::end(operators), name) ==
                                       std::end(operators);
  }

  void stepOverSign(char byte) {
    constexpr std::string_view openers = "([{", closers = ")]}";
    const size_t closer = closers.find(byte);
    if (openers.find(byte) != openers.npos) {
      open(byte);
    } else if (closer != closers.npos && !_open.empty() && _open.back() == openers[closer]) {
      _open.pop_back();
      ++_at;
    } else {
      ++_at;
    }
    _isBehindOperand = closer != closers.npos;
  }

  void stepInTag() {
    const char byte = _text[_at];
    if (byte == '"' || byte == '\'') return open(byte);
    if (startsWith("/>")) {
      _at += 2;
      _open.pop_back();
    } else {
      ++_at;
      if (byte == '>') _open.back() = 'c';
    }
  }

  void stepInValue(char quote) {
    const char byte = _text[_at];
    if (startsWith("{{")) {
      _at += 2;
    } else if (byte == '{') {
      openExpression();
    } else {
      ++_at;
      if (byte == quote) _open.pop_back();
    }
  }

  void stepInContent() {
    if (passedMarkup()) return;
    if (startsWith("</")) {
      passed("</", ">");
      if (!_isCut) _open.pop_back();
    } else if (startsWith("{{")) {
      _at += 2;
    } else if (_text[_at] == '{') {
      openExpression();
    } else if (_text[_at] == '<') {
      open('<');
    } else {
      ++_at;
    }
  }

  void open(char what) {
    _open += what;
    ++_at;
  }
  void openExpression() {
    open('{');
    _isBehindOperand = false;
  }

  void endDeclaration() {
    ++_at;
    if (_hasBody) _declarations.emplace_back(_text.substr(_start, _at - _start));
    _start = _at;
    _hasBody = false;
    _isBehindOperand = false;
  }

  const std::string_view _text;
  size_t _at = 0;
  size_t _start = 0;  // of the declaration or the body
  std::string _open;
  std::vector<std::string> _declarations;
  bool _hasBody = false;          // more than blanks and comments since then
  bool _isBehindOperand = false;  // so that "<" compares
  bool _isCut = false;
};

// The words and signs of a declaration, one after the other.
class Words {
 public:
  explicit Words(std::string_view text) : _text(text) {}
  std::string_view next() {
    skipBlanks();
    size_t length = 0;
    while (length < _text.size() && (isNameByte(_text[length]) || _text[length] == ':')) {
      if (_text.substr(length, 2) == ":=") break;
      ++length;
    }
    length = std::max<size_t>(length, _text.empty() ? 0 : 1);
    const std::string_view word = _text.substr(0, length);
    _text.remove_prefix(length);
    return word;
  }
  std::string_view rest() const { return _text; }

 private:
  void skipBlanks() {
    for (;;) {
      _text.remove_prefix(std::min(_text.find_first_not_of(blanks), _text.size()));
      if (!_text.starts_with("(:")) return;
      size_t depth = 0, at = 0;
      do {
        const std::string_view two = _text.substr(at, 2);
        depth += two == "(:";
        depth -= two == ":)";
        at += two == "(:" || two == ":)" ? 2 : 1;
      } while (depth > 0 && at < _text.size());
      _text.remove_prefix(std::min(at, _text.size()));
    }
  }

  std::string_view _text;
};

// Behind the opening parenthesis. A type may hold commas of its own, but no dollar sign.
size_t parametersIn(Words words) {
  size_t count = 0, depth = 1;
  while (depth > 0) {
    const std::string_view word = words.next();
    if (word.empty()) break;
    depth += word == "(";
    depth -= word == ")";
    count += word == "$";
  }
  return count;
}

}  // namespace

SessionInput sessionInput(std::string_view text) {
  return Reader(text).read();
}

DeclarationName declarationName(std::string_view declaration) {
  using Kind = DeclarationName::Kind;
  Words words(declaration);
  const std::string first(words.next()), second(words.next()), third(words.next());
  if (first == "xquery" && second == "version") return {Kind::Version, {}};
  if (first == "module") return {Kind::Module, {}};
  if (second == "variable") return {Kind::Variable, std::string(words.next())};
  if (second == "function") {
    words.next();
    return {Kind::Function, third + "/" + std::to_string(parametersIn(words))};
  }
  if (second == "namespace") return {Kind::Namespace, "namespace " + third};
  if (second == "default") {
    const bool isNamespace = third == "element" || third == "function";
    return {isNamespace ? Kind::Namespace : Kind::Setting, "default " + third};
  }
  // Modules and schemas are known by their prefix, where they have one, or by all that is said.
  if (first == "import" && third == "namespace") {
    return {Kind::Namespace, "namespace " + std::string(words.next())};
  }
  if (first == "import") return {Kind::Namespace, std::string(declaration)};
  return {Kind::Setting, second};
}

bool isUnprefixedName(std::string_view text) {
  return !text.empty() && isNameStart(text.front()) && std::ranges::all_of(text, isNameByte);
}

bool isVariableName(std::string_view text) {
  const size_t colon = text.find(':');
  if (colon == text.npos) return isUnprefixedName(text);
  return isUnprefixedName(text.substr(0, colon)) && isUnprefixedName(text.substr(colon + 1));
}

std::vector<std::string> variablesIn(std::string_view text) {
  std::vector<std::string> names;
  for (size_t at = text.find('$'); at != text.npos; at = text.find('$', at + 1)) {
    const std::string name(Words(text.substr(at + 1)).next());
    if (!name.empty() && isNameStart(name.front())) names.push_back(name);
  }
  std::sort(names.begin(), names.end());
  names.erase(std::unique(names.begin(), names.end()), names.end());
  return names;
}

}  // namespace cli
