#include "Plan/Plan.h"

#include "Plan/JoinedPaths.h"
#include "Plan/Planning.h"
#include "Plan/Profile/XQueryProfiledProgram.h"

#include <algorithm>
#include <cstdlib>
#include <optional>
#include <string_view>
#include <unordered_set>
#include <vector>

namespace xquery {

bool XQueryPlanIsEnabled() {
  const char* value = std::getenv("XQUERY_PLAN");
  return !value || std::string_view(value) != "0";
}

namespace {

void applyRules(XQueryPlanning& planning, std::span<const XQueryRule> rules,
                std::vector<XQueryPlanNote>* notes) {
  for (const XQueryRule& rule : rules) {
    planning.beginRule(rule, notes);
    rule.apply(planning);
  }
}

// A program whose paths have been put together, and what is known of it.
class WholeProgram {
 public:
  // The projection is that of the program as it is written.
  WholeProgram(const XQueryProlog& prolog, Ref<XQueryExpr> body, XQueryProjectionPlan& projection) {
    read(prolog, std::move(body));
    projection = XQueryPlanProjection(*_program, _planning->facts);
    const bool isPossible = projection.isPossible();
    const XQueryExpr* refused = isPossible ? nullptr : (*_program)[projection.refusedAt].expr;
    // A path may go on from one that has been put together.
    constexpr int mostRounds = 8;
    for (int round = 0; round < mostRounds; ++round) {
      const auto joined = XQueryJoinPaths(*_program, _planning->facts);
      if (joined.empty()) break;
      _joined.insert(joined.begin(), joined.end());
      read(prolog, _program->install());
    }
    if (!_joined.empty() && !isPossible) projection.refusedAt = placeOf(refused);
  }

  XQueryProgram& program() { return *_program; }
  XQueryPlanning& planning() { return *_planning; }

  // Says where paths have been put together.
  void addNotes(std::vector<XQueryPlanNote>& notes) const {
    const auto rules = XQueryRules();
    const auto rule = std::find_if(rules.begin(), rules.end(), [](const XQueryRule& each) {
      return each.name == "moved paths";
    });
    for (XQueryPlaceID place = 0; place < _program->placeCount() && !_joined.empty(); ++place) {
      const XQueryExpr* expr = (*_program)[place].expr;
      if (!_joined.contains(expr)) continue;
      notes.push_back({place, &*rule, false, "it is put together from paths that were apart"});
    }
  }

 private:
  void read(const XQueryProlog& prolog, Ref<XQueryExpr> body) {
    _planning.reset();
    _program.emplace(prolog, std::move(body));
    _planning.emplace(*_program);
  }
  // The body of the query for what is not there any more.
  XQueryPlaceID placeOf(const XQueryExpr* expr) const {
    for (XQueryPlaceID place = 0; place < _program->placeCount(); ++place) {
      if ((*_program)[place].expr == expr) return place;
    }
    return _program->bodies().back().place;
  }

  std::optional<XQueryProgram> _program;
  std::optional<XQueryPlanning> _planning;
  std::unordered_set<const XQueryExpr*> _joined;
};

}  // namespace

Ref<XQueryExpr> XQueryPlanned(const XQueryProlog& prolog, const Ref<XQueryExpr>& body,
                              std::span<const XQueryRule> rules) {
  XQueryProgram program(prolog, body);
  // Most queries of a line or two hold nothing that any rule could change.
  if (program.placeCount() < 2) return body;
  XQueryPlanning planning(program);
  applyRules(planning, rules, nullptr);
  return program.install();
}

Ref<XQueryExpr> XQueryPlanned(const XQueryProlog& prolog, const Ref<XQueryExpr>& body,
                              XQueryProjectionPlan& projection) {
  WholeProgram whole(prolog, body, projection);
  if (whole.program().placeCount() < 2) return body;
  applyRules(whole.planning(), XQueryRules(), nullptr);
  return whole.program().install();
}

Ref<XQueryExpr> XQueryPlanned(const XQueryProlog& prolog, const Ref<XQueryExpr>& body,
                              XQueryProjectionPlan& projection, XQueryPlanReport& report) {
  WholeProgram whole(prolog, body, projection);
  std::vector<XQueryPlanNote> notes;
  whole.addNotes(notes);
  applyRules(whole.planning(), XQueryRules(), &notes);
  report = XQueryPlanReport(whole.planning(), prolog, std::move(notes));
  report.addInput(whole.planning(), prolog, projection);
  return whole.program().install();
}

namespace {

void profile(XQueryPlanning& planning, const XQueryProlog& prolog,
             std::vector<XQueryPlanNote> notes, XQueryProfiledProgram& profiled) {
  const XQueryPlanReport report(planning, prolog, std::move(notes));
  XQueryProfileProgram(planning, report, prolog, profiled);
}

}  // namespace

Ref<XQueryExpr> XQueryProfiled(const XQueryProlog& prolog, const Ref<XQueryExpr>& body,
                               std::optional<XQueryProjectionPlan>& projection,
                               XQueryProfiledProgram& profiled) {
  std::vector<XQueryPlanNote> notes;
  if (!XQueryPlanIsEnabled()) {
    XQueryProgram program(prolog, body);
    XQueryPlanning planning(program);
    profile(planning, prolog, std::move(notes), profiled);
    return program.install();
  }
  WholeProgram whole(prolog, body, projection.emplace());
  whole.addNotes(notes);
  applyRules(whole.planning(), XQueryRules(), &notes);
  profile(whole.planning(), prolog, std::move(notes), profiled);
  return whole.program().install();
}

}  // namespace xquery
