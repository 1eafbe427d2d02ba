#include "Expr/Constructors/XQueryAttributeExpr.h"
#include "Expr/Constructors/XQueryElementContentString.h"
#include "Expr/Constructors/XQueryElementExpr.h"
#include "Expr/Constructors/XQueryNodeExprs.h"
#include "Parser/BuilderSupport.h"
#include "Parser/ParserText.h"
#include "Parser/XQueryTokens.h"
#include "Platform/Tree/Arena.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryNodeFunctions.h"

namespace xquery {
namespace {

// The last object of a list when it is a T, else null.
template <class T>
T* lastOf(NSObject* list) {
  const auto& objects = cast<NSArray>(list)->objects();
  return objects.empty() ? nullptr : dyn_cast<T>(objects.back().get());
}

// The text of a comment, processing instruction or CDATA section, which may be missing.
Ref<NSString> textOf(NSObject* chars) {
  return chars ? cast<XQueryParserText>(chars)->string() : NSString::empty();
}

// Runs of characters stand in a list among expressions; each becomes a literal.
template <class Run, class LiteralValue>
std::vector<Ref<XQueryExpr>> expressions(NSObject* list, LiteralValue literalValue) {
  std::vector<Ref<XQueryExpr>> result;
  if (!list) return result;
  for (const Value& item : cast<NSArray>(list)->objects()) {
    if (Run* run = dyn_cast<Run>(item)) {
      result.push_back(XQueryLiteral::literalWithValue(literalValue(run)));
    } else {
      result.push_back(XQRef<XQueryExpr>(item.get()));
    }
  }
  return result;
}

// A literal that every evaluation answers: its node must stay what it is, whoever uses it.
NSObject* XQNodeLiteral(const Ref<NSXMLNode>& node, int64_t line) {
  NSXMLTree::setFixed(node.get());
  return XQAtLine(XQueryLiteral::literalWithValue(node), line);
}

// "xmlns" or "xmlns:prefix": a declaration, of which only the first part of the value counts.
Ref<XQueryExpr> namespaceDeclaration(const Ref<NSString>& prefix,
                                     const std::vector<Ref<XQueryExpr>>& items) {
  Ref<XQueryExpr> value =
      items.empty() ? XQueryLiteral::literalWithValue(NSString::empty()) : items.front();
  return XQueryNamespaceExpr::namespaceExprWithName(prefix, value);
}

}  // namespace

NSObject* XQElementConstructor(NSObject* name, NSObject* attributes, NSObject* content,
                               int64_t line) {
  auto items = expressions<XQueryElementContentString>(
      content, [](XQueryElementContentString* run) { return Value(run); });
  return XQAtLine(XQueryElementExpr::elementeExprWithName(
                      XQRef<NSString>(name), XQVector<XQueryExpr>(attributes), std::move(items)),
                  line);
}

void XQEndTag(NSObject* startName, NSObject* endName, int64_t line, XQuerySpan endNameAt) {
  if (cast<NSString>(startName)->isEqualToString(*cast<NSString>(endName))) return;
  XQRemarkAt(endNameAt, XQueryRemark::Matter::EndTag, line, startName, endName);
}

void XQCharRefInAttribute(char16_t unit, int64_t line) {
  const bool isKept = unit != u'\t' && unit != u'\n' && unit != u'\r';
  if (!isKept) XQRemark(XQueryRemark::Matter::LineEndReference, line);
}

NSObject* XQAttributeList(NSObject* item) {
  return XQList(item);
}

NSObject* XQAttributeListAdd(NSObject* list, NSObject* item) {
  return XQListAdd(list, item);
}

NSObject* XQAttributeListItem(NSObject* name, NSObject* items, int quoteToken, int64_t line) {
  const auto values = expressions<XQueryParserText>(
      items, [](XQueryParserText* text) { return Value(text->string()); });
  const Ref<NSString> attributeName = XQRef<NSString>(name);
  const NSStringView text = attributeName->view();
  const NSStringView declaration = NSStringView::ascii("xmlns:");
  const bool isDeclaration = text == "xmlns" || text.startsWith(declaration);
  const bool isLiteral = values.empty() || (values.size() == 1 && isa<XQueryLiteral>(values[0]));
  if (isDeclaration && !isLiteral) {
    XQRemark(XQueryRemark::Matter::EnclosedNamespace, line, attributeName.get());
  }
  if (text == "xmlns") return XQAtLine(namespaceDeclaration(NSString::empty(), values), line);
  if (text.startsWith(declaration)) {
    const auto prefix = NSString::stringWithView(text.substring(declaration.length()));
    return XQAtLine(namespaceDeclaration(prefix, values), line);
  }
  const char16_t quote = quoteToken == kTokenApos ? u'\'' : u'"';
  return XQAtLine(XQueryAttributeExpr::attributeExprWithName(attributeName, values, quote), line);
}

NSObject* XQAttributeValueCharsWithUnicode(char16_t unit) {
  return XQAttributeValueCharsAddUnicode(XQList(nullptr), unit);
}

NSObject* XQAttributeValueCharsAddUnicode(NSObject* items, char16_t unit) {
  if (XQueryParserText* text = lastOf<XQueryParserText>(items)) {
    text->addChar(unit);
    return items;
  }
  return XQListAdd(items, XQChars(unit));
}

NSObject* XQAttributeValueCharsWithExpr(NSObject* expr) {
  return XQList(expr);
}

NSObject* XQAttributeValueCharsAddExpr(NSObject* items, NSObject* expr) {
  return XQListAdd(items, expr);
}

NSObject* XQElementContent(NSObject* item) {
  return XQList(item);
}

NSObject* XQElementContentAdd(NSObject* items, NSObject* item) {
  return XQListAdd(items, item);
}

NSObject* XQElementContentWithUnicode(char16_t unit) {
  return XQElementContentAddUnicode(XQList(nullptr), unit);
}

NSObject* XQElementContentAddUnicode(NSObject* items, char16_t unit) {
  if (XQueryElementContentString* run = lastOf<XQueryElementContentString>(items)) {
    run->addChar(unit);
    return items;
  }
  return XQListAdd(items,
                   XQueryParserAutoRelease(XQueryElementContentString::stringWithChar(unit)));
}

NSObject* XQElementContentWhiteSpace(char16_t unit) {
  return XQElementContentAddWhiteSpace(XQList(nullptr), unit);
}

NSObject* XQElementContentAddWhiteSpace(NSObject* items, char16_t unit) {
  if (XQueryElementContentString* run = lastOf<XQueryElementContentString>(items)) {
    run->addWhiteSpace(unit);
    return items;
  }
  return XQListAdd(items,
                   XQueryParserAutoRelease(XQueryElementContentString::stringWithWhiteSpace(unit)));
}

NSObject* XQChars(char16_t unit) {
  return XQueryParserAutoRelease(XQueryParserText::textWithChar(unit));
}

NSObject* XQCharsAdd(NSObject* text, char16_t unit) {
  cast<XQueryParserText>(text)->addChar(unit);
  return text;
}

NSObject* XQCdataSection(NSObject* text, int64_t line) {
  return XQNodeLiteral(XQueryXMLNodeCDATA(*textOf(text)), line);
}

NSObject* XQXmlComment(NSObject* text, int64_t line) {
  if (const auto comment = XQueryXMLNodeComment(*textOf(text))) return XQNodeLiteral(comment, line);
  // Answered as a value, which is told as an error wherever somebody looks at it.
  Ref<XQueryLiteral> literal = XQueryLiteral::literalWithValue(
      XQueryParser::currentParser()->placed(XQueryErrors::invalidComment.errorAtLine(line)));
  return XQAtLine(std::move(literal), line);
}

NSObject* XQXmlPI(NSObject* target, NSObject* content, int64_t line) {
  NSObject* name = target ? target : NSString::empty().get();
  auto value = XQueryLiteral::literalWithValue(textOf(content));
  return XQComputedPI(XQStringLiteral(name, line), XQueryParserAutoRelease(std::move(value)), line);
}

NSObject* XQCompDocConstructor(NSObject* expr, int64_t line) {
  return XQAtLine(XQueryDocumentExpr::documentWithExpr(XQRef<XQueryExpr>(expr)), line);
}

NSObject* XQCompElemConstructor(NSObject* name, NSObject* content, int64_t line) {
  return XQAtLine(
      XQueryElementExpr::elementExprWithNameExpr(Value(name), XQRef<XQueryExpr>(content)), line);
}

NSObject* XQCompAttrConsructor(NSObject* name, NSObject* value, int64_t line) {
  return XQAtLine(XQueryComputedAttributeExpr::computedAttributeExprWithName(
                      XQRef<XQueryExpr>(name), XQRef<XQueryExpr>(value)),
                  line);
}

NSObject* XQComputedPI(NSObject* name, NSObject* value, int64_t line) {
  return XQAtLine(XQueryProcessingInstructionExpr::processingInstructionExprWithName(
                      XQRef<XQueryExpr>(name), XQRef<XQueryExpr>(value)),
                  line);
}

NSObject* XQComputedXmlComment(NSObject* value, int64_t line) {
  return XQAtLine(XQueryCommentExpr::commentExprWithValue(XQRef<XQueryExpr>(value)), line);
}

NSObject* XQCompTextConstructor(NSObject* value, int64_t line) {
  return XQAtLine(XQueryTextExpr::textExprWithValue(XQRef<XQueryExpr>(value)), line);
}

NSObject* XQCompNSConstructor(NSObject* prefix, NSObject* URI, int64_t line) {
  return XQAtLine(
      XQueryNamespaceExpr::namespaceExprWithName(XQRef<NSString>(prefix), XQRef<XQueryExpr>(URI)),
      line);
}

}  // namespace xquery
