// Measures markup before libxml2 works on it. libxml2 compares the attributes of a tag with each
// other, and the names of a list in a declaration too, so that what is sent to keep it busy must be
// refused while it arrives.
//
// Text is read in pieces, once, and no further than to tell where markup, literals, comments and
// the like begin and end; what is malformed may be measured wrongly, but libxml2 stops there.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace xquery {

class MarkupMeter {
 public:
  // Beyond is where nothing is measured, such as in a literal that ends nobody knows how.
  enum class Place : uint8_t { Content, Declaration, Comment, Instruction, Section, Beyond };

  // What comes next is text that begins in such a place.
  explicit MarkupMeter(Place place = Place::Content) { restart(place); }
  void restart(Place place);
  void read(std::string_view text);

  // Of the largest tag, or of what has come of it so far; "=" outside of literals.
  size_t mostAttributes() const { return _mostAttributes; }
  // The same without declarations of namespaces: those whose prefixes are looked up.
  size_t mostNamed() const { return _mostNamed; }
  // Of the largest list in parentheses; "|" and "," in it.
  size_t mostListed() const { return _mostListed; }

 private:
  enum class State : uint8_t {
    Content,
    Less,         // after "<"
    Exclamation,  // after "<!"
    Tag,
    Declaration,
    Literal,  // up to _ending, then back to _around
    Passed,   // up to _ending: a comment, an instruction, a section
    Beyond,
  };

  // Each reads from `at` and answers the place of the next byte to read.
  size_t readContent(std::string_view text, size_t at);
  size_t readOpening(std::string_view text, size_t at);
  size_t readTag(std::string_view text, size_t at);
  size_t readDeclaration(std::string_view text, size_t at);
  size_t readLiteral(std::string_view text, size_t at);
  size_t readPassed(std::string_view text, size_t at);
  size_t readBeyond(std::string_view text, size_t at);
  void openLiteral(std::string_view quote);
  void pass(std::string_view ending);

  State _state;
  State _around;
  std::string_view _ending;
  size_t _matched;  // of the ending
  size_t _depth;    // of parentheses
  size_t _attributes;
  size_t _named;
  size_t _listed;
  size_t _mostAttributes;
  size_t _mostNamed;
  size_t _mostListed;
};

}  // namespace xquery
