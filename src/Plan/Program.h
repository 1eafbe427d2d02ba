// A whole program as one list of places.
//
// A program is what a query evaluates: its body, and the functions and global variables of the main
// module and of all that it imports. Each expression stands at a place of it. Places are listed as
// they are read, every whole before its parts, so that the parts of a place are the stretch of the
// list behind it:
//
//   place   0        1         2        3         4        5
//   of      $a + f($b)   $a    f($b)    ($b)      $b       ...
//   end     5        2         5        5         5
//
// The same expression may stand at several places ("." is one object for all queries), so whatever
// is known of an expression is known of a place. No walk here recurses: a query may nest as deep as
// memory goes.
#pragma once

#include "Expr/XQueryExpr.h"
#include "Expr/XQueryParts.h"

#include <cstddef>
#include <cstdint>
#include <utility>
#include <vector>

namespace xquery {

class XQueryFunctionDecl;
class XQueryProlog;
class XQueryStep;
class XQueryVarDecl;

// What is noted of a program is many times as long as its text, so that it counts as memory of an
// evaluation that compiles one.
template <class T>
using XQueryPlanList = std::vector<T, ValueAllocator<T>>;

using XQueryPlaceID = uint32_t;
inline constexpr XQueryPlaceID XQueryNoPlace = UINT32_MAX;

struct XQueryPlace {
  XQueryExpr* expr;
  // Where the whole holds the expression and another one may be put; null for an own part.
  Ref<XQueryExpr>* slot;
  // The step of a path that it belongs to; null for what belongs to none.
  const XQueryStep* step;
  XQueryPlaceID parent;  // XQueryNoPlace for a body
  XQueryPlaceID end;     // behind its last part
  // The nearest place, from this one upwards, that has a focus of its own: what "." means here is
  // set there. XQueryNoPlace where it is the focus in which the body is evaluated.
  XQueryPlaceID focus;
  // Of a reference to a local variable the clause that sets it; XQueryNoPlace for a parameter.
  XQueryPlaceID binder;
  XQueryRole role;
  // Whether path results are sorted here.
  bool isOrdered;
};

struct XQueryProgramBody {
  Ref<XQueryExpr> expr;
  XQueryFunctionDecl* function = nullptr;  // whose body it is, or
  XQueryVarDecl* variable = nullptr;       // whose value; both null for the body of the query
  const XQueryProlog* prolog = nullptr;
  XQueryPlaceID place = XQueryNoPlace;
};

class XQueryProgram {
 public:
  // The program of a main module and what it imports; everything has been bound. `body` may be
  // null.
  XQueryProgram(const XQueryProlog& prolog, Ref<XQueryExpr> body);
  XQueryProgram(const XQueryProgram&) = delete;
  XQueryProgram& operator=(const XQueryProgram&) = delete;

  size_t placeCount() const { return _places.size(); }
  const XQueryPlace& operator[](XQueryPlaceID place) const { return _places[place]; }
  // Every place once, parts before their whole and, of the parts of a whole, in the order in which
  // they are bound: a clause before what its variable is used in.
  const XQueryPlanList<XQueryPlaceID>& partsFirst() const { return _partsFirst; }
  // The body of the query, if any, is the last.
  const XQueryPlanList<XQueryProgramBody>& bodies() const { return _bodies; }
  // The body that a place is in.
  const XQueryProgramBody& bodyOf(XQueryPlaceID place) const;

  // The body of a declared function; null for one that is not of the program, as external ones.
  const XQueryProgramBody* bodyOfFunction(const XQueryFunctionDecl* function) const;

  // The first part of a place, and the next part of the same whole; XQueryNoPlace for none.
  XQueryPlaceID firstPart(XQueryPlaceID place) const {
    return place + 1 < _places[place].end ? place + 1 : XQueryNoPlace;
  }
  XQueryPlaceID nextPart(XQueryPlaceID place) const;
  // The first part in that role.
  XQueryPlaceID part(XQueryPlaceID whole, XQueryRole role) const;

  // What stands there in parentheses, however many; the place itself for anything else.
  XQueryPlaceID withoutParentheses(XQueryPlaceID place) const;

  // Puts an expression in the place of another one. The list of places stays as it is: it tells of
  // the expressions as they were written, which live as long as it does.
  void replace(XQueryPlaceID place, Ref<XQueryExpr> expr) {
    _replaced.push_back(std::exchange(*_places[place].slot, std::move(expr)));
  }
  // Hands the bodies back to the declarations; the body of the query is the answer.
  Ref<XQueryExpr> install();

 private:
  void addBodiesOf(const XQueryProlog& prolog);
  void addModules(const XQueryProlog& main);
  friend class XQueryProgramReader;

  XQueryPlanList<Ref<XQueryExpr>> _replaced;
  XQueryPlanList<XQueryProgramBody> _bodies;
  XQueryPlanList<XQueryPlace> _places;
  XQueryPlanList<XQueryPlaceID> _partsFirst;
};

}  // namespace xquery
