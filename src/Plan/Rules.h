// The rules of the planner, in the order in which they run.
//
// A rule is one file of Rules/: the pattern, what must hold of the facts, the operator that takes
// over, and why nobody can tell. To add one: write the file, declare its function below, give it a
// row in the table of Rules.cpp, and add an example to docs/plan.md.
#pragma once

#include <span>
#include <string_view>

namespace xquery {

class XQueryPlanning;

struct XQueryRule {
  std::string_view name;
  // What it is about, in a line.
  std::string_view summary;
  // Goes over the program once.
  void (*apply)(XQueryPlanning& planning);
};

std::span<const XQueryRule> XQueryRules();

void XQueryWalkPaths(XQueryPlanning& planning);
void XQueryKeepTrails(XQueryPlanning& planning);
void XQueryFoldConstants(XQueryPlanning& planning);
void XQueryTakeNames(XQueryPlanning& planning);
void XQueryMovePaths(XQueryPlanning& planning);
void XQuerySplicePaths(XQueryPlanning& planning);
void XQueryTakePositions(XQueryPlanning& planning);
void XQueryTakePositionRanges(XQueryPlanning& planning);
void XQueryEndWithPositions(XQueryPlanning& planning);
void XQueryCompareNames(XQueryPlanning& planning);
void XQueryKeepInvariants(XQueryPlanning& planning);
void XQueryCompareEarlierItems(XQueryPlanning& planning);
void XQueryCompareWithSets(XQueryPlanning& planning);
void XQueryJoinForClauses(XQueryPlanning& planning);
void XQueryJoinQuantifiers(XQueryPlanning& planning);
void XQueryJoinSteps(XQueryPlanning& planning);
void XQueryCountLists(XQueryPlanning& planning);
void XQueryCountSets(XQueryPlanning& planning);
void XQueryCountLoops(XQueryPlanning& planning);
void XQueryCountByWays(XQueryPlanning& planning);
void XQueryCountPaths(XQueryPlanning& planning);
void XQueryTakeFirst(XQueryPlanning& planning);
void XQueryTakeOneByOne(XQueryPlanning& planning);
void XQueryFindPositions(XQueryPlanning& planning);
void XQueryAskMembers(XQueryPlanning& planning);
void XQueryFilterByPaths(XQueryPlanning& planning);
void XQueryFindNearbyNodes(XQueryPlanning& planning);
void XQueryTakeStretches(XQueryPlanning& planning);
void XQueryCompareConstants(XQueryPlanning& planning);
void XQueryShortenPaths(XQueryPlanning& planning);
void XQueryAnswerQuickly(XQueryPlanning& planning);
void XQueryBuildInPlace(XQueryPlanning& planning);
void XQueryJoinConditions(XQueryPlanning& planning);
void XQueryLookUpValues(XQueryPlanning& planning);
void XQueryAskEarly(XQueryPlanning& planning);
void XQueryComputeScalars(XQueryPlanning& planning);
void XQueryFoldNumbers(XQueryPlanning& planning);
void XQueryComputeFunctions(XQueryPlanning& planning);
void XQueryTakeLastUses(XQueryPlanning& planning);

}  // namespace xquery
