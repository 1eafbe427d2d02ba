// Text as it stands in a document, and the text that it stands for.
#pragma once

#include "Platform/Reading/NotTaken.h"
#include "Platform/Reading/ReadTree.h"
#include "Platform/Reading/References.h"

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace xquery {

// What has been seen of a run of text or a value: whether it stands for itself.
struct RawText {
  const char* begin = nullptr;
  const char* end = nullptr;
  uint64_t wide = 0;
  bool isPlain = true;

  std::string_view bytes() const { return {begin, static_cast<size_t>(end - begin)}; }
  // Whether nothing is left to be looked at, whoever needs it.
  bool isSurelyRight() const {
    return isPlain && !wide && static_cast<size_t>(end - begin) <= longestPieceTaken;
  }
};

// Of one document. These answer what is good until the next of them is called, and throw NotTaken.
class RawTexts {
 public:
  // By the declaration of the document, of which all is to be ASCII.
  void expectASCII() { _isASCII = true; }
  bool expectsASCII() const { return _isASCII; }

  // As it stands there. Text beside a section is looked at together with it: the one must not
  // complete a character of the other.
  ReadText written(std::string_view bytes, uint64_t wide) const {
    take(bytes.size() <= longestPieceTaken && !(wide && (_isASCII || isCutBefore(bytes))));
    return {bytes, wide == 0};
  }
  // Between markup: with references and line ends replaced.
  ReadText content(const RawText& text) { return standingFor(text, appendTextOf); }
  // Of an attribute: with white space replaced as well.
  ReadText value(const RawText& text) { return standingFor(text, appendValueOf); }
  // Of what is not looked at for markup: with line ends replaced.
  ReadText lines(const RawText& text) { return standingFor(text, appendLinesOf); }

 private:
  using Append = void (*)(std::string_view bytes, ValueText<char>& text);
  ReadText standingFor(const RawText& text, Append append) {
    // Nothing is copied where there is nothing to replace.
    if (text.isPlain) return written(text.bytes(), text.wide);
    return replaced(written(text.bytes(), text.wide), append);
  }
  ReadText replaced(const ReadText& known, Append append);
  // Whether the text, of one byte at least, begins with what goes on with a character.
  static bool isCutBefore(std::string_view bytes) {
    return (static_cast<unsigned char>(bytes.front()) & 0xC0U) == 0x80;
  }

  bool _isASCII = false;
  ValueText<char> _scratch;
};

}  // namespace xquery
