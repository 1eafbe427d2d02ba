#include "Expr/XQueryElementContentString.h"
#include "Parser/BuilderSupport.h"
#include "Parser/ParserText.h"

namespace xquery {
namespace {

constexpr const char* elements = "element constructors";
constexpr const char* attributes = "attribute constructors";
constexpr const char* comments = "comment constructors";
constexpr const char* instructions = "processing-instruction constructors";

// The last object of a list when it is a T, else null.
template <class T>
T* lastOf(NSObject* list) {
  const auto& objects = cast<NSArray>(list)->objects();
  return objects.empty() ? nullptr : dyn_cast<T>(objects.back().get());
}

}  // namespace

NSObject* XQElementConstructor(NSObject*, NSObject*, NSObject*, int64_t line) {
  return XQUnavailable(elements, line);
}

NSObject* XQAttributeList(NSObject* item) {
  return XQList(item);
}

NSObject* XQAttributeListAdd(NSObject* list, NSObject* item) {
  return XQListAdd(list, item);
}

NSObject* XQAttributeListItem(NSObject*, NSObject*, int, int64_t line) {
  return XQUnavailable(elements, line);
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

NSObject* XQCdataSection(NSObject*, int64_t line) {
  return XQUnavailable("CDATA sections", line);
}

NSObject* XQXmlComment(NSObject*, int64_t line) {
  return XQUnavailable(comments, line);
}

NSObject* XQXmlPI(NSObject*, NSObject*, int64_t line) {
  return XQUnavailable(instructions, line);
}

NSObject* XQCompDocConstructor(NSObject*, int64_t line) {
  return XQUnavailable("document constructors", line);
}

NSObject* XQCompElemConstructor(NSObject*, NSObject*, int64_t line) {
  return XQUnavailable(elements, line);
}

NSObject* XQCompAttrConsructor(NSObject*, NSObject*, int64_t line) {
  return XQUnavailable(attributes, line);
}

NSObject* XQComputedPI(NSObject*, NSObject*, int64_t line) {
  return XQUnavailable(instructions, line);
}

NSObject* XQComputedXmlComment(NSObject*, int64_t line) {
  return XQUnavailable(comments, line);
}

NSObject* XQCompTextConstructor(NSObject*, int64_t line) {
  return XQUnavailable("text constructors", line);
}

NSObject* XQCompNSConstructor(NSObject*, NSObject*, int64_t line) {
  return XQUnavailable("namespace constructors", line);
}

}  // namespace xquery
