#include "Platform/Reading/SkippedElements.h"

#include "Platform/Text/ASCII.h"

namespace xquery {

// In all of these null stands for: left to the reader.

const char* SkippedElements::skip(const char* at, OpenNames& open) {
  const char* const end = _text.end();
  for (;;) {
    if (end - at < 2) break;
    ReadName* const last = _names.last();
    const char* next = nullptr;
    if (*at != '<') {
      next = behindText(at);
    } else if (at[1] == '/') {
      next = behindEndTag(at, open);
    } else if (at[1] != '!' && at[1] != '?') {
      next = behindStartTag(at, open);
    }
    if (!next) {
      _names.goBack(last);
      break;
    }
    at = next;
  }
  _text.goBack(at);
  return at;
}

inline const char* SkippedElements::behindText(const char* at) {
  if (_tags.needsTexts()) return nullptr;
  RawText text;
  text.begin = at;
  text.end = _text.textEnd(at, text.wide);
  if (text.end == _text.end() || *text.end != '<') return nullptr;
  if (!text.isSurelyRight()) _tree.check(_texts.content(text));
  return text.end;
}

inline const char* SkippedElements::behindEndTag(const char* at, OpenNames& open) {
  const ReadName& name = *open.back();
  const char* const end = _text.end();
  at += 2;
  if (static_cast<size_t>(end - at) <= name.bytes.size()) return nullptr;
  const char* const behind = at + name.bytes.size();
  if (*behind != '>' || !ReadNames::isAt(name, at, end) || !_tags.closeIfWaiting()) return nullptr;
  open.pop_back();
  _names.endElement(open.size());
  return behind + 1;
}

inline ReadName* SkippedElements::nameAt(const char*& at) {
  const char* const end = _text.end();
  if (ReadName* const name = _names.likely(at, end)) [[likely]] {
    at += name->bytes.size();
    return name;
  }
  uint64_t wide = 0;
  const char* const begin = at;
  at = _text.nameEnd(at, wide);
  if (at == begin || at == end || wide) return nullptr;
  return _names.find(begin, at, end);
}

inline const char* SkippedElements::behindStartTag(const char* at, OpenNames& open) {
  const char* const end = _text.end();
  ReadName* const name = nameAt(++at);
  if (!name || (name->hasPrefix && !name->prefix->bound)) return nullptr;
  ProjectedTags::State* const state = _tags.stateIfWaiting(*name);
  if (!state) return nullptr;
  if (*at == ' ') {
    at = behindAttributes(at);
    if (!at) return nullptr;
  }
  if (*at == '>') {
    open.push_back(name);
    _tags.openWaiting(state, *name);
    return at + 1;
  }
  if (*at != '/' || end - at < 2 || at[1] != '>') return nullptr;
  _tree.endText();
  return at + 2;
}

// From the white space before the first one to what ends the tag.
const char* SkippedElements::behindAttributes(const char* at) {
  constexpr size_t most = 16;
  const ReadName* names[most];
  size_t count = 0;
  bool hasPrefix = false;
  const char* const end = _text.end();
  for (;;) {
    while (at < end && *at == ' ') ++at;
    if (at == end) return nullptr;
    if (*at == '>' || *at == '/') return at;
    if (at[-1] != ' ' || count == most) return nullptr;
    const ReadName* const name = nameAt(at);
    if (!name || name->declares) return nullptr;
    if (name->hasPrefix) {
      // Two prefixes may stand for one namespace.
      if (hasPrefix || name->isOfXML || !name->prefix->bound) return nullptr;
      hasPrefix = true;
    }
    for (size_t index = 0; index < count; ++index) {
      if (names[index] == name) return nullptr;
    }
    names[count++] = name;
    at = behindValue(at);
    if (!at) return nullptr;
  }
}

inline const char* SkippedElements::behindValue(const char* at) {
  const char* const end = _text.end();
  if (end - at < 2 || *at != '=' || (at[1] != '"' && at[1] != '\'')) return nullptr;
  const char quote = at[1];
  RawText value;
  value.begin = at + 2;
  for (at = value.begin;; ++at) {
    at = _text.valueEnd(at, value.wide);
    if (at == end) return nullptr;
    if (*at == quote) break;
    if (*at != '"' && *at != '\'' && *at != '>') return nullptr;
  }
  value.end = at;
  return value.isSurelyRight() ? at + 1 : nullptr;
}

}  // namespace xquery
