#include "Expr/Constructors/XQueryNodeExprs.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Constructors/XQueryContent.h"
#include "Expr/Constructors/XQueryContentText.h"
#include "Expr/XQueryLeaves.h"
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

// Appends the text of the value of a part, which may be missing. Answer: whether it had any item.
bool appendTextOf(const Ref<XQueryExpr>& part, NSMutableString& text, XQueryContext& context) {
  XQueryCheckStack(context);
  return part && XQueryAppendText(part->evaluateWithContext(context), text, context);
}

}  // namespace

void XQueryValueConstructor::bindInfoForProlog(XQueryProlog& prolog) {
  bindPart(_value, prolog);
}

// --- text ----------------------------------------------------------------------------------------

Ref<XQueryTextExpr> XQueryTextExpr::textExprWithValue(Ref<XQueryExpr> value) {
  return make<XQueryTextExpr>(std::move(value));
}

Value XQueryTextExpr::evaluateWithContext(XQueryContext& context) const {
  NSMutableString text;
  if (!appendTextOf(_value, text, context)) return NSNull::null();
  return NSXMLNode::textWithStringValue(text.view());
}

// --- comments ------------------------------------------------------------------------------------

Ref<XQueryCommentExpr> XQueryCommentExpr::commentExprWithValue(Ref<XQueryExpr> value) {
  return make<XQueryCommentExpr>(std::move(value));
}

Value XQueryCommentExpr::evaluateWithContext(XQueryContext& context) const {
  NSMutableString text;
  appendTextOf(_value, text, context);
  const Ref<NSXMLNode> comment = XQueryXMLNodeComment(*text.string());
  if (!comment) context._internal().raise(XQueryErrors::invalidComment.errorAtLine(exprLine()));
  return comment;
}

// --- processing instructions ---------------------------------------------------------------------

Ref<XQueryProcessingInstructionExpr>
XQueryProcessingInstructionExpr::processingInstructionExprWithName(Ref<XQueryExpr> name,
                                                                   Ref<XQueryExpr> value) {
  return make<XQueryProcessingInstructionExpr>(std::move(name), std::move(value));
}

void XQueryProcessingInstructionExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  _name.bind(prolog, Kind::ProcessingInstruction, exprLine());
  bindPart(_value, prolog);
}

Value XQueryProcessingInstructionExpr::evaluateWithContext(XQueryContext& context) const {
  XQueryCheckStack(context);
  auto& dynamic = context._internal();
  const NSXMLNameRef name = _name.evaluate(context, exprLine());
  const Ref<NSString> target = NSString::stringWithView(name->expanded->localName);
  NSMutableString content;
  appendTextOf(_value, content, context);
  if (content.view().find(NSStringView::ascii("?>")) != NSStringView::notFound) {
    dynamic.raise(XQueryErrors::invalidInstruction.errorAtLine(exprLine()));
  }
  Ref<NSXMLNode> instruction;
  if (target->length() > 0) {
    instruction = XQueryXMLNodePI(*target, *XQueryStringTrimLeadingWS(content.string()));
  }
  if (!instruction) dynamic.raise(XQueryErrors::invalidType.errorAtLine(exprLine()));
  dynamic.setBaseURI(dynamic.baseURI(), instruction.get());
  return instruction;
}

// --- documents -----------------------------------------------------------------------------------

Ref<XQueryDocumentExpr> XQueryDocumentExpr::documentWithExpr(Ref<XQueryExpr> expr) {
  return make<XQueryDocumentExpr>(std::move(expr));
}

void XQueryDocumentExpr::bindInfoForProlog(XQueryProlog& prolog) {
  prolog.countAdopter();
  XQueryValueConstructor::bindInfoForProlog(prolog);
}

Value XQueryDocumentExpr::evaluateWithContext(XQueryContext& context) const {
  XQueryCheckStack(context);
  auto& dynamic = context._internal();
  const Ref<NSXMLDocument> document = NSXMLDocument::document();
  dynamic.setBaseURI(dynamic.baseURI(), document.get());
  XQueryDocumentContent content(*document, context, exprLine());
  content.add(_value->evaluateWithContext(context));
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

Value XQueryNamespaceExpr::evaluateWithContext(XQueryContext& context) const {
  if (_name->view() == "xml" || _name->view() == "xmlns") {
    context._internal().raise(XQueryErrors::invalidNamespace.errorAtLine(exprLine()));
  }
  NSMutableString URI;
  appendTextOf(_value, URI, context);
  return XQueryXMLNodeNamespace(*_name, *URI.string());
}

}  // namespace xquery
