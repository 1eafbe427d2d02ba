#include "Plan/Labels.h"

#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Constructors/XQueryAttributeExpr.h"
#include "Expr/Constructors/XQueryElementExpr.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/TypeTests/XQueryTypeExprs.h"
#include "Expr/XQueryBinding.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Paths/XQueryWalkedPath.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryValues.h"

#include <array>
#include <bit>
#include <utility>

namespace xquery {
namespace {

std::string textOf(const Ref<NSString>& text) {
  return text ? text->utf8() : std::string();
}

std::string variableNamed(const Ref<NSString>& name) {
  return "$" + textOf(name);
}

// --- literals ------------------------------------------------------------------------------------

std::string labelOfLiteral(const XQueryExpr& expr) {
  constexpr size_t mostUnits = 40;
  const NSObject* value = cast<XQueryLiteral>(&expr)->literalValue().get();
  if (!value || value->kind() == Kind::Null) return "()";
  const auto text = XQueryDescription(value);
  const bool isCut = text->length() > mostUnits;
  std::string shown = (isCut ? text->view().substring(0, mostUnits) : text->view()).utf8();
  for (char& each : shown) {
    if (static_cast<unsigned char>(each) < ' ') each = ' ';
  }
  if (isCut) shown += "...";
  return isa<NSString>(value) ? "\"" + shown + "\"" : shown;
}

// --- types ---------------------------------------------------------------------------------------

std::string nameInside(const NSObject* data) {
  if (const auto* test = dyn_cast<XQueryNameTest>(data)) return textOf(test->name());
  if (const auto* name = dyn_cast<XQueryQName>(data)) return name->XQueryStringValue()->utf8();
  if (const auto* name = dyn_cast<NSString>(data)) return name->utf8();
  return {};
}

std::string labelOfType(const XQueryExpr& expr) {
  const auto& type = *cast<XQueryTypeDeclaration>(&expr);
  // By XQueryTypeDeclaration::Type.
  constexpr std::array<std::string_view, 11> tests = {
      "",          "",        "empty", "item", "document-node", "element", "processing-instruction",
      "attribute", "comment", "text",  "node"};
  constexpr std::array<std::string_view, 4> occurrences = {"", "?", "*", "+"};
  const std::string inside = nameInside(type.data());
  const std::string name =
      type.type() == XQueryTypeDeclaration::Atomic
          ? inside
          : std::string(tests.at(static_cast<size_t>(type.type()))) + "(" + inside + ")";
  return name + std::string(occurrences.at(static_cast<size_t>(type.occuranceType())));
}

// --- paths ---------------------------------------------------------------------------------------

std::string labelOfTest(const XQueryExpr* test) {
  if (!test) return "node()";
  if (const auto* name = dyn_cast<XQueryNameTest>(test)) return textOf(name->name());
  if (const auto* any = dyn_cast<XQueryWildCardNameTest>(test)) {
    const std::string local = any->localName() ? any->localName()->utf8() : "*";
    return any->prefix()      ? any->prefix()->utf8() + ":" + local
           : any->localName() ? "*:" + local
                              : local;
  }
  return XQueryLabelOf(*test);
}

bool isAnyNode(const XQueryAxisStep& step) {
  const auto* type = dyn_cast<XQueryTypeDeclaration>(step.expr());
  return type && type->type() == XQueryTypeDeclaration::AnyKindTest;
}

// "//" stands for a step of its own.
bool isSlash(const XQueryAxisStep& step) {
  return step.axis() == XQueryAxisDescendantOrSelf && isAnyNode(step) &&
         step.predicates().empty() && step.next();
}

std::string labelOfAxisStep(const XQueryAxisStep& step) {
  constexpr std::array<std::string_view, 13> axes = {"",
                                                     "",
                                                     "descendant::",
                                                     "descendant-or-self::",
                                                     "@",
                                                     "self::",
                                                     "following-sibling::",
                                                     "following::",
                                                     "ancestor::",
                                                     "parent::",
                                                     "preceding::",
                                                     "preceding-sibling::",
                                                     "ancestor-or-self::"};
  if (step.axis() == XQueryAxisParent && isAnyNode(step)) return "..";
  return std::string(axes.at(static_cast<size_t>(step.axis()))) + labelOfTest(step.expr());
}

// "a | @b"; empty for anything but a union of single steps.
std::string labelOfNames(const XQueryExpr* expr) {
  constexpr int mostNames = 8;
  std::string label;
  for (int i = 0; i < mostNames; ++i) {
    const auto* joint = dyn_cast<XQueryOperatorExpr>(expr);
    const bool isUnion = joint && joint->operatorType() == XQueryOperatorUnion;
    const XQueryPathExpr* path = XQueryPathIn(isUnion ? joint->right() : expr);
    const auto* step = path ? dyn_cast<XQueryAxisStep>(path->step()) : nullptr;
    if (!step || step->next() || !step->predicates().empty()) return "";
    label = labelOfAxisStep(*step) + (label.empty() ? "" : " | ") + label;
    if (!isUnion) return label;
    expr = joint->left();
  }
  return "";
}

// What a filter step filters stands below as a part of its own, unless it is brief.
std::string labelOfPrimary(const XQueryExpr* expr) {
  const XQueryExpr* inside = XQueryWithoutParentheses(expr);
  if (!inside) return "()";
  switch (inside->kind()) {
    case Kind::Variable:
    case Kind::ContextItemExpr:
    case Kind::Literal:
    case Kind::FunctionCall:
      return XQueryLabelOf(*inside);
    default: {
      const std::string names = labelOfNames(inside);
      return names.empty() ? "(...)" : "(" + names + ")";
    }
  }
}

std::string labelOfPath(const XQueryExpr& expr) {
  std::string label;
  const XQueryStep* first = cast<XQueryPathExpr>(&expr)->step();
  bool afterSlash = true;
  for (const XQueryStep* step = first; step; step = step->next()) {
    if (step->kind() == Kind::RootStep) {
      label = "/";
      continue;
    }
    const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
    if (axisStep && isSlash(*axisStep)) {
      label += step == first ? ".//" : label == "/" ? "/" : "//";
      afterSlash = true;
      continue;
    }
    if (!afterSlash) label += "/";
    afterSlash = false;
    label += axisStep ? labelOfAxisStep(*axisStep) : labelOfPrimary(step->expr());
    for (size_t index = 0; index < step->predicates().size(); ++index) {
      const XQueryExpr* predicate = step->predicates()[index].get();
      const bool isLiteral = predicate && step->asksForPosition(index);
      label += "[" + (isLiteral ? labelOfPrimary(predicate) : "...") + "]";
    }
  }
  return label;
}

// --- everything else -----------------------------------------------------------------------------

std::string labelOfOperator(const XQueryExpr& expr) {
  // By XQueryOperatorCode.
  constexpr std::array<std::string_view, 28> symbols = {
      "",          "or",     "and", "+",  "-",  "*",  "div", "idiv", "mod", "union",
      "intersect", "except", "to",  "=",  "!=", "<",  "<=",  ">",    ">=",  "eq",
      "ne",        "lt",     "le",  "gt", "ge", "is", "<<",  ">>"};
  return std::string(
      symbols.at(static_cast<size_t>(cast<XQueryOperatorExpr>(&expr)->operatorType())));
}

std::string labelOfBinding(const XQueryExpr& expr) {
  const auto& clause = *cast<XQueryBindingExpr>(&expr);
  const auto* forExpr = dyn_cast<XQueryForExpr>(&clause);
  std::string label = expr.kind() == Kind::LetExpr ? "let " : forExpr ? "for " : "";
  label += variableNamed(clause.varName());
  if (clause.type()) label += " as " + labelOfType(*clause.type());
  if (forExpr && forExpr->posVarID()) label += " at " + variableNamed(forExpr->posVarName());
  return label + (expr.kind() == Kind::LetExpr ? " :=" : " in");
}

std::string labelOfCase(const XQueryExpr& expr) {
  const auto& clause = *cast<XQueryBindingExpr>(&expr);
  std::string label = clause.type() ? "case " : "default ";
  if (clause.varName() && clause.varName()->length()) {
    label += variableNamed(clause.varName()) + (clause.type() ? " as " : " ");
  }
  return label + (clause.type() ? labelOfType(*clause.type()) + " return" : "return");
}

std::string labelOfCall(const XQueryExpr& expr) {
  const auto& call = *cast<XQueryFunctionCall>(&expr);
  const bool isBare = !call.args() || call.args()->count() == 0;
  return textOf(call.name()) + (isBare ? "()" : "(...)");
}

std::string labelOfTyped(const XQueryExpr& expr) {
  constexpr std::array<std::string_view, 4> words = {"instance of ", "treat as ", "cast as ",
                                                     "castable as "};
  const auto which = static_cast<size_t>(expr.kind()) - static_cast<size_t>(Kind::InstanceOfExpr);
  return std::string(words.at(which)) + labelOfType(cast<XQueryTypedExpr>(&expr)->type());
}

std::string labelOfVariable(const XQueryExpr& expr) {
  return variableNamed(cast<XQueryVariable>(&expr)->name());
}
std::string labelOfQuantifier(const XQueryExpr& expr) {
  return cast<XQueryQuantifiedExpr>(&expr)->every() ? "every" : "some";
}
std::string labelOfOrderSpec(const XQueryExpr& expr) {
  return cast<XQueryOrderSpec>(&expr)->ascending() ? "order by" : "order by descending";
}
std::string labelOfOrdering(const XQueryExpr& expr) {
  return cast<XQueryOrderExpr>(&expr)->ordered() ? "ordered" : "unordered";
}
std::string labelOfElement(const XQueryExpr& expr) {
  const auto& name = cast<XQueryElementExpr>(&expr)->name().constantName();
  return "element " + (name ? name->utf8() : "{...}");
}
std::string labelOfAttribute(const XQueryExpr& expr) {
  const auto& name = cast<XQueryAttributeExpr>(&expr)->name().constantName();
  return "attribute " + (name ? name->utf8() : "{...}");
}

struct Row {
  Kind kind;
  std::string_view words;                   // the label, where it is the same for all
  std::string (*label)(const XQueryExpr&);  // null for those
};

constexpr auto rows = std::to_array<Row>({
    {Kind::ExprList, "list", nullptr},
    {Kind::Args, "arguments", nullptr},
    {Kind::Literal, "", labelOfLiteral},
    {Kind::Variable, "", labelOfVariable},
    {Kind::ContextItemExpr, ".", nullptr},
    {Kind::QNameReference, "name", nullptr},
    {Kind::PathExpr, "", labelOfPath},
    {Kind::RootStepExpr, "/", nullptr},
    {Kind::NameTest, "name test", nullptr},
    {Kind::WildCardNameTest, "name test", nullptr},
    {Kind::OperatorExpr, "", labelOfOperator},
    {Kind::TypeDeclaration, "", labelOfType},
    {Kind::ForExpr, "", labelOfBinding},
    {Kind::Param, "parameter", nullptr},
    {Kind::ElementExpr, "", labelOfElement},
    {Kind::AttributeExpr, "", labelOfAttribute},
    {Kind::NamespaceExpr, "namespace", nullptr},
    {Kind::FunctionCall, "", labelOfCall},
    {Kind::ConditionalExpr, "if", nullptr},
    {Kind::FLWORExpr, "FLWOR", nullptr},
    {Kind::LetExpr, "", labelOfBinding},
    {Kind::OrderSpec, "", labelOfOrderSpec},
    {Kind::OrderExpr, "", labelOfOrdering},
    {Kind::QuantifiedExpr, "", labelOfQuantifier},
    {Kind::QuantifiedItem, "", labelOfBinding},
    {Kind::TypeswitchExpr, "typeswitch", nullptr},
    {Kind::CaseClause, "", labelOfCase},
    {Kind::InstanceOfExpr, "", labelOfTyped},
    {Kind::TreatExpr, "", labelOfTyped},
    {Kind::CastExpr, "", labelOfTyped},
    {Kind::CastableExpr, "", labelOfTyped},
    {Kind::ComputedAttributeExpr, "attribute {...}", nullptr},
    {Kind::TextExpr, "text {...}", nullptr},
    {Kind::CommentExpr, "comment {...}", nullptr},
    {Kind::ProcessingInstructionExpr, "processing-instruction {...}", nullptr},
    {Kind::DocumentExpr, "document {...}", nullptr},
});

}  // namespace

std::string XQueryLabelOf(const XQueryExpr& expr) {
  for (const Row& row : rows) {
    if (row.kind == expr.kind()) return row.label ? row.label(expr) : std::string(row.words);
  }
  return "expression";
}

std::string_view XQueryLabelOf(XQueryRole role) {
  switch (role) {
    case XQueryRole::Test:
      return "test";
    case XQueryRole::Where:
      return "where";
    case XQueryRole::Return:
      return "return";
    case XQueryRole::Satisfies:
      return "satisfies";
    case XQueryRole::Predicate:
      return "predicate";
    case XQueryRole::Name:
      return "name";
    default:
      return {};
  }
}

// --- facts ---------------------------------------------------------------------------------------

namespace {

struct KindName {
  XQueryItemKinds kinds;
  std::string_view one;
  std::string_view several;
};

// Larger sets first: what one row has named is not named again.
constexpr auto kindNames = std::to_array<KindName>({
    {XQueryItems::Any, "item", "items"},
    {XQueryItems::Node, "node", "nodes"},
    {XQueryItems::Atomic, "atomic value", "atomic values"},
    {XQueryItems::Numeric, "number", "numbers"},
    {XQueryItems::Duration, "duration", "durations"},
    {XQueryItems::String, "string", "strings"},
    {XQueryItems::Document, "document", "documents"},
    {XQueryItems::Element, "element", "elements"},
    {XQueryItems::Attribute, "attribute", "attributes"},
    {XQueryItems::Namespace, "namespace", "namespaces"},
    {XQueryItems::Instruction, "processing instruction", "processing instructions"},
    {XQueryItems::Comment, "comment", "comments"},
    {XQueryItems::Text, "text", "texts"},
    {XQueryItems::Untyped, "untyped value", "untyped values"},
    {XQueryItems::PlainString, "string", "strings"},
    {XQueryItems::DerivedString, "derived string", "derived strings"},
    {XQueryItems::Boolean, "boolean", "booleans"},
    {XQueryItems::Integer, "integer", "integers"},
    {XQueryItems::Decimal, "decimal", "decimals"},
    {XQueryItems::Float, "float", "floats"},
    {XQueryItems::Double, "double", "doubles"},
    {XQueryItems::URI, "URI", "URIs"},
    {XQueryItems::QName, "QName", "QNames"},
    {XQueryItems::DateTime, "dateTime", "dateTimes"},
    {XQueryItems::Date, "date", "dates"},
    {XQueryItems::Time, "time", "times"},
    {XQueryItems::Gregorian, "part of a date", "parts of dates"},
    {XQueryItems::PlainDuration, "plain duration", "plain durations"},
    {XQueryItems::YearMonthDuration, "yearMonthDuration", "yearMonthDurations"},
    {XQueryItems::DayTimeDuration, "dayTimeDuration", "dayTimeDurations"},
    {XQueryItems::HexBinary, "hexBinary", "hexBinaries"},
    {XQueryItems::Base64Binary, "base64Binary", "base64Binaries"},
    {XQueryItems::Notation, "notation", "notations"},
    {XQueryItems::Other, "other value", "other values"},
});

std::string namesOf(XQueryItemKinds kinds, bool several) {
  std::vector<std::string_view> names;
  for (const KindName& row : kindNames) {
    if ((kinds & row.kinds) != row.kinds || row.kinds == XQueryItems::None) continue;
    names.push_back(several ? row.several : row.one);
    kinds &= ~row.kinds;
  }
  // More than a few say no more than "something".
  constexpr size_t mostNames = 4;
  if (names.size() > mostNames) return several ? "items" : "item";
  std::string text;
  for (size_t i = 0; i < names.size(); ++i) {
    if (i) text += i + 1 == names.size() ? " or " : ", ";
    text += names[i];
  }
  return text;
}

}  // namespace

std::string XQueryLabelOfItems(const XQueryFacts& facts) {
  if (facts.most == 0) return "nothing";
  if (facts.kinds == XQueryItems::None) return "no value";
  const bool several = facts.most > 1;
  const std::string_view count = !several          ? (facts.least ? "one " : "at most one ")
                                 : facts.least > 1 ? "two or more "
                                 : facts.least     ? "one or more "
                                                   : "any number of ";
  std::string text = std::string(count) + namesOf(facts.kinds, several);
  if (several && facts.inOrder) text += " in document order";
  return text;
}

std::vector<std::string_view> XQueryLabelsOfDeeds(unsigned deeds) {
  // By the bits of XQueryDeeds.
  constexpr std::array<std::string_view, 12> words = {"reads the context item",
                                                      "reads the document above the context item",
                                                      "reads the position",
                                                      "reads the size",
                                                      "reads global variables",
                                                      "reads the static context",
                                                      "loads documents",
                                                      "looks outside the nodes it starts from",
                                                      "makes nodes",
                                                      "traces",
                                                      "may differ when repeated",
                                                      "may fail"};
  std::vector<std::string_view> labels;
  for (size_t bit = 0; bit < words.size(); ++bit) {
    if (deeds >> bit & 1U) labels.push_back(words[bit]);
  }
  return labels;
}

}  // namespace xquery
