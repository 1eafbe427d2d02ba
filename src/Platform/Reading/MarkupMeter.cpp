#include "Platform/Reading/MarkupMeter.h"

#include <algorithm>

namespace xquery {

void MarkupMeter::restart(Place place) {
  struct Beginning {
    State state;
    std::string_view ending;
  };
  // In the order of the places.
  static constexpr Beginning beginnings[] = {
      {State::Content, {}},  {State::Declaration, {}}, {State::Passed, "-->"},
      {State::Passed, "?>"}, {State::Passed, "]]>"},   {State::Beyond, {}},
  };
  const Beginning& beginning = beginnings[static_cast<size_t>(place)];
  _state = _around = beginning.state;
  _ending = beginning.ending;
  _matched = _depth = 0;
  _attributes = _named = _listed = 0;
  _mostAttributes = _mostNamed = _mostListed = 0;
}

void MarkupMeter::read(std::string_view text) {
  using Step = size_t (MarkupMeter::*)(std::string_view text, size_t at);
  // In the order of the states.
  static constexpr Step steps[] = {
      &MarkupMeter::readContent, &MarkupMeter::readOpening,     &MarkupMeter::readOpening,
      &MarkupMeter::readTag,     &MarkupMeter::readDeclaration, &MarkupMeter::readLiteral,
      &MarkupMeter::readPassed,  &MarkupMeter::readBeyond,
  };
  for (size_t at = 0; at < text.size();) {
    const Step step = steps[static_cast<size_t>(_state)];
    at = (this->*step)(text, at);
  }
}

size_t MarkupMeter::readContent(std::string_view text, size_t at) {
  const size_t less = text.find('<', at);
  if (less == text.npos) return text.size();
  _state = State::Less;
  return less + 1;
}

size_t MarkupMeter::readOpening(std::string_view text, size_t at) {
  const char byte = text[at];
  if (_state == State::Less && byte == '!') {
    _state = State::Exclamation;
    return at + 1;
  }
  if (_state == State::Less && byte != '?') {
    _state = State::Tag;
    _attributes = _named = 0;
    return at;
  }
  if (byte == '?') {
    pass("?>");
  } else if (byte == '-') {
    pass("-->");
  } else if (byte == '[') {
    pass("]]>");
  } else {
    _state = State::Declaration;
    _depth = _listed = 0;
  }
  return at + 1;
}

// Of the attribute whose "=" is there; a name that began in an earlier piece is not recognised.
bool isNamespaceDeclaration(std::string_view text, size_t equals) {
  constexpr std::string_view whiteSpace = " \t\r\n";
  constexpr std::string_view xmlns = "xmlns";
  const size_t end = text.substr(0, equals).find_last_not_of(whiteSpace);
  const size_t before = text.find_last_of(whiteSpace, end);
  if (end == text.npos || before == text.npos) return false;
  const std::string_view name = text.substr(before + 1, end - before);
  return name == xmlns || (name.starts_with(xmlns) && name[xmlns.size()] == ':');
}

size_t MarkupMeter::readTag(std::string_view text, size_t at) {
  const size_t found = text.find_first_of("=\"'>", at);
  if (found == text.npos) return text.size();
  switch (text[found]) {
    case '=':
      _mostAttributes = std::max(_mostAttributes, ++_attributes);
      if (!isNamespaceDeclaration(text, found)) _mostNamed = std::max(_mostNamed, ++_named);
      break;
    case '>':
      _state = State::Content;
      break;
    default:
      openLiteral(text.substr(found, 1));
  }
  return found + 1;
}

// A list may stand in the text of a parameter entity, without its parentheses.
size_t MarkupMeter::readDeclaration(std::string_view text, size_t at) {
  const size_t found = text.find_first_of("|,()\"'<>", at);
  if (found == text.npos) return text.size();
  switch (text[found]) {
    case '|':
    case ',':
      _mostListed = std::max(_mostListed, ++_listed);
      break;
    case '(':
      if (_depth++ == 0) _listed = 0;
      break;
    case ')':
      _depth -= std::min(_depth, size_t{1});
      break;
    case '<':
      _state = State::Less;
      break;
    case '>':
      _state = State::Content;
      break;
    default:
      openLiteral(text.substr(found, 1));
  }
  return found + 1;
}

void MarkupMeter::openLiteral(std::string_view quote) {
  _around = _state;
  _state = State::Literal;
  _ending = quote == "'" ? "'" : "\"";
}

size_t MarkupMeter::readLiteral(std::string_view text, size_t at) {
  const size_t end = text.find(_ending[0], at);
  if (end == text.npos) return text.size();
  _state = _around;
  return end + 1;
}

void MarkupMeter::pass(std::string_view ending) {
  _state = State::Passed;
  _ending = ending;
  _matched = 0;
}

// The ending may come in pieces; its bytes before the last repeat the first.
size_t MarkupMeter::readPassed(std::string_view text, size_t at) {
  if (_matched == 0) {
    at = text.find(_ending[0], at);
    if (at == text.npos) return text.size();
  }
  const char byte = text[at];
  if (byte == _ending[_matched]) {
    if (++_matched == _ending.size()) _state = State::Content;
  } else if (byte != _ending[0]) {
    _matched = 0;
  }
  return at + 1;
}

size_t MarkupMeter::readBeyond(std::string_view text, size_t) {
  return text.size();
}

}  // namespace xquery
