// Names and the runs of words that are one token.
//
// Many tokens are several words with white space and comments between them: "declare variable $",
// "element" QName "{", ") as". Comments nest, so no regular pattern describes such a run; the
// generated scanner finds the first character of a name and leaves the rest to this table.
//
// A row holds in one state, so a token whose next state depends on where it stands has several
// rows. The longest row that matches wins; between rows of equal length there is no doubt, because
// their words differ.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace xquery {

struct XQueryPhrase {
  int state;          // where the row holds
  const char* words;  // separated by blanks; QNAME, NCNAME and QUOTE stand for what they say
  int token;
  int push;  // the state to return to, or -1 for none
  int next;  // the next state
};

struct XQueryPhraseMatch {
  const XQueryPhrase* phrase = nullptr;  // null when no row matches
  size_t length = 0;                     // bytes of the whole run
  std::string_view name;                 // what QNAME or NCNAME matched
  char quote = '\0';                     // the delimiter that QUOTE matched
};

// The longest row of `state` at the start of `text`.
XQueryPhraseMatch XQueryMatchPhrase(int state, std::string_view text);

// Length of the name at the start of `text`, 0 when there is none. Names are those of the XML names
// recommendation: letters, digits and combining characters of the BMP.
size_t XQueryNCNameLength(std::string_view text);
// With a prefix when there is one.
size_t XQueryQNameLength(std::string_view text);
// With any number of colons inside.
size_t XQueryNameLength(std::string_view text);
// Length of the white space and comments at the start of `text`.
size_t XQuerySkipLength(std::string_view text);

}  // namespace xquery
