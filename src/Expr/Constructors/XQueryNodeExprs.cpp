#include "Expr/Constructors/XQueryNodeExprs.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Constructors/XQueryContent.h"
#include "Expr/Constructors/XQueryContentText.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryParts.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryNodeFunctions.h"
#include "Types/XQueryStringFunctions.h"
#include "xquery/Collection.h"

namespace xquery {
namespace {

void bindPart(const Ref<XQueryExpr>& part, XQueryProlog& prolog) {
  if (part && XQueryCheckStack(prolog)) part->bindInfoForProlog(prolog);
}

enum class Part : uint8_t { Empty, Appended, Failed };

// Appends the text of the value of a part, which may be missing.
Part appendTextOf(const Ref<XQueryExpr>& part, NSMutableString& text, XQueryContext& context) {
  XQueryCheckStack(context);
  if (!part) return Part::Empty;
  const Value value = part->evaluateWithContext(context);
  if (XQueryHasFailed(value, context)) return Part::Failed;
  return XQueryAppendText(value, text, context) ? Part::Appended : Part::Empty;
}

}  // namespace

void XQueryValueConstructor::bindInfoForProlog(XQueryProlog& prolog) {
  bindPart(_value, prolog);
}

void XQueryValueConstructor::visitParts(XQueryPartVisitor& visitor) {
  visitor.part(_value, XQueryRole::Content);
}

// --- text ----------------------------------------------------------------------------------------

Ref<XQueryTextExpr> XQueryTextExpr::textExprWithValue(Ref<XQueryExpr> value) {
  return make<XQueryTextExpr>(Kind::TextExpr, std::move(value));
}

Value XQueryTextExpr::computeValue(XQueryContext& context) const {
  NSMutableString text;
  switch (appendTextOf(_value, text, context)) {
    case Part::Empty:
      return NSNull::null();
    case Part::Failed:
      return {};
    case Part::Appended:
      break;
  }
  return NSXMLNode::textWithStringValue(text.view());
}

// --- comments ------------------------------------------------------------------------------------

Ref<XQueryCommentExpr> XQueryCommentExpr::commentExprWithValue(Ref<XQueryExpr> value) {
  return make<XQueryCommentExpr>(Kind::CommentExpr, std::move(value));
}

Value XQueryCommentExpr::computeValue(XQueryContext& context) const {
  NSMutableString text;
  if (appendTextOf(_value, text, context) == Part::Failed) return {};
  if (const Ref<NSXMLNode> comment = XQueryXMLNodeComment(*text.string())) return comment;
  return _internal(context).fail(XQueryErrors::invalidComment.errorAtLine(exprLine()), exprPlace());
}

// --- processing instructions ---------------------------------------------------------------------

Ref<XQueryProcessingInstructionExpr>
XQueryProcessingInstructionExpr::processingInstructionExprWithName(Ref<XQueryExpr> name,
                                                                   Ref<XQueryExpr> value) {
  return make<XQueryProcessingInstructionExpr>(std::move(name), std::move(value));
}

// A target is in no namespace. The name itself serves mostly, which the compiled query holds, so
// that threads need not look it up in the table that they share.
NSXMLNameRef XQueryProcessingInstructionExpr::targetNamed(const NSXMLNameRef& name) {
  const NSXMLExpandedName& expanded = *name->expanded;
  if (name->prefixLength == 0 && !expanded.URI) return name;
  return {expanded.localName, NSStringView()};
}

void XQueryProcessingInstructionExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  _name.bind(prolog, Kind::ProcessingInstruction, *this);
  bindPart(_value, prolog);
}

void XQueryProcessingInstructionExpr::visitParts(XQueryPartVisitor& visitor) {
  _name.visitParts(visitor);
  visitor.part(_value, XQueryRole::Content);
}

Value XQueryProcessingInstructionExpr::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  auto& dynamic = _internal(context);
  const NSXMLNameRef name = _name.evaluate(context, exprLine());
  if (!name) return {};
  NSMutableString content;
  if (appendTextOf(_value, content, context) == Part::Failed) return {};
  if (content.view().find(NSStringView::ascii("?>")) != NSStringView::notFound) {
    return dynamic.fail(XQueryErrors::invalidInstruction.errorAtLine(exprLine()), exprPlace());
  }
  const Ref<NSXMLNode> instruction =
      XQueryXMLNodePI(targetNamed(name), XQueryStringTrimLeadingWS(content.string())->view());
  if (!instruction)
    return dynamic.fail(XQueryErrors::invalidType.errorAtLine(exprLine()), exprPlace());
  dynamic.setBaseURI(dynamic.baseURI(), instruction.get());
  return instruction;
}

// --- documents -----------------------------------------------------------------------------------

Ref<XQueryDocumentExpr> XQueryDocumentExpr::documentWithExpr(Ref<XQueryExpr> expr) {
  return make<XQueryDocumentExpr>(Kind::DocumentExpr, std::move(expr));
}

void XQueryDocumentExpr::bindInfoForProlog(XQueryProlog& prolog) {
  prolog.countAdopter();
  XQueryValueConstructor::bindInfoForProlog(prolog);
}

Value XQueryDocumentExpr::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  auto& dynamic = _internal(context);
  const Ref<NSXMLDocument> document = NSXMLDocument::document();
  dynamic.setBaseURI(dynamic.baseURI(), document.get());
  XQueryDocumentContent content(*document, context, exprLine());
  const Value value = _value->evaluateWithContext(context);
  if (XQueryHasFailed(value, context)) return {};
  content.add(value);
  content.finish();
  return document;
}

// --- namespaces ----------------------------------------------------------------------------------

Ref<XQueryNamespaceExpr> XQueryNamespaceExpr::namespaceExprWithName(Ref<NSString> name,
                                                                    Ref<XQueryExpr> value) {
  return make<XQueryNamespaceExpr>(std::move(name), std::move(value));
}

Ref<NSXMLNode> XQueryNamespaceExpr::constantNode() const {
  const auto* literal = dyn_cast<XQueryLiteral>(_value.get());
  const auto* URI = literal ? dyn_cast<NSString>(literal->literalValue()) : nullptr;
  return URI ? XQueryXMLNodeNamespace(*_name, *URI) : nullptr;
}

void XQueryNamespaceExpr::bindInfoForProlog(XQueryProlog& prolog) {
  bindPart(_value, prolog);
}

void XQueryNamespaceExpr::visitParts(XQueryPartVisitor& visitor) {
  visitor.part(_value, XQueryRole::Content);
}

Value XQueryNamespaceExpr::computeValue(XQueryContext& context) const {
  if (_name->view() == "xml" || _name->view() == "xmlns") {
    return _internal(context).fail(XQueryErrors::invalidNamespace.errorAtLine(exprLine()),
                                   exprPlace());
  }
  NSMutableString URI;
  if (appendTextOf(_value, URI, context) == Part::Failed) return {};
  return XQueryXMLNodeNamespace(*_name, *URI.string());
}

}  // namespace xquery
