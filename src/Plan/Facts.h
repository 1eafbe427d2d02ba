// What is known of the value of an expression before it is evaluated.
//
// Facts hold for every evaluation that answers a value; what fails, and what ends at a limit, has
// none. They err on one side only: what is not known is "any number of items of any kind", and that
// an expression reads or does something means no more than that it may.
#pragma once

#include "Types/XQueryItemKinds.h"

#include <algorithm>
#include <cstdint>

namespace xquery {

class XQueryExpr;

// What evaluating an expression may look at, and what it may do, as bits.
namespace XQueryDeeds {
enum : uint16_t {
  // The focus in which the expression itself stands: the context item, only the document above it,
  // the position, the size.
  ReadsItem = 1 << 0,
  ReadsRoot = 1 << 1,
  ReadsPosition = 1 << 2,
  ReadsSize = 1 << 3,
  ReadsGlobals = 1 << 4,
  // The static context, the zone, the clock: they stay what they are throughout an evaluation.
  ReadsStatic = 1 << 5,
  // A document may be fetched, once for all of an evaluation.
  LoadsDocuments = 1 << 6,
  // What lies outside the subtrees of the nodes that it starts from. This may change while a query
  // is evaluated: a constructor may take a node in. What is inside a node does not.
  ReadsOutside = 1 << 7,

  MakesNodes = 1 << 8,
  Traces = 1 << 9,
  // Evaluated again over the same it may answer something else, or do more, apart from the above.
  IsUnrepeatable = 1 << 10,
  MayFail = 1 << 11,

  ReadsFocus = ReadsItem | ReadsRoot | ReadsPosition | ReadsSize,
  // Of all that may be evaluated any number of times over the same, nothing.
  Once = MakesNodes | Traces | IsUnrepeatable,
};
}  // namespace XQueryDeeds

// In which tree all the nodes of a value lie.
enum class XQueryTreeFact : uint8_t {
  NoNodes,
  OfContext,  // that of the context item in the expression's own focus
  Any,        // in one or several that are not known
};

// Local variables by their IDs; those from `most` on are one and the same.
class XQueryVariableSet {
 public:
  static constexpr int64_t most = 63;

  void add(int64_t varID) {
    if (varID > 0) _bits |= bitOf(varID);
  }
  // Forgets one that is known by its own; false for those that are not.
  void remove(int64_t varID) {
    if (varID > 0 && varID < most) _bits &= ~bitOf(varID);
  }
  void add(const XQueryVariableSet& others) { _bits |= others._bits; }
  bool isEmpty() const { return _bits == 0; }
  bool meets(const XQueryVariableSet& others) const { return (_bits & others._bits) != 0; }
  // Whether all of them are known by their own.
  bool isExact() const { return (_bits & bitOf(most)) == 0; }
  // Whether all of the others, known by their own, are among them.
  bool holds(const XQueryVariableSet& others) const {
    return others.isExact() && (others._bits & ~_bits) == 0;
  }
  int count() const { return __builtin_popcountll(_bits); }
  template <class Visit>
  void forEach(Visit visit) const {
    for (uint64_t left = _bits; left != 0; left &= left - 1) visit(__builtin_ctzll(left));
  }
  bool operator==(const XQueryVariableSet&) const = default;

 private:
  static uint64_t bitOf(int64_t varID) { return uint64_t{1} << std::min(varID, most); }
  uint64_t _bits = 0;
};

struct XQueryFacts {
  static constexpr uint8_t many = 2;  // or more

  // How many items there are, at least and at most.
  uint8_t least = 0;
  uint8_t most = many;
  // They are nodes in document order, none of them twice, and of one tree.
  bool inOrder = false;
  // There is a document above the context item of the focus in which the expression itself stands:
  // it has looked for one there, and fails where there is none.
  bool findsRoot = false;
  XQueryTreeFact tree = XQueryTreeFact::Any;
  XQueryItemKinds kinds = XQueryItems::Any;
  uint16_t deeds = 0;
  XQueryVariableSet reads;    // local variables that were set outside
  XQueryVariableSet assigns;  // local variables that it leaves set

  static XQueryFacts items(XQueryItemKinds kinds, uint8_t least, uint8_t most);
  static XQueryFacts one(XQueryItemKinds kinds) { return items(kinds, 1, 1); }
  static XQueryFacts none() { return items(XQueryItems::None, 0, 0); }
  // Of what never answers: the facts that every value keeps, since there is none.
  static XQueryFacts nothingYet();

  bool are(XQueryItemKinds set) const { return (kinds & ~set) == 0; }
  bool mayBe(XQueryItemKinds set) const { return (kinds & set) != 0; }
  bool does(unsigned deed) const { return (deeds & deed) != 0; }
  bool isRepeatable() const { return !does(XQueryDeeds::Once); }

  // Takes over how many items of which kinds there are and where, leaving what is read and done.
  void setItems(const XQueryFacts& from);
  void setItems(XQueryItemKinds ofKinds, uint8_t atLeast, uint8_t atMost);
  // The other part is evaluated as well.
  void addDeeds(const XQueryFacts& part);
  // The same for a part with a focus of its own.
  void addDeedsWithin(const XQueryFacts& part);
  // The value is that of the other expression or the present one.
  void orItems(const XQueryFacts& other);
  // The items of the other one stand behind.
  void appendItems(const XQueryFacts& other);
  // Only some of the items are left, in their order.
  void filter() { least = 0; }
  // Draws the simplest conclusions.
  void settle();

  bool operator==(const XQueryFacts&) const = default;
};

}  // namespace xquery
