// Generated programs: no value contradicts a fact, and the plan changes nothing that can be told.
//
// The environment variable XQUERY_PLAN_PROGRAMS says how many programs there are for each test, or
// XQUERY_PLAN_SECONDS for how long there are more; XQUERY_PLAN_SEED with which one to begin.
#include "Expr/Paths/NodeOrder.h"
#include "Expr/XQuerySequence.h"
#include "Plan/Plan.h"
#include "Plan/Planning.h"
#include "Plan/PlanTesting.h"
#include "Plan/ProgramGenerator.h"

#include <algorithm>
#include <chrono>
#include <functional>

namespace xquery {
namespace {

using namespace plantest;

unsigned programCount() {
  return numberFrom("XQUERY_PLAN_PROGRAMS", 200);
}

// Programs of which fewer come to a value, or are planned, show nothing.
constexpr unsigned fewestPart = 5;

constexpr std::chrono::seconds plainDuration(1);
constexpr std::chrono::seconds plannedDuration(60);

// How many programs there were.
unsigned forEachProgram(const std::function<void(const std::string&, const Value&)>& visit) {
  using Clock = std::chrono::steady_clock;
  const unsigned first = numberFrom("XQUERY_PLAN_SEED", 1);
  const std::chrono::seconds time(numberFrom("XQUERY_PLAN_SECONDS", 0));
  const auto end = Clock::now() + time;
  unsigned seed = first;
  for (; time.count() ? Clock::now() < end : seed < first + programCount(); ++seed) {
    ProgramGenerator generator(seed);
    const std::string xml = generator.document();
    const std::string program = generator.program();
    SCOPED_TRACE("XQUERY_PLAN_SEED=" + std::to_string(seed) + "\n" + xml + "\n" + program);
    visit(program, document(xml));
    if (testing::Test::HasFailure()) break;
  }
  testing::Test::RecordProperty("programs", static_cast<int>(seed - first));
  return seed - first;
}

// --- facts ---------------------------------------------------------------------------------------

bool isInTree(const NSObject& item, const Value& contextItem) {
  const auto* node = dyn_cast<NSXMLNode>(&item);
  const auto* context = dyn_cast<NSXMLNode>(contextItem.get());
  return node && context && node->rootNode() == context->rootNode();
}

// What the value shows to be wrong in the facts; empty for nothing.
std::string contradiction(const XQueryFacts& facts, const Value& value, const Value& contextItem) {
  std::vector<NSObject*> items;
  if (const auto* array = dyn_cast<NSArray>(value)) {
    for (const Value& each : array->objects()) items.push_back(each.get());
  } else if (!isNull(value)) {
    items.push_back(value.get());
  }
  if (items.size() < facts.least) return "too few items";
  if (facts.most < XQueryFacts::many && items.size() > facts.most) return "too many items";
  const NSXMLNode* previous = nullptr;
  for (const NSObject* item : items) {
    if (!facts.mayBe(XQueryKindsOfItem(*item))) return "an item of kind " + shownItem(*item);
    if (facts.tree == XQueryTreeFact::NoNodes && item->isNode()) return "a node";
    if (facts.tree == XQueryTreeFact::OfContext && item->isNode() &&
        !isInTree(*item, contextItem)) {
      return "a node of another tree";
    }
    if (facts.inOrder) {
      if (!item->isNode()) return "no node in an order";
      const auto* node = cast<NSXMLNode>(item);
      if (previous && !XQueryNodeBefore(previous, node)) return "nodes out of order";
      previous = node;
    }
  }
  return "";
}

// Evaluates what it stands for and compares with the facts.
class CheckedExpr : public XQueryPlannedExpr {
 public:
  CheckedExpr(Ref<XQueryExpr> plain, const XQueryFacts& facts)
      : XQueryPlannedExpr(std::move(plain)), _facts(facts) {}

  Value computeValue(XQueryContext& context) const override {
    auto& dynamic = _internal(context);
    const Value contextItem = dynamic.contextItem();
    const int64_t position = dynamic.position();
    std::vector<Value> variables;
    for (int64_t id = 1; id < XQueryVariableSet::most; ++id) {
      variables.push_back(dynamic.variableForID(id));
    }
    Value value = plain().evaluateWithContext(context);
    if (XQueryHasFailed(value, context)) {
      if (!dynamic.isFailingForGood() && !_facts.does(XQueryDeeds::MayFail)) report("a failure");
      return value;
    }
    if (value) {
      const std::string wrong = contradiction(_facts, value, contextItem);
      if (!wrong.empty()) report(wrong);
    }
    for (int64_t id = 1; id < XQueryVariableSet::most; ++id) {
      XQueryVariableSet changed;
      changed.add(id);
      const NSObject* before = variables[static_cast<size_t>(id) - 1].get();
      const NSObject* after = dynamic.variableForID(id);
      const bool isNew = before != after && !(!before && after && after->kind() == Kind::Null);
      if (isNew && !_facts.assigns.meets(changed)) report("a variable set");
    }
    if (dynamic.contextItem() != contextItem || dynamic.position() != position) {
      report("another focus");
    }
    return value;
  }

 private:
  void report(const std::string& wrong) const {
    ADD_FAILURE() << wrong << " where the facts are " << shownItems(_facts) << " "
                  << shownDeeds(_facts) << ", line " << exprLine() << " kind "
                  << static_cast<int>(plain().kind());
  }

  const XQueryFacts _facts;
};

bool isChecked(const XQueryPlanning& planning, XQueryPlaceID place) {
  const XQueryPlace& here = planning.program[place];
  return planning.isOpen(place) && !XQueryTraitsOf(here.role).isNoValue;
}

void checkEverything(XQueryPlanning& planning) {
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    if (!isChecked(planning, place)) continue;
    planning.wrap(place, make<CheckedExpr>(*planning.program[place].slot, planning.facts[place]));
  }
}

TEST(GeneratedPrograms, ContradictNoFact) {
  const XQueryRule rule = {"check", "", checkEverything};
  size_t values = 0;
  const unsigned programs = forEachProgram([&](const std::string& text, const Value& contextItem) {
    const auto query = compiled(text);
    auto& internal = _internal(*query);
    const auto body =
        XQueryPlanned(*internal.prolog(), Ref<XQueryExpr>(internal.body()), std::span(&rule, 1));
    const auto checked =
        make<XQuery>(std::make_unique<XQueryInternal>(Ref<XQueryProlog>(internal.prolog()), body));
    const auto context = XQueryContext::xqueryContext();
    context->contextSetLimits(boundedBy(plainDuration));
    Ref<XQueryError> error;
    const auto items = context->evaluateXQuery(*checked, {}, contextItem, &error);
    values += items ? 1 : 0;
  });
  EXPECT_GT(values, programs / fewestPart);
}

// --- both ways -----------------------------------------------------------------------------------

TEST(GeneratedPrograms, AnswerTheSamePlannedAndPlain) {
  size_t operators = 0;
  size_t values = 0;
  const unsigned programs = forEachProgram([&](const std::string& text, const Value& contextItem) {
    const auto planned = compiled(text, XQueryWay::Planned);
    operators += OperatorList(*_internal(*planned).body()).operators.size();
    const Outcome plain = outcomeOf(*compiled(text), contextItem, {}, boundedBy(plainDuration));
    if (endedAtLimit(plain)) return;
    EXPECT_EQ(plain.lines, outcomeOf(*planned, contextItem, {}, boundedBy(plannedDuration)).lines);
    const auto profiled = compiled(text, XQueryWay::Profiled);
    EXPECT_EQ(plain.lines, outcomeOf(*profiled, contextItem, {}, boundedBy(plannedDuration)).lines);
    values += plain.lines.empty() || plain.lines.front().starts_with("error") ? 0 : 1;
  });
  EXPECT_GT(operators, programs / fewestPart);
  EXPECT_GT(values, programs / fewestPart);
}

}  // namespace
}  // namespace xquery
