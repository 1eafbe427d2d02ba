// What a rule is given: the program, what is known of it, and the means to change it.
#pragma once

#include "Plan/FactsAnalysis.h"
#include "Plan/Program.h"

#include <string_view>
#include <vector>

namespace xquery {

class XQueryPlannedExpr;
struct XQueryRule;

// What a rule did in a place, or why it did nothing there.
struct XQueryPlanNote {
  XQueryPlaceID place;
  const XQueryRule* rule;
  bool isRefusal;
  std::string_view text;  // a literal
};

class XQueryPlanning {
 public:
  // How far rules look up from a place for what is around it. Planning stays in proportion to the
  // length of a query, however deep that nests.
  static constexpr int mostLevels = 256;

  explicit XQueryPlanning(XQueryProgram& ofProgram);

  // Whether another expression may be put in this place. Not where one of an earlier rule stands,
  // nor inside of what an earlier rule has taken out of the program.
  bool isOpen(XQueryPlaceID place) const {
    return program[place].slot && _states[place] == State::AsWritten;
  }
  // What is evaluated in the place.
  Ref<XQueryExpr> exprAt(XQueryPlaceID place) const {
    const XQueryPlace& at = program[place];
    return at.slot ? *at.slot : Ref<XQueryExpr>(at.expr);
  }
  // Whether an operator stands there that evaluates what was written.
  bool isWrapped(XQueryPlaceID place) const { return _states[place] == State::Wrapped; }
  // Whether it can be told which objects the items of the value are. Objects that are equal and not
  // the same are two items of a path's results, and two items of a host.
  bool showsIdentity(XQueryPlaceID place) const;

  // Whether one of these variables may be read in the same frame where nothing has set it, so that
  // what was left in it can be told.
  bool showsLeftovers(const XQueryVariableSet& variables, XQueryPlaceID place) const;

  // Puts an operator in the place, which evaluates what was written there or parts of it.
  void wrap(XQueryPlaceID place, Ref<XQueryExpr> by, std::string_view reason = {});
  // Puts an expression in the place; what was written there is evaluated no more.
  void replace(XQueryPlaceID place, Ref<XQueryExpr> by, std::string_view reason = {});
  // Notes, for those who ask to see the plan, that the rule saw its pattern in the place and left
  // it as it was, and which fact was missing. Texts are literals.
  void refuse(XQueryPlaceID place, std::string_view missing) { note(place, true, missing); }
  // Notes something done in the place that puts no operator there. Without a text, as for the
  // reasons above, it is the summary of the rule.
  void choose(XQueryPlaceID place, std::string_view reason = {}) { note(place, false, reason); }

  // The rule that is applied next; whose notes are kept where `notes` is not null.
  void beginRule(const XQueryRule& rule, std::vector<XQueryPlanNote>* notes) {
    _rule = &rule;
    _notes = notes;
  }

  // What is written in the place is evaluated no more: what is around it does its work.
  void leaveOut(XQueryPlaceID place);

  XQueryProgram& program;
  const XQueryFactTable facts;

 private:
  enum class State : uint8_t { AsWritten, Wrapped, Gone };

  void shareFrame();

  void note(XQueryPlaceID place, bool isRefusal, std::string_view text);

  std::vector<State> _states;
  std::vector<XQueryVariableSet> _unset;  // for each body, those that may be read unset
  const XQueryRule* _rule = nullptr;
  std::vector<XQueryPlanNote>* _notes = nullptr;
};

}  // namespace xquery
