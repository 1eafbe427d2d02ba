// Facts of function calls, from the registry's columns and the summaries of declared functions, and
// of constructors.
#include "Functions/XQueryFunctionCall.h"
#include "Plan/FactsAnalysis.h"

#include <array>
#include <utility>

namespace xquery {
namespace {

using Function = XQueryBuiltInFunction;

uint8_t counted(uint8_t number) {
  return std::min(number, XQueryFacts::many);
}

struct Arguments {
  size_t count = 0;
  XQueryFacts first = XQueryFacts::none();
  XQueryItemKinds kinds = XQueryItems::None;
};

Arguments argumentsOf(const XQueryFactsAt& at) {
  Arguments arguments;
  const XQueryPlaceID list = at.program.part(at.place, XQueryRole::Arguments);
  if (list == XQueryNoPlace) return arguments;
  for (XQueryPlaceID each = at.program.firstPart(list); each != XQueryNoPlace;
       each = at.program.nextPart(each)) {
    if (arguments.count++ == 0) arguments.first = at.table[each];
    arguments.kinds |= at.table[each].kinds;
  }
  return arguments;
}

uint16_t deedsOf(const Function::Registration& row, size_t argumentCount) {
  using namespace XQueryDeeds;
  constexpr std::array<std::pair<Function::Traits, uint16_t>, 8> deeds = {{
      {Function::LooksAround, ReadsOutside},
      {Function::ReadsPosition, ReadsPosition},
      {Function::ReadsSize, ReadsSize},
      {Function::ReadsStatic, ReadsStatic},
      {Function::LoadsDocuments, LoadsDocuments},
      {Function::MakesNodes, MakesNodes},
      {Function::Traces, Traces},
      {Function::Unrepeatable, IsUnrepeatable},
  }};
  uint16_t found = 0;
  for (const auto& [trait, deed] : deeds) {
    if (row.has(trait)) found |= deed;
  }
  if (row.readsContextItem(argumentCount)) found |= ReadsItem;
  if (!row.has(Function::NeverFails) || !row.takes(argumentCount)) found |= MayFail;
  return found;
}

XQueryFacts answerOf(const Function::Registration& row, const Arguments& arguments) {
  const XQueryFacts& first = arguments.first;
  XQueryItemKinds kinds = row.answer.kinds & XQueryItems::Any;
  if (row.answer.kinds & Function::OfFirst) kinds |= first.kinds;
  if (row.answer.kinds & Function::OfAll) kinds |= arguments.kinds;
  if (row.answer.kinds & Function::AtomizedFirst) kinds |= XQueryAtomizedKinds(first.kinds);
  XQueryFacts answer =
      XQueryFacts::items(kinds, counted(row.answer.least), counted(row.answer.most));
  // An array of a host among the items makes their number a matter of opinion.
  if (first.mayBe(XQueryItems::Other)) return answer;
  const bool keepsCount = row.has(Function::KeepsCount);
  if (keepsCount || row.has(Function::KeepsOrder)) answer.most = std::min(answer.most, first.most);
  if (keepsCount) answer.least = std::min(answer.most, std::max(answer.least, first.least));
  if (row.answer.kinds == Function::OfFirst) answer.tree = first.tree;
  if (row.has(Function::KeepsOrder)) answer.inOrder = first.inOrder;
  answer.settle();
  return answer;
}

}  // namespace

void XQueryFactsOfCall(const XQueryFactsAt& at, XQueryFacts& facts) {
  const auto& call = at.expr<XQueryFunctionCall>();
  const Arguments arguments = argumentsOf(at);
  if (const Function* builtIn = call.builtIn()) {
    facts.deeds |= deedsOf(builtIn->row(), arguments.count);
    if (arguments.kinds & XQueryItems::Other) facts.deeds |= XQueryDeeds::MayFail;
    facts.setItems(answerOf(builtIn->row(), arguments));
    return;
  }
  facts.deeds |= XQueryDeeds::MayFail;
  if (!call.functionDecl()) return;
  const XQueryFacts& summary = at.table.ofFunction(call.functionDecl());
  facts.addDeeds(summary);
  facts.findsRoot = facts.findsRoot || summary.findsRoot;
  facts.setItems(summary);
}

// Where nodes are made, and of which kind.
void XQueryFactsOfConstructor(const XQueryFactsAt& at, XQueryFacts& facts) {
  using namespace XQueryItems;
  constexpr std::array<std::pair<Kind, XQueryItemKinds>, 8> kinds = {{
      {Kind::ElementExpr, Element},
      {Kind::AttributeExpr, Attribute},
      {Kind::ComputedAttributeExpr, Attribute},
      {Kind::TextExpr, Text},
      {Kind::CommentExpr, Comment},
      {Kind::ProcessingInstructionExpr, Instruction},
      {Kind::DocumentExpr, Document},
      {Kind::NamespaceExpr, Namespace},
  }};
  facts.deeds |= XQueryDeeds::MakesNodes | XQueryDeeds::ReadsStatic;
  const Kind made = at.here().expr->kind();
  for (const auto& [kind, node] : kinds) {
    if (kind == made) facts.setItems(node, made == Kind::TextExpr ? 0 : 1, 1);
  }
}

}  // namespace xquery
