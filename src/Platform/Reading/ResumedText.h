// The text that libxml2 is given where our reader stops in the middle of a document: what stands
// before the document element as it was, the tags of the elements that are open, and what our
// reader has not taken. Line feeds and blanks between them put every tag on its line, and the rest
// into its place, so that errors are those of the whole text.
#pragma once

#include "Platform/Reading/TextLines.h"
#include "Platform/Reading/TextSource.h"
#include "xquery/XMLNode.h"

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

class ResumedText {
 public:
  // The text before the document element.
  explicit ResumedText(std::string_view prolog) { add(prolog); }
  // An element that is open, with the line on which it began.
  void addTag(const NSXMLElement& element, int64_t line);
  // An element instead of the document element, which has been closed.
  void addRoot() { add("<a/>"); }
  // Up to where the rest begins. Answers how many bytes that takes.
  uint64_t moveTo(const TextPlace& place);
  // All of it and then the rest. To be used while this object lives.
  TextInput followedBy(TextInput rest);

 private:
  // A text, or so many times a character.
  struct Part {
    std::string text;
    char filler = 0;
    uint64_t count = 0;
  };

  void add(std::string_view text);
  uint64_t fill(char filler, int64_t count);
  size_t read(char* buffer, size_t size);

  std::vector<Part> _parts;
  TextPlace _place;
  size_t _part = 0;  // that is read
  uint64_t _at = 0;
};

}  // namespace xquery
