// What hosts are told whose values and nodes are refused, or are asked for as what they are not:
// the rows of the catalogue that no query raises.
#pragma once

#include "Types/XQueryErrors.h"

#include <string>
#include <string_view>

namespace xquery {

namespace XQueryErrors {

// --- making --------------------------------------------------------------------------------------

inline constexpr XQueryErrorText<> textNotUTF8{Values, 6, "the text is not well-formed UTF-8"};
inline constexpr XQueryErrorText<1> notACharacterOfXML{
    Values, 6, "the text holds the character U+%@, which XML does not have"};
inline constexpr XQueryErrorText<2> notOfTheForm{Values, 6, "\"%@\" is not of the form of %@"};
inline constexpr XQueryErrorText<2> outOfTheRange{Values, 6, "%@ is out of the range of %@"};
inline constexpr XQueryErrorText<3> fieldOutOfRange{Values, 6, "%@ %@ of %@ is out of range"};
inline constexpr XQueryErrorText<1> notADateType{Values, 6, "%@ is no type of dates and times"};
inline constexpr XQueryErrorText<1> notMadeFromText{Values, 6, "%@ is not made from a text alone"};

// --- building ------------------------------------------------------------------------------------

inline constexpr XQueryErrorText<> cdataEnds{Values, 0, "a CDATA section cannot contain ]]>"};
inline constexpr XQueryErrorText<> documentIsFrozen{Internal, 0, "the document is frozen"};
inline constexpr XQueryErrorText<> nodeHasParent{Internal, 0, "the node has a parent already"};
inline constexpr XQueryErrorText<> nodeCannotBeThere{Internal, 0, "the node cannot be there"};

// --- reading -------------------------------------------------------------------------------------

inline constexpr XQueryErrorText<1> notReadable{Loading, 0, "%@"};  // a document
inline constexpr XQueryErrorText<2> itemOfAnotherType{Types, 6, "the item is %@, not %@"};
inline constexpr XQueryErrorText<> noValue{Types, 6, "there is no value"};
inline constexpr XQueryErrorText<> emptySequence{
    Types, 6, "the sequence is empty, where one item is asked for"};
inline constexpr XQueryErrorText<1> severalItems{Types, 6, "the sequence has %@ items, not one"};

}  // namespace XQueryErrors

// A text as a message shows it: the beginning of a long one, and three points.
inline std::string XQueryShownText(std::string_view utf8) {
  constexpr size_t most = 80;
  if (utf8.size() <= most) return std::string(utf8);
  size_t end = most;
  while (end > 0 && (static_cast<unsigned char>(utf8[end]) & 0xC0) == 0x80) --end;
  return std::string(utf8.substr(0, end)) + "...";
}

}  // namespace xquery
