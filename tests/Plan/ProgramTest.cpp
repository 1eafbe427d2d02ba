// Every class of expressions names its parts.
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Plan/Plan.h"
#include "Plan/PlanTesting.h"
#include "Platform/Base/WorkMeter.h"

#include <map>
#include <set>

namespace xquery {
namespace {

using namespace plantest;

constexpr auto kindNames = std::to_array<std::pair<Kind, const char*>>({
    {Kind::ExprList, "list"},
    {Kind::Args, "args"},
    {Kind::Literal, "literal"},
    {Kind::Variable, "variable"},
    {Kind::ContextItemExpr, "item"},
    {Kind::QNameReference, "name"},
    {Kind::PathExpr, "path"},
    {Kind::RootStepExpr, "root"},
    {Kind::NameTest, "nametest"},
    {Kind::WildCardNameTest, "wildcard"},
    {Kind::OperatorExpr, "operator"},
    {Kind::TypeDeclaration, "type"},
    {Kind::ForExpr, "for"},
    {Kind::ElementExpr, "element"},
    {Kind::AttributeExpr, "attribute"},
    {Kind::NamespaceExpr, "namespace"},
    {Kind::FunctionCall, "call"},
    {Kind::ConditionalExpr, "if"},
    {Kind::FLWORExpr, "flwor"},
    {Kind::LetExpr, "let"},
    {Kind::OrderSpec, "orderspec"},
    {Kind::OrderExpr, "ordering"},
    {Kind::QuantifiedExpr, "quantified"},
    {Kind::QuantifiedItem, "in"},
    {Kind::TypeswitchExpr, "typeswitch"},
    {Kind::CaseClause, "case"},
    {Kind::InstanceOfExpr, "instance"},
    {Kind::TreatExpr, "treat"},
    {Kind::CastExpr, "cast"},
    {Kind::CastableExpr, "castable"},
    {Kind::ComputedAttributeExpr, "computedattribute"},
    {Kind::TextExpr, "text"},
    {Kind::CommentExpr, "comment"},
    {Kind::ProcessingInstructionExpr, "instruction"},
    {Kind::DocumentExpr, "document"},
});

constexpr std::array roleNames = {"Body",     "Element",   "Operand", "LaterOperand", "Arguments",
                                  "Argument", "Test",      "Branch",  "Clause",       "Bound",
                                  "Where",    "OrderKey",  "Return",  "Satisfies",    "Switched",
                                  "Case",     "FirstStep", "Step",    "Predicate",    "NodeTest",
                                  "Type",     "Name",      "Content"};

std::string nameOf(Kind kind) {
  for (const auto& [each, name] : kindNames) {
    if (each == kind) return name;
  }
  return std::to_string(static_cast<int>(kind));
}

// "whole(Role part(...) Role part)".
std::string shape(const XQueryProgram& program, XQueryPlaceID place) {
  std::vector<std::string> parts;
  for (auto part = program.firstPart(place); part != XQueryNoPlace; part = program.nextPart(part)) {
    parts.push_back(std::string(roleNames[static_cast<size_t>(program[part].role)]) + " " +
                    shape(program, part));
  }
  const std::string name = nameOf(program[place].expr->kind());
  return parts.empty() ? name : name + "(" + joined(parts, ", ") + ")";
}

// Of the only expression of a body, which is a list.
std::string shapeOfBody(const XQueryProgram& program, const XQueryProgramBody& body) {
  return shape(program, program.firstPart(body.place));
}

struct Shape {
  const char* query;
  const char* shape;
};

constexpr auto shapes = std::to_array<Shape>({
    {"(1, $x)", "list(Element literal, Element variable)"},
    {"1 + .", "operator(Operand literal, Operand item)"},
    {"-1", "operator(Operand literal)"},
    {"1 or 2", "operator(Operand literal, LaterOperand literal)"},
    {"f(1, 2)", "call(Arguments args(Argument literal, Argument literal))"},
    {"if (1) then 2 else 3", "if(Test list(Element literal), Branch literal, Branch literal)"},
    {"for $a at $p in 1, $b as item() in 2 let $c := 3 where 4 order by 5, 6 return 7",
     "flwor(Clause for(Bound literal), Clause for(Type type, Bound literal), Clause let(Bound "
     "literal), Where literal, Clause orderspec(OrderKey literal), Clause orderspec(OrderKey "
     "literal), Return literal)"},
    {"some $a in 1, $b in 2 satisfies 3",
     "quantified(Clause in(Bound literal), Clause in(Bound literal), Satisfies literal)"},
    {"typeswitch (1) case $a as xs:integer return 2 default return 3",
     "typeswitch(Switched list(Element literal), Clause case(Type type, Case literal), Clause "
     "case(Case literal))"},
    {"1 instance of item()", "instance(Type type, Operand literal)"},
    {"1 treat as item()", "treat(Type type, Element literal)"},
    {"1 cast as xs:string", "cast(Type type, Operand literal)"},
    {"1 castable as xs:string", "castable(Type type, Operand literal)"},
    {"ordered {1}", "ordering(Element list(Element literal))"},
    {"/a/@*[1][b]",
     "path(FirstStep root, NodeTest nametest, NodeTest wildcard, Predicate list(Element literal), "
     "Predicate list(Element path(NodeTest nametest)))"},
    {"(1)[2]/a/element(b)/(3)",
     "path(FirstStep list(Element literal), Predicate list(Element literal), NodeTest nametest, "
     "NodeTest type(NodeTest nametest), Step list(Element literal))"},
    {"element {1} {2}", "element(Name list(Element literal), Content list(Element literal))"},
    {"attribute {1} {2}",
     "computedattribute(Name list(Element literal), Content list(Element literal))"},
    {"processing-instruction {1} {2}",
     "instruction(Name list(Element literal), Content list(Element literal))"},
    {"text {1}", "text(Content list(Element literal))"},
    {"comment {1}", "comment(Content list(Element literal))"},
    {"document {1}", "document(Content list(Element literal))"},
    {"<a xmlns:p='u' b='{1}'>{2}</a>",
     "element(Name name, Content namespace(Content literal), Content attribute(Name name, Content "
     "list(Element literal)), Content list(Element literal))"},
});

TEST(Parts, AreNamedByEveryClass) {
  for (const Shape& each : shapes) {
    const auto query = compiled(each.query);
    const XQueryProgram program = programOf(*query);
    EXPECT_EQ(shapeOfBody(program, program.bodies().back()), each.shape) << each.query;
  }
}

// A kind between the first and the last that no shape shows is one that was forgotten there.
TEST(Parts, OfNoClassAreLeftOut) {
  std::set<std::string> shown;
  for (const Shape& each : shapes) {
    const auto query = compiled(each.query);
    const XQueryProgram program = programOf(*query);
    for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
      shown.insert(nameOf(program[place].expr->kind()));
    }
  }
  std::set<std::string> all;
  for (int kind = static_cast<int>(Kind::ExprFirst); kind < static_cast<int>(Kind::PlannedExpr);
       ++kind) {
    // A parameter is part of no expression.
    if (static_cast<Kind>(kind) != Kind::Param) all.insert(nameOf(static_cast<Kind>(kind)));
  }
  EXPECT_EQ(shown, all);
}

TEST(Program, HoldsTheBodiesOfFunctionsAndGlobals) {
  const auto query =
      compiled("declare variable $g := 1; declare function local:f($p) { $p + 2 }; local:f($g)");
  const XQueryProgram program = programOf(*query);
  ASSERT_EQ(program.bodies().size(), 3U);
  EXPECT_TRUE(program.bodies()[0].variable);
  EXPECT_TRUE(program.bodies()[1].function);
  EXPECT_EQ(shape(program, program.bodies()[0].place), "literal");
  EXPECT_EQ(shapeOfBody(program, program.bodies()[1]),
            "operator(Operand variable, Operand literal)");
  EXPECT_EQ(&program.bodyOf(program.bodies()[2].place + 1), &program.bodies()[2]);
  EXPECT_EQ(&program.bodyOf(program.bodies()[1].place), &program.bodies()[1]);
}

TEST(Program, CountsAsMemoryWithWhatIsKnownOfItsPlaces) {
  std::string text;
  for (int i = 0; i < 1000; ++i) {
    text += "declare function local:f" + std::to_string(i) + "() { 1 + 2 };\n";
  }
  const auto query = compiled(text + "1");
  const int64_t before = workMeter.valueBytes;
  {
    const XQueryProgram program = programOf(*query);
    const size_t ofProgram = static_cast<size_t>(workMeter.valueBytes - before);
    EXPECT_GE(ofProgram, program.placeCount() * sizeof(XQueryPlace));
    const XQueryFactTable facts(program);
    const size_t ofAll = static_cast<size_t>(workMeter.valueBytes - before);
    EXPECT_GE(ofAll - ofProgram, (program.placeCount() + 1000) * sizeof(XQueryFacts));
  }
  EXPECT_EQ(workMeter.valueBytes, before);
}

XQueryPlaceID onlyOf(const XQueryProgram& program, Kind kind, int which = 0) {
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    if (program[place].expr->kind() == kind && which-- == 0) return place;
  }
  return XQueryNoPlace;
}

TEST(Program, KnowsTheClauseOfEachVariable) {
  const auto query = compiled("for $a in (1, 2) return for $a in $a return $a");
  const XQueryProgram program = programOf(*query);
  const auto outer = onlyOf(program, Kind::ForExpr, 0);
  const auto inner = onlyOf(program, Kind::ForExpr, 1);
  EXPECT_EQ(program[onlyOf(program, Kind::Variable, 0)].binder, outer);
  EXPECT_EQ(program[onlyOf(program, Kind::Variable, 1)].binder, inner);
}

TEST(Program, KnowsTheFocusOfEachPlace) {
  const auto query = compiled("(., a[. = 1]/(.))");
  const XQueryProgram program = programOf(*query);
  EXPECT_EQ(program[onlyOf(program, Kind::ContextItemExpr, 0)].focus, XQueryNoPlace);
  const auto predicate = program[onlyOf(program, Kind::ContextItemExpr, 1)].focus;
  EXPECT_EQ(program[predicate].role, XQueryRole::Predicate);
  const auto step = program[onlyOf(program, Kind::ContextItemExpr, 2)].focus;
  EXPECT_EQ(program[step].role, XQueryRole::Step);
}

TEST(Program, KnowsWhereResultsAreSorted) {
  const auto query = compiled("declare ordering unordered; (a, ordered { b })");
  const XQueryProgram program = programOf(*query);
  EXPECT_FALSE(program[onlyOf(program, Kind::PathExpr, 0)].isOrdered);
  EXPECT_TRUE(program[onlyOf(program, Kind::PathExpr, 1)].isOrdered);
}

// Nesting is a matter of memory here, not of the stack.
TEST(Program, ListsWhatIsDeeplyNested) {
  const auto path = compiled("//a");
  Ref<XQueryExpr> expr(_internal(*path).body());
  constexpr int depth = 50'000;
  for (int i = 0; i < depth; ++i) {
    auto list = XQueryExprList::exprList();
    list->addObject(expr);
    expr = list;
  }
  const auto query = compiled("1");
  XQueryProgram program(*_internal(*query).prolog(), expr);
  EXPECT_GT(program.placeCount(), depth + 1U);
  const XQueryFactTable facts(program);
  EXPECT_EQ(shownItems(facts[0]), "* element in order");
  EXPECT_TRUE(XQueryPlanned(*_internal(*query).prolog(), expr));
}

}  // namespace
}  // namespace xquery
