// Where values go: who takes the value of a place, through variables, parameters, functions and all
// that hands on what it gets.
#pragma once

#include "Plan/Program.h"

#include <string_view>
#include <unordered_map>
#include <vector>

namespace xquery {

class XQueryChecking;
class XQueryFunctionDecl;
class XQueryVarDecl;

class XQueryUses {
 public:
  explicit XQueryUses(const XQueryChecking& checking);

  // Whether all that is asked of the value is whether it is true, as far as that can be told; also
  // of a value that nobody takes, and where that is too far to tell.
  bool isAskedForTruthOnly(XQueryPlaceID place) const;
  // Whether it can be told in which order the items of the value come; not where that is too far to
  // tell.
  bool showsOrder(XQueryPlaceID place) const;

  // Where a function is called, and where a global variable is read.
  const std::vector<XQueryPlaceID>& callsOf(const XQueryFunctionDecl* function) const;
  const std::vector<XQueryPlaceID>& readsOf(const XQueryVarDecl* variable) const;
  // Where the variable is read that a clause sets: by the clause and the ID of the variable.
  const std::vector<XQueryPlaceID>& readsOf(XQueryPlaceID binder, int64_t varID) const;
  // The global variable that is read in a place; null for a local or an unknown one.
  const XQueryVarDecl* globalReadIn(XQueryPlaceID place) const;

 private:
  enum class Question { Truth, Order };
  enum class Taken { Hidden, Shown, HandedOn };

  bool isHidden(XQueryPlaceID place, Question question) const;
  // Where it is handed on, the places are added that hold the value then.
  Taken takerOf(XQueryPlaceID place, Question question, std::vector<XQueryPlaceID>& next) const;
  Taken takenByCall(XQueryPlaceID place, Question question, std::vector<XQueryPlaceID>& next) const;
  Taken takenByBody(XQueryPlaceID place, std::vector<XQueryPlaceID>& next) const;
  Taken takenByClause(XQueryPlaceID place, Question question,
                      std::vector<XQueryPlaceID>& next) const;
  Taken takenByPath(XQueryPlaceID place, std::vector<XQueryPlaceID>& next) const;

  using Places = std::vector<XQueryPlaceID>;
  const XQueryChecking& _checking;
  const XQueryProgram& _program;
  std::unordered_map<const XQueryFunctionDecl*, Places> _calls;
  std::unordered_map<const XQueryVarDecl*, Places> _globals;
  std::unordered_map<uint64_t, Places> _locals;  // by binder and ID; of parameters by body
};

}  // namespace xquery
