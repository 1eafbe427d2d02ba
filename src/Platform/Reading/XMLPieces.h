// Our reader, a piece of the document after the other: tags, texts, comments and so on.
#pragma once

#include "Platform/Reading/TextSource.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string_view>

namespace xquery {

class ReadTree;

class XMLPieces {
 public:
  // Hears the text between the window's begin and the next piece, before it is gone.
  using Leaving = std::function<void(std::string_view text)>;

  XMLPieces(TextSource& source, uint32_t options, Leaving leaving);
  ~XMLPieces();
  XMLPieces(const XMLPieces&) = delete;
  XMLPieces& operator=(const XMLPieces&) = delete;

  // Puts the next piece into the tree, and answers how many elements are open then; `none` at the
  // end of the document. Throws NotTaken or LibXMLStop for what our reader does not take, with the
  // pieces before it in the tree, and of this one no more than a tag that is not complete.
  size_t read();
  static constexpr size_t none = SIZE_MAX;

  ReadTree& tree();
  // Leaves it to those who refer to it; there must be somebody.
  void letGoOfTree();
  // Whether the document element has been met.
  bool hasRoot() const;
  // Where the piece that was read last begins.
  const char* lastPiece() const;
  // Of the text in hand, what is before the next piece.
  std::string_view textBehind() const;
  // From the next piece on. Nothing can be read here any more.
  TextInput rest();

 private:
  class Reading;
  std::unique_ptr<Reading> _reading;
};

}  // namespace xquery
